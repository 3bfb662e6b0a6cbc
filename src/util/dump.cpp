// Diagnostic dumps of property containers, class registrations and component hierarchies.
#include <ut/dump.h>

#include <algorithm>
#include <cinttypes>
#include <cstdint>
#include <memory>
#include <mutex>
#include <utility>
#include <vector>

#include <ut/platform/detail/boundary.h>
#include <ut/platform/process.h>
#include <ut/platform/registry.h>
#include <ut/platform/text.h>
#include <ut/sdk/application.h>
#include <ut/sdk/components.h>
#include <ut/sdk/objects.h>

namespace {

// One process-wide depth, as the dumps are for one thread at a time: it indents nested
// containers and keeps their header off.
int nestingDepth = 0;

// The sink and log override are set rarely, read at every line: a mutex keeps a swap safe.
std::mutex settingsLock;
ut::DumpOutput& OutputSink() {
    static ut::DumpOutput sink;
    return sink;
}
std::wstring& LogPathOverride() {
    static std::wstring path;
    return path;
}

void ToDebugger(std::wstring_view text) {
    ut::DumpOutput sink;
    {
        std::lock_guard lock(settingsLock);
        sink = OutputSink();
    }
    if (sink)
        sink(text);
    else
        ut::platform::WriteDebugOutput(std::wstring(text).c_str());
}

// printf-style pieces, formatted narrow (numbers and ASCII only) and widened, at any length.
template <class... Args>
std::wstring Format(const char* format, Args... args) {
    int length = std::snprintf(nullptr, 0, format, args...);
    if (length <= 0)
        return std::wstring();
    std::string text(static_cast<std::size_t>(length) + 1, '\0');
    std::snprintf(text.data(), text.size(), format, args...);
    text.pop_back();
    return std::wstring(text.begin(), text.end());
}

std::wstring Address(const void* pointer) {
    return Format("%08" PRIXPTR, reinterpret_cast<std::uintptr_t>(pointer));
}

std::wstring PaddedName(const wchar_t* name) {
    std::wstring text = name ? name : L"";
    if (text.size() < 20)
        text.append(20 - text.size(), L' ');
    return text;
}

std::wstring Indent(int depth) {
    std::wstring text;
    for (int i = 0; i < depth; ++i)
        text += L"   ";
    return text;
}

// The value line of one property: its type's name and value, as the table of types gives them.
std::wstring ValueLine(const VARIANT& value) {
    switch (value.vt) {
    case VT_I2:
    case VT_UI2:
        return Format(": INTEGER2 %d\n", static_cast<int>(value.iVal));
    case VT_I4:
    case VT_UI4:
    case VT_INT:
    case VT_UINT:
        return Format(": INTEGER4 %d\n", static_cast<int>(value.lVal));
    case VT_UI1:
        return Format(": INTEGER1 %d\n", static_cast<int>(value.bVal));
    case VT_R4:
        return Format(": FLOAT_F  %f\n", static_cast<double>(value.fltVal));
    case VT_R8:
        return Format(": FLOAT_D  %f\n", value.dblVal);
    case VT_BOOL:
        return std::wstring(L": BOOL     ") + (value.boolVal ? L"true" : L"false") + L"\n";
    case VT_UNKNOWN:
        return L": IUnknown " + Address(value.punkVal) + L"\n";
    case VT_LPSTR: {
        const char* text = static_cast<const char*>(value.byref);
        // Narrow text is taken a byte per character, as a debugger shows it.
        std::string_view bytes = text ? text : "<nil>";
        std::wstring wide;
        for (unsigned char c : bytes)
            wide += static_cast<wchar_t>(c);
        return L": STRING A [" + wide + L"]\n";
    }
    case VT_LPWSTR: {
        const wchar_t* text = static_cast<const wchar_t*>(value.byref);
        return std::wstring(L": STRING W [") + (text ? text : L"<nil>") + L"]\n";
    }
    case GW_VT_GUID:
        return L": GUID     " +
               (value.byref ? ut::GuidToString(*static_cast<const GUID*>(value.byref))
                            : std::wstring(L"<nil>")) +
               L"\n";
    default:
        return Format(": No idea what this is...(%d)\n", static_cast<int>(value.vt));
    }
}

// Frees what an enumeration handed out with an entry.
struct PropertyEntry : tagGWPROPERTY {
    PropertyEntry() : tagGWPROPERTY{} { VariantInit(&value); }
    ~PropertyEntry() { Clear(); }
    PropertyEntry(const PropertyEntry&) = delete;
    PropertyEntry& operator=(const PropertyEntry&) = delete;
    void Clear() {
        CoTaskMemFree(name);
        name = nullptr;
        (void)GWVariantClear(&value); // a type the clear does not know holds nothing of ours
    }
};

void DumpNested(IUnknown* value);

void DumpContainer(IGWProperties* container, const wchar_t* label) {
    if (nestingDepth == 0)
        ToDebugger(L"\nKXDumpPropertyContainer [" + Address(container) + L"] : " + (label ? label : L"") +
                   L"\n");
    ut::ComPtr<IEnumGWProperties> entries;
    if (!container || FAILED(container->EnumProperties(27, entries.Put())) || !entries)
        return;
    PropertyEntry entry;
    ULONG fetched = 0;
    if (FAILED(entries->Next(1, &entry, &fetched)))
        return;
    while (fetched == 1) {
        ToDebugger(Indent(nestingDepth));
        ToDebugger(L"   " + ut::GuidToString(entry.id) + L" Flags=" +
                   Format("%08lX", static_cast<unsigned long>(entry.flags)) + L" : " +
                   PaddedName(entry.name));
        ToDebugger(ValueLine(entry.value));
        if (entry.value.vt == VT_UNKNOWN && entry.value.punkVal)
            DumpNested(entry.value.punkVal);
        entry.Clear();
        fetched = 0;
        if (FAILED(entries->Next(1, &entry, &fetched)))
            break;
    }
}

void DumpNested(IUnknown* value) {
    ut::ComPtr<IGWProperties> nested;
    if (FAILED(value->QueryInterface(IID_IGWProperties, nested.PutVoid())) || !nested)
        return;
    struct Deeper {
        Deeper() { ++nestingDepth; }
        ~Deeper() { --nestingDepth; }
        Deeper(const Deeper&) = delete;
        Deeper& operator=(const Deeper&) = delete;
    } deeper;
    DumpContainer(nested.Get(), L" ");
}

void MapGuidToName(const GUID& guid, std::FILE* file, CKXString* name) {
    std::wstring key = L"CLSID\\" + ut::GuidToString(guid) + L"\\InprocServer32";
    if (name)
        *name = CKXString(L"[" + key.substr(0, key.size() - 15) + L"]");
    HKEY opened = nullptr;
    if (RegOpenKeyExW(HKEY_CLASSES_ROOT, key.c_str(), 0, KEY_READ, &opened) != ERROR_SUCCESS)
        return;
    ut::UniqueHKey server(opened);
    wchar_t value[260] = {}; // announced as 260 bytes: at most 130 characters come back
    DWORD bytes = 260;
    bool read = RegQueryValueExW(server.get(), nullptr, nullptr, nullptr, reinterpret_cast<BYTE*>(value),
                                 &bytes) == ERROR_SUCCESS &&
                value[0] != L'\0';
    if (read) {
        if (name)
            *name += CKXString(L" : ") + value;
        else if (file)
            std::fprintf(file, "<%s>", ut::platform::Utf8FromWide(value).c_str());
        else
            ToDebugger(std::wstring(value) + L"\n");
        return;
    }
    constexpr const char* kNotRegistered = "This GUID is NOT registered Properly, (no Default Value)";
    if (file)
        std::fputs(kNotRegistered, file);
    else
        ToDebugger(Format("%s\n", kNotRegistered));
}

// Sends each line of KXDumpActiveData to the debugger and the log.
class ActiveDataLog {
public:
    explicit ActiveDataLog(std::FILE* file) : file_(file) {}
    ~ActiveDataLog() {
        if (file_)
            std::fclose(file_);
    }
    ActiveDataLog(const ActiveDataLog&) = delete;
    ActiveDataLog& operator=(const ActiveDataLog&) = delete;

