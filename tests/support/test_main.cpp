// Every test program stands where the application's main thread stands: COM is initialised
// before the tests load or create anything, as the application does before it loads plug-ins.
#include <gmock/gmock.h>

#include <ut/platform/com.h>

namespace {

// The multithreaded apartment, so that threads a test starts are in it too.
class ComApartment {
public:
    ComApartment() : status_(CoInitializeEx(nullptr, COINIT_MULTITHREADED)) {}
    ~ComApartment() {
        if (SUCCEEDED(status_))
            CoUninitialize();
    }
    ComApartment(const ComApartment&) = delete;
    ComApartment& operator=(const ComApartment&) = delete;

    HRESULT Status() const { return status_; }

private:
    HRESULT status_;
};

} // namespace

int main(int argc, char** argv) {
    testing::InitGoogleMock(&argc, argv);
    ComApartment apartment;
    if (FAILED(apartment.Status()))
        return 1;
    return RUN_ALL_TESTS();
}
