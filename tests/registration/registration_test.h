// What the registration tests share: a fixture with the reference host and the test module's
// string table over a cleared registry, and short ways to read registrations back.
#pragma once

#include <functional>
#include <ostream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/platform/registry.h>
#include <ut/platform/text.h>

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
    void SetUp() override;
    static HINSTANCE Module() { return TestModule(); }

private:
    RegistrationScope scope_;
    host::ReferenceHost host_;
};

// The classes KXGetCLSIDList gives for a category; {GUID_NULL} when it fails (with its result in
// `hr` when asked).
std::vector<GUID> Listed(const wchar_t* category, HRESULT* hr = nullptr);
// What a listing hands out, checking its result; the list must be set, if only to null.
using Ids = std::vector<GUID>;
Ids Listing(const std::function<HRESULT(DWORD*, GUID**)>& list, HRESULT expected);
// The "Name" KXGetKeyName gives, or "<failed>".
std::wstring NameOf(const wchar_t* category, const GUID& clsid);
// A text value of `root`\`path`, or "<none>"; whether a key is there.
std::wstring TextAt(HKEY root, const std::wstring& path, const wchar_t* value);
bool KeyExists(HKEY root, const std::wstring& path);
// Writes a text value, making the key.
void SetText(HKEY root, const std::wstring& path, const wchar_t* name, const std::wstring& text);
// The library's base key followed by `path`.
std::wstring Base(const std::wstring& path = L"");

} // namespace ut::test