    void Write(const std::wstring& text) {
        ToDebugger(text);
        if (!file_)
            return;
        std::string bytes;
        if (!ut::platform::MultibyteFromWide(text, text.size() + 49, bytes))
            bytes = PlainText(text);
        std::fputs(bytes.c_str(), file_);
        std::fflush(file_);
    }

private:
    // What the log holds of a line the code page cannot hold: its ASCII, the rest as '?'.
    static std::string PlainText(const std::wstring& text) {
        std::string plain;
        for (wchar_t c : text)
            plain += c < 0x80 ? static_cast<char>(c) : '?';
        return plain;
    }

    std::FILE* file_;
};

class HierarchyWriter {
public:
    HierarchyWriter(ActiveDataLog& log, int level) : log_(log), level_(level) {}

    // Writes the hierarchy from its root at `depth`; one "<more...>" stands for it past the level
    // asked for or where it is already being written further out.
    void Write(IGWComponentHierarchy* hierarchy, int depth) {
        ut::ComPtr<IUnknown> identity;
        (void)hierarchy->QueryInterface(IID_IUnknown, identity.PutVoid());
        if (!Within(depth) || std::find(open_.begin(), open_.end(), identity.Get()) != open_.end()) {
            More(depth);
            return;
        }
        tagGWComponent root{};
        if (FAILED(hierarchy->GetRootComponent(&root)))
            return;
        open_.push_back(identity.Get());
        WriteComponent(hierarchy, root, depth);
        open_.pop_back();
    }

private:
    void WriteComponent(IGWComponentHierarchy* hierarchy, const tagGWComponent& component, int depth) {
        GUID id = GUID_NULL;
        (void)hierarchy->GetComponentGuid(component, &id); // an unnamed component shows as GUID_NULL
        std::wstring line = Indent(depth) + Format("%03d", depth) +
                            Format(" %04X", static_cast<unsigned>(component.kind << 8 | component.size)) +
                            L": " + ut::GuidToString(id);
        ut::ComPtr<IGWComponentHierarchy> nested;
        if (hierarchy->GetNestedHierarchy(component, IID_IGWComponentHierarchy, nested.PutVoid()) != S_OK)
            nested.Reset();
        log_.Write(line +
                   (nested ? L": IUnknown " + Address(nested.Get()) + L"\n" : std::wstring(L": VT_EMPTY\n")));
        if (nested)
            Write(nested.Get(), depth + 1);
        tagGWComponent child{};
        if (hierarchy->GetFirstChild(component, GWCOMPONENT_ANY_DEPTH, &child) != S_OK)
            return;
        if (!Within(depth + 1)) {
            More(depth + 1);
            return;
        }
        for (bool more = true; more;) {
            WriteComponent(hierarchy, child, depth + 1);
            tagGWComponent next{};
            more = hierarchy->GetNextSibling(child, GWCOMPONENT_ANY_DEPTH, &next) == S_OK;
            child = next;
        }
    }

