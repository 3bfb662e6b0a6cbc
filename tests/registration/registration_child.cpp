// The second process of the POSIX registration tests, on the store UT_REGISTRY names; it first
// prints "pid N". "register FIRST COUNT" registers operators FIRST.. and prints each number once
// registered; "probe" (as an unprivileged user when started as root) prints registration results.
#include <cstdio>
#include <cstdlib>
#include <string>
#include <unistd.h>

#include <ut/registration.h>

#include "support/registrations.h"

namespace {

std::wstring OperatorName(long n) {
    return L"Operator " + std::to_wstring(n);
}

int Register(long first, long count) {
    for (long n = first; n < first + count; ++n) {
        HRESULT hr = KXRegisterOperator(ut::test::TestGuid(static_cast<ULONG>(n)), ut::test::TestModule(),
                                        OperatorName(n).c_str());
        if (hr != S_OK) {
            std::printf("error %08x at %ld\n", static_cast<unsigned>(hr), n);
            return 1;
        }
        std::printf("%ld\n", n);
        std::fflush(stdout);
    }
    return 0;
}

// Drops root's rights first, so that file permissions apply as they do to a user.
int Probe() {
    constexpr uid_t kNobody = 65534;
    if (geteuid() == 0 && (setgid(kNobody) != 0 || setuid(kNobody) != 0)) {
        std::printf("cannot drop privileges\n");
        return 1;
    }
    const GUID clsid = ut::test::TestGuid(1);
    std::printf("add=%x translator=%x path=%x remove=%x operator=%08x\n",
                static_cast<unsigned>(KXAddRegistryKey(clsid, L"Operator", L"Name", L"denied")),
                static_cast<unsigned>(KXRegisterTranslator(clsid, L"c:\\denied.dll")),
                static_cast<unsigned>(KXRegisterKeyPath(clsid, L"Shaders", L"c:\\denied")),
                static_cast<unsigned>(KXRemRegistryKey(clsid, L"Operator")),
                static_cast<unsigned>(KXRegisterOperator(clsid, ut::test::TestModule(), L"denied")));
    return 0;
}

} // namespace

int main(int argc, char** argv) {
    std::printf("pid %ld\n", static_cast<long>(getpid()));
    std::fflush(stdout);
    std::string command = argc > 1 ? argv[1] : "";
    if (command == "register" && argc == 4)
        return Register(std::atol(argv[2]), std::atol(argv[3]));
    if (command == "probe")
        return Probe();
    std::fprintf(stderr, "usage: registration_child register FIRST COUNT | probe\n");
    return 2;
}
