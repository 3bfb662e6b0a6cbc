// Fails the running test when an object it tracks keeps more references at the end of the
// test than it should.
//
//   RefTracker refs;
//   refs.Track(object, 1);      // the test's own reference is all that may remain
//
// LiveObjectCheck does the same for every CGWCOMObject: none may be left alive that the test
// created.
#pragma once

#include <string>
#include <vector>

#include <ut/platform/com.h>

namespace ut::test {

class RefTracker {
public:
    RefTracker() = default;
    RefTracker(const RefTracker&) = delete;
    RefTracker& operator=(const RefTracker&) = delete;
    ~RefTracker();

    // Expects `object` to hold exactly `expected` references when the tracker goes.
    void Track(IUnknown* object, ULONG expected, std::string name = {});

    // The object's current count, read with an AddRef/Release pair.
    static ULONG References(IUnknown* object);

private:
    struct Entry {
        IUnknown* object;
        ULONG expected;
        std::string name;
    };
    std::vector<Entry> entries_;
};

class LiveObjectCheck {
public:
    LiveObjectCheck();
    ~LiveObjectCheck();
    LiveObjectCheck(const LiveObjectCheck&) = delete;
    LiveObjectCheck& operator=(const LiveObjectCheck&) = delete;

private:
    long before_;
};

} // namespace ut::test
