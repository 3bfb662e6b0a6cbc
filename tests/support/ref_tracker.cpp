// Reference and live-object checks for tests.
#include "support/ref_tracker.h"

#include <gtest/gtest.h>

#include <ut/sdk/comobject.h>
#include <ut/sdk/testing.h>

namespace ut::test {

RefTracker::~RefTracker() {
    for (const Entry& entry : entries_) {
        ULONG actual = References(entry.object);
        EXPECT_EQ(actual, entry.expected) << "references left on " << (entry.name.empty() ? "object" : entry.name);
    }
}

void RefTracker::Track(IUnknown* object, ULONG expected, std::string name) {
    entries_.push_back({object, expected, std::move(name)});
}

ULONG RefTracker::References(IUnknown* object) {
    object->AddRef();
    return object->Release();
}

LiveObjectCheck::LiveObjectCheck() : before_(ut::sdk::LiveCount()) {}

LiveObjectCheck::~LiveObjectCheck() {
    EXPECT_EQ(ut::sdk::LiveCount(), before_) << "COM objects created by the test are still alive";
}

} // namespace ut::test
