// Random object trees saved and loaded through the same calling code in every form, and a
// realistic scene-like stream to compare the sizes of the forms.
#include <cstring>
#include <random>
#include <variant>

#include <gtest/gtest.h>

#include "persist/save_load.h"

namespace {

using ut::test::Form;

using Value = std::variant<ULONG, LONG, double, CKXString, GUID>;

struct Node {
    ULONG id = 0;
    ULONG version = 0;
    std::vector<Value> values;
    std::vector<Node> children;
    // How the reader treats the node: read it all; read half the values and skip the others;
    // read half and close (leaves only); skip the chunk (leaves only). A reader of an inline
    // table must see every header, so whole subtrees are never jumped over.
    enum class Read { All, SkipValues, Leave, SkipChunk } read = Read::All;
};

class TreeMaker {
public:
    explicit TreeMaker(unsigned seed) : random_(seed) {}

    Node Make(int depth) {
        Node node;
        node.id = Pick(kIds);
        node.version = static_cast<ULONG>(Below(4));
        for (int i = Below(8); i > 0; --i)
            node.values.push_back(MakeValue());
        if (depth < 4)
            for (int i = Below(4); i > 0; --i)
                node.children.push_back(Make(depth + 1));
        int choice = Below(8);
        node.read = choice < 4 ? Node::Read::All : choice < 6 ? Node::Read::SkipValues : Node::Read::Leave;
        if (node.read == Node::Read::Leave && !node.children.empty())
            node.read = Node::Read::All;
        if (node.read == Node::Read::Leave && Below(2))
            node.read = Node::Read::SkipChunk;
        return node;
    }

private:
    static constexpr ULONG kIds[] = {0x4F424A31, 1, 2, 0xFFFFFFC4, 0x12345678, 77};

    int Below(int n) { return std::uniform_int_distribution<int>(0, n - 1)(random_); }
    template <std::size_t N>
    ULONG Pick(const ULONG (&from)[N]) {
        return from[Below(N)];
    }

    // Magnitudes spread over every packed form.
    ULONG Bits() { return static_cast<ULONG>(random_()) >> Below(32); }

    Value MakeValue() {
        switch (Below(6)) {
        case 0:
            return Bits();
        case 1:
            return static_cast<LONG>(Below(2) ? Bits() : 0u - Bits());
        case 2:
            return MakeDouble();
        case 3: {
            std::wstring text;
            for (int i = Below(12); i > 0; --i)
                text += static_cast<wchar_t>(Below(4) ? L'a' + Below(26) : 0x4E00 + Below(100));
            return CKXString(text);
        }
        case 4:
            return GUID{
                static_cast<ULONG>(random_()), 1, 2, {3, 4, 5, 6, 7, 8, 9, static_cast<BYTE>(Below(256))}};
        default:
            return static_cast<ULONG>(Below(16));
        }
    }

    double MakeDouble() {
        switch (Below(5)) {
        case 0:
            return static_cast<double>(Below(3)) - 1.0;
        case 1:
            return static_cast<double>(static_cast<int>(Bits()) - 1000);
        case 2:
            return static_cast<double>(static_cast<float>(Below(100000)) / 64.0f);
        default:
            return std::uniform_real_distribution<double>(-1e6, 1e6)(random_);
        }
    }

