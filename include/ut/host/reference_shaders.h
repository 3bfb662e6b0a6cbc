// The reference host's shader networks, as tests set them up: shader nodes by name, their nested
// ports, each port connected to another node by name (cycles and shared nodes allowed), and the
// name spaces the nodes are named in.
#pragma once

#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include <ut/sdk/shaders.h>

namespace ut::host {

struct PortDescription {
    ULONG index = 0;
    // The node this port is connected to; empty for none.
    std::wstring connected = {};
    std::vector<PortDescription> children = {};
};

struct ShaderDescription {
    std::wstring name = {};
    // A shader node answers IGWComponentAccess and IGWShaderPorts; otherwise the node is a plain
    // hierarchy that walks pass by.
    bool node = true;
    // Answers IGWShaderOpaque: walks do not descend into it.
    bool opaque = false;
    // Answers IGWShaderPortIndex with this port when it is not GWSHADERPORT_NONE.
    ULONG skippedPort = GWSHADERPORT_NONE;
    std::vector<PortDescription> ports = {};
    // The name spaces the node is in and would rather be in (by name; empty for none).
    std::wstring nameSpace = {};
    std::wstring preferredNameSpace = {};
};

class ShaderNetwork {
public:
    ShaderNetwork(const std::vector<ShaderDescription>& shaders, const std::vector<std::wstring>& nameSpaces);
    ~ShaderNetwork();
    ShaderNetwork(const ShaderNetwork&) = delete;
    ShaderNetwork& operator=(const ShaderNetwork&) = delete;

    // The node or name space of that name; null for none.
    ut::ComPtr<IGWComponentHierarchy> Node(std::wstring_view name) const;
    ut::ComPtr<I3DGenericNameSpace> NameSpace(std::wstring_view name) const;
    // The names of the nodes in a name space, in the order they came in.
    std::vector<std::wstring> Members(std::wstring_view nameSpace) const;

    struct Parts;

private:
    std::unique_ptr<Parts> parts_;
};

} // namespace ut::host
