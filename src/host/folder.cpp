// The reference host's folders.
#include "folder.h"

namespace ut::host {

std::span<const CGWCOMObject::InterfaceEntry> Folder::GetInterfaceMap() const {
    static const InterfaceEntry layers[] = {ut::sdk::Entry<Folder, IKXLayerContainer>(IID_IKXLayerContainer)};
    static const InterfaceEntry planes[] = {ut::sdk::Entry<Folder, I3DRefPlaneFolder>(IID_I3DRefPlaneFolder)};
    static const InterfaceEntry caches[] = {ut::sdk::Entry<Folder, I3DCacheMgr>(IID_I3DCacheMgr)};
    switch (role_) {
    case Role::kLayers:
        return layers;
    case Role::kReferencePlanes:
        return planes;
    case Role::kCaches:
        return caches;
    case Role::kPlain:
        break;
    }
    return {};
}

} // namespace ut::host
