// What the registration tests share: a fixture with the reference host and the test module's
// string table over a cleared registry, and short ways to read registrations back.
#pragma once

#include <functional>
#include <memory>
#include <ostream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/platform/registry.h>
#include <ut/platform/text.h>
#include <ut/registration.h>
#include <ut/sdk/detail/registry.h>
#include <ut/sdk/resources.h>

#include "support/registrations.h"

// Identifiers print as their text in failure messages.
inline void PrintTo(const GUID& id, std::ostream* out) {
    *out << ut::platform::Utf8FromWide(ut::GuidToString(id));
}

namespace ut::test {

// The test module's string table.
inline constexpr unsigned int kTwistId = 1, kInspectorId = 2, kUnusedId = 3;
inline constexpr const wchar_t *kTwist = L"Twist deformer", *kInspector = L"Twist inspector",
                               *kUnused = L"Never shown";

class RegistrationTest : public testing::Test {
protected:
    void SetUp() override {
        ASSERT_EQ(host_.Status(), S_OK);
        const KXDictString strings[] = {{kTwistId, kTwist}, {kInspectorId, kInspector}, {kUnusedId, kUnused}};
        ASSERT_EQ(KXDictAddInstanceStrings(Module(), strings, 3), S_OK);
    }
    static HINSTANCE Module() { return TestModule(); }

private:
    RegistrationScope scope_;
    host::ReferenceHost host_;
};

using Ids = std::vector<GUID>;

// The classes KXGetCLSIDList gives for a category; {GUID_NULL} when it fails.
inline Ids Listed(const wchar_t* category) {
    DWORD count = 0;
    GUID* list = nullptr;
    HRESULT listed = KXGetCLSIDList(category, &count, &list);
    std::unique_ptr<GUID, TaskMemDeleter> owned(list);
    return FAILED(listed) ? Ids{GUID_NULL} : Ids(list, list + count);
}
// What a listing hands out, checking its result; the list must be set, if only to null.
inline Ids Listing(const std::function<HRESULT(DWORD*, GUID**)>& list, HRESULT expected) {
    DWORD count = 9;
    GUID* ids = reinterpret_cast<GUID*>(&count);
    EXPECT_EQ(list(&count, &ids), expected);
    std::unique_ptr<GUID, TaskMemDeleter> owned(ids);
    return ids ? Ids(ids, ids + count) : Ids{};
}
// The "Name" KXGetKeyName gives, or "<failed>".
inline std::wstring NameOf(const wchar_t* category, const GUID& clsid) {
    wchar_t name[80] = L"";
    DWORD bytes = sizeof name;
    return KXGetKeyName(category, clsid, name, &bytes) == S_OK ? std::wstring(name) : L"<failed>";
}
// A text value of `root`\`path`, or "<none>"; whether a key is there.
inline std::wstring TextAt(HKEY root, const std::wstring& path, const wchar_t* value) {
    UniqueHKey key = sdk::OpenKey(root, path.c_str());
    std::wstring text;
    return key && sdk::ReadText(key.get(), value, text) == ERROR_SUCCESS ? text : L"<none>";
}
inline bool KeyExists(HKEY root, const std::wstring& path) {
    return sdk::OpenKey(root, path.c_str()) != nullptr;
}
// Writes a text value, making the key.
inline void SetText(HKEY root, const std::wstring& path, const wchar_t* name, const std::wstring& text) {
    UniqueHKey key;
    ASSERT_EQ(sdk::CreateKey(root, path.c_str(), key), ERROR_SUCCESS);
    ASSERT_EQ(sdk::SetText(key.get(), name, text.c_str()), ERROR_SUCCESS);
}
// The library's base key followed by `path`.
inline std::wstring Base(const std::wstring& path = L"") {
    return LibraryBaseKey() + path;
}

} // namespace ut::test