    void More(int depth) { log_.Write(Indent(depth) + L"<more...>\n"); }

    bool Within(int depth) const { return level_ < 0 || depth <= level_; }

    ActiveDataLog& log_;
    int level_;
    std::vector<IUnknown*> open_; // the hierarchies being written, outermost first
};

bool DumpsAllowed() {
    ut::ComPtr<IGWApplication> application;
    (void)GWQueryGenericObject(CLSID_GWApplication, IID_IGWApplication, application.PutVoid());
    return application && application->AllowsDumps() == S_OK;
}

void DumpActiveData(IUnknown* object, const wchar_t* label, int level, const double* time) {
    if (!DumpsAllowed())
        return;
    std::wstring path;
    {
        std::lock_guard lock(settingsLock);
        path = LogPathOverride();
    }
    if (path.empty())
        path = ut::platform::DumpLogPath();
    ActiveDataLog log(ut::platform::OpenFileForAppend(path));
    std::wstring header = L"\n\nKXDumpActiveData [" + Address(object) + L"]";
    if (time)
        header += Format(" : TIME: %8.3lf", *time);
    if (label)
        header += std::wstring(L" : ") + label + L"\n";
    log.Write(header + L"\n");
    ut::ComPtr<IGWComponentHierarchy> hierarchy;
    if (object && SUCCEEDED(object->QueryInterface(IID_IGWComponentHierarchy, hierarchy.PutVoid())) &&
        hierarchy)
        HierarchyWriter(log, level).Write(hierarchy.Get(), 0);
    log.Write(L"KXDumpActiveData end\n");
}

} // namespace

long KXDumpPropertyContainer(IGWProperties* container, wchar_t* label) {
    (void)ut::ExportBoundary([&] {
        DumpContainer(container, label);
        return S_OK;
    });
    return S_OK;
}

void F3DMapGuidToName(const GUID& guid, std::FILE* file, CKXString* name) {
    (void)ut::ExportBoundary([&] {
        MapGuidToName(guid, file, name);
        return S_OK;
    });
}

long KXDumpActiveData(IUnknown* object, wchar_t* label, int level, double* time) {
    (void)ut::ExportBoundary([&] {
        DumpActiveData(object, label, level, time);
        return S_OK;
    });
    return S_OK;
}

namespace ut {

DumpOutput SetDumpOutput(DumpOutput output) {
    std::lock_guard lock(settingsLock);
    return std::exchange(OutputSink(), std::move(output));
}

std::wstring SetDumpLogPath(std::wstring path) {
    std::lock_guard lock(settingsLock);
    return std::exchange(LogPathOverride(), std::move(path));
}

} // namespace ut
