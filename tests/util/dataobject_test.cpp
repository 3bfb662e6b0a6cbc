#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ut/dataobject.h>
#include <ut/detail/names.h>

#include "support/wine.h"

namespace {

using ut::ComPtr;

// What a drop carries: files, Unicode text, a URL (narrow text), or nothing.
struct Drop {
    std::vector<std::wstring> files;
    std::wstring text;
    std::string url;
    bool hasFiles = false, hasText = false, hasUrl = false;
};

ComPtr<IDataObject> Make(const Drop& drop) {
    ComPtr<IDataObject> data;
    EXPECT_EQ(ut::platform::CreateDataObject(data.Put()), S_OK);
    if (drop.hasFiles) {
        EXPECT_EQ(ut::platform::SetDropFiles(data.Get(), drop.files), S_OK);
    }
    if (drop.hasText) {
        EXPECT_EQ(ut::platform::SetGlobalData(data.Get(), CF_UNICODETEXT, drop.text.c_str(),
                                              (drop.text.size() + 1) * sizeof(wchar_t)),
                  S_OK);
    }
    if (drop.hasUrl) {
        EXPECT_EQ(ut::platform::SetGlobalData(
                      data.Get(),
                      static_cast<CLIPFORMAT>(RegisterClipboardFormatW(L"UniformResourceLocator")),
                      drop.url.c_str(), drop.url.size() + 1),
                  S_OK);
    }
    return data;
}

Drop Files(std::vector<std::wstring> files) {
    Drop drop;
    drop.files = std::move(files);
    drop.hasFiles = true;
    return drop;
}
Drop Text(std::wstring text) {
    Drop drop;
    drop.text = std::move(text);
    drop.hasText = true;
    return drop;
}
Drop Url(std::string url) {
    Drop drop;
    drop.url = std::move(url);
    drop.hasUrl = true;
    return drop;
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
        {"one file",
         Files({L"C:\\a.scn"}),
         S_OK,
         S_FALSE,
         S_OK,
         1,
         S_OK,
         L"C:\\a.scn",
         S_OK,
         {L"C:\\a.scn", L""}},
        {"two files",
         Files({L"C:\\a.scn", L"D:\\b.scn"}),
         S_OK,
         S_FALSE,
         S_OK,
         2,
         E_FAIL,
         L"",
         S_OK,
         {L"C:\\a.scn", L"D:\\b.scn"}},
        {"empty list", Files({}), S_OK, S_FALSE, E_FAIL, 0, E_FAIL, L"", E_FAIL, {L"", L""}},
        {"text",
         Text(L"first line\r\nsecond"),
         S_OK,
         S_FALSE,
         S_OK,
         1,
         DV_E_FORMATETC,
         L"",
         S_OK,
         {L"first line", L""}},
        {"url",
         Url("http://host/a.avi"),
         S_OK,
         S_OK,
         S_OK,
         1,
         DV_E_FORMATETC,
         L"",
         S_OK,
         {L"http://host/a.avi", L""}},
        {"nothing",
         Drop{},
         DV_E_FORMATETC,
         S_FALSE,
         E_FAIL,
         0,
         DV_E_FORMATETC,
         L"",
         DV_E_FORMATETC,
         {L"", L""}},
    };
    for (const Case& c : cases) {
        if (c.drop.hasFiles && c.drop.files.empty() &&
            ut::test::UnderWine("wine counts an empty list as one name"))
            continue;
        ComPtr<IDataObject> data = Make(c.drop);
        EXPECT_EQ(KXIsDataObjectFile(data.Get()), c.isFile) << c.what;
        EXPECT_EQ(KXIsURLDataObject(data.Get()), c.isUrl) << c.what;
        unsigned count = 99;
        EXPECT_EQ(KXGetNbrFileFromDataObject(data.Get(), &count), c.number) << c.what;
        EXPECT_EQ(count, c.count) << c.what;
        wchar_t buffer[ut::kPathCapacity] = L"";
        EXPECT_EQ(KXGetFileNameFromDataObject(data.Get(), buffer, ut::kPathCapacity), c.oneName) << c.what;
        EXPECT_EQ(std::wstring(buffer), c.single) << c.what;
        CKXString names[2];
        count = 99;
        EXPECT_EQ(KXGetFileNamesFromDataObject(data.Get(), names, 2, &count, ut::kPathCapacity), c.names)
            << c.what;
        EXPECT_EQ((std::vector<std::wstring>{std::wstring(names[0]), std::wstring(names[1])}), c.all)
            << c.what;
    }
    for (auto* call : {&KXIsDataObjectFile, &KXIsURLDataObject})
        EXPECT_EQ(call(nullptr), E_UNEXPECTED);
    CKXString name;
    wchar_t buffer[4];
    EXPECT_EQ(KXGetNbrFileFromDataObject(nullptr, nullptr), E_POINTER);
    EXPECT_EQ(KXGetFileNameFromDataObject(nullptr, buffer, 4), E_POINTER);
    EXPECT_EQ(KXGetFileNameFromDataObject(Make(Files({L"a"})).Get(), nullptr, 4), E_POINTER);
    EXPECT_EQ(KXGetFileNamesFromDataObject(nullptr, &name, 1, nullptr, 4), E_POINTER);
    EXPECT_EQ(KXGetFileNamesFromDataObject(Make(Files({L"a"})).Get(), &name, 0, nullptr, 4), E_UNEXPECTED);
}

TEST(DataObject, NamesAreCutToTheirBuffersAndCountedInFull) {
    ComPtr<IDataObject> data = Make(Files({L"C:\\long.scn", L"D:\\b.scn", L"E:\\c.scn"}));
    CKXString names[2];
    unsigned count = 0;
    EXPECT_EQ(KXGetFileNamesFromDataObject(data.Get(), names, 2, &count, 6), S_OK);
    EXPECT_EQ(count, 3u);
    EXPECT_EQ(std::wstring(names[0]), L"C:\\lo");
    EXPECT_EQ(std::wstring(names[1]), L"D:\\b.");
    wchar_t buffer[5];
    EXPECT_EQ(KXGetFileNameFromDataObject(Make(Files({L"C:\\long.scn"})).Get(), buffer, 5), S_OK);
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
        EXPECT_EQ(KXGetFileNamesFromDataObject(Make(Url(url)).Get(), names, 1, &count, ut::kPathCapacity),
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