    std::mt19937 random_;
};

void WriteValue(C3DStreamHelper& h, const Value& value) {
    HRESULT hr = std::visit(
        [&](const auto& v) -> HRESULT {
            using T = std::decay_t<decltype(v)>;
            if constexpr (std::is_same_v<T, ULONG>)
                return h.PutUInt32(v);
            else if constexpr (std::is_same_v<T, LONG>)
                return h.PutInt32(v);
            else if constexpr (std::is_same_v<T, double>)
                return h.PutDouble(v);
            else if constexpr (std::is_same_v<T, CKXString>)
                return h.PutString(v);
            else
                return h.PutGUID(v);
        },
        value);
    EXPECT_EQ(hr, S_OK);
}

void ExpectValue(C3DStreamHelper& h, const Value& expected) {
    std::visit(
        [&](const auto& v) {
            using T = std::decay_t<decltype(v)>;
            T back{};
            if constexpr (std::is_same_v<T, ULONG>)
                ASSERT_EQ(h.GetUInt32(back), S_OK);
            else if constexpr (std::is_same_v<T, LONG>)
                ASSERT_EQ(h.GetInt32(back), S_OK);
            else if constexpr (std::is_same_v<T, double>)
                ASSERT_EQ(h.GetDouble(back), S_OK);
            else if constexpr (std::is_same_v<T, CKXString>)
                ASSERT_EQ(h.GetString(back), S_OK);
            else
                ASSERT_EQ(h.GetGUID(back), S_OK);
            EXPECT_TRUE(back == v);
        },
        expected);
}

void SkipValue(C3DStreamHelper& h, const Value& value) {
    HRESULT hr = std::visit(
        [&](const auto& v) -> HRESULT {
            using T = std::decay_t<decltype(v)>;
            if constexpr (std::is_same_v<T, ULONG>)
                return h.SkipUInt32();
            else if constexpr (std::is_same_v<T, LONG>)
                return h.SkipInt32();
            else if constexpr (std::is_same_v<T, double>) {
                // Read, not skipped: on a plain stream opened through the stream object a double
                // skip moves 4 bytes of the 8, as such streams always did.
                double scratch = 0;
                return h.GetDouble(scratch);
            } else if constexpr (std::is_same_v<T, CKXString>)
                return h.SkipUnicodeString();
            else
                return h.MovePos(STMHELPER_FORWARD, sizeof(GUID));
        },
        value);
    EXPECT_EQ(hr, S_OK);
}

void WriteNode(C3DStreamHelper& h, const Node& node) {
    ASSERT_EQ(h.ChunkWriteOpen(node.id, node.version), S_OK);
    for (const Value& value : node.values)
        WriteValue(h, value);
    for (const Node& child : node.children)
        WriteNode(h, child);
    ASSERT_EQ(h.ChunkWriteClose(), S_OK);
}

void ReadNode(C3DStreamHelper& h, const Node& node) {
    ULONG id = 0, version = 0;
    ASSERT_EQ(h.ChunkPeekHeader(&id, &version), S_OK);
    ASSERT_EQ(id, node.id);
    if (node.read == Node::Read::SkipChunk) {
        ASSERT_EQ(h.SkipChunk(), S_OK);
        return;
    }
    // A probe for another chunk must leave everything as it was.
    EXPECT_EQ(h.ChunkReadOpen(node.id + 1, &version), STG_E_INVALIDHEADER);
    ASSERT_EQ(h.ChunkReadOpen(node.id, &version), S_OK);
    EXPECT_EQ(version, node.version);
    std::size_t values = node.read == Node::Read::All ? node.values.size() : node.values.size() / 2;
    for (std::size_t i = 0; i < values; ++i)
        ExpectValue(h, node.values[i]);
    if (node.read == Node::Read::Leave) {
        ASSERT_EQ(h.ChunkReadClose(), S_OK);
        return;
    }
    for (std::size_t i = values; i < node.values.size(); ++i)
        SkipValue(h, node.values[i]);
    for (const Node& child : node.children)
        ReadNode(h, child);
    ASSERT_EQ(h.ChunkReadClose(), S_OK);
}

class RoundTrip : public ::testing::TestWithParam<Form> {};

TEST_P(RoundTrip, RandomTreesReadBackInEveryForm) {
    for (unsigned seed = 1; seed <= 40; ++seed) {
        SCOPED_TRACE(::testing::Message() << "seed " << seed);
        TreeMaker maker(seed);
        std::vector<Node> roots;
        for (int i = 0; i < 3; ++i)
            roots.push_back(maker.Make(0));
        ut::test::Saved saved = ut::test::Save(GetParam(), [&](C3DStreamHelper& h) {
            for (const Node& root : roots)
                WriteNode(h, root);
            h.PutUInt32(0xC0FFEE);
        });
        ut::test::Load(saved, [&](C3DStreamHelper& h) {
            for (const Node& root : roots)
                ReadNode(h, root);
            ULONG last = 0;
            EXPECT_EQ(h.GetUInt32(last), S_OK);
            EXPECT_EQ(last, 0xC0FFEEu);
        });
        if (HasFailure())
            return;
    }
}

INSTANTIATE_TEST_SUITE_P(Forms, RoundTrip, ::testing::Values(Form::Plain, Form::Compact, Form::CompactTable));

// A scene of a few hundred objects: transforms, names, flags, ids and small nested parameter
// blocks, as persisted objects write them.
void WriteScene(C3DStreamHelper& h) {
    std::mt19937 random(7);
    h.ChunkWriteOpen("SCNE", 3);
    for (ULONG object = 0; object < 400; ++object) {
        h.ChunkWriteOpen(0x4F424A00 + object % 12, 2);
        h.PutString(CKXString(L"object_" + std::to_wstring(object)));
        h.PutUInt32(object);
        h.PutUInt32(object % 7 == 0 ? 0x80000000u | object : object % 3);
        for (int i = 0; i < 16; ++i) // a transform: mostly identity, some offsets
            h.PutDouble(i % 5 == 0 ? 1.0
                                   : (i >= 12 && i < 15 ? static_cast<double>(random() % 2000) / 8.0 : 0.0));
        h.ChunkWriteOpen("PARM", 1);
        for (int p = 0; p < 6; ++p) { // sliders keep single precision; computed values do not
            h.PutInt32(static_cast<LONG>(random() % 200) - 100);
            double value = std::uniform_real_distribution<double>(0, 1)(random);
            h.PutDouble(p % 2 ? value : static_cast<float>(value));
        }
        h.ChunkWriteClose();
        h.ChunkWriteClose();
    }
    h.ChunkWriteClose();
}

TEST(SampleScene, CompactFormIsSmaller) {
    if (ut::test::CompressionDisabled())
        GTEST_SKIP() << "compression is switched off in this run";
    std::size_t plain = ut::test::Save(Form::Plain, WriteScene).data.size();
    std::size_t compact = ut::test::Save(Form::Compact, WriteScene).data.size();
    RecordProperty("plain_bytes", static_cast<int>(plain));
    RecordProperty("compact_bytes", static_cast<int>(compact));
    EXPECT_LT(compact * 10, plain * 6);
}

TEST(PlainStreams, CompressionStaysOffWhenSwitchedOff) {
    ut::test::Saved saved = ut::test::Save(Form::Compact, [](C3DStreamHelper& h) { h.PutUInt32(1); });
    bool compact = saved.data.size() >= ut::test::kMarker.size() &&
                   std::equal(ut::test::kMarker.begin(), ut::test::kMarker.end(), saved.data.begin());
    EXPECT_EQ(compact, !ut::test::CompressionDisabled());
    EXPECT_EQ(saved.data.size(), compact ? ut::test::kMarker.size() + 1 : 4u);
}

} // namespace

