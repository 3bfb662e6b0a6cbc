#include <optional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ut/dataobject.h>
#include <ut/detail/names.h>

#include "support/wine.h"

namespace {

using ut::ComPtr;

// What a drop carries: files, Unicode text, a URL (narrow text), each only when present.
struct Drop {
    std::optional<std::vector<std::wstring>> files = {};
    std::optional<std::wstring> text = {};
    std::optional<std::string> url = {};
};

ComPtr<IDataObject> Make(const Drop& drop) {
    ComPtr<IDataObject> data;
    EXPECT_EQ(ut::platform::CreateDataObject(data.Put()), S_OK);
    if (drop.files) {
        EXPECT_EQ(ut::platform::SetDropFiles(data.Get(), *drop.files), S_OK);
    }
    if (drop.text) {
        EXPECT_EQ(ut::platform::SetGlobalData(data.Get(), CF_UNICODETEXT, drop.text->c_str(),
                                              (drop.text->size() + 1) * sizeof(wchar_t)),
                  S_OK);
    }
    auto urlFormat = static_cast<CLIPFORMAT>(RegisterClipboardFormatW(L"UniformResourceLocator"));
    if (drop.url) {
        EXPECT_EQ(ut::platform::SetGlobalData(data.Get(), urlFormat, drop.url->c_str(), drop.url->size() + 1),
                  S_OK);
    }
    return data;
}

TEST(DataObject, AnswersWhatADropCarries) {
    struct Case {
        const char* what;
        Drop drop;
        HRESULT isFile, isUrl, number;
        unsigned count;
        HRESULT oneName;
        std::wstring single;
        HRESULT names;
        std::vector<std::wstring> all;
    } cases[] = {
        // clang-format off
        {"one file", {.files = {{L"C:\\a.scn"}}}, S_OK, S_FALSE, S_OK, 1, S_OK, L"C:\\a.scn", S_OK, {L"C:\\a.scn", L""}},
        {"two files", {.files = {{L"C:\\a.scn", L"D:\\b.scn"}}}, S_OK, S_FALSE, S_OK, 2, E_FAIL, L"", S_OK,
         {L"C:\\a.scn", L"D:\\b.scn"}},
        {"empty list", {.files = std::vector<std::wstring>{}}, S_OK, S_FALSE, E_FAIL, 0, E_FAIL, L"", E_FAIL, {L"", L""}},
        {"text", {.text = L"first line\r\nsecond"}, S_OK, S_FALSE, S_OK, 1, DV_E_FORMATETC, L"", S_OK, {L"first line", L""}},
        {"url", {.url = "http://host/a.avi"}, S_OK, S_OK, S_OK, 1, DV_E_FORMATETC, L"", S_OK, {L"http://host/a.avi", L""}},
        {"nothing", {}, DV_E_FORMATETC, S_FALSE, E_FAIL, 0, DV_E_FORMATETC, L"", DV_E_FORMATETC, {L"", L""}},
        // clang-format on
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.what);
        if (c.drop.files && c.drop.files->empty() &&
            ut::test::UnderWine("wine counts an empty list as one name"))
            continue;
        ComPtr<IDataObject> data = Make(c.drop);
        EXPECT_EQ(KXIsDataObjectFile(data.Get()), c.isFile);
        EXPECT_EQ(KXIsURLDataObject(data.Get()), c.isUrl);
        unsigned count = 99;
        EXPECT_EQ(KXGetNbrFileFromDataObject(data.Get(), &count), c.number);
        EXPECT_EQ(count, c.count);
        wchar_t buffer[ut::kPathCapacity] = L"";
        EXPECT_EQ(KXGetFileNameFromDataObject(data.Get(), buffer, ut::kPathCapacity), c.oneName);
        EXPECT_EQ(std::wstring(buffer), c.single);
        CKXString names[2];
        count = 99;
        EXPECT_EQ(KXGetFileNamesFromDataObject(data.Get(), names, 2, &count, ut::kPathCapacity), c.names);
        EXPECT_EQ((std::vector<std::wstring>{std::wstring(names[0]), std::wstring(names[1])}), c.all);
    }
    for (auto* call : {&KXIsDataObjectFile, &KXIsURLDataObject})
        EXPECT_EQ(call(nullptr), E_UNEXPECTED);
    CKXString name;
    wchar_t buffer[4];
    EXPECT_EQ(KXGetNbrFileFromDataObject(nullptr, nullptr), E_POINTER);
    EXPECT_EQ(KXGetFileNameFromDataObject(nullptr, buffer, 4), E_POINTER);
    EXPECT_EQ(KXGetFileNameFromDataObject(Make({.files = {{L"a"}}}).Get(), nullptr, 4), E_POINTER);
    EXPECT_EQ(KXGetFileNamesFromDataObject(nullptr, &name, 1, nullptr, 4), E_POINTER);
    EXPECT_EQ(KXGetFileNamesFromDataObject(Make({.files = {{L"a"}}}).Get(), &name, 0, nullptr, 4),
              E_UNEXPECTED);
}

