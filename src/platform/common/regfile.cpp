// ".reg" files on both homes, through the registry calls: the parser that reads a whole file into
// a list of operations before anything is written, the writer of exports, and the conversion of
// text values between the file's UTF-16LE and wchar_t in memory.
#include <algorithm>
#include <cstdint>
#include <cstring>
#include <new>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include <ut/platform/regfile.h>
#include <ut/platform/text.h>

namespace ut::platform {
namespace {

constexpr std::wstring_view kHeader = L"Windows Registry Editor Version 5.00";
constexpr bool kWideIsUtf16 = sizeof(wchar_t) == 2;
// Hex data wraps once a line reaches this many columns, as the system's editor wraps it.
constexpr std::size_t kHexWrapColumn = 77;
constexpr DWORD kLongestPath = 32767;

struct Root {
    std::wstring_view name;
    std::wstring_view shortName;
    HKEY key;
};

const Root* FindRoot(std::wstring_view name) {
    static const Root kRoots[] = {
        {L"HKEY_LOCAL_MACHINE", L"HKLM", HKEY_LOCAL_MACHINE},
        {L"HKEY_CLASSES_ROOT", L"HKCR", HKEY_CLASSES_ROOT},
        {L"HKEY_CURRENT_USER", L"HKCU", HKEY_CURRENT_USER},
    };
    auto same = [](std::wstring_view a, std::wstring_view b) {
        if (a.size() != b.size())
            return false;
        for (std::size_t i = 0; i < a.size(); ++i) {
            auto upper = [](wchar_t c) { return c >= L'a' && c <= L'z' ? static_cast<wchar_t>(c - 32) : c; };
            if (upper(a[i]) != upper(b[i]))
                return false;
        }
        return true;
    };
    for (const Root& root : kRoots)
        if (same(name, root.name) || same(name, root.shortName))
            return &root;
    return nullptr;
}

// A key path split into its root and the sub-key path below it, with empty names dropped.
struct KeyPath {
    const Root* root = nullptr;
    std::wstring subKey;
};

std::optional<KeyPath> SplitKeyPath(std::wstring_view text) {
    std::size_t cut = text.find(L'\\');
    KeyPath path;
    path.root = FindRoot(text.substr(0, cut));
    if (!path.root)
        return std::nullopt;
    while (cut != std::wstring_view::npos) {
        std::size_t next = text.find(L'\\', cut + 1);
        std::wstring_view name =
            text.substr(cut + 1, next == std::wstring_view::npos ? next : next - cut - 1);
        if (!name.empty())
            path.subKey.append(path.subKey.empty() ? L"" : L"\\").append(name);
        cut = next;
    }
    return path;
}

bool IsText(DWORD type) {
    return type == REG_SZ || type == REG_EXPAND_SZ || type == REG_MULTI_SZ;
}

// Text data in the file's layout (UTF-16LE) from the layout of memory, and back. Where wchar_t is
// UTF-16 the bytes pass as they are, odd ones included.
std::string FileBytes(DWORD type, std::string bytes) {
    if (!IsText(type) || kWideIsUtf16)
        return bytes;
    std::wstring text(bytes.size() / sizeof(wchar_t), L'\0');
    std::memcpy(text.data(), bytes.data(), text.size() * sizeof(wchar_t));
    std::string out;
    AppendUtf16Le(text, out);
    return out;
}

std::string MemoryBytes(DWORD type, std::string bytes) {
    if (!IsText(type) || kWideIsUtf16)
        return bytes;
    std::wstring text =
        WideFromUtf16Le(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size() / 2);
    return std::string(reinterpret_cast<const char*>(text.data()), text.size() * sizeof(wchar_t));
}

// ---- Import ----

struct Operation {
    enum Kind { kCreateKey, kDeleteKey, kSetValue, kDeleteValue };
    Operation(Kind kind, unsigned line) : kind(kind), line(line) {}

