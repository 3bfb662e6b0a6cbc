// Shader traversal over a reference network with a skipped output port, nested ports, a shared
// sub-network, an opaque node, a plain hierarchy and a cycle.
#include <algorithm>
#include <map>
#include <string>

#include <gtest/gtest.h>

#include <ut/host/reference_shaders.h>
#include <ut/shaders.h>

#include "support/ref_tracker.h"
#include "test_scene.h"

namespace {

using ut::host::ShaderDescription;

// Surface's output port 0 leads to Noise but is not followed; port 2 nests ports 3 and 4.
ut::host::ShaderNetwork TestNetwork() {
    const std::vector<ShaderDescription> shaders = {
        {.name = L"Surface",
         .skippedPort = 0,
         .ports = {{0, L"Noise"}, {1, L"Mix"}, {2, L"", {{3, L"Texture"}, {4, L"Opaque"}}}},
         .nameSpace = L"Scene"},
        {.name = L"Mix", .ports = {{1, L"Texture"}, {2, L"Noise"}}, .preferredNameSpace = L"Library"},
        {.name = L"Texture", .ports = {{1, L"Noise"}}},
        {.name = L"Noise"},
        {.name = L"Opaque", .opaque = true, .ports = {{1, L"Noise"}}},
        {.name = L"Plain", .node = false, .ports = {{1, L"Noise"}}},
        {.name = L"Loop1", .ports = {{1, L"Loop2"}}},
        {.name = L"Loop2", .ports = {{1, L"Loop1"}}}};
    return ut::host::ShaderNetwork(shaders, {L"Scene", L"Library"});
}

// Records the nodes visited by name; answers `stop` at the `stopAt`-th visit, or at the first
// node visited twice when `stopAt` is 0 and `stop` is not.
struct Recorder : C3DShaderTraverserCallback {
    const ut::host::ShaderNetwork& network;
    int stopAt = -1;
    long stop = 0;
    std::string seen;
    long OnShader(IUnknown* shader) override {
        std::string name;
        for (const wchar_t* candidate :
             {L"Surface", L"Mix", L"Texture", L"Noise", L"Opaque", L"Plain", L"Loop1", L"Loop2"})
            if (static_cast<IUnknown*>(network.Node(candidate).Get()) == shader)
                name = ut::test::Narrow(candidate);
        bool repeat = seen.find(name) != std::string::npos;
        seen += (seen.empty() ? "" : " ") + name;
        int visits = static_cast<int>(std::count(seen.begin(), seen.end(), ' ')) + 1;
        return (stopAt == visits || (stopAt == 0 && repeat)) ? stop : 0;
    }
    explicit Recorder(const ut::host::ShaderNetwork& n) : network(n) {}
};

TEST(ShaderTraverser, WalksConnectedPortsDepthFirstAndStopsWhenTold) {
    ut::test::LiveObjectCheck live;
    ut::host::ShaderNetwork network = TestNetwork();
    struct Case {
        const wchar_t* root;
        int stopAt;
        long stop;
        std::string expected;
    };
    const Case cases[] = {
        // The output port is skipped, a nested port is followed, Noise is reached three times and
        // the opaque node not at all.
        {L"Surface", -1, 0, "S_OK: Surface Mix Texture Noise Noise Texture Noise"},
        {L"Plain", -1, 0, "S_OK: "},
        {L"Surface", 1, 5, "5: Surface"},
        {L"Surface", 3, -7, "-7: Surface Mix Texture"},
        // A cycle goes round until the callback stops it.
        {L"Loop1", 0, 9, "9: Loop1 Loop2 Loop1"}};
    for (const Case& c : cases) {
        Recorder recorder(network);
        recorder.stopAt = c.stopAt;
        recorder.stop = c.stop;
        C3DShaderTraverser traverser;
        HRESULT hr = traverser.Traverse(network.Node(c.root).Get(), &recorder, false);
        EXPECT_EQ(ut::test::Result(hr) + ": " + recorder.seen, c.expected);
    }
}

TEST(ShaderTraverser, WalksARootOnceWithTheOnceOption) {
    ut::host::ShaderNetwork network = TestNetwork();
    Recorder recorder(network);
    C3DShaderTraverser traverser;
    auto noise = network.Node(L"Noise");
    EXPECT_EQ(traverser.Traverse(nullptr, &recorder, true), E_POINTER);
    EXPECT_EQ(traverser.Traverse(noise.Get(), nullptr, true), E_POINTER);
    EXPECT_EQ(traverser.Traverse(noise.Get(), &recorder, true), S_OK);
    EXPECT_EQ(traverser.Traverse(noise.Get(), &recorder, true), S_FALSE);
    EXPECT_EQ(traverser.Traverse(noise.Get(), &recorder, false), S_OK);
    C3DShaderTraverser copy(traverser);
    EXPECT_EQ(copy.Traverse(noise.Get(), &recorder, true), S_FALSE); // the set is copied
    EXPECT_EQ(recorder.seen, "Noise Noise");
}

TEST(ShaderNameSpaceTraverser, NamesEveryShaderInItsPreferredOrTheGivenNameSpace) {
    ut::test::LiveObjectCheck live;
    ut::host::ShaderNetwork network = TestNetwork();
    C3DShaderNameSpaceTraverser naming;
    auto surface = network.Node(L"Surface");
    EXPECT_EQ(naming.Traverse(nullptr, network.NameSpace(L"Scene").Get()), E_POINTER);
    EXPECT_EQ(naming.Traverse(surface.Get(), network.NameSpace(L"Scene").Get()), S_OK);
    EXPECT_EQ(network.Members(L"Scene"), (std::vector<std::wstring>{L"Surface", L"Texture", L"Noise"}));
    EXPECT_EQ(network.Members(L"Library"), std::vector<std::wstring>{L"Mix"});
    C3DShaderNameSpaceTraverser copy(naming);
    EXPECT_EQ(copy.Traverse(surface.Get(), network.NameSpace(L"Library").Get()), S_FALSE);
    EXPECT_EQ(copy.OnShader(nullptr), 0);
}

} // namespace
