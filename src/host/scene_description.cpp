// The reference scene's description as JSON text, read and written with nlohmann-json.
#include <initializer_list>
#include <new>
#include <string>
#include <type_traits>
#include <variant>

#include <nlohmann/json.hpp>

#include <ut/host/reference_scene.h>
#include <ut/platform/text.h>

namespace ut::host {
namespace {

using Json = nlohmann::ordered_json;

// What is wrong with the description, and where.
struct Refusal {
    std::string where;
    std::string what;
};

std::string Member(const std::string& path, const char* key) {
    return path.empty() ? key : path + "." + key;
}

std::string Element(const std::string& path, size_t index) {
    return path + "[" + std::to_string(index) + "]";
}

void Expect(bool holds, const std::string& path, const char* what) {
    if (!holds)
        throw Refusal{path.empty() ? "the description" : path, what};
}

// Refuses keys other than `known`, which catches misspelt ones.
void OnlyKeys(const Json& object, const std::string& path, std::initializer_list<const char*> known) {
    Expect(object.is_object(), path, "expected an object");
    for (const auto& item : object.items()) {
        bool expected = false;
        for (const char* key : known)
            expected = expected || item.key() == key;
        if (!expected)
            throw Refusal{Member(path, item.key().c_str()), "unknown key"};
    }
}

std::wstring Text(const Json& value, const std::string& path) {
    Expect(value.is_string(), path, "expected a string");
    return ut::platform::WideFromUtf8(value.get<std::string>());
}

GUID Guid(const Json& value, const std::string& path) {
    GUID guid = GUID_NULL;
    Expect(SUCCEEDED(ut::ParseGuid(Text(value, path).c_str(), &guid)), path,
           "expected a GUID in braces, such as {9F43B240-58E5-11D0-8469-00A024C7919C}");
    return guid;
}

bool Truth(const Json& value, const std::string& path) {
    Expect(value.is_boolean(), path, "expected true or false");
    return value.get<bool>();
}

ParameterValue Value(const Json& value, const std::string& path) {
    if (value.is_number())
        return value.get<double>();
    if (value.is_boolean())
        return value.get<bool>();
    Expect(value.is_string(), path, "expected a number, a string, true or false");
    return Text(value, path);
}

// Reads `object[key]` with `read` when it is there.
template <class Read>
void Optional(const Json& object, const char* key, const std::string& path, Read read) {
    if (auto found = object.find(key); found != object.end())
        read(*found, Member(path, key));
}

// Reads every element of the array `object[key]`, when it is there, with `read`.
template <class Item, class Read>
void Each(const Json& object, const char* key, const std::string& path, std::vector<Item>& into, Read read) {
    Optional(object, key, path, [&](const Json& array, const std::string& arrayPath) {
        Expect(array.is_array(), arrayPath, "expected an array");
        for (size_t i = 0; i < array.size(); ++i)
            into.push_back(read(array[i], Element(arrayPath, i)));
    });
}

ParameterDescription ReadParameter(const Json& json, const std::string& path) {
    OnlyKeys(json, path, {"id", "name", "value"});
    Expect(json.contains("id"), Member(path, "id"), "missing");
    ParameterDescription parameter;
    parameter.id = Guid(json["id"], Member(path, "id"));
    Optional(json, "name", path,
             [&](const Json& value, const std::string& at) { parameter.name = Text(value, at); });
    Optional(json, "value", path,
             [&](const Json& value, const std::string& at) { parameter.value = Value(value, at); });
    return parameter;
}

PropertySetDescription ReadPropertySet(const Json& json, const std::string& path) {
    OnlyKeys(json, path, {"class", "name", "parameters", "properties"});
    PropertySetDescription set;
    Optional(json, "class", path,
             [&](const Json& value, const std::string& at) { set.clsid = Guid(value, at); });
    Optional(json, "name", path,
             [&](const Json& value, const std::string& at) { set.name = Text(value, at); });
    Each(json, "parameters", path, set.parameters, ReadParameter);
    Each(json, "properties", path, set.properties, ReadPropertySet);
    return set;
}

ObjectDescription ReadObject(const Json& json, const std::string& path) {
    OnlyKeys(json, path,
             {"name", "model", "selected", "hidden", "families", "properties", "children", "references",
              "operators"});
    ObjectDescription object;
    Optional(json, "name", path,
             [&](const Json& value, const std::string& at) { object.name = Text(value, at); });
    Optional(json, "model", path,
             [&](const Json& value, const std::string& at) { object.model = Truth(value, at); });
    Optional(json, "selected", path,
             [&](const Json& value, const std::string& at) { object.selected = Truth(value, at); });
    Optional(json, "hidden", path,
             [&](const Json& value, const std::string& at) { object.hidden = Truth(value, at); });
    Each(json, "families", path, object.families, Guid);
    Each(json, "properties", path, object.properties, ReadPropertySet);
    Each(json, "children", path, object.children, ReadObject);
    Optional(json, "references", path,
             [&](const Json& value, const std::string& at) { object.references = Text(value, at); });
    Each(json, "operators", path, object.operators, Guid);
    return object;
}

// The keys a source or a clip shares: its class, name and whether it is hidden.
template <class Media>
void ReadMedia(const Json& json, const std::string& path, const char* link, std::wstring Media::*linked,
               Media& media) {
    OnlyKeys(json, path, {"class", "name", "hidden", link});
    Optional(json, "class", path,
             [&](const Json& value, const std::string& at) { media.clsid = Guid(value, at); });
    Optional(json, "name", path,
             [&](const Json& value, const std::string& at) { media.name = Text(value, at); });
    Optional(json, "hidden", path,
             [&](const Json& value, const std::string& at) { media.hidden = Truth(value, at); });
    Optional(json, link, path,
             [&](const Json& value, const std::string& at) { media.*linked = Text(value, at); });
}

SourceDescription ReadSource(const Json& json, const std::string& path) {
    SourceDescription source;
    ReadMedia(json, path, "path", &SourceDescription::path, source);
    return source;
}

ClipDescription ReadClip(const Json& json, const std::string& path) {
    ClipDescription clip;
    ReadMedia(json, path, "source", &ClipDescription::source, clip);
    return clip;
}

// The containers, in the order of ContainersDescription, by their JSON names.
struct ContainerName {
    const char* key;
    std::vector<std::wstring> ContainersDescription::*members;
};
const ContainerName kContainers[] = {
    {"layers", &ContainersDescription::layers},
    {"passes", &ContainersDescription::passes},
    {"parameterTypes", &ContainersDescription::parameterTypes},
    {"environments", &ContainersDescription::environments},
    {"referencePlanes", &ContainersDescription::referencePlanes},
    {"devices", &ContainersDescription::devices},
    {"caches", &ContainersDescription::caches},
};

ContainersDescription ReadContainers(const Json& json, const std::string& path) {
    OnlyKeys(json, path,
             {"layers", "passes", "parameterTypes", "environments", "referencePlanes", "devices", "caches"});
    ContainersDescription containers;
    for (const ContainerName& container : kContainers)
        Each(json, container.key, path, containers.*container.members, Text);
    return containers;
}

SceneDescription ReadScene(const Json& json) {
    OnlyKeys(json, "", {"name", "properties", "objects", "containers", "sources", "clips"});
    SceneDescription scene;
    Optional(json, "name", "",
             [&](const Json& value, const std::string& at) { scene.name = Text(value, at); });
    Each(json, "properties", "", scene.properties, ReadPropertySet);
    Each(json, "objects", "", scene.objects, ReadObject);
    Optional(json, "containers", "",
             [&](const Json& value, const std::string& at) { scene.containers = ReadContainers(value, at); });
    Each(json, "sources", "", scene.sources, ReadSource);
    Each(json, "clips", "", scene.clips, ReadClip);
    return scene;
}

std::string Utf8(const std::wstring& text) {
    return ut::platform::Utf8FromWide(text);
}

std::string GuidText(REFGUID guid) {
    return Utf8(ut::GuidToString(guid));
}

// Sets `json[key]` to the array of `values` written with `write`, unless there are none.
template <class Value, class Write>
void PutEach(Json& json, const char* key, const std::vector<Value>& values, Write write) {
    if (values.empty())
        return;
    Json& array = json[key] = Json::array();
    for (const Value& value : values)
        array.push_back(write(value));
}

Json WriteParameter(const ParameterDescription& parameter) {
    Json json = {{"id", GuidText(parameter.id)}};
    if (!parameter.name.empty())
        json["name"] = Utf8(parameter.name);
    std::visit(
        [&](const auto& value) {
            if constexpr (std::is_same_v<std::decay_t<decltype(value)>, std::wstring>)
                json["value"] = Utf8(value);
            else
                json["value"] = value;
        },
        parameter.value);
    return json;
}

Json WritePropertySet(const PropertySetDescription& set) {
    Json json = {{"class", GuidText(set.clsid)}};
    if (!set.name.empty())
        json["name"] = Utf8(set.name);
    PutEach(json, "parameters", set.parameters, WriteParameter);
    PutEach(json, "properties", set.properties, WritePropertySet);
    return json;
}

Json WriteObject(const ObjectDescription& object) {
    Json json = {{"name", Utf8(object.name)}};
    for (auto [key, set] : {std::pair("model", object.model), std::pair("selected", object.selected),
                            std::pair("hidden", object.hidden)})
        if (set)
            json[key] = true;
    PutEach(json, "families", object.families, GuidText);
    PutEach(json, "properties", object.properties, WritePropertySet);
    PutEach(json, "children", object.children, WriteObject);
    if (!object.references.empty())
        json["references"] = Utf8(object.references);
    PutEach(json, "operators", object.operators, GuidText);
    return json;
}

template <class Media>
Json WriteMedia(const Media& media, const GUID& defaultClass, const char* link, const std::wstring& linked) {
    Json json = {{"name", Utf8(media.name)}};
    if (!IsEqualGUID(media.clsid, defaultClass))
        json["class"] = GuidText(media.clsid);
    if (!linked.empty())
        json[link] = Utf8(linked);
    if (media.hidden)
        json["hidden"] = true;
    return json;
}

Json WriteSource(const SourceDescription& source) {
    return WriteMedia(source, CLSID_3DImageSource, "path", source.path);
}

Json WriteClip(const ClipDescription& clip) {
    return WriteMedia(clip, CLSID_3DImageClip, "source", clip.source);
}

} // namespace

HRESULT ParseSceneDescription(std::string_view json, SceneDescription& scene, std::string& error) {
    error.clear();
    try {
        scene = ReadScene(Json::parse(json.begin(), json.end()));
        return S_OK;
    } catch (const Json::parse_error& refused) {
        // The library's message names the line and column; its own tag in brackets is dropped.
        std::string what = refused.what();
        size_t tagEnd = what.find("] ");
        error = "the description: " + (tagEnd == std::string::npos ? what : what.substr(tagEnd + 2));
    } catch (const Refusal& refused) {
        error = refused.where + ": " + refused.what;
    } catch (const std::bad_alloc&) {
        return E_OUTOFMEMORY;
    }
    return E_INVALIDARG;
}

std::string FormatSceneDescription(const SceneDescription& scene) {
    Json json = {{"name", Utf8(scene.name)}};
    PutEach(json, "properties", scene.properties, WritePropertySet);
    PutEach(json, "objects", scene.objects, WriteObject);
    Json containers = Json::object();
    for (const ContainerName& container : kContainers)
        PutEach(containers, container.key, scene.containers.*container.members, Utf8);
    if (!containers.empty())
        json["containers"] = std::move(containers);
    PutEach(json, "sources", scene.sources, WriteSource);
    PutEach(json, "clips", scene.clips, WriteClip);
    return json.dump(2) + "\n";
}

} // namespace ut::host
