// The registry calls answer alike on both homes: the system's registry and our own POSIX store.
#include <algorithm>
#include <array>

#include <gtest/gtest.h>

#include "registry_helpers.h"
#include "support/registry_scratch.h"

namespace {

using namespace ut::test;
using ut::UniqueHKey;

// One-call forms for the tables; what they hand out is dropped.
constexpr bool kCreate = true;
LONG Open(HKEY key, const wchar_t* path, bool create = false) {
    HKEY handed = nullptr;
    LONG result = create ? RegCreateKeyExW(key, path, 0, nullptr, 0, KEY_READ, nullptr, &handed, nullptr)
                         : RegOpenKeyExW(key, path, 0, KEY_READ, &handed);
    UniqueHKey owned(handed);
    return result;
}
LONG Query(HKEY key) {
    DWORD size = 0;
    return RegQueryValueExW(key, L"v", nullptr, nullptr, nullptr, &size);
}
LONG List(HKEY key, bool values, DWORD index = 0) {
    wchar_t name[64];
    DWORD length = 64;
    return values ? RegEnumValueW(key, index, name, &length, nullptr, nullptr, nullptr, nullptr)
                  : RegEnumKeyExW(key, index, name, &length, nullptr, nullptr, nullptr, nullptr);
}
using Call = LONG (*)(HKEY);
const Call Set = [](HKEY key) { return SetText(key, L"v", L"y"); };
const Call ListKeys = [](HKEY key) { return List(key, false); };
const Call ListValues = [](HKEY key) { return List(key, true); };
const Call DeleteValue = [](HKEY key) { return RegDeleteValueW(key, L"v"); };
const Call OpenSub = [](HKEY key) { return Open(key, L"sub"); };
const Call CreateNew = [](HKEY key) { return Open(key, L"new", kCreate); };
const Call DeleteNew = [](HKEY key) { return RegDeleteKeyW(key, L"new"); };
LONG Info(HKEY key) {
    DWORD subKeys = 0;
    return RegQueryInfoKeyW(key, nullptr, nullptr, nullptr, &subKeys, nullptr, nullptr, nullptr, nullptr,
                            nullptr, nullptr, nullptr);
}

class Registry : public testing::Test {
protected:
    void SetUp() override { ASSERT_NE(Scratch(), nullptr); }
    HKEY Scratch() const { return scratch_.Get(); }

