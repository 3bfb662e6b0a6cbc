// Windows home: the registry calls are the system's; its calls each stand alone, so the store
// transactions have nothing to group.
#include <ut/platform/registry.h>

namespace ut::platform {

LONG BeginRegistryTransaction() {
    return ERROR_SUCCESS;
}
LONG CommitRegistryTransaction() {
    return ERROR_SUCCESS;
}
LONG RollbackRegistryTransaction() {
    return ERROR_SUCCESS;
}

} // namespace ut::platform
