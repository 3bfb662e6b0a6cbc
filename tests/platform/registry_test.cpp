// The registry calls answer alike on both homes: the same tables run against the system's
// registry on Windows and against the store of our own on POSIX.
#include <functional>

#include <gtest/gtest.h>

#include "registry_helpers.h"
#include "support/registry_scratch.h"

namespace {

using namespace ut::test;
using ut::UniqueHKey;

class Registry : public testing::Test {
protected:
    void SetUp() override { ASSERT_NE(scratch_.Get(), nullptr); }
    HKEY Scratch() const { return scratch_.Get(); }

    ScratchKey scratch_;
};

TEST_F(Registry, EveryTypeRoundTripsByteForByte) {
    struct Case {
        const char* label;
        DWORD type;
        Bytes data;
    };
    const Case cases[] = {
        {"REG_SZ", REG_SZ, TextBytes(L"plain text")},
        {"REG_SZ empty", REG_SZ, TextBytes(L"")},
        {"REG_SZ beyond ASCII", REG_SZ, TextBytes(L"\u00c4pfel \u00e9t\u00e9 \u4e2d\u6587")},
        {"REG_SZ beyond the basic plane", REG_SZ, TextBytes(L"clip \U0001F3AC")},
        {"REG_EXPAND_SZ", REG_EXPAND_SZ, TextBytes(L"%TEMP%\\ut")},
        {"REG_MULTI_SZ", REG_MULTI_SZ, MultiBytes({L"one", L"two \u00df"})},
        {"REG_DWORD", REG_DWORD, LittleEndian(0x12345678, 4)},
        {"REG_DWORD of 3 bytes", REG_DWORD, LittleEndian(0x030201, 3)},
        {"REG_QWORD", REG_QWORD, LittleEndian(0x0102030405060708, 8)},
        {"REG_BINARY", REG_BINARY, Bytes{0, 1, 2, 0xFE, 0xFF, 0}},
        {"REG_BINARY empty", REG_BINARY, Bytes{}},
        {"REG_NONE", REG_NONE, Bytes{}},
        {"REG_NONE with bytes", REG_NONE, Bytes{7, 8, 9}},
        {"type 0x55", 0x55, Bytes{1, 2}},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.label);
        ASSERT_EQ(SetValue(Scratch(), L"v", c.type, c.data), ERROR_SUCCESS);
        Value read = QueryValue(Scratch(), L"v");
        EXPECT_EQ(read.result, ERROR_SUCCESS);
        EXPECT_EQ(read.type, c.type);
        EXPECT_EQ(read.data, c.data);

        wchar_t name[8];
        DWORD nameLength = 8, type = 0, size = static_cast<DWORD>(c.data.size() + 16);
        Bytes listed(size);
        ASSERT_EQ(RegEnumValueW(Scratch(), 0, name, &nameLength, nullptr, &type, listed.data(), &size),
                  ERROR_SUCCESS);
        listed.resize(size);
        EXPECT_EQ(std::wstring(name, nameLength), L"v");
        EXPECT_EQ(type, c.type);
        EXPECT_EQ(listed, c.data);
    }
}

TEST_F(Registry, TextTerminatorsFollowTheSystemsRules) {
    // A count that leaves out a terminator present in memory gets it added; text stored without
    // one is read back as stored, with a terminator after it only when the buffer has room.
    const wchar_t counted[] = L"hello";
    ASSERT_EQ(RegSetValueExW(Scratch(), L"forgot", 0, REG_SZ, reinterpret_cast<const BYTE*>(counted),
                             5 * sizeof(wchar_t)),
              ERROR_SUCCESS);
    EXPECT_EQ(QueryValue(Scratch(), L"forgot").data, TextBytes(L"hello"));

    const wchar_t open[] = L"abcX";
    ASSERT_EQ(RegSetValueExW(Scratch(), L"open", 0, REG_SZ, reinterpret_cast<const BYTE*>(open),
                             3 * sizeof(wchar_t)),
              ERROR_SUCCESS);
    struct Case {
        DWORD room; // in characters
        bool terminated;
    };
    for (Case c : {Case{3, false}, Case{4, true}, Case{8, true}}) {
        SCOPED_TRACE(c.room);
        wchar_t buffer[8];
        std::fill(std::begin(buffer), std::end(buffer), L'#');
        DWORD size = c.room * sizeof(wchar_t);
        ASSERT_EQ(
            RegQueryValueExW(Scratch(), L"open", nullptr, nullptr, reinterpret_cast<BYTE*>(buffer), &size),
            ERROR_SUCCESS);
        EXPECT_EQ(size, 3 * sizeof(wchar_t));
        EXPECT_EQ(std::wstring(buffer, 3), L"abc");
        EXPECT_EQ(buffer[3], c.terminated ? L'\0' : L'#');
    }
}

