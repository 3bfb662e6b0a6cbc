#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ut/host/reference_scene.h>
#include <ut/platform/text.h>

#include "commands.h"
#include "run_tool.h"
#include "support/temp_folder.h"

namespace {

ut::test::Outcome RunTool(std::vector<std::string> args) {
    return ut::test::RunTool(&ut::tool::AddSceneCommand, args);
}

const char kDescription[] = R"({"name": "Shot", "objects": [
  {"name": "Robot", "model": true, "children": [{"name": "Arm", "selected": true, "properties": [
    {"class": "{00000001-0002-0003-0405-060708090A0B}", "name": "Transform"},
    {"class": "{00000001-0002-0003-0405-060708090A0C}", "name": "Look"}]}]},
  {"name": "Camera1", "families": ["{9F43B240-58E5-11D0-8469-00A024C7919C}"]}]})";

TEST(SceneCommand, ShowsTheTreeOfADescriptionOrTheDescriptionAsTheHostHoldsIt) {
    ut::host::SceneDescription scene;
    std::string error;
    ASSERT_EQ(ut::host::ParseSceneDescription(kDescription, scene, error), S_OK) << error;
    ut::test::TempFolder folder;
    std::string file = ut::platform::Utf8FromWide(folder.Write(L"shot.json", kDescription));
    std::string bad = ut::platform::Utf8FromWide(folder.Write(L"bad.json", R"({"objects": [{"name": 1}]})"));
    struct Case {
        std::vector<std::string> args;
        ut::test::Outcome expected;
    };
    const Case cases[] = {
        {{"scene", "show", file},
         {0, "Shot  model\n  Robot  model\n    Arm  selected  [Transform, Look]\n  Camera1  camera\n"}},
        {{"scene", "show", file, "--json"}, {0, ut::host::FormatSceneDescription(scene)}},
        {{"scene", "show", bad}, {2, "", "ut scene: " + bad + ": objects[0].name: expected a string"}},
        {{"scene", "show", file + ".missing"}, {2, "", "ut scene: cannot read " + file + ".missing"}},
        {{"scene"}, {2, "", "A subcommand is required"}},
    };
    for (const Case& c : cases) {
        ut::test::Outcome run = RunTool(c.args);
        EXPECT_EQ(run.exit, c.expected.exit) << c.args.back();
        EXPECT_EQ(run.out, c.expected.out) << c.args.back();
        EXPECT_EQ(run.error, c.expected.error) << c.args.back();
    }
    // The sample scene, without a file, is a description that reads back.
    ut::test::Outcome sample = RunTool({"scene", "show", "--json"});
    EXPECT_EQ(ut::host::ParseSceneDescription(sample.out, scene, error), S_OK) << error;
    EXPECT_EQ(RunTool({"scene", "show"}).out.substr(0, 14), "Sample  model\n");
}

} // namespace