TEST(DataObject, NamesAreCutToTheirBuffersAndCountedInFull) {
    ComPtr<IDataObject> data = Make({.files = {{L"C:\\long.scn", L"D:\\b.scn", L"E:\\c.scn"}}});
    CKXString names[2];
    unsigned count = 0;
    EXPECT_EQ(KXGetFileNamesFromDataObject(data.Get(), names, 2, &count, 6), S_OK);
    EXPECT_EQ(count, 3u);
    EXPECT_EQ(std::wstring(names[0]), L"C:\\lo");
    EXPECT_EQ(std::wstring(names[1]), L"D:\\b.");
    wchar_t buffer[5];
    EXPECT_EQ(KXGetFileNameFromDataObject(Make({.files = {{L"C:\\long.scn"}}}).Get(), buffer, 5), S_OK);
    EXPECT_EQ(std::wstring(buffer), L"C:\\l");
}

TEST(DataObject, UrlsBecomeNamesByTheSlashAndSchemeRules) {
    const std::pair<const char*, const wchar_t*> cases[] = {
        {"file:///C:/dir/a.avi", L"C:\\dir\\a.avi"},
        {"FILE:///C:/dir/a.avi", L"C:\\dir\\a.avi"},
        {"file:////server/share/a.avi", L"\\\\server\\share\\a.avi"},
        {"file://server/share/a.avi", L"server\\share\\a.avi"},
        // Without a colon from the sixth character on, the slashes stay.
        {"http://host/a.avi", L"http://host/a.avi"},
        {"http://host:80/a.avi", L"http:\\\\host:80\\a.avi"},
        {"file:///", L"\\"},
        {"file:", L""},
        {"", L""},
    };
    for (const auto& [url, name] : cases) {
        CKXString names[1];
        unsigned count = 0;
        EXPECT_EQ(KXGetFileNamesFromDataObject(Make({.url = url}).Get(), names, 1, &count, ut::kPathCapacity),
                  S_OK)
            << url;
        EXPECT_EQ(std::wstring(names[0]), name) << url;
        EXPECT_EQ(count, 1u) << url;
    }
}

TEST(IsFileNameType, ComparesTheEndingWithoutCase) {
    struct Case {
        const wchar_t* name;
        const wchar_t* extension;
        HRESULT result;
    } cases[] = {
        {L"scene.SCN", L".scn", S_OK},
        {L"scene.scn", L"scn", S_OK},
        {L"scene.scn", L".sc", S_FALSE},
        {L"scn", L".scn", S_FALSE},
        {L"", L"", S_OK},
        {L"a.scn", L"", S_OK},
    };
    for (const Case& c : cases) {
        CKXString name = c.name;
        EXPECT_EQ(KXIsFileNameType(&name, c.extension), c.result) << c.name << L" " << c.extension;
    }
    CKXString name;
    EXPECT_EQ(KXIsFileNameType(nullptr, L".scn"), E_POINTER);
    EXPECT_EQ(KXIsFileNameType(&name, nullptr), E_POINTER);
}

} // namespace
