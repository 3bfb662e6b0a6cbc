// The reference scene the scene tests run on.
#pragma once

#include <string>

#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/platform/com.h>
#include <ut/scene.h>

#include "support/fault_plan.h"

namespace ut::test {

// Classes and parameters of the test scene's property sets.
inline constexpr GUID kTransform = {
    0x5DF886F7, 0x01E8, 0x4B91, {0x99, 0x4F, 0x3D, 0x6F, 0xB1, 0x39, 0x1F, 0x11}};
inline constexpr GUID kMaterial = {
    0x0AC84717, 0xA443, 0x439C, {0x96, 0x77, 0xC9, 0x8D, 0x55, 0x50, 0x26, 0x39}};
inline constexpr GUID kColor = {0x26A41078, 0x851E, 0x417F, {0xAB, 0xF1, 0x5B, 0x19, 0xE3, 0xB8, 0xC6, 0x8D}};
inline constexpr GUID kX = {0x78287B72, 0x0673, 0x4444, {0x9B, 0x9E, 0x0C, 0x63, 0x71, 0xC8, 0xDB, 0x67}};

// A model "Robot" with an "Arm" (selected; a transform with x = 1.5, and a material holding two
// colours), a camera and a light below the root, a time mapping, and a layer.
inline ut::host::Settings TestScene(bool currentContainer = true) {
    using namespace ut::host;
    ObjectDescription arm = {
        .name = L"Arm",
        .selected = true,
        .properties = {
            {.clsid = kTransform, .name = L"Transform", .parameters = {{kX, L"x", 1.5}}},
            {.clsid = kMaterial,
             .name = L"Material",
             .properties = {{.clsid = kColor, .name = L"Color"}, {.clsid = kColor, .name = L"Tint"}}}}};
    Settings settings{.currentContainer = currentContainer};
    settings.scene = {.name = L"Shot",
                      .properties = {{.clsid = GUID_GWTimeMappingProperty, .name = L"Time mapping"}},
                      .objects = {{.name = L"Robot", .model = true, .children = {arm}},
                                  {.name = L"Camera1", .families = {GUID_3DCameraFamily}},
                                  {.name = L"Light"}},
                      .containers = {.layers = {L"Background"}, .devices = {L"Tablet"}}};
    return settings;
}

// ASCII text of a wide name, for messages and comparisons.
inline std::string Narrow(const wchar_t* text) {
    std::string narrow;
    for (; text && *text; ++text)
        narrow += static_cast<char>(*text);
    return narrow;
}

// The scene's object of that name.
inline ComPtr<I3DObject> Find(std::wstring name) {
    ComPtr<I3DObject> object;
    EXPECT_EQ(F3DGet3DObjectFromName(name.data(), object.Put()), S_OK)
        << "no object " << Narrow(name.c_str());
    return object;
}

// The application service of that class.
template <class Interface>
ComPtr<Interface> Service(REFCLSID clsid) {
    ComPtr<Interface> service;
    EXPECT_EQ(GWQueryGenericObject(clsid, InterfaceId<Interface>::Get(), service.PutVoid()), S_OK);
    return service;
}

// The name of the object, "null" for none; the reference is released.
template <class Interface>
std::string NameOf(Interface*& object) {
    ComPtr<I3DObject> named;
    LPOLESTR name = nullptr;
    if (object && SUCCEEDED(object->QueryInterface(IID_I3DObject, named.PutVoid())))
        named->GetName(&name);
    std::string text = object ? Narrow(name) : "null";
    CoTaskMemFree(name);
    if (object)
        object->Release();
    object = nullptr;
    return text;
}

// "set" or "null" for an out-parameter; what it holds is released.
template <class Interface>
std::string Held(Interface*& out) {
    if (!out)
        return "null";
    out->Release();
    out = nullptr;
    return "set";
}

} // namespace ut::test
