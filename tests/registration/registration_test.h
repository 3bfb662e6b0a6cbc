// What the registration tests share: a fixture with the reference host and the test module's
// string table over a cleared registry, and short ways to read registrations back.
#pragma once

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

// String identifiers of the test module's table.
inline constexpr unsigned int kTwistId = 1;
inline constexpr unsigned int kInspectorId = 2;
inline constexpr unsigned int kUnusedId = 3;
inline constexpr const wchar_t* kTwist = L"Twist deformer";
inline constexpr const wchar_t* kInspector = L"Twist inspector";
inline constexpr const wchar_t* kUnused = L"Never shown";

class RegistrationTest : public testing::Test {
protected:
    void SetUp() override;

    static HINSTANCE Module() { return TestModule(); }

private:
    RegistrationScope scope_;
    host::ReferenceHost host_;
};

// The classes of a category in the order listed, or a one-entry "failure" marker: {GUID_NULL}
// with the result in `hr` when given.
std::vector<GUID> Listed(const wchar_t* category, HRESULT* hr = nullptr);

// The "Name" a category holds for a class through KXGetKeyName, or "<failed>".
std::wstring NameOf(const wchar_t* category, const GUID& clsid);

// A text value of `root`\`path`, or "<none>".
std::wstring TextAt(HKEY root, const std::wstring& path, const wchar_t* value);
bool KeyExists(HKEY root, const std::wstring& path);

// The base key followed by `path`, and the key text of a class.
std::wstring Base(const std::wstring& path = L"");
std::wstring ClassText(const GUID& clsid);

} // namespace ut::test