TEST_F(Registry, DefaultValueHasTheEmptyName) {
    ASSERT_EQ(SetText(Scratch(), nullptr, L"default"), ERROR_SUCCESS);
    EXPECT_EQ(QueryValue(Scratch(), L"").data, TextBytes(L"default"));
    EXPECT_EQ(QueryValue(Scratch(), nullptr).data, TextBytes(L"default"));
    EXPECT_EQ(ValueNames(Scratch()), std::vector<std::wstring>{L""});
}

TEST_F(Registry, FailuresAnswerTheSystemsCodes) {
    UniqueHKey closed = CreateKey(Scratch(), L"closed");
    ASSERT_TRUE(closed);
    HKEY stale = closed.release();
    ASSERT_EQ(RegCloseKey(stale), ERROR_SUCCESS);
    struct Case {
        const char* label;
        std::function<LONG(HKEY)> call;
        LONG expected;
    };
    HKEY out = nullptr;
    DWORD size = 4, type = 0, length = 16;
    BYTE data[4];
    wchar_t name[16];
    const Case cases[] = {
        {"open a missing key", [&](HKEY k) { return RegOpenKeyExW(k, L"missing", 0, KEY_READ, &out); },
         ERROR_FILE_NOT_FOUND},
        {"open below a missing key",
         [&](HKEY k) { return RegOpenKeyExW(k, L"missing\\deeper", 0, KEY_READ, &out); },
         ERROR_FILE_NOT_FOUND},
        {"open without a result", [](HKEY k) { return RegOpenKeyExW(k, L"x", 0, KEY_READ, nullptr); },
         ERROR_INVALID_PARAMETER},
        {"create a path that starts with a backslash",
         [&](HKEY k) {
             return RegCreateKeyExW(k, L"\\lead", 0, nullptr, 0, KEY_ALL_ACCESS, nullptr, &out, nullptr);
         },
         ERROR_BAD_PATHNAME},
        {"query a missing value",
         [&](HKEY k) { return RegQueryValueExW(k, L"missing", nullptr, &type, data, &size); },
         ERROR_FILE_NOT_FOUND},
        {"query data without a byte count",
         [&](HKEY k) { return RegQueryValueExW(k, L"missing", nullptr, &type, data, nullptr); },
         ERROR_INVALID_PARAMETER},
        {"set data from a null pointer",
         [](HKEY k) { return RegSetValueExW(k, L"v", 0, REG_BINARY, nullptr, 4); }, ERROR_NOACCESS},
        {"delete a missing value", [](HKEY k) { return RegDeleteValueW(k, L"missing"); },
         ERROR_FILE_NOT_FOUND},
        {"delete a missing key", [](HKEY k) { return RegDeleteKeyW(k, L"missing"); }, ERROR_FILE_NOT_FOUND},
        {"delete a key without a name", [](HKEY k) { return RegDeleteKeyW(k, nullptr); },
         ERROR_INVALID_PARAMETER},
        {"delete a root", [](HKEY) { return RegDeleteKeyW(HKEY_CURRENT_USER, L""); }, ERROR_ACCESS_DENIED},
        {"list sub-keys past the last",
         [&](HKEY k) { return RegEnumKeyExW(k, 1, name, &length, nullptr, nullptr, nullptr, nullptr); },
         ERROR_NO_MORE_ITEMS},
        {"list values past the last",
         [&](HKEY k) { return RegEnumValueW(k, 0, name, &length, nullptr, &type, data, &size); },
         ERROR_NO_MORE_ITEMS},
        {"use a closed handle",
         [&](HKEY) { return RegQueryValueExW(stale, L"v", nullptr, &type, nullptr, &size); },
         ERROR_INVALID_HANDLE},
        {"use a null handle",
         [&](HKEY) { return RegQueryValueExW(nullptr, L"v", nullptr, &type, nullptr, &size); },
         ERROR_INVALID_HANDLE},
        {"close a closed handle", [&](HKEY) { return RegCloseKey(stale); }, ERROR_INVALID_HANDLE},
        {"close a null handle", [](HKEY) { return RegCloseKey(nullptr); }, ERROR_INVALID_HANDLE},
        {"close a root", [](HKEY) { return RegCloseKey(HKEY_LOCAL_MACHINE); }, ERROR_SUCCESS},
    };
    for (const Case& c : cases) {
        length = 16;
        size = 4;
        EXPECT_EQ(c.call(Scratch()), c.expected) << c.label;
    }
}