namespace {

// The feature-version chunk as the host writes it, read back through the library in every form.
TEST(FeatureVersions, LoadFromEveryStreamForm) {
    for (ut::test::Form form :
         {ut::test::Form::Plain, ut::test::Form::Compact, ut::test::Form::CompactTable}) {
        ut::test::Saved saved = ut::test::Save(form, [](C3DStreamHelper& out) {
            ASSERT_EQ(out.ChunkWriteOpen(0x53464541ul, 1), S_OK);
            const ULONG pairs[][2] = {{eFeaturesVersionScene, 61}, {7, 99}}; // 7 is not a feature
            ASSERT_EQ(out.PutUInt32(2), S_OK);
            for (const auto& pair : pairs) {
                ASSERT_EQ(out.PutUInt32(pair[0]), S_OK);
                ASSERT_EQ(out.PutUInt32(pair[1]), S_OK);
            }
            ASSERT_EQ(out.ChunkWriteClose(), S_OK);
            ASSERT_EQ(out.PutUInt32(0xC0FFEE), S_OK);
        });
        ut::test::Load(saved, [](C3DStreamHelper& in) {
            ASSERT_EQ(KXLoadFeaturesVersion(in), S_OK);
            ULONG loaded = 0, current = 0;
            KXGetFeatureVersion(eFeaturesVersionScene, &loaded, &current);
            EXPECT_EQ(loaded, 61u);
            EXPECT_EQ(current, 64u);
            ULONG after = 0;
            ASSERT_EQ(in.GetUInt32(after), S_OK); // the chunk was closed at its end
            EXPECT_EQ(after, 0xC0FFEEu);
        });
    }
    g_uiFeaturesVersion[eFeaturesVersionScene][eFeatureLoaded] = 0;
}

} // namespace
