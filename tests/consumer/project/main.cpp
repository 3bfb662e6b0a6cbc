// A plug-in's view of the installed library: the headers compile, the libraries link and load.
#include <cstdio>

#include <ut/detail/names.h>
#include <ut/platform/bitmap.h>
#include <ut/platform/dataobject.h>
#include <ut/platform/files.h>
#include <ut/platform/storage.h>
#include <ut/platform/stream.h>
#include <ut/sdk/resources.h>
#include <ut/sdk/storage.h>
#include <ut/ut.h>

// Defined for the home the plug-in is built on.
bool SystemHeadersWhole();

int main() {
    if (g_uiFeaturesVersion[eFeaturesVersionScene][eFeatureCurrent] == 0 ||
        !KXDictFindInstance(ut::kDictionaryName)) {
        std::puts("the library did not load");
        return 1;
    }
    // The library's texts were installed beside it.
    wchar_t text[80] = L"";
    KXGetCDError(0xFFFF, text, 80);
    if (!text[0]) {
        std::puts("the library's dictionary was not found");
        return 1;
    }
    ut::ComPtr<IStream> stream;
    if (FAILED(ut::platform::CreateMemoryStream(stream.Put())) || FAILED(stream->Write("ok", 2, nullptr))) {
        std::puts("no memory stream");
        return 1;
    }
    if (!SystemHeadersWhole()) {
        std::puts("the system headers were cut short");
        return 1;
    }
    std::puts("consumer: ut found, loaded and usable");
    return 0;
}