TEST_F(Registry, AHandleToADeletedKeyAnswersKeyDeleted) {
    UniqueHKey doomed = CreateKey(Scratch(), L"doomed");
    ASSERT_TRUE(doomed);
    ASSERT_EQ(SetText(doomed.get(), L"v", L"x"), ERROR_SUCCESS);
    ASSERT_EQ(RegDeleteKeyW(Scratch(), L"doomed"), ERROR_SUCCESS);
    HKEY out = nullptr;
    DWORD size = 0, length = 16, count = 0;
    wchar_t name[16];
    const std::pair<const char*, std::function<LONG()>> calls[] = {
        {"set", [&] { return SetText(doomed.get(), L"v", L"y"); }},
        {"query", [&] { return RegQueryValueExW(doomed.get(), L"v", nullptr, nullptr, nullptr, &size); }},
        {"delete value", [&] { return RegDeleteValueW(doomed.get(), L"v"); }},
        {"list sub-keys",
         [&] { return RegEnumKeyExW(doomed.get(), 0, name, &length, nullptr, nullptr, nullptr, nullptr); }},
        {"list values",
         [&] { return RegEnumValueW(doomed.get(), 0, name, &length, nullptr, nullptr, nullptr, nullptr); }},
        {"create below",
         [&] {
             return RegCreateKeyExW(doomed.get(), L"x", 0, nullptr, 0, KEY_READ, nullptr, &out, nullptr);
         }},
        {"open below", [&] { return RegOpenKeyExW(doomed.get(), L"x", 0, KEY_READ, &out); }},
        {"key information",
         [&] {
             return RegQueryInfoKeyW(doomed.get(), nullptr, nullptr, nullptr, &count, nullptr, nullptr,
                                     nullptr, nullptr, nullptr, nullptr, nullptr);
         }},
    };
    for (const auto& [label, call] : calls)
        EXPECT_EQ(call(), ERROR_KEY_DELETED) << label;
    EXPECT_EQ(RegCloseKey(doomed.release()), ERROR_SUCCESS);
}