    ScratchKey scratch_;
};

TEST_F(Registry, EveryTypeRoundTripsByteForByte) {
    for (const Sample& sample : EveryKindOfValue()) {
        SCOPED_TRACE(Narrow(sample.name));
        ASSERT_EQ(SetValue(Scratch(), sample.name, sample.type, sample.data), ERROR_SUCCESS);
        Value read = QueryValue(Scratch(), sample.name);
        EXPECT_EQ(read.type, sample.type);
        EXPECT_EQ(read.data, sample.data);
    }
    EXPECT_EQ(QueryValue(Scratch(), nullptr).data, TextBytes(L"the default"));
    std::vector<std::wstring> names = ValueNames(Scratch());
    EXPECT_EQ(names.size(), EveryKindOfValue().size());
    DWORD index = static_cast<DWORD>(std::find(names.begin(), names.end(), L"binary") - names.begin());
    wchar_t name[16];
    DWORD length = 16, type = 0, size = 400;
    Bytes listed(size);
    ASSERT_EQ(RegEnumValueW(Scratch(), index, name, &length, nullptr, &type, listed.data(), &size),
              ERROR_SUCCESS);
    listed.resize(size);
    EXPECT_EQ(type, static_cast<DWORD>(REG_BINARY));
    EXPECT_EQ(listed, QueryValue(Scratch(), L"binary").data);

    ASSERT_TRUE(CreateKey(Scratch(), L"a") && CreateKey(Scratch(), L"long-name"));
    DWORD counts[5] = {};
    ASSERT_EQ(RegQueryInfoKeyW(Scratch(), nullptr, nullptr, nullptr, &counts[0], &counts[1], nullptr,
                               &counts[2], &counts[3], &counts[4], nullptr, nullptr),
              ERROR_SUCCESS);
    // Two sub-keys, "long-name" the longest; the values, "quote \" and back\\slash" the longest name.
    EXPECT_EQ(std::vector<DWORD>(counts, counts + 5),
              (std::vector<DWORD>{2, 9, DWORD(names.size()), 22, 300}));
}

TEST_F(Registry, TextTerminatorsFollowTheSystemsRules) {
    // A count that leaves out a terminator present in memory gets it added; text stored without
    // one reads back as stored, with a terminator after it only when the buffer has room.
    const wchar_t counted[] = L"hello", open[] = L"abcX";
    ASSERT_EQ(RegSetValueExW(Scratch(), L"forgot", 0, REG_SZ, reinterpret_cast<const BYTE*>(counted),
                             5 * sizeof(wchar_t)),
              ERROR_SUCCESS);
    EXPECT_EQ(QueryValue(Scratch(), L"forgot").data, TextBytes(L"hello"));
    ASSERT_EQ(RegSetValueExW(Scratch(), L"open", 0, REG_SZ, reinterpret_cast<const BYTE*>(open),
                             3 * sizeof(wchar_t)),
              ERROR_SUCCESS);
    for (DWORD room : {3, 4, 8}) {
        wchar_t buffer[8];
        std::fill(std::begin(buffer), std::end(buffer), L'#');
        DWORD size = room * sizeof(wchar_t);
        ASSERT_EQ(
            RegQueryValueExW(Scratch(), L"open", nullptr, nullptr, reinterpret_cast<BYTE*>(buffer), &size),
            ERROR_SUCCESS);
        EXPECT_EQ(size, 3 * sizeof(wchar_t));
        EXPECT_EQ(std::wstring(buffer, 4), room > 3 ? std::wstring(L"abc\0", 4) : L"abc#") << room;
    }
}

TEST_F(Registry, CallsAnswerTheSystemsCodes) {
    ASSERT_TRUE(CreateKey(Scratch(), L"sub"));
    struct Case {
        const char* label;
        REGSAM access; // of the handle the call gets
        LONG (*call)(HKEY);
        LONG expected;
    };
    // clang-format off
    const Case cases[] = {
        {"open a missing key", KEY_READ, [](HKEY k) { return Open(k, L"missing"); }, ERROR_FILE_NOT_FOUND},
        {"open below a missing key", KEY_READ, [](HKEY k) { return Open(k, L"missing\\deeper"); }, ERROR_FILE_NOT_FOUND},
        {"open without a result", KEY_READ, [](HKEY k) { return RegOpenKeyExW(k, L"sub", 0, KEY_READ, nullptr); },
         ERROR_INVALID_PARAMETER},
        {"a path that starts with a backslash", KEY_READ, [](HKEY k) { return Open(k, L"\\lead", kCreate); }, ERROR_BAD_PATHNAME},
        {"query a missing value", KEY_READ, Query, ERROR_FILE_NOT_FOUND},
        {"query data without a byte count", KEY_READ,
         [](HKEY k) { return RegQueryValueExW(k, L"v", nullptr, nullptr, reinterpret_cast<BYTE*>(&k), nullptr); },
         ERROR_INVALID_PARAMETER},
        {"set data from a null pointer", KEY_ALL_ACCESS, [](HKEY k) { return RegSetValueExW(k, L"v", 0, REG_BINARY, nullptr, 4); },
         ERROR_NOACCESS},
        {"delete a missing value", KEY_ALL_ACCESS, DeleteValue, ERROR_FILE_NOT_FOUND},
        {"delete a missing key", KEY_ALL_ACCESS, DeleteNew, ERROR_FILE_NOT_FOUND},
        {"delete a key without a name", KEY_ALL_ACCESS, [](HKEY k) { return RegDeleteKeyW(k, nullptr); }, ERROR_INVALID_PARAMETER},
        {"delete a root", KEY_ALL_ACCESS, [](HKEY) { return RegDeleteKeyW(HKEY_CURRENT_USER, L""); }, ERROR_ACCESS_DENIED},
        {"list sub-keys past the last", KEY_READ, [](HKEY k) { return List(k, false, 1); }, ERROR_NO_MORE_ITEMS},
        {"list values past the last", KEY_READ, [](HKEY k) { return List(k, true, 1); }, ERROR_NO_MORE_ITEMS},
        {"use a null handle", KEY_READ, [](HKEY) { return Query(nullptr); }, ERROR_INVALID_HANDLE},
        {"close a null handle", KEY_READ, [](HKEY) { return RegCloseKey(nullptr); }, ERROR_INVALID_HANDLE},
        {"close a root", KEY_READ, [](HKEY) { return RegCloseKey(HKEY_LOCAL_MACHINE); }, ERROR_SUCCESS},
    };
    // clang-format on
    for (const Case& c : cases)
        EXPECT_EQ(c.call(OpenKey(HKEY_CURRENT_USER, scratch_.SubKey(), c.access).get()), c.expected)
            << c.label;

    ASSERT_EQ(SetText(Scratch(), L"v", L"x"), ERROR_SUCCESS);
    // What each access allows: query, list sub-keys, list values, set, open, create and delete a
    // sub-key, delete a value (5 is ERROR_ACCESS_DENIED).
    const Call calls[] = {Query, ListKeys, ListValues, Set, OpenSub, CreateNew, DeleteNew, DeleteValue};
    const std::pair<REGSAM, std::array<LONG, 8>> rights[] = {
        {KEY_READ, {0, 0, 0, 5, 0, 0, 0, 5}},        {KEY_WRITE, {5, 5, 5, 0, 0, 0, 0, 0}},
        {KEY_QUERY_VALUE, {0, 5, 0, 5, 0, 0, 0, 5}}, {KEY_ENUMERATE_SUB_KEYS, {5, 0, 5, 5, 0, 0, 0, 5}},
        {KEY_SET_VALUE, {5, 5, 5, 0, 0, 0, 0, 0}},   {0, {5, 5, 5, 5, 0, 0, 0, 5}},
    };
    for (const auto& [access, expected] : rights) {
        UniqueHKey handle = OpenKey(HKEY_CURRENT_USER, scratch_.SubKey(), access);
        for (std::size_t i = 0; i < expected.size(); ++i)
            EXPECT_EQ(calls[i](handle.get()), expected[i]) << "access " << access << ", call " << i;
        ASSERT_EQ(SetText(Scratch(), L"v", L"x"), ERROR_SUCCESS);
    }

    HKEY closed = CreateKey(Scratch(), L"closed").release();
    ASSERT_EQ(RegCloseKey(closed), ERROR_SUCCESS);
    EXPECT_EQ(Query(closed), ERROR_INVALID_HANDLE);
    EXPECT_EQ(RegCloseKey(closed), ERROR_INVALID_HANDLE);

    UniqueHKey doomed = CreateKey(Scratch(), L"doomed");
    ASSERT_EQ(RegDeleteKeyW(Scratch(), L"doomed"), ERROR_SUCCESS);
    for (Call call : {Query, Set, Info, DeleteValue, ListKeys, ListValues, CreateNew, OpenSub})
        EXPECT_EQ(call(doomed.get()), ERROR_KEY_DELETED);
}

TEST_F(Registry, NamesAreCaseInsensitiveAndKeepTheirFirstCase) {
    // clang-format off
    const std::tuple<const wchar_t*, const wchar_t*, bool> cases[] = {
        {L"MixedCase", L"mixedcase", true}, {L"MixedCase", L"MIXEDCASE", true}, {L"\u00c4pfel", L"\u00e4PFEL", true},
        {L"\u00e9clair", L"\u00c9CLAIR", true}, {L"\u00ffe", L"\u0178E", true},
        {L"\u041c\u0438\u0440", L"\u041c\u0418\u0420", true}, {L"Stra\u00dfe", L"STRASSE", false},
        {L"\u00df", L"\u1e9e", false}, /* ß, ẞ */ {L"a", L"\u00e0", false}};
    // clang-format on
    for (const auto& [created, opened, same] : cases) {
        SCOPED_TRACE(Narrow(created) + " / " + Narrow(opened));
        UniqueHKey parent = CreateKey(Scratch(), L"case");
        DWORD first = 0, second = 0;
        ASSERT_TRUE(CreateKey(parent.get(), created, KEY_READ, &first));
        ASSERT_TRUE(CreateKey(parent.get(), opened, KEY_READ, &second));
        EXPECT_EQ(first, static_cast<DWORD>(REG_CREATED_NEW_KEY));
        EXPECT_EQ(second, static_cast<DWORD>(same ? REG_OPENED_EXISTING_KEY : REG_CREATED_NEW_KEY));
        std::vector<std::wstring> names = SubKeyNames(parent.get());
        EXPECT_EQ(names.size(), same ? 1u : 2u);
        EXPECT_TRUE(!same || names.front() == created);
        parent.reset();
        ASSERT_EQ(RegDeleteTreeW(Scratch(), L"case"), ERROR_SUCCESS);
    }
    ASSERT_EQ(SetText(Scratch(), L"Name", L"text"), ERROR_SUCCESS);
    ASSERT_EQ(SetValue(Scratch(), L"NAME", REG_DWORD, LittleEndian(7, 4)), ERROR_SUCCESS);
    EXPECT_EQ(ValueNames(Scratch()), std::vector<std::wstring>{L"Name"});
    EXPECT_EQ(QueryValue(Scratch(), L"nAmE").type, static_cast<DWORD>(REG_DWORD));
}

TEST_F(Registry, SubKeysEnumerateInCaseInsensitiveOrderAndIndexesCountInTheCurrentList) {
    const wchar_t* created[] = {L"b",     L"Zeta", L"{0A}", L"a.b", L"C2", L"1",
                                L"alpha", L"a b",  L"c10",  L"A",   L"a-b"};
    for (const wchar_t* name : created)
        ASSERT_TRUE(CreateKey(Scratch(), name));
    EXPECT_EQ(SubKeyNames(Scratch()), (std::vector<std::wstring>{L"1", L"A", L"a b", L"a-b", L"a.b", L"alpha",
                                                                 L"b", L"c10", L"C2", L"Zeta", L"{0A}"}));
    auto at = [&](DWORD index) {
        wchar_t name[8];
        DWORD length = 8;
        LONG result = RegEnumKeyExW(Scratch(), index, name, &length, nullptr, nullptr, nullptr, nullptr);
        return result == ERROR_SUCCESS ? std::wstring(name, length) : L"error " + std::to_wstring(result);
    };
    EXPECT_EQ(at(5), L"alpha");
    EXPECT_EQ(at(6), L"b");
    ASSERT_EQ(RegDeleteKeyW(Scratch(), L"A"), ERROR_SUCCESS); // behind the walk, through another path
    EXPECT_EQ(at(7), L"C2");
    ASSERT_TRUE(CreateKey(Scratch(), L"b2"));
    EXPECT_EQ(at(7), L"c10");
    EXPECT_EQ(at(11), L"error 259");

    // Values come back once each, in the same order on every walk.
    for (const wchar_t* name : created)
        ASSERT_EQ(SetText(Scratch(), name, name), ERROR_SUCCESS);
    std::vector<std::wstring> values = ValueNames(Scratch()), sorted(std::begin(created), std::end(created));
    EXPECT_EQ(values, ValueNames(Scratch()));
    std::sort(values.begin(), values.end());
    std::sort(sorted.begin(), sorted.end());
    EXPECT_EQ(values, sorted);
}

TEST_F(Registry, ShortBuffersAnswerMoreDataWithTheSizeNeeded) {
    ASSERT_TRUE(CreateKey(Scratch(), L"seven77"));
    ASSERT_EQ(SetText(Scratch(), L"name", L"twelve chars"), ERROR_SUCCESS);
    const DWORD text = 13 * sizeof(wchar_t);
    wchar_t name[16];
    BYTE data[64];
    // Each call answers its code and the count it reports back.
    auto listKey = [&](DWORD length) {
        return std::pair{RegEnumKeyExW(Scratch(), 0, name, &length, nullptr, nullptr, nullptr, nullptr),
                         length};
    };
    auto query = [&](BYTE* buffer, DWORD size) {
        return std::pair{RegQueryValueExW(Scratch(), L"name", nullptr, nullptr, buffer, &size), size};
    };
    auto listValue = [&](DWORD length, DWORD size, bool reportName) {
        LONG result = RegEnumValueW(Scratch(), 0, name, &length, nullptr, nullptr, data, &size);
        return std::pair{result, reportName ? length : size};
    };
    using Answer = std::pair<LONG, DWORD>;
    const std::tuple<const char*, Answer, Answer> cases[] = {
        {"a name without room for its terminator", listKey(7), {ERROR_MORE_DATA, 7}},
        {"a name that just fits", listKey(8), {ERROR_SUCCESS, 7}},
        {"a value one byte short", query(data, text - 1), {ERROR_MORE_DATA, text}},
        {"a value's size asked without a buffer", query(nullptr, 0), {ERROR_SUCCESS, text}},
        {"a listed value's data without room", listValue(16, 4, false), {ERROR_MORE_DATA, text}},
        {"a listed value's name without room", listValue(4, sizeof data, true), {ERROR_MORE_DATA, 4}},
    };
    for (const auto& [label, got, expected] : cases)
        EXPECT_EQ(got, expected) << label;
}

TEST_F(Registry, DeletionFollowsTheSystemsRules) {
    ASSERT_TRUE(CreateKey(Scratch(), L"parent\\child"));
    EXPECT_EQ(RegDeleteKeyW(Scratch(), L"parent"), ERROR_ACCESS_DENIED);
    EXPECT_EQ(Open(Scratch(), L"parent\\child"), ERROR_SUCCESS);
    EXPECT_EQ(RegDeleteKeyW(Scratch(), L"parent\\child"), ERROR_SUCCESS);
    EXPECT_EQ(Open(Scratch(), L"parent\\child"), ERROR_FILE_NOT_FOUND);

    UniqueHKey valued = CreateKey(Scratch(), L"valued");
    ASSERT_EQ(SetText(valued.get(), L"v", L"x"), ERROR_SUCCESS);
    EXPECT_EQ(RegDeleteKeyW(valued.get(), L""), ERROR_SUCCESS); // a key deletes itself by the empty name
    EXPECT_EQ(Query(CreateKey(Scratch(), L"valued").get()), ERROR_FILE_NOT_FOUND);

    ASSERT_TRUE(CreateKey(Scratch(), L"tree\\a\\b"));
    UniqueHKey tree = CreateKey(Scratch(), L"tree");
    ASSERT_EQ(Set(tree.get()), ERROR_SUCCESS);
    EXPECT_EQ(RegDeleteTreeW(tree.get(), nullptr), ERROR_SUCCESS); // what it holds, not the key
    EXPECT_EQ(SubKeyNames(tree.get()).size() + ValueNames(tree.get()).size(), 0u);
    ASSERT_TRUE(CreateKey(Scratch(), L"tree\\c\\d"));
    EXPECT_EQ(RegDeleteTreeW(Scratch(), L"tree"), ERROR_SUCCESS);
    EXPECT_EQ(Open(Scratch(), L"tree"), ERROR_FILE_NOT_FOUND);

    ASSERT_EQ(Set(Scratch()), ERROR_SUCCESS);
    EXPECT_EQ(RegDeleteValueW(Scratch(), L"V"), ERROR_SUCCESS);
    EXPECT_EQ(Query(Scratch()), ERROR_FILE_NOT_FOUND);
}

TEST_F(Registry, PathsCreateEveryLevelAndIgnoreRepeatedSeparators) {
    const std::pair<const wchar_t*, DWORD> cases[] = {
        {L"a\\b\\c", REG_CREATED_NEW_KEY},       {L"A\\B\\C", REG_OPENED_EXISTING_KEY},
        {L"a\\b\\c\\", REG_OPENED_EXISTING_KEY}, {L"a\\\\b\\c", REG_OPENED_EXISTING_KEY},
        {L"a\\b\\d", REG_CREATED_NEW_KEY},
    };
    for (const auto& [path, expected] : cases) {
        DWORD disposition = 0;
        EXPECT_TRUE(CreateKey(Scratch(), path, KEY_READ, &disposition)) << Narrow(path);
        EXPECT_EQ(disposition, expected) << Narrow(path);
    }
    EXPECT_EQ(SubKeyNames(OpenKey(Scratch(), L"a\\b").get()), (std::vector<std::wstring>{L"c", L"d"}));

    // An empty path opens a second handle on the same key; the short form hands back the first.
    UniqueHKey again = OpenKey(Scratch(), L"", KEY_ALL_ACCESS);
    ASSERT_NE(again.get(), Scratch());
    ASSERT_EQ(Set(again.get()), ERROR_SUCCESS);
    EXPECT_EQ(Query(Scratch()), ERROR_SUCCESS);
    HKEY same = nullptr;
    EXPECT_EQ(RegOpenKeyW(Scratch(), nullptr, &same), ERROR_SUCCESS);
    EXPECT_EQ(same, Scratch());
}

} // namespace
