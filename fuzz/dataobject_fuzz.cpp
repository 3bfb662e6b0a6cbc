// Offers arbitrary bytes as a dropped-file list, Unicode text or a URL, and asks every question a
// drop target asks. Nothing may read or write outside the block or the caller's buffers, every
// name must fit the size asked for, and the answers must agree with one another.
//
// Input: one byte that picks the format (low two bits: file list, text, URL; bit 2: a second
// format beside it), one byte of buffer sizes (low nibble: names, high nibble: characters), then
// the block's bytes.
#include <cstdint>
#include <cstdlib>
#include <cwchar>
#include <memory>
#include <vector>

#include <ut/dataobject.h>
#include <ut/platform/dataobject.h>

namespace {

CLIPFORMAT FormatOf(unsigned choice) {
    switch (choice % 3) {
    case 0:
        return CF_HDROP;
    case 1:
        return CF_UNICODETEXT;
    default:
        return static_cast<CLIPFORMAT>(RegisterClipboardFormatW(L"UniformResourceLocator"));
    }
}

void Require(bool condition) {
    if (!condition)
        std::abort();
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    if (size < 2)
        return 0;
    ut::ComPtr<IDataObject> object;
    if (FAILED(ut::platform::CreateDataObject(object.Put())))
        return 0;
    const unsigned maxNames = data[1] & 0x0F, nameSize = data[1] >> 4;
    (void)ut::platform::SetGlobalData(object.Get(), FormatOf(data[0] & 3), data + 2, size - 2);
    if (data[0] & 4)
        (void)ut::platform::SetGlobalData(object.Get(), FormatOf((data[0] & 3) + 1), data + 2,
                                          (size - 2) / 2);

    Require(SUCCEEDED(KXIsURLDataObject(object.Get())));
    (void)KXIsDataObjectFile(object.Get()); // answers the URL query's failure when nothing is offered
    unsigned count = 0;
    HRESULT counted = KXGetNbrFileFromDataObject(object.Get(), &count);
    Require(SUCCEEDED(counted) == (count > 0));

    // Exactly as many characters as the caller says it has: a write past them is a fault.
    auto single = std::make_unique<wchar_t[]>(nameSize + 1);
    single[nameSize] = L'#';
    if (SUCCEEDED(KXGetFileNameFromDataObject(object.Get(), single.get(), nameSize)) && nameSize)
        Require(std::wcslen(single.get()) < nameSize);
    Require(single[nameSize] == L'#');

    std::vector<CKXString> names(maxNames + 1, CKXString(L"unwritten"));
    unsigned listed = 0;
    if (SUCCEEDED(KXGetFileNamesFromDataObject(object.Get(), names.data(), maxNames, &listed, nameSize))) {
        Require(listed == count);
        Require(names[maxNames] == L"unwritten");
    }
    for (const CKXString& name : names) {
        CKXString copy = name;
        Require(SUCCEEDED(KXIsFileNameType(&copy, L".scn")));
    }
    return 0;
}
