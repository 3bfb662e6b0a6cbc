// Data-object transfer helpers over the platform's data transfer.
#include <ut/dataobject.h>

#include <algorithm>
#include <cwctype>
#include <string>
#include <vector>

#include <ut/platform/detail/boundary.h>
#include <ut/platform/text.h>

namespace {

constexpr DWORD kAnyMedium = 0xFFFFFFFF;

FORMATETC Format(CLIPFORMAT format) {
    return {format, nullptr, DVASPECT_CONTENT, -1, kAnyMedium};
}

CLIPFORMAT UrlFormat() {
    return static_cast<CLIPFORMAT>(RegisterClipboardFormatW(L"UniformResourceLocator"));
}

HRESULT Offers(IDataObject* data, CLIPFORMAT format) {
    FORMATETC asked = Format(format);
    return data->QueryGetData(&asked);
}

// A medium released on every path.
struct Medium {
    STGMEDIUM medium{};
    Medium() = default;
    Medium(const Medium&) = delete;
    Medium& operator=(const Medium&) = delete;
    ~Medium() { ReleaseStgMedium(&medium); }

    HRESULT Get(IDataObject* data, CLIPFORMAT format) {
        FORMATETC asked = Format(format);
        return data->GetData(&asked, &medium);
    }
    HDROP Drop() const { return static_cast<HDROP>(medium.hGlobal); }
};

// The text of a global block, up to its terminator or its end.
template <class Char>
std::basic_string<Char> BlockText(const Medium& held) {
    ut::GlobalLockGuard lock(held.medium.hGlobal);
    if (!lock.Data())
        return {};
    const Char* text = static_cast<const Char*>(lock.Data());
    std::size_t capacity = GlobalSize(held.medium.hGlobal) / sizeof(Char);
    return std::basic_string<Char>(text, std::find(text, text + capacity, Char{}));
}

bool StartsWithoutCase(const std::wstring& text, const wchar_t* prefix) {
    std::size_t i = 0;
    for (; prefix[i]; ++i)
        if (i >= text.size() || std::towlower(text[i]) != std::towlower(prefix[i]))
            return false;
    return true;
}

// A URL as a name: a path-like one (a colon from the sixth character on, or a "file:" URL, whose
// three forms the application has always turned into paths) gets backslashes, and a "file:"
// scheme goes with the slashes that belong to it.
std::wstring NameFromUrl(std::wstring text) {
    bool file = StartsWithoutCase(text, L"file:");
    if (file || text.find(L':', 5) != std::wstring::npos)
        std::replace(text.begin(), text.end(), L'/', L'\\');
    if (file) {
        bool driveAfter = text.size() >= 9 && text[7] == L'\\' && text[8] != L'\\';
        text.erase(0, driveAfter ? 8 : 7);
    }
    return text;
}

UINT DroppedCount(HDROP drop) {
    return DragQueryFileW(drop, 0xFFFFFFFF, nullptr, 0);
}

HRESULT NamesFromDrop(IDataObject* data, CKXString* names, unsigned int maxNames, unsigned int* count,
                      unsigned int nameSize) {
    Medium held;
    HRESULT got = held.Get(data, CF_HDROP);
    if (FAILED(got))
        return got;
    UINT files = DroppedCount(held.Drop());
    if (files == 0)
        return E_FAIL;
    if (count)
        *count = files;
    std::vector<wchar_t> buffer(std::max(nameSize, 1u));
    for (UINT i = 0; i < files && i < maxNames; ++i) {
        buffer[0] = L'\0';
        (void)DragQueryFileW(held.Drop(), i, buffer.data(), nameSize); // a name it cannot read stays empty
        buffer.back() = L'\0';
        names[i] = buffer.data();
    }
    return got;
}

HRESULT NameFromText(IDataObject* data, CKXString* names, unsigned int* count, bool url) {
    Medium held;
    HRESULT got = held.Get(data, url ? UrlFormat() : CF_UNICODETEXT);
    if (FAILED(got))
        return got;
    std::wstring name;
    if (url) {
        name = NameFromUrl(ut::platform::WideFromUtf8(BlockText<char>(held)));
    } else {
        name = BlockText<wchar_t>(held);
        name.erase(std::min(name.find_first_of(L"\r\n"), name.size()));
    }
    names[0] = name.c_str();
    if (count)
        *count = 1;
    return got;
}

} // namespace

HRESULT KXIsDataObjectFile(IDataObject* data) {
    if (!data)
        return E_UNEXPECTED;
    if (Offers(data, CF_HDROP) == S_OK || Offers(data, CF_UNICODETEXT) == S_OK)
        return S_OK;
    return Offers(data, UrlFormat());
}

HRESULT KXIsURLDataObject(IDataObject* data) {
    if (!data)
        return E_UNEXPECTED;
    return Offers(data, UrlFormat()) == S_OK ? S_OK : S_FALSE;
}

HRESULT KXGetNbrFileFromDataObject(IDataObject* data, unsigned int* count) {
    if (!data)
        return E_POINTER;
    unsigned int found = 0;
    HRESULT hr = E_FAIL;
    if (Offers(data, CF_HDROP) == S_OK) {
        Medium held;
        if (SUCCEEDED(held.Get(data, CF_HDROP)))
            found = DroppedCount(held.Drop());
        hr = found ? S_OK : E_FAIL;
    } else if (Offers(data, CF_UNICODETEXT) == S_OK || Offers(data, UrlFormat()) == S_OK) {
        found = 1;
        hr = S_OK;
    }
    if (count)
        *count = found;
    return hr;
}

HRESULT KXGetFileNameFromDataObject(IDataObject* data, wchar_t* buffer, unsigned int size) {
    if (!data || !buffer)
        return E_POINTER;
    if (HRESULT hr = Offers(data, CF_HDROP); FAILED(hr))
        return hr;
    Medium held;
    HRESULT got = held.Get(data, CF_HDROP);
    if (FAILED(got))
        return got;
    if (DroppedCount(held.Drop()) != 1)
        return E_FAIL;
    (void)DragQueryFileW(held.Drop(), 0, buffer, size); // the count says the name is there
    return got;
}

HRESULT KXGetFileNamesFromDataObject(IDataObject* data, CKXString* names, unsigned int maxNames,
                                     unsigned int* count, unsigned int nameSize) {
    if (!data)
        return E_POINTER;
    if (maxNames == 0 || !names)
        return E_UNEXPECTED;
    return ut::ExportBoundary([&] {
        if (Offers(data, CF_HDROP) == S_OK)
            return NamesFromDrop(data, names, maxNames, count, nameSize);
        return NameFromText(data, names, count, Offers(data, CF_UNICODETEXT) != S_OK);
    });
}

HRESULT KXIsFileNameType(CKXString* name, const wchar_t* extension) {
    if (!name || !extension)
        return E_POINTER;
    std::wstring_view ending(extension);
    if (ending.size() > static_cast<std::size_t>(name->Length()))
        return S_FALSE;
    return ut::ExportBoundary([&] {
        return name->Right(static_cast<int>(ending.size())).CaseLessEqual(extension) ? S_OK : S_FALSE;
    });
}