    Kind kind;
    unsigned line;
    const Root* root = nullptr;
    std::wstring path; // the key's sub-key path, or the value's name
    DWORD type = REG_NONE;
    std::string data; // in the file's layout
};

struct ParseError {
    unsigned line;
    std::wstring message;
};

// The input as wide text, from UTF-16 (either byte order, with its mark) or UTF-8.
std::optional<std::wstring> DecodeInput(const std::uint8_t* bytes, std::size_t size) {
    auto starts = [&](std::initializer_list<std::uint8_t> mark) {
        return size >= mark.size() && std::equal(mark.begin(), mark.end(), bytes);
    };
    if (starts({0xFF, 0xFE}) || starts({0xFE, 0xFF})) {
        if (size % 2 != 0)
            return std::nullopt;
        std::vector<std::uint8_t> little(bytes + 2, bytes + size);
        if (bytes[0] == 0xFE)
            for (std::size_t i = 0; i + 1 < little.size(); i += 2)
                std::swap(little[i], little[i + 1]);
        return WideFromUtf16Le(little.data(), little.size() / 2);
    }
    std::size_t skip = starts({0xEF, 0xBB, 0xBF}) ? 3 : 0;
    return WideFromUtf8(std::string_view(reinterpret_cast<const char*>(bytes) + skip, size - skip));
}

bool IsBlank(wchar_t c) {
    return c == L' ' || c == L'\t';
}

std::wstring_view Trim(std::wstring_view text) {
    while (!text.empty() && (IsBlank(text.front()) || text.front() == L'\r'))
        text.remove_prefix(1);
    while (!text.empty() && (IsBlank(text.back()) || text.back() == L'\r'))
        text.remove_suffix(1);
    return text;
}

int HexDigit(wchar_t c) {
    if (c >= L'0' && c <= L'9')
        return c - L'0';
    if (c >= L'a' && c <= L'f')
        return c - L'a' + 10;
    if (c >= L'A' && c <= L'F')
        return c - L'A' + 10;
    return -1;
}

// Reads 1 to 8 hex digits as a number.
std::optional<DWORD> ParseHexNumber(std::wstring_view digits) {
    if (digits.empty() || digits.size() > 8)
        return std::nullopt;
    DWORD value = 0;
    for (wchar_t c : digits) {
        int digit = HexDigit(c);
        if (digit < 0)
            return std::nullopt;
        value = (value << 4) | static_cast<DWORD>(digit);
    }
    return value;
}

class Parser {
public:
    explicit Parser(std::wstring_view text) {
        while (true) {
            std::size_t end = text.find(L'\n');
            lines_.push_back(text.substr(0, end));
            if (end == std::wstring_view::npos)
                break;
            text.remove_prefix(end + 1);
        }
    }

    std::optional<ParseError> Parse(std::vector<Operation>& operations) {
        if (Trim(lines_[0]) != kHeader)
            return ParseError{1, L"the first line is not \"" + std::wstring(kHeader) + L"\""};
        for (index_ = 1; index_ < lines_.size(); ++index_) {
            std::wstring_view line = Trim(lines_[index_]);
            std::optional<ParseError> error;
            if (line.empty() || line.front() == L';')
                continue;
            if (line.front() == L'[')
                error = ParseKey(line, operations);
            else if (line.front() == L'"' || line.front() == L'@')
                error = ParseValue(line, operations);
            else
                error = Error(L"the line is neither a key, a value nor a comment");
            if (error)
                return error;
        }
        return std::nullopt;
    }

private:
    unsigned LineNumber() const { return static_cast<unsigned>(index_ + 1); }
    ParseError Error(std::wstring message) const { return ParseError{LineNumber(), std::move(message)}; }

    std::optional<ParseError> ParseKey(std::wstring_view line, std::vector<Operation>& operations) {
        if (line.back() != L']')
            return Error(L"a key line must end with ']'");
        std::wstring_view inside = line.substr(1, line.size() - 2);
        bool deletion = !inside.empty() && inside.front() == L'-';
        if (deletion)
            inside.remove_prefix(1);
        std::optional<KeyPath> path = SplitKeyPath(inside);
        if (!path)
            return Error(L"unknown root key: " + std::wstring(inside.substr(0, inside.find(L'\\'))));
        if (deletion && path->subKey.empty())
            return Error(L"a root key cannot be deleted");
        Operation operation(deletion ? Operation::kDeleteKey : Operation::kCreateKey, LineNumber());
        operation.root = path->root;
        operation.path = std::move(path->subKey);
        operations.push_back(std::move(operation));
        inKey_ = !deletion;
        return std::nullopt;
    }