TEST_F(Registry, NamesAreCaseInsensitiveAndKeepTheirFirstCase) {
    struct Case {
        const wchar_t* created;
        const wchar_t* opened;
        bool same;
    };
    const Case cases[] = {
        {L"MixedCase", L"mixedcase", true},
        {L"MixedCase", L"MIXEDCASE", true},
        {L"\u00c4pfel", L"\u00e4PFEL", true},                 // Äpfel, äPFEL
        {L"\u00e9clair", L"\u00c9CLAIR", true},               // éclair, ÉCLAIR
        {L"\u00ffe", L"\u0178E", true},                       // ÿe, ŸE
        {L"\u041c\u0438\u0440", L"\u041c\u0418\u0420", true}, // Мир, МИР
        {L"Stra\u00dfe", L"STRASSE", false},                  // no folding into two letters
        {L"\u00df", L"\u1e9e", false},                        // ß and capital ẞ stay apart
        {L"a", L"\u00e0", false},                             // accents are not dropped
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(Narrow(c.created) + " / " + Narrow(c.opened));
        UniqueHKey parent = CreateKey(Scratch(), L"case");
        ASSERT_TRUE(parent);
        DWORD first = 0, second = 0;
        ASSERT_TRUE(CreateKey(parent.get(), c.created, KEY_ALL_ACCESS, &first));
        ASSERT_TRUE(CreateKey(parent.get(), c.opened, KEY_ALL_ACCESS, &second));
        EXPECT_EQ(first, static_cast<DWORD>(REG_CREATED_NEW_KEY));
        EXPECT_EQ(second, static_cast<DWORD>(c.same ? REG_OPENED_EXISTING_KEY : REG_CREATED_NEW_KEY));
        if (c.same)
            EXPECT_EQ(SubKeyNames(parent.get()), std::vector<std::wstring>{c.created});
        else
            EXPECT_EQ(SubKeyNames(parent.get()).size(), 2u);
        parent.reset();
        ASSERT_EQ(RegDeleteTreeW(Scratch(), L"case"), ERROR_SUCCESS);
    }

    ASSERT_EQ(SetText(Scratch(), L"Name", L"text"), ERROR_SUCCESS);
    ASSERT_EQ(SetValue(Scratch(), L"NAME", REG_DWORD, LittleEndian(7, 4)), ERROR_SUCCESS);
    EXPECT_EQ(ValueNames(Scratch()), std::vector<std::wstring>{L"Name"});
    EXPECT_EQ(QueryValue(Scratch(), L"nAmE").type, static_cast<DWORD>(REG_DWORD));
}

TEST_F(Registry, SubKeysEnumerateInCaseInsensitiveOrder) {
    const wchar_t* created[] = {L"b",     L"Zeta", L"{0A}", L"a.b", L"C2", L"1",
                                L"alpha", L"a b",  L"c10",  L"A",   L"a-b"};
    for (const wchar_t* name : created)
        ASSERT_TRUE(CreateKey(Scratch(), name));
    const std::vector<std::wstring> expected = {L"1", L"A",   L"a b", L"a-b",  L"a.b", L"alpha",
                                                L"b", L"c10", L"C2",  L"Zeta", L"{0A}"};
    EXPECT_EQ(SubKeyNames(Scratch()), expected);

    // Values come back once each, in the same order on every walk.
    for (const wchar_t* name : created)
        ASSERT_EQ(SetText(Scratch(), name, name), ERROR_SUCCESS);
    std::vector<std::wstring> values = ValueNames(Scratch());
    EXPECT_EQ(values, ValueNames(Scratch()));
    std::sort(values.begin(), values.end());
    std::vector<std::wstring> sorted(std::begin(created), std::end(created));
    std::sort(sorted.begin(), sorted.end());
    EXPECT_EQ(values, sorted);
}

TEST_F(Registry, AnIndexAlwaysCountsInTheCurrentList) {
    for (const wchar_t* name : {L"a", L"b", L"c", L"d", L"e"})
        ASSERT_TRUE(CreateKey(Scratch(), name));
    wchar_t name[8];
    auto at = [&](DWORD index) {
        DWORD length = 8;
        LONG result = RegEnumKeyExW(Scratch(), index, name, &length, nullptr, nullptr, nullptr, nullptr);
        return result == ERROR_SUCCESS ? std::wstring(name, length) : L"error " + std::to_wstring(result);
    };
    EXPECT_EQ(at(0), L"a");
    EXPECT_EQ(at(1), L"b");
    ASSERT_EQ(RegDeleteKeyW(Scratch(), L"a"), ERROR_SUCCESS); // through another path than the walk
    EXPECT_EQ(at(2), L"d");
    EXPECT_EQ(at(3), L"e");
    ASSERT_TRUE(CreateKey(Scratch(), L"B2"));
    EXPECT_EQ(at(2), L"c");
    EXPECT_EQ(at(4), L"e");
    EXPECT_EQ(at(5), L"error 259");
}

