// The reference host's scene, as a plug-in's tests set it up: a description built in code, or
// read from a small JSON text, that ReferenceHost turns into the current scene.
//
//   {
//     "name": "Shot 10",
//     "properties": [{"class": "{4A3193B2-9199-11D0-B05B-00A0C90640EC}", "name": "Time mapping"}],
//     "objects": [
//       {"name": "Robot", "model": true, "children": [
//         {"name": "Arm", "selected": true,
//          "properties": [{"class": "{...}", "name": "Transform",
//                          "parameters": [{"id": "{...}", "name": "x", "value": 1.5}]}]}]},
//       {"name": "Camera1", "families": ["{9F43B240-58E5-11D0-8469-00A024C7919C}"]}
//     ],
//     "containers": {"layers": ["Background"], "passes": ["Beauty"]},
//     "sources": [{"name": "plate", "path": "C:\\plates\\a.pic"}],
//     "clips": [{"name": "plate_clip", "source": "plate"}]
//   }
//
// An object's "operators" lists the classes of its operator stack, top first; a source or clip
// "class" defaults to the image source and image clip classes, and "hidden" hides it from lists.
//
// Every key is optional. Object names need not be unique; the first in depth-first order is the
// one found by name. A property set's members are further property sets ("properties" again).
#pragma once

#include <string>
#include <string_view>
#include <variant>
#include <vector>

#include <ut/platform/com.h>
#include <ut/sdk/sources.h>

namespace ut::host {

// A number, a text or a truth value; read by the library as VT_R8, VT_BSTR or VT_BOOL.
using ParameterValue = std::variant<double, std::wstring, bool>;

struct ParameterDescription {
    GUID id = GUID_NULL;
    std::wstring name = {};
    ParameterValue value = 0.0;
};

struct PropertySetDescription {
    GUID clsid = GUID_NULL;
    std::wstring name = {};
    std::vector<ParameterDescription> parameters = {};
    std::vector<PropertySetDescription> properties = {};
};

struct ObjectDescription {
    std::wstring name = {};
    // A model answers I3DModel and holds root properties.
    bool model = false;
    bool selected = false;
    bool hidden = false;
    // The families the object belongs to, such as GUID_3DCameraFamily.
    std::vector<GUID> families = {};
    std::vector<PropertySetDescription> properties = {};
    std::vector<ObjectDescription> children = {};
    // The name of a model elsewhere in the scene that this object references: its hierarchy is
    // nested in this object's, so that a model referenced twice is reached twice.
    std::wstring references = {};
    // The object's own extent (minimum x, y, z, then maximum x, y, z; none when empty) and its
    // position relative to its parent. Set in code only: the JSON form leaves them out.
    std::vector<double> extent = {};
    std::vector<double> position = {};
    // The classes of the operators stacked on the object, top first.
    std::vector<GUID> operators = {};
};

// A source of the scene: a file of images or animation.
struct SourceDescription {
    GUID clsid = CLSID_3DImageSource;
    std::wstring name = {};
    std::wstring path = {};
    bool hidden = false;
};

// A clip of the scene: a use of the source named `source` (none when no source has the name).
struct ClipDescription {
    GUID clsid = CLSID_3DImageClip;
    std::wstring name = {};
    std::wstring source = {};
    bool hidden = false;
};

// The member names of the scene's containers and of the content container's folders.
struct ContainersDescription {
    std::vector<std::wstring> layers = {};
    std::vector<std::wstring> passes = {};
    std::vector<std::wstring> parameterTypes = {};
    std::vector<std::wstring> environments = {};
    std::vector<std::wstring> referencePlanes = {};
    std::vector<std::wstring> devices = {};
    std::vector<std::wstring> caches = {};
};

struct SceneDescription {
    // The name of the scene's root model.
    std::wstring name = L"Scene";
    // The scene's own property sets.
    std::vector<PropertySetDescription> properties = {};
    // The objects below the root model.
    std::vector<ObjectDescription> objects = {};
    ContainersDescription containers = {};
    // The sources and clips containers' members, in order.
    std::vector<SourceDescription> sources = {};
    std::vector<ClipDescription> clips = {};
};

// Reads a description. A text that is not one answers E_INVALIDARG with `error` set to one line
// that names the offending element, such as "objects[1].children[0].name: expected a string".
HRESULT ParseSceneDescription(std::string_view json, SceneDescription& scene, std::string& error);
// The description as JSON text (indented by two, keys in the order above, empty parts left out),
// which ParseSceneDescription reads back into the same description.
std::string FormatSceneDescription(const SceneDescription& scene);

} // namespace ut::host