    // Reads a quoted string starting at text[0] == '"', leaving `text` after the closing quote.
    std::optional<ParseError> ParseQuoted(std::wstring_view& text, std::wstring& out) const {
        for (std::size_t i = 1; i < text.size(); ++i) {
            wchar_t c = text[i];
            if (c == L'"') {
                text.remove_prefix(i + 1);
                return std::nullopt;
            }
            if (c != L'\\') {
                out.push_back(c);
                continue;
            }
            if (++i == text.size())
                break;
            switch (text[i]) {
            case L'\\':
            case L'"':
                out.push_back(text[i]);
                break;
            case L'n':
                out.push_back(L'\n');
                break;
            case L'r':
                out.push_back(L'\r');
                break;
            case L'0':
                out.push_back(L'\0');
                break;
            default:
                return Error(L"unknown escape \\" + std::wstring(1, text[i]));
            }
        }
        return Error(L"a quoted string is not closed on its line");
    }

    std::optional<ParseError> ParseValue(std::wstring_view line, std::vector<Operation>& operations) {
        if (!inKey_)
            return Error(L"a value must follow a key line");
        Operation operation(Operation::kSetValue, LineNumber());
        if (line.front() == L'@') {
            line.remove_prefix(1);
        } else if (auto error = ParseQuoted(line, operation.path)) {
            return error;
        }
        line = Trim(line);
        if (line.empty() || line.front() != L'=')
            return Error(L"'=' is missing after the value name");
        line = Trim(line.substr(1));
        std::optional<ParseError> error;
        if (line == L"-") {
            operation.kind = Operation::kDeleteValue;
        } else if (!line.empty() && line.front() == L'"') {
            error = ParseString(line, operation);
        } else if (line.substr(0, 6) == L"dword:") {
            error = ParseDword(line.substr(6), operation);
        } else if (line.substr(0, 3) == L"hex") {
            error = ParseHex(line.substr(3), operation);
        } else {
            error = Error(L"the value's data is not \"text\", dword:, hex: or hex(type):");
        }
        if (error)
            return error;
        operations.push_back(std::move(operation));
        return std::nullopt;
    }

    std::optional<ParseError> ParseString(std::wstring_view line, Operation& operation) const {
        std::wstring text;
        if (auto error = ParseQuoted(line, text))
            return error;
        if (!Trim(line).empty())
            return Error(L"unexpected text after the closing quote");
        text.push_back(L'\0');
        operation.type = REG_SZ;
        AppendUtf16Le(text, operation.data);
        return std::nullopt;
    }

    std::optional<ParseError> ParseDword(std::wstring_view digits, Operation& operation) const {
        std::optional<DWORD> value = ParseHexNumber(Trim(digits));
        if (!value)
            return Error(L"dword: needs 1 to 8 hexadecimal digits");
        operation.type = REG_DWORD;
        for (int shift = 0; shift < 32; shift += 8)
            operation.data.push_back(static_cast<char>((*value >> shift) & 0xFF));
        return std::nullopt;
    }

    // After "hex": an optional "(type)", a colon, and the bytes, which may continue on the lines
    // that follow while a line ends with a backslash.
    std::optional<ParseError> ParseHex(std::wstring_view rest, Operation& operation) {
        operation.type = REG_BINARY;
        if (!rest.empty() && rest.front() == L'(') {
            std::size_t close = rest.find(L')');
            std::optional<DWORD> type =
                close == std::wstring_view::npos ? std::nullopt : ParseHexNumber(rest.substr(1, close - 1));
            if (!type)
                return Error(L"hex( needs a hexadecimal type and ')'");
            operation.type = *type;
            rest.remove_prefix(close + 1);
        }
        if (rest.empty() || rest.front() != L':')
            return Error(L"':' is missing after hex");
        rest.remove_prefix(1);
        while (true) {
            rest = Trim(rest);
            bool continues = !rest.empty() && rest.back() == L'\\';
            if (continues)
                rest.remove_suffix(1);
            if (auto error = ParseHexBytes(rest, operation.data))
                return error;
            if (!continues)
                return std::nullopt;
            if (index_ + 1 == lines_.size())
                return Error(L"the data continues past the end of the file");
            rest = lines_[++index_];
            if (Trim(rest).empty())
                return Error(L"the data continues on an empty line");
        }
    }

