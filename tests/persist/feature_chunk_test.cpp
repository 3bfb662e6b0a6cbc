// The feature-version chunk read into the feature table.
#include <vector>

#include <gtest/gtest.h>

#include "persist/feature_chunk.h"

namespace {

// A reader over at most one chunk, holding the values that follow its header.
class ScriptedReader {
public:
    ScriptedReader(HRESULT openResult, std::vector<ULONG> values)
        : openResult_(openResult), values_(std::move(values)) {}

    HRESULT ChunkReadOpen(ULONG id, ULONG*) {
        openedId = id;
        return openResult_;
    }
    HRESULT GetUInt32(ULONG& value) {
        if (next_ == values_.size())
            return STG_E_READFAULT;
        value = values_[next_++];
        return S_OK;
    }
    HRESULT ChunkReadClose() {
        ++closes;
        return S_OK;
    }

    ULONG openedId = 0;
    int closes = 0;

private:
    HRESULT openResult_;
    std::vector<ULONG> values_;
    std::size_t next_ = 0;
};

TEST(FeatureChunk, FillsTheLoadedColumnAndSkipsUnknownFeatures) {
    ULONG& loaded = g_uiFeaturesVersion[eFeaturesVersionScene][eFeatureLoaded];
    struct Case {
        const char* what;
        HRESULT openResult;
        std::vector<ULONG> values;
        ULONG loaded;
    };
    const Case cases[] = {
        {"no chunk", STG_E_INVALIDHEADER, {1, 0, 70}, 0},
        {"open answering S_FALSE", S_FALSE, {1, 0, 70}, 0},
        {"one pair", S_OK, {1, 0, 70}, 70},
        {"last pair wins", S_OK, {2, 0, 70, 0, 71}, 71},
        {"features beyond the table", S_OK, {3, 1, 5, 0xFFFFFFFF, 6, 0, 65}, 65},
        {"no pairs", S_OK, {0}, 0},
        {"count unreadable", S_OK, {}, 0},
        {"count beyond the data", S_OK, {0xFFFFFFFF, 0, 66}, 66},
        {"pair cut short", S_OK, {2, 0, 67, 0}, 67},
    };
    for (const Case& c : cases) {
        loaded = 99;
        ScriptedReader reader(c.openResult, c.values);
        EXPECT_EQ(ut::persist::LoadFeaturesVersion(reader), S_OK) << c.what;
        EXPECT_EQ(reader.openedId, 0x53464541u) << c.what;
        EXPECT_EQ(reader.closes, c.openResult == S_OK ? 1 : 0) << c.what;
        ULONG reported = 0, current = 0;
        KXGetFeatureVersion(eFeaturesVersionScene, &reported, &current);
        EXPECT_EQ(reported, c.loaded) << c.what;
        EXPECT_EQ(current, 64u) << c.what;
    }
    loaded = 0;
    // A feature the table does not have is not read past the table's end.
    ULONG reported = 99;
    KXGetFeatureVersion(eFeaturesVersionCount, &reported, nullptr);
    EXPECT_EQ(reported, 99u);
}

} // namespace