TEST_F(Registry, ShortBuffersAnswerMoreDataWithTheSizeNeeded) {
    ASSERT_TRUE(CreateKey(Scratch(), L"seven77"));
    ASSERT_EQ(SetText(Scratch(), L"name", L"twelve chars"), ERROR_SUCCESS);
    const DWORD textSize = 13 * sizeof(wchar_t);
    struct Result {
        LONG code;
        DWORD reported;
    };
    wchar_t name[16];
    BYTE data[64];
    struct Case {
        const char* label;
        std::function<Result()> call;
        Result expected;
    };
    const Case cases[] = {
        {"sub-key name without room for its terminator",
         [&] {
             DWORD length = 7;
             return Result{RegEnumKeyExW(Scratch(), 0, name, &length, nullptr, nullptr, nullptr, nullptr),
                           length};
         },
         {ERROR_MORE_DATA, 7}},
        {"sub-key name that just fits",
         [&] {
             DWORD length = 8;
             return Result{RegEnumKeyExW(Scratch(), 0, name, &length, nullptr, nullptr, nullptr, nullptr),
                           length};
         },
         {ERROR_SUCCESS, 7}},
        {"value one byte short",
         [&] {
             DWORD size = textSize - 1;
             return Result{RegQueryValueExW(Scratch(), L"name", nullptr, nullptr, data, &size), size};
         },
         {ERROR_MORE_DATA, textSize}},
        {"value size asked without a buffer",
         [&] {
             DWORD size = 0;
             return Result{RegQueryValueExW(Scratch(), L"name", nullptr, nullptr, nullptr, &size), size};
         },
         {ERROR_SUCCESS, textSize}},
        {"listed value with too little room for its data",
         [&] {
             DWORD length = 16, size = 4;
             return Result{RegEnumValueW(Scratch(), 0, name, &length, nullptr, nullptr, data, &size), size};
         },
         {ERROR_MORE_DATA, textSize}},
        {"listed value with too little room for its name",
         [&] {
             DWORD length = 4, size = sizeof data;
             return Result{RegEnumValueW(Scratch(), 0, name, &length, nullptr, nullptr, data, &size), length};
         },
         {ERROR_MORE_DATA, 4}},
    };
    for (const Case& c : cases) {
        Result got = c.call();
        EXPECT_EQ(got.code, c.expected.code) << c.label;
        EXPECT_EQ(got.reported, c.expected.reported) << c.label;
    }
}