    std::optional<ParseError> ParseHexBytes(std::wstring_view text, std::string& out) const {
        while (true) {
            text = Trim(text);
            if (text.empty())
                return std::nullopt;
            std::size_t comma = text.find(L',');
            std::wstring_view digits = Trim(text.substr(0, comma));
            int high = digits.size() == 2 ? HexDigit(digits[0]) : -1;
            int low = digits.size() == 2 ? HexDigit(digits[1]) : -1;
            if (high < 0 || low < 0)
                return Error(L"hex data must be two-digit hexadecimal bytes separated by commas");
            out.push_back(static_cast<char>(high * 16 + low));
            if (comma == std::wstring_view::npos)
                return std::nullopt;
            text.remove_prefix(comma + 1);
        }
    }

    std::vector<std::wstring_view> lines_;
    std::size_t index_ = 0;
    bool inKey_ = false;
};

// Sets a value from data in the file's layout. A unit that is not zero follows text in memory, so
// that the registry keeps text without a terminator as it is instead of completing it.
LONG SetValue(HKEY key, const Operation& operation) {
    std::string bytes = MemoryBytes(operation.type, operation.data);
    std::size_t size = bytes.size();
    if (IsText(operation.type))
        bytes.append(sizeof(wchar_t), '\x01');
    return RegSetValueExW(key, operation.path.c_str(), 0, operation.type,
                          reinterpret_cast<const BYTE*>(bytes.data()), static_cast<DWORD>(size));
}

LONG Apply(const std::vector<Operation>& operations, RegFileProblem& problem) {
    RegistryTransaction transaction;
    if (transaction.Status() != ERROR_SUCCESS) {
        problem = {0, L"the registry cannot be written"};
        return transaction.Status();
    }
    UniqueHKey current;
    for (const Operation& operation : operations) {
        LONG result = ERROR_SUCCESS;
        switch (operation.kind) {
        case Operation::kCreateKey: {
            HKEY created = nullptr;
            result =
                RegCreateKeyExW(operation.root->key, operation.path.c_str(), 0, nullptr,
                                REG_OPTION_NON_VOLATILE, KEY_READ | KEY_WRITE, nullptr, &created, nullptr);
            current.reset(result == ERROR_SUCCESS ? created : nullptr);
            break;
        }
        case Operation::kDeleteKey:
            result = RegDeleteTreeW(operation.root->key, operation.path.c_str());
            break;
        case Operation::kSetValue:
            result = SetValue(current.get(), operation);
            break;
        case Operation::kDeleteValue:
            result = RegDeleteValueW(current.get(), operation.path.c_str());
            break;
        }
        if (result == ERROR_FILE_NOT_FOUND &&
            (operation.kind == Operation::kDeleteKey || operation.kind == Operation::kDeleteValue))
            result = ERROR_SUCCESS;
        if (result != ERROR_SUCCESS) {
            problem = {operation.line,
                       L"the registry refused this line (error " + std::to_wstring(result) + L")"};
            return result;
        }
    }
    LONG committed = transaction.Commit();
    if (committed != ERROR_SUCCESS)
        problem = {0,
                   L"the registry could not commit the import (error " + std::to_wstring(committed) + L")"};
    return committed;
}

// ---- Export ----

void AppendEscaped(std::wstring& out, std::wstring_view text) {
    for (wchar_t c : text) {
        if (c == L'\\' || c == L'"')
            out.push_back(L'\\');
        if (c == L'\n')
            out.append(L"\\n");
        else if (c == L'\r')
            out.append(L"\\r");
        else
            out.push_back(c);
    }
}

// The text of a REG_SZ value when it is one terminated string without control characters, the
// only form the quoted notation gives back exactly.
std::optional<std::wstring> PlainText(const std::string& bytes) {
    if (bytes.size() < sizeof(wchar_t) || bytes.size() % sizeof(wchar_t) != 0)
        return std::nullopt;
    std::wstring text(bytes.size() / sizeof(wchar_t), L'\0');
    std::memcpy(text.data(), bytes.data(), bytes.size());
    if (text.back() != L'\0')
        return std::nullopt;
    text.pop_back();
    for (wchar_t c : text)
        if (c < 0x20)
            return std::nullopt;
    return text;
}

void AppendHex(std::wstring& out, std::size_t column, const std::string& bytes) {
    static constexpr wchar_t kDigits[] = L"0123456789abcdef";
    for (std::size_t i = 0; i < bytes.size(); ++i) {
        auto byte = static_cast<unsigned char>(bytes[i]);
        out.push_back(kDigits[byte >> 4]);
        out.push_back(kDigits[byte & 0xF]);
        if (i + 1 == bytes.size())
            break;
        out.push_back(L',');
        column += 3;
        if (column >= kHexWrapColumn) {
            out.append(L"\\\r\n  ");
            column = 2;
        }
    }
}

void AppendValue(std::wstring& out, const std::wstring& name, DWORD type, const std::string& bytes) {
    std::size_t lineStart = out.size();
    if (name.empty()) {
        out.push_back(L'@');
    } else {
        out.push_back(L'"');
        AppendEscaped(out, name);
        out.push_back(L'"');
    }
    out.push_back(L'=');
    std::optional<std::wstring> text = type == REG_SZ ? PlainText(bytes) : std::nullopt;
    if (text) {
        out.push_back(L'"');
        AppendEscaped(out, *text);
        out.append(L"\"\r\n");
        return;
    }
    if (type == REG_DWORD && bytes.size() == 4) {
        DWORD value = 0;
        for (int i = 3; i >= 0; --i)
            value = (value << 8) | static_cast<unsigned char>(bytes[static_cast<std::size_t>(i)]);
        wchar_t digits[9];
        for (int i = 7; i >= 0; --i, value >>= 4)
            digits[i] = L"0123456789abcdef"[value & 0xF];
        out.append(L"dword:").append(digits, 8).append(L"\r\n");
        return;
    }
    out.append(L"hex");
    if (type != REG_BINARY) {
        wchar_t digits[9];
        int count = 0;
        DWORD rest = type;
        do {
            digits[count++] = L"0123456789abcdef"[rest & 0xF];
            rest >>= 4;
        } while (rest);
        out.push_back(L'(');
        while (count)
            out.push_back(digits[--count]);
        out.push_back(L')');
    }
    out.push_back(L':');
    std::wstring_view line(out.data() + lineStart, out.size() - lineStart);
    AppendHex(out, Utf16Length(line), FileBytes(type, bytes));
    out.append(L"\r\n");
}

LONG ExportValues(HKEY key, std::wstring& out) {
    std::wstring name(256, L'\0');
    std::string data(256, '\0');
    for (DWORD index = 0;; ++index) {
        DWORD nameLength = static_cast<DWORD>(name.size());
        DWORD size = static_cast<DWORD>(data.size());
        DWORD type = REG_NONE;
        LONG result = RegEnumValueW(key, index, name.data(), &nameLength, nullptr, &type,
                                    reinterpret_cast<BYTE*>(data.data()), &size);
        if (result == ERROR_NO_MORE_ITEMS)
            return ERROR_SUCCESS;
        if (result == ERROR_MORE_DATA) {
            // Grow to what the key needs and read the same index again.
            DWORD longestName = 0, largest = 0;
            result = RegQueryInfoKeyW(key, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr,
                                      &longestName, &largest, nullptr, nullptr);
            if (result != ERROR_SUCCESS)
                return result;
            name.resize(std::max<std::size_t>(name.size(), longestName + 1u) * 2);
            data.resize(std::max<std::size_t>({data.size(), largest, size}) * 2);
            --index;
            continue;
        }
        if (result != ERROR_SUCCESS)
            return result;
        AppendValue(out, std::wstring(name.data(), nameLength), type, data.substr(0, size));
    }
}

LONG ExportKey(HKEY key, const std::wstring& path, std::wstring& out) {
    out.append(L"[").append(path).append(L"]\r\n");
    LONG result = ExportValues(key, out);
    if (result != ERROR_SUCCESS)
        return result;
    out.append(L"\r\n");
    std::wstring name(256, L'\0');
    for (DWORD index = 0;; ++index) {
        DWORD nameLength = static_cast<DWORD>(name.size());
        result = RegEnumKeyExW(key, index, name.data(), &nameLength, nullptr, nullptr, nullptr, nullptr);
        if (result == ERROR_NO_MORE_ITEMS)
            return ERROR_SUCCESS;
        if (result == ERROR_MORE_DATA && name.size() < kLongestPath) {
            name.resize(name.size() * 2);
            --index;
            continue;
        }
        if (result != ERROR_SUCCESS)
            return result;
        std::wstring childName(name.data(), nameLength);
        HKEY child = nullptr;
        result = RegOpenKeyExW(key, childName.c_str(), 0, KEY_READ, &child);
        if (result != ERROR_SUCCESS)
            return result;
        UniqueHKey owned(child);
        result = ExportKey(child, path + L"\\" + childName, out);
        if (result != ERROR_SUCCESS)
            return result;
    }
}

} // namespace

LONG OpenKeyPath(const wchar_t* keyPath, REGSAM access, HKEY* key) {
    try {
        if (!key)
            return ERROR_INVALID_PARAMETER;
        *key = nullptr;
        std::optional<KeyPath> path = SplitKeyPath(keyPath ? keyPath : L"");
        if (!path)
            return ERROR_BAD_PATHNAME;
        return RegOpenKeyExW(path->root->key, path->subKey.c_str(), 0, access, key);
    } catch (const std::bad_alloc&) {
        return ERROR_OUTOFMEMORY;
    }
}

LONG ExportRegFile(const wchar_t* keyPath, std::string& bytes) {
    try {
        std::optional<KeyPath> path = SplitKeyPath(keyPath ? keyPath : L"");
        HKEY key = nullptr;
        LONG result = OpenKeyPath(keyPath, KEY_READ, &key);
        if (result != ERROR_SUCCESS)
            return result;
        UniqueHKey owned(key);
        std::wstring text(kHeader);
        text.append(L"\r\n\r\n");
        std::wstring name(path->root->name);
        if (!path->subKey.empty())
            name.append(L"\\").append(path->subKey);
        result = ExportKey(key, name, text);
        if (result != ERROR_SUCCESS)
            return result;
        bytes.assign("\xFF\xFE");
        AppendUtf16Le(text, bytes);
        return ERROR_SUCCESS;
    } catch (const std::bad_alloc&) {
        return ERROR_OUTOFMEMORY;
    }
}

LONG ImportRegFile(const void* bytes, std::size_t size, RegFileProblem* problem) {
    try {
        RegFileProblem ignored;
        RegFileProblem& report = problem ? *problem : ignored;
        report = {};
        if (!bytes && size)
            return ERROR_INVALID_PARAMETER;
        std::optional<std::wstring> text =
            DecodeInput(static_cast<const std::uint8_t*>(bytes ? bytes : ""), bytes ? size : 0);
        if (!text) {
            report = {0, L"the UTF-16 input has an odd number of bytes"};
            return ERROR_INVALID_DATA;
        }
        std::vector<Operation> operations;
        if (std::optional<ParseError> error = Parser(*text).Parse(operations)) {
            report = {error->line, std::move(error->message)};
            return ERROR_INVALID_DATA;
        }
        return Apply(operations, report);
    } catch (const std::bad_alloc&) {
        return ERROR_OUTOFMEMORY;
    }
}

} // namespace ut::platform
