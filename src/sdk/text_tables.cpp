// The process's table of string dictionaries and message catalogs, read from files on first use.
#include "text_tables.h"

#include <algorithm>
#include <memory>
#include <mutex>
#include <vector>

#include <ut/platform/process.h>
#include <ut/platform/stream.h>
#include <ut/platform/text.h>

namespace ut::sdk {
namespace {

struct Tables {
    std::mutex mutex;
    std::map<std::pair<TextKind, std::wstring>, std::shared_ptr<const TextEntries>> loaded;
    // Tables that were replaced: the texts they handed out must stay valid.
    std::vector<std::shared_ptr<const TextEntries>> retired;
};

// Never destroyed: modules look texts up while the process exits.
Tables& AllTables() {
    static Tables* tables = new Tables;
    return *tables;
}

const wchar_t* Extension(TextKind kind) {
    return kind == TextKind::Dictionary ? L".dict" : L".cat";
}

std::wstring Unescape(std::string_view text) {
    std::string plain;
    plain.reserve(text.size());
    for (std::size_t i = 0; i < text.size(); ++i) {
        char next = i + 1 < text.size() ? text[i + 1] : '\0';
        if (text[i] != '\\' || (next != 'n' && next != 't' && next != '\\')) {
            plain += text[i];
            continue;
        }
        plain += next == 'n' ? '\n' : next == 't' ? '\t' : '\\';
        ++i;
    }
    return ut::platform::WideFromUtf8(plain);
}

HRESULT ReadWholeFile(const wchar_t* path, std::string& content) {
    ut::ComPtr<IStream> stream;
    if (HRESULT hr = ut::platform::OpenFileStream(path, STGM_READ, stream.Put()); FAILED(hr))
        return hr;
    char chunk[4096];
    for (;;) {
        ULONG read = 0;
        if (HRESULT hr = stream->Read(chunk, sizeof chunk, &read); FAILED(hr))
            return hr;
        if (read == 0)
            return S_OK;
        content.append(chunk, read);
    }
}

// Where the texts lie beside `module`: "../share/ut" from its folder, and the installed layout's
// own path when that differs; written with the module's own separator.
std::vector<std::wstring> TextFolders(HINSTANCE module) {
    std::wstring file = ut::platform::ModuleFileName(module);
    std::size_t slash = file.find_last_of(L"/\\");
    if (slash == std::wstring::npos)
        return {};
    const wchar_t separator = file[slash];
    std::vector<std::wstring> folders;
    for (std::wstring relative :
         {std::wstring(L"../share/ut"), ut::platform::WideFromUtf8(UT_INSTALLED_TEXTS)}) {
        std::replace(relative.begin(), relative.end(), L'/', separator);
        std::wstring folder = file.substr(0, slash + 1) + relative + separator;
        if (std::find(folders.begin(), folders.end(), folder) == folders.end())
            folders.push_back(std::move(folder));
    }
    return folders;
}

HINSTANCE ThisLibrary() {
    return ut::platform::ModuleOf(reinterpret_cast<const void*>(&ThisLibrary));
}

HRESULT ReadTable(const wchar_t* path, TextEntries& entries) {
    std::string content;
    if (HRESULT hr = ReadWholeFile(path, content); FAILED(hr))
        return hr;
    entries = ParseTextTable(content);
    return S_OK;
}

// Reads the table from the first folder that has it.
HRESULT FindTable(TextKind kind, std::wstring_view name, HINSTANCE owner, TextEntries& entries) {
    HRESULT hr = STG_E_FILENOTFOUND;
    for (HINSTANCE module : {owner, ThisLibrary()}) {
        if (!module)
            continue;
        for (const std::wstring& folder : TextFolders(module)) {
            std::wstring path = folder + std::wstring(name) + Extension(kind);
            if (hr = ReadTable(path.c_str(), entries); SUCCEEDED(hr))
                return hr;
        }
    }
    return hr;
}

void Install(TextKind kind, std::wstring_view name, TextEntries entries) {
    auto table = std::make_shared<const TextEntries>(std::move(entries));
    Tables& all = AllTables();
    std::lock_guard lock(all.mutex);
    std::shared_ptr<const TextEntries>& slot = all.loaded[{kind, std::wstring(name)}];
    if (slot)
        all.retired.push_back(std::move(slot));
    slot = std::move(table);
}

std::shared_ptr<const TextEntries> Loaded(TextKind kind, std::wstring_view name) {
    Tables& all = AllTables();
    std::lock_guard lock(all.mutex);
    auto found = all.loaded.find({kind, std::wstring(name)});
    return found == all.loaded.end() ? nullptr : found->second;
}

} // namespace

TextEntries ParseTextTable(std::string_view content) {
    TextEntries entries;
    while (!content.empty()) {
        std::size_t end = content.find('\n');
        std::string_view line = content.substr(0, end);
        content = end == std::string_view::npos ? std::string_view() : content.substr(end + 1);
        if (!line.empty() && line.back() == '\r')
            line.remove_suffix(1);
        std::size_t digits = 0;
        unsigned id = 0;
        while (digits < line.size() && line[digits] >= '0' && line[digits] <= '9' && digits < 9)
            id = id * 10 + static_cast<unsigned>(line[digits++] - '0');
        if (digits == 0 || (digits < line.size() && line[digits] != ' ' && line[digits] != '\t'))
            continue;
        std::size_t text = line.find_first_not_of(" \t", digits);
        entries[id] = text == std::string_view::npos ? std::wstring() : Unescape(line.substr(text));
    }
    return entries;
}

const wchar_t* FindText(TextKind kind, std::wstring_view name, unsigned id, HINSTANCE owner, HRESULT* found) {
    std::shared_ptr<const TextEntries> table = Loaded(kind, name);
    HRESULT hr = S_OK;
    if (!table) {
        TextEntries entries;
        if (hr = FindTable(kind, name, owner, entries); SUCCEEDED(hr)) {
            Install(kind, name, std::move(entries));
            table = Loaded(kind, name);
        }
    }
    if (found)
        *found = hr;
    if (!table)
        return nullptr;
    auto entry = table->find(id);
    return entry == table->end() ? nullptr : entry->second.c_str();
}

HRESULT LoadTextTable(TextKind kind, std::wstring_view name, const wchar_t* path) {
    if (!path || name.empty())
        return E_INVALIDARG;
    TextEntries entries;
    if (HRESULT hr = ReadTable(path, entries); FAILED(hr))
        return hr;
    Install(kind, name, std::move(entries));
    return S_OK;
}

} // namespace ut::sdk
