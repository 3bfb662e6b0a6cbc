// The reference scene's JSON description: what is written reads back, through the host too, and
// a wrong description is refused with a line that names the offending element.
#include <string>

#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/host/reference_scene.h>

#include "support/ref_tracker.h"

namespace {

// Every kind of element, written compactly; the formatted text is what reads back the same.
const char kScene[] = R"({"name": "Shot 10", "objects": [
  {"name": "Robot", "model": true, "children": [{"name": "Arm", "selected": true, "hidden": true, "properties": [
    {"class": "{0E1A4F60-0509-11D1-AA94-00A0243E34C4}", "name": "Look", "parameters": [
      {"id": "{00000001-0002-0003-0405-060708090A0B}", "name": "colour", "value": "réd"},
      {"id": "{00000001-0002-0003-0405-060708090A0C}", "value": false}],
     "properties": [{"class": "{00000000-0000-0000-0000-000000000000}"}]}]}]},
  {"name": "Camera1", "families": ["{9F43B240-58E5-11D0-8469-00A024C7919C}"]}],
 "properties": [{"class": "{4A3193B2-9199-11D0-B05B-00A0C90640EC}", "name": "Time mapping",
   "parameters": [{"id": "{B20A80FB-FF66-11D3-B7DD-0008C7A011A6}", "value": 2.5}]}],
 "containers": {"layers": ["Background"], "referencePlanes": ["Ground"], "caches": ["Simulation"]}})";

TEST(SceneDescription, WhatIsWrittenReadsBackAlsoThroughTheHost) {
    ut::host::SceneDescription scene, again;
    std::string error;
    ASSERT_EQ(ut::host::ParseSceneDescription(kScene, scene, error), S_OK) << error;
    const std::string formatted = ut::host::FormatSceneDescription(scene);
    ASSERT_EQ(ut::host::ParseSceneDescription(formatted, again, error), S_OK) << error;
    EXPECT_EQ(ut::host::FormatSceneDescription(again), formatted);
    EXPECT_NE(formatted.find("\"value\": \"réd\""), std::string::npos) << formatted;
    ut::test::LiveObjectCheck live;
    ut::host::ReferenceHost host({.scene = scene});
    ASSERT_EQ(host.Status(), S_OK);
    EXPECT_EQ(ut::host::FormatSceneDescription(host.DescribeScene()), formatted);
    // Every key may be left out.
    ASSERT_EQ(ut::host::ParseSceneDescription("{}", scene, error), S_OK);
    EXPECT_EQ(ut::host::FormatSceneDescription(scene), "{\n  \"name\": \"Scene\"\n}\n");
}

TEST(SceneDescription, AWrongDescriptionIsRefusedNamingTheOffendingElement) {
    const std::pair<const char*, const char*> refusals[] = {
        {"[]", "the description: expected an object"},
        {R"({"name": 7})", "name: expected a string"},
        {R"({"objects": {}})", "objects: expected an array"},
        {R"({"objects": [{"name": "A"}, {"colour": "red"}]})", "objects[1].colour: unknown key"},
        {R"({"objects": [{"children": [{"model": "yes"}]}]})",
         "objects[0].children[0].model: expected true or false"},
        {R"({"objects": [{"families": ["camera"]}]})",
         "objects[0].families[0]: expected a GUID in braces, such as {9F43B240-58E5-11D0-8469-00A024C7919C}"},
        {R"({"properties": [{"parameters": [{"name": "x"}]}]})", "properties[0].parameters[0].id: missing"},
        {R"({"properties": [{"parameters": [{"id": "{00000001-0002-0003-0405-060708090A0B}", "value": null}]}]})",
         "properties[0].parameters[0].value: expected a number, a string, true or false"},
        {R"({"containers": {"layers": [1]}})", "containers.layers[0]: expected a string"},
        {R"({"containers": {"lights": []}})", "containers.lights: unknown key"},
    };
    for (auto [json, expected] : refusals) {
        ut::host::SceneDescription scene;
        scene.name = L"untouched";
        std::string error;
        EXPECT_EQ(ut::host::ParseSceneDescription(json, scene, error), E_INVALIDARG) << json;
        EXPECT_EQ(error, expected);
        EXPECT_EQ(scene.name, L"untouched");
    }
    // Text that is not JSON at all is refused with where it broke.
    ut::host::SceneDescription scene;
    std::string error;
    EXPECT_EQ(ut::host::ParseSceneDescription("{\n  \"name\": \"A\",\n}", scene, error), E_INVALIDARG);
    EXPECT_EQ(error.rfind("the description: parse error at line 3, column 1", 0), 0u) << error;
}

} // namespace
