// COM basics for POSIX: the last error, task memory, GUID text and the in-process class table.
#include <cstdlib>
#include <mutex>
#include <vector>

#include <ut/platform/com.h>

namespace {

constexpr int kGuidTextLength = 38;

int HexValue(wchar_t c) {
    if (c >= L'0' && c <= L'9')
        return c - L'0';
    if (c >= L'a' && c <= L'f')
        return c - L'a' + 10;
    if (c >= L'A' && c <= L'F')
        return c - L'A' + 10;
    return -1;
}

// Reads `digits` hex digits at text[at]; false on any non-hex character.
template <class Unsigned>
bool ReadHex(const wchar_t* text, int at, int digits, Unsigned& value) {
    value = 0;
    for (int i = 0; i < digits; ++i) {
        int nibble = HexValue(text[at + i]);
        if (nibble < 0)
            return false;
        value = static_cast<Unsigned>((value << 4) | static_cast<Unsigned>(nibble));
    }
    return true;
}

bool ParseBracedGuid(const wchar_t* text, GUID& guid) {
    for (int i = 0; i < kGuidTextLength; ++i)
        if (text[i] == L'\0')
            return false;
    if (text[0] != L'{' || text[9] != L'-' || text[14] != L'-' || text[19] != L'-' || text[24] != L'-' ||
        text[37] != L'}' || text[38] != L'\0')
        return false;
    if (!ReadHex(text, 1, 8, guid.Data1) || !ReadHex(text, 10, 4, guid.Data2) ||
        !ReadHex(text, 15, 4, guid.Data3))
        return false;
    static constexpr int kByteAt[8] = {20, 22, 25, 27, 29, 31, 33, 35};
    for (int i = 0; i < 8; ++i)
        if (!ReadHex(text, kByteAt[i], 2, guid.Data4[i]))
            return false;
    return true;
}

struct ClassEntry {
    DWORD cookie;
    CLSID clsid;
    IUnknown* factory;
};

struct ClassTable {
    std::mutex mutex;
    std::vector<ClassEntry> entries;
    DWORD nextCookie = 1;
};

// Never destroyed, like the registries above it: modules revoke classes while the process exits.
ClassTable& Classes() {
    static ClassTable* table = new ClassTable;
    return *table;
}

// Finds the factory registered for clsid and returns it with a new reference.
IUnknown* FindFactory(REFCLSID clsid) {
    ClassTable& table = Classes();
    std::lock_guard lock(table.mutex);
    for (const ClassEntry& entry : table.entries) {
        if (IsEqualGUID(entry.clsid, clsid)) {
            entry.factory->AddRef();
            return entry.factory;
        }
    }
    return nullptr;
}

thread_local DWORD lastError = 0;

} // namespace

extern "C" {

DWORD GetLastError() { return lastError; }
void SetLastError(DWORD code) { lastError = code; }

void* CoTaskMemAlloc(SIZE_T size) { return std::malloc(size ? size : 1); }

void* CoTaskMemRealloc(void* block, SIZE_T size) { return std::realloc(block, size ? size : 1); }

void CoTaskMemFree(void* block) { std::free(block); }

int StringFromGUID2(REFGUID guid, LPOLESTR text, int capacity) {
    if (!text || capacity < kGuidTextLength + 1)
        return 0;
    static constexpr wchar_t kDigits[] = L"0123456789ABCDEF";
    int at = 0;
    auto put = [&](std::uint32_t value, int digits) {
        for (int shift = (digits - 1) * 4; shift >= 0; shift -= 4)
            text[at++] = kDigits[(value >> shift) & 0xF];
    };
    text[at++] = L'{';
    put(guid.Data1, 8);
    text[at++] = L'-';
    put(guid.Data2, 4);
    text[at++] = L'-';
    put(guid.Data3, 4);
    text[at++] = L'-';
    put(guid.Data4[0], 2);
    put(guid.Data4[1], 2);
    text[at++] = L'-';
    for (int i = 2; i < 8; ++i)
        put(guid.Data4[i], 2);
    text[at++] = L'}';
    text[at++] = L'\0';
    return at;
}

HRESULT CLSIDFromString(LPCOLESTR text, CLSID* clsid) {
    if (!clsid)
        return E_INVALIDARG;
    if (!text || text[0] == L'\0') {
        *clsid = GUID_NULL;
        return S_OK;
    }
    GUID parsed{};
    if (!ParseBracedGuid(text, parsed))
        return CO_E_CLASSSTRING;
    *clsid = parsed;
    return S_OK;
}

HRESULT IIDFromString(LPCOLESTR text, IID* iid) { return CLSIDFromString(text, iid); }

HRESULT CoInitializeEx(void*, DWORD) { return S_OK; }

void CoUninitialize() {}

HRESULT CoRegisterClassObject(REFCLSID clsid, IUnknown* factory, DWORD, DWORD, DWORD* cookie) {
    if (!factory || !cookie)
        return E_INVALIDARG;
    ClassTable& table = Classes();
    std::lock_guard lock(table.mutex);
    factory->AddRef();
    *cookie = table.nextCookie++;
    table.entries.push_back({*cookie, clsid, factory});
    return S_OK;
}

HRESULT CoRevokeClassObject(DWORD cookie) {
    IUnknown* factory = nullptr;
    {
        ClassTable& table = Classes();
        std::lock_guard lock(table.mutex);
        for (auto it = table.entries.begin(); it != table.entries.end(); ++it) {
            if (it->cookie == cookie) {
                factory = it->factory;
                table.entries.erase(it);
                break;
            }
        }
    }
    if (!factory)
        return E_INVALIDARG;
    factory->Release();
    return S_OK;
}

HRESULT CoGetClassObject(REFCLSID clsid, DWORD, void*, REFIID iid, void** object) {
    if (!object)
        return E_POINTER;
    *object = nullptr;
    ut::ComPtr<IUnknown> factory = ut::ComPtr<IUnknown>::Adopt(FindFactory(clsid));
    if (!factory)
        return REGDB_E_CLASSNOTREG;
    return factory->QueryInterface(iid, object);
}

HRESULT CoCreateInstance(REFCLSID clsid, IUnknown* outer, DWORD context, REFIID iid, void** object) {
    if (!object)
        return E_POINTER;
    *object = nullptr;
    ut::ComPtr<IClassFactory> factory;
    HRESULT hr = CoGetClassObject(clsid, context, nullptr, IID_IClassFactory, factory.PutVoid());
    if (FAILED(hr))
        return hr;
    return factory->CreateInstance(outer, iid, object);
}

} // extern "C"
