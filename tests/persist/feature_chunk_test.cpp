#include <optional>
#include <vector>

#include <gtest/gtest.h>

#include "persist/feature_chunk.h"

namespace {

// A reader that holds at most one chunk, with the values that follow its header.
class ScriptedReader {
public:
    ScriptedReader(HRESULT openResult, std::vector<ULONG> values)
        : openResult_(openResult), values_(std::move(values)) {}

    HRESULT ChunkReadOpen(ULONG id, ULONG* version) {
        openedId = id;
        if (openResult_ == S_OK)
            *version = 1;
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

    std::optional<ULONG> openedId;
    int closes = 0;

private:
    HRESULT openResult_;
    std::vector<ULONG> values_;
    std::size_t next_ = 0;
};

class FeatureChunk : public testing::Test {
protected:
    void SetUp() override { SetLoaded(0); }
    void TearDown() override { SetLoaded(0); }
    static void SetLoaded(ULONG version) {
        g_uiFeaturesVersion[eFeaturesVersionScene][eFeatureLoaded] = version;
    }
    static ULONG Loaded() {
        ULONG loaded = 0;
        KXGetFeatureVersion(eFeaturesVersionScene, &loaded, nullptr);
        return loaded;
    }
};

TEST_F(FeatureChunk, AStreamWithoutItReportsVersionZero) {
    for (HRESULT openResult : {STG_E_INVALIDHEADER, S_FALSE, E_FAIL}) {
        SetLoaded(70);
        ScriptedReader reader(openResult, {1, 0, 70});
        EXPECT_EQ(ut::persist::LoadFeaturesVersion(reader), S_OK);
        EXPECT_EQ(reader.openedId, 0x53464541u);
        EXPECT_EQ(reader.closes, 0);
        ULONG loaded = 99, current = 0;
        KXGetFeatureVersion(eFeaturesVersionScene, &loaded, &current);
        EXPECT_EQ(loaded, 0u) << "open answering " << openResult;
        EXPECT_EQ(current, 64u);
    }
}

TEST_F(FeatureChunk, FillsTheLoadedColumnAndSkipsUnknownFeatures) {
    struct Case {
        const char* what;
        std::vector<ULONG> values;
        ULONG loaded;
    };
    const Case cases[] = {
        {"one pair", {1, 0, 70}, 70},
        {"last pair wins", {2, 0, 70, 0, 71}, 71},
        {"features beyond the table", {3, 1, 5, 0xFFFFFFFF, 6, 0, 65}, 65},
        {"no pairs", {0}, 0},
        {"count unreadable", {}, 0},
        {"count beyond the data", {0xFFFFFFFF, 0, 66}, 66},
        {"pair cut short", {2, 0, 67, 0}, 67},
    };
    for (const Case& c : cases) {
        SetLoaded(99);
        ScriptedReader reader(S_OK, c.values);
        EXPECT_EQ(ut::persist::LoadFeaturesVersion(reader), S_OK) << c.what;
        EXPECT_EQ(Loaded(), c.loaded) << c.what;
        EXPECT_EQ(reader.closes, 1) << c.what;
        EXPECT_EQ(g_uiFeaturesVersion[eFeaturesVersionScene][eFeatureNumber], 0u) << c.what;
        EXPECT_EQ(g_uiFeaturesVersion[eFeaturesVersionScene][eFeatureCurrent], 64u) << c.what;
    }
}

} // namespace