TEST_F(Registry, DeletionFollowsTheSystemsRules) {
    auto exists = [&](const wchar_t* path) { return static_cast<bool>(OpenKey(Scratch(), path)); };
    ASSERT_TRUE(CreateKey(Scratch(), L"parent\\child"));
    EXPECT_EQ(RegDeleteKeyW(Scratch(), L"parent"), ERROR_ACCESS_DENIED);
    EXPECT_TRUE(exists(L"parent\\child"));
    EXPECT_EQ(RegDeleteKeyW(Scratch(), L"parent\\child"), ERROR_SUCCESS);
    EXPECT_FALSE(exists(L"parent\\child"));

    UniqueHKey valued = CreateKey(Scratch(), L"valued");
    ASSERT_EQ(SetText(valued.get(), L"v", L"x"), ERROR_SUCCESS);
    EXPECT_EQ(RegDeleteKeyW(valued.get(), L""), ERROR_SUCCESS); // a key deletes itself by the empty name
    EXPECT_FALSE(exists(L"valued"));
    ASSERT_TRUE(CreateKey(Scratch(), L"valued"));
    EXPECT_EQ(QueryValue(OpenKey(Scratch(), L"valued").get(), L"v").result, ERROR_FILE_NOT_FOUND);

    UniqueHKey tree = CreateKey(Scratch(), L"tree\\a\\b");
    ASSERT_TRUE(CreateKey(Scratch(), L"tree\\c"));
    UniqueHKey top = OpenKey(Scratch(), L"tree", KEY_ALL_ACCESS);
    ASSERT_EQ(SetText(top.get(), L"v", L"x"), ERROR_SUCCESS);
    EXPECT_EQ(RegDeleteTreeW(top.get(), nullptr), ERROR_SUCCESS); // what it holds, not the key
    DWORD subKeys = 9, values = 9;
    EXPECT_EQ(RegQueryInfoKeyW(top.get(), nullptr, nullptr, nullptr, &subKeys, nullptr, nullptr, &values,
                               nullptr, nullptr, nullptr, nullptr),
              ERROR_SUCCESS);
    EXPECT_EQ(subKeys + values, 0u);
    ASSERT_TRUE(CreateKey(Scratch(), L"tree\\d\\e"));
    EXPECT_EQ(RegDeleteTreeW(Scratch(), L"tree"), ERROR_SUCCESS);
    EXPECT_FALSE(exists(L"tree"));

    ASSERT_EQ(SetText(Scratch(), L"gone", L"x"), ERROR_SUCCESS);
    EXPECT_EQ(RegDeleteValueW(Scratch(), L"GONE"), ERROR_SUCCESS);
    EXPECT_EQ(QueryValue(Scratch(), L"gone").result, ERROR_FILE_NOT_FOUND);
}

TEST_F(Registry, AHandleDoesOnlyWhatItsAccessAllows) {
    ASSERT_EQ(SetText(Scratch(), L"v", L"x"), ERROR_SUCCESS);
    ASSERT_TRUE(CreateKey(Scratch(), L"sub"));
    wchar_t name[16];
    DWORD size = 0;
    struct Case {
        const char* label;
        REGSAM access;
        std::function<LONG(HKEY)> call;
        LONG expected;
    };
    auto setValue = [](HKEY k) { return SetText(k, L"v", L"y"); };
    auto queryValue = [&](HKEY k) { return RegQueryValueExW(k, L"v", nullptr, nullptr, nullptr, &size); };
    auto listKeys = [&](HKEY k) {
        DWORD length = 16;
        return RegEnumKeyExW(k, 0, name, &length, nullptr, nullptr, nullptr, nullptr);
    };
    auto listValues = [&](HKEY k) {
        DWORD length = 16;
        return RegEnumValueW(k, 0, name, &length, nullptr, nullptr, nullptr, nullptr);
    };
    HKEY out = nullptr;
    const Case cases[] = {
        {"read: set", KEY_READ, setValue, ERROR_ACCESS_DENIED},
        {"read: delete value", KEY_READ, [](HKEY k) { return RegDeleteValueW(k, L"v"); },
         ERROR_ACCESS_DENIED},
        {"read: query", KEY_READ, queryValue, ERROR_SUCCESS},
        {"read: list sub-keys", KEY_READ, listKeys, ERROR_SUCCESS},
        {"read: list values", KEY_READ, listValues, ERROR_SUCCESS},
        {"write: set", KEY_WRITE, setValue, ERROR_SUCCESS},
        {"write: query", KEY_WRITE, queryValue, ERROR_ACCESS_DENIED},
        {"write: list values", KEY_WRITE, listValues, ERROR_ACCESS_DENIED},
        {"query value: list sub-keys", KEY_QUERY_VALUE, listKeys, ERROR_ACCESS_DENIED},
        {"enumerate: list values", KEY_ENUMERATE_SUB_KEYS, listValues, ERROR_ACCESS_DENIED},
        {"set value: query", KEY_SET_VALUE, queryValue, ERROR_ACCESS_DENIED},
        {"nothing: open a sub-key", 0, [&](HKEY k) { return RegOpenKeyExW(k, L"sub", 0, KEY_READ, &out); },
         ERROR_SUCCESS},
        {"nothing: create a sub-key", 0,
         [&](HKEY k) { return RegCreateKeyExW(k, L"new", 0, nullptr, 0, KEY_READ, nullptr, &out, nullptr); },
         ERROR_SUCCESS},
        {"nothing: delete a sub-key", 0, [](HKEY k) { return RegDeleteKeyW(k, L"new"); }, ERROR_SUCCESS},
    };
    for (const Case& c : cases) {
        UniqueHKey limited = OpenKey(HKEY_CURRENT_USER, scratch_.SubKey(), c.access);
        ASSERT_TRUE(limited) << c.label;
        out = nullptr;
        EXPECT_EQ(c.call(limited.get()), c.expected) << c.label;
        if (out)
            RegCloseKey(out);
    }
}

