// ut scene show: the scene tree of a scene description, set up on the reference host and walked
// through the library as a plug-in would.
//
//   ut scene show                  the sample scene
//   ut scene show shot.json        the scene shot.json describes
//   ut scene show shot.json --json the scene as the host holds it, as a description again
#include <cstdio>
#include <fstream>
#include <iterator>
#include <memory>
#include <sstream>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>

#include <ut/host/reference_host.h>
#include <ut/platform/text.h>
#include <ut/scene.h>

#include "commands.h"

namespace ut::tool {
namespace {

struct ShowOptions {
    std::string file;
    bool json = false;
};

std::string Narrow(const wchar_t* text) {
    return text ? ut::platform::Utf8FromWide(text) : std::string();
}

} // namespace

ut::host::SceneDescription SampleScene() {
    using namespace ut::host;
    constexpr GUID transform = {0x6E2F1C3A, 0x2B1D, 0x4C55, {0x9A, 0x11, 0x3E, 0x6B, 0x55, 0x0D, 0x2A, 0x10}};
    constexpr GUID x = {0x6E2F1C3B, 0x2B1D, 0x4C55, {0x9A, 0x11, 0x3E, 0x6B, 0x55, 0x0D, 0x2A, 0x10}};
    SceneDescription scene{.name = L"Sample"};
    scene.properties = {{.clsid = GUID_GWTimeMappingProperty, .name = L"Time mapping"}};
    scene.objects = {{.name = L"Robot",
                      .model = true,
                      .children = {{.name = L"Arm",
                                    .selected = true,
                                    .properties = {{.clsid = transform,
                                                    .name = L"Transform",
                                                    .parameters = {{x, L"x", 1.5}}}}}}},
                     {.name = L"Camera1", .families = {GUID_3DCameraFamily}},
                     {.name = L"Light"}};
    scene.containers.layers = {L"Background"};
    scene.sources = {{.name = L"plate", .path = L"C:\\plates\\plate.####.pic"},
                     {.name = L"reference", .path = L"C:\\plates\\reference.pic"}};
    scene.clips = {{.name = L"plate_clip", .source = L"plate"}};
    return scene;
}

ut::host::SceneDescription ReadScene(const std::string& file) {
    std::ifstream in(file, std::ios::binary);
    if (!in)
        Fail(kExitUsage, "cannot read " + file);
    std::string text((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
    ut::host::SceneDescription scene;
    std::string error;
    if (FAILED(ut::host::ParseSceneDescription(text, scene, error)))
        Fail(kExitUsage, file + ": " + error);
    return scene;
}

namespace {

// The names of the property sets the object owns, as one text.
std::string PropertySetNames(I3DObject& object) {
    ut::ComPtr<IGWPropertyOwner> owner;
    ut::ComPtr<IGWProperties> sets;
    ut::ComPtr<IEnumGWProperties> entries;
    if (FAILED(object.QueryInterface(IID_IGWPropertyOwner, owner.PutVoid())) ||
        owner->GetPropertySets(sets.Put()) != S_OK || !sets ||
        FAILED(sets->EnumProperties(GWPROPERTY_MEMBERS, entries.Put())))
        return {};
    std::string names;
    tagGWPROPERTY entry{};
    while (entries->Next(1, &entry, nullptr) == S_OK) {
        names += (names.empty() ? "" : ", ") + Narrow(entry.name);
        ut::sdk::ClearProperty(entry);
    }
    return names;
}

// The objects a list points at.
std::vector<ut::ComPtr<I3DObject>> Objects(I3DList* list) {
    std::vector<ut::ComPtr<I3DObject>> objects;
    ULONG count = 0;
    if (!list || FAILED(list->GetCount(&count)))
        return objects;
    for (ULONG i = 0; i < count; ++i) {
        ut::ComPtr<I3DElemRef> element;
        ut::ComPtr<I3DObject> object;
        if (SUCCEEDED(list->GetItem(i, element.Put())) &&
            element->GetTarget(IID_I3DObject, object.PutVoid(), 1) == S_OK)
            objects.push_back(object);
    }
    return objects;
}

// One line per object, indented by its depth: its name, what it is, and its property sets.
void PrintTree(I3DObject& object, int depth, const std::vector<ut::ComPtr<I3DObject>>& cameras) {
    LPOLESTR name = nullptr;
    (void)object.GetName(&name); // an object without a name shows as an empty one
    std::string line(static_cast<size_t>(depth) * 2, ' ');
    line += Narrow(name);
    CoTaskMemFree(name);
    ut::ComPtr<I3DModel> model;
    if (SUCCEEDED(object.QueryInterface(IID_I3DModel, model.PutVoid())))
        line += "  model";
    for (const ut::ComPtr<I3DObject>& camera : cameras)
        if (camera.Get() == &object)
            line += "  camera";
    if (KXIsActiveDataSelected(&object))
        line += "  selected";
    if (std::string sets = PropertySetNames(object); !sets.empty())
        line += "  [" + sets + "]";
    std::printf("%s\n", line.c_str());
    ut::ComPtr<I3DList> children;
    (void)object.GetChildren(children.Put()); // none is S_FALSE and an empty list
    for (const ut::ComPtr<I3DObject>& child : Objects(children.Get()))
        PrintTree(*child, depth + 1, cameras);
}

void Show(const ShowOptions& options) {
    ut::host::Settings settings;
    settings.scene = options.file.empty() ? SampleScene() : ReadScene(options.file);
    ut::host::ReferenceHost host(settings);
    if (FAILED(host.Status()))
        Fail(kExitUsage, "the reference host did not start");
    if (options.json) {
        std::printf("%s", ut::host::FormatSceneDescription(host.DescribeScene()).c_str());
        return;
    }
    ut::ComPtr<I3DObject> root;
    if (FAILED(KXGetCurrentSceneModel(IID_I3DObject, root.PutVoid())) || !root)
        Fail(kExitUsage, "the scene has no root model");
    ut::ComPtr<I3DList> cameras;
    (void)KXGetListOfSceneCameras(cameras.Put()); // a scene without cameras lists none
    PrintTree(*root, 0, Objects(cameras.Get()));
}

} // namespace

void AddSceneCommand(CLI::App& app) {
    CLI::App* scene = app.add_subcommand("scene", "Set up a scene on the reference host and look at it.");
    scene->require_subcommand(1);
    auto options = std::make_shared<ShowOptions>();
    CLI::App* show =
        scene->add_subcommand("show", "Print the scene tree of a scene description (or of a sample scene).");
    show->add_option("file", options->file, "a scene description in JSON");
    show->add_flag("--json", options->json, "print the scene as a description instead");
    show->footer("One line per object, indented by depth: its name, then model, camera, selected and its "
                 "property sets.\nExample:\n  ut scene show shot.json\n  Shot  model\n    Robot  model\n"
                 "      Arm  selected  [Transform]");
    show->callback([options] { Show(*options); });
}

} // namespace ut::tool