TEST_F(Registry, PathsCreateEveryLevelAndIgnoreRepeatedSeparators) {
    struct Case {
        const wchar_t* created;
        DWORD disposition;
    };
    const Case cases[] = {
        {L"a\\b\\c", REG_CREATED_NEW_KEY},       {L"A\\B\\C", REG_OPENED_EXISTING_KEY},
        {L"a\\b\\c\\", REG_OPENED_EXISTING_KEY}, {L"a\\\\b\\c", REG_OPENED_EXISTING_KEY},
        {L"a\\b\\d", REG_CREATED_NEW_KEY},
    };
    for (const Case& c : cases) {
        DWORD disposition = 0;
        EXPECT_TRUE(CreateKey(Scratch(), c.created, KEY_READ, &disposition)) << Narrow(c.created);
        EXPECT_EQ(disposition, c.disposition) << Narrow(c.created);
    }
    EXPECT_EQ(SubKeyNames(OpenKey(Scratch(), L"a\\b", KEY_READ).get()),
              (std::vector<std::wstring>{L"c", L"d"}));

    // An empty path opens a second handle on the same key.
    UniqueHKey again = OpenKey(Scratch(), L"", KEY_ALL_ACCESS);
    ASSERT_TRUE(again);
    EXPECT_NE(again.get(), Scratch());
    ASSERT_EQ(SetText(again.get(), L"through", L"second"), ERROR_SUCCESS);
    EXPECT_EQ(QueryValue(Scratch(), L"through").data, TextBytes(L"second"));
    HKEY same = nullptr;
    EXPECT_EQ(RegOpenKeyW(Scratch(), nullptr, &same), ERROR_SUCCESS);
    EXPECT_EQ(same, Scratch());
}

TEST_F(Registry, KeyInformationCountsAndMeasures) {
    ASSERT_TRUE(CreateKey(Scratch(), L"a"));
    ASSERT_TRUE(CreateKey(Scratch(), L"long-name"));
    ASSERT_EQ(SetText(Scratch(), nullptr, L"x"), ERROR_SUCCESS);
    ASSERT_EQ(SetValue(Scratch(), L"Name", REG_DWORD, LittleEndian(1, 4)), ERROR_SUCCESS);
    ASSERT_EQ(SetValue(Scratch(), L"binary", REG_BINARY, Bytes(100, 0xAB)), ERROR_SUCCESS);
    ASSERT_EQ(SetText(Scratch(), L"text", std::wstring(60, L't')), ERROR_SUCCESS);
    DWORD subKeys = 0, longestSubKey = 0, values = 0, longestName = 0, largest = 0;
    ASSERT_EQ(RegQueryInfoKeyW(Scratch(), nullptr, nullptr, nullptr, &subKeys, &longestSubKey, nullptr,
                               &values, &longestName, &largest, nullptr, nullptr),
              ERROR_SUCCESS);
    EXPECT_EQ(subKeys, 2u);
    EXPECT_EQ(longestSubKey, 9u);
    EXPECT_EQ(values, 4u);
    EXPECT_EQ(longestName, 6u);
    EXPECT_EQ(largest, std::max<DWORD>(100, 61 * sizeof(wchar_t)));
}

} // namespace
