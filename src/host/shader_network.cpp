// The reference host's shader networks: nodes with nested ports connected by name, and name spaces.
#include <algorithm>
#include <utility>

#include <ut/host/reference_shaders.h>
#include <ut/platform/detail/boundary.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/testing.h>

#include "host_support.h"

namespace ut::host {
namespace {

class ShaderNode;
class NameSpaceObject;

// A port, flattened: positions count from 1, 0 is none.
struct FlatPort {
    ULONG index;
    std::wstring connected;
    ULONG firstChild = 0;
    ULONG next = 0;
};

class NameSpaceObject final : public ut::sdk::ComObject<I3DGenericNameSpace> {
public:
    explicit NameSpaceObject(std::wstring name) : name_(std::move(name)) {}
    std::span<const InterfaceEntry> GetInterfaceMap() const override {
        static const InterfaceEntry map[] = {
            ut::sdk::Entry<NameSpaceObject, I3DGenericNameSpace>(IID_I3DGenericNameSpace)};
        return map;
    }
    HRESULT STDMETHODCALLTYPE Add(IUnknown* object) override;

    std::wstring name_;
    std::vector<std::wstring> members_;
};

// {61C0C0A5-8B0B-4C8E-9D4E-0B7F6B0C2D11}: answers the ShaderNode itself.
constexpr IID IID_ReferenceShader = {
    0x61C0C0A5, 0x8B0B, 0x4C8E, {0x9D, 0x4E, 0x0B, 0x7F, 0x6B, 0x0C, 0x2D, 0x11}};

class ShaderNode final : public ut::sdk::ComObject<IGWComponentHierarchy, IGWComponentAccess, IGWShaderPorts,
                                                   IGWShaderPortIndex, IGWShaderOpaque, IGWNamedObject> {
public:
    ShaderNode(const ShaderDescription& description, ULONG id, ShaderNetwork::Parts* network);

    std::span<const InterfaceEntry> GetInterfaceMap() const override { return map_; }

    HRESULT STDMETHODCALLTYPE GetRootComponent(tagGWComponent* root) override {
        if (HRESULT hr = ut::sdk::CheckHostFault("IGWComponentHierarchy::GetRootComponent"); FAILED(hr))
            return hr;
        if (!root)
            return E_POINTER;
        *root = tagGWComponent{1, 4, 0, id_, {}};
        return S_OK;
    }
    HRESULT STDMETHODCALLTYPE GetComponentGuid(const tagGWComponent&, GUID* guid) override {
        if (!guid)
            return E_POINTER;
        *guid = GUID_NULL;
        return S_OK;
    }
    HRESULT STDMETHODCALLTYPE GetFirstChild(const tagGWComponent&, USHORT, tagGWComponent*) override {
        return S_FALSE;
    }
    HRESULT STDMETHODCALLTYPE GetNextSibling(const tagGWComponent&, USHORT, tagGWComponent*) override {
        return S_FALSE;
    }
    HRESULT STDMETHODCALLTYPE GetNestedHierarchy(const tagGWComponent&, REFIID, void** nested) override {
        if (nested)
            *nested = nullptr;
        return S_FALSE;
    }
    HRESULT STDMETHODCALLTYPE MoveComponent(const tagGWComponent&, LONG, const tagGWComponent*) override {
        return E_NOTIMPL;
    }

    HRESULT STDMETHODCALLTYPE GetFirstPort(USHORT, tagGWShaderPort* port) override {
        return Hand("IGWShaderPorts::GetFirstPort", ports_.empty() ? 0 : 1, port);
    }
    HRESULT STDMETHODCALLTYPE GetFirstChildPort(const tagGWShaderPort& port, USHORT,
                                                tagGWShaderPort* child) override {
        const FlatPort* at = At(port);
        return at ? Hand("IGWShaderPorts::GetFirstChildPort", at->firstChild, child) : E_INVALIDARG;
    }
    HRESULT STDMETHODCALLTYPE GetNextSiblingPort(const tagGWShaderPort& port, USHORT,
                                                 tagGWShaderPort* next) override {
        const FlatPort* at = At(port);
        return at ? Hand("IGWShaderPorts::GetNextSiblingPort", at->next, next) : E_INVALIDARG;
    }
    HRESULT STDMETHODCALLTYPE IsPortConnected(const tagGWShaderPort& port) override {
        if (HRESULT hr = ut::sdk::CheckHostFault("IGWShaderPorts::IsPortConnected"); FAILED(hr))
            return hr;
        const FlatPort* at = At(port);
        return !at ? E_INVALIDARG : Connected(*at) ? S_OK : S_FALSE;
    }
    HRESULT STDMETHODCALLTYPE GetConnectedHierarchy(const tagGWShaderPort& port, REFIID iid,
                                                    void** connected) override;

    HRESULT STDMETHODCALLTYPE GetSkippedPort(ULONG* index) override {
        if (HRESULT hr = ut::sdk::CheckHostFault("IGWShaderPortIndex::GetSkippedPort"); FAILED(hr))
            return hr;
        if (!index)
            return E_POINTER;
        *index = skipped_;
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE GetNameSpace(I3DGenericNameSpace** current) override {
        return HandOut("IGWNamedObject::GetNameSpace", nameSpace_, current);
    }
    HRESULT STDMETHODCALLTYPE GetPreferredNameSpace(I3DGenericNameSpace** preferred) override;
    HRESULT STDMETHODCALLTYPE GetName(wchar_t** name) override {
        if (HRESULT hr = ut::sdk::CheckHostFault("IGWNamedObject::GetName"); FAILED(hr))
            return hr;
        return ut::ExportBoundary([&] { return CopyToTaskMemory(name_, name); });
    }

    const std::wstring name_;
    NameSpaceObject* nameSpace_ = nullptr; // the network holds its name spaces
    ShaderNetwork::Parts* network_;        // null once the network is gone

private:
    void Flatten(const std::vector<PortDescription>& ports);
    const FlatPort* At(const tagGWShaderPort& port) const {
        return port.node == id_ && port.path[0] >= 1 && port.path[0] <= ports_.size()
                   ? &ports_[port.path[0] - 1]
                   : nullptr;
    }
    bool Connected(const FlatPort& port) const;
    HRESULT Hand(const char* operation, ULONG position, tagGWShaderPort* port) const {
        if (HRESULT hr = ut::sdk::CheckHostFault(operation); FAILED(hr))
            return hr;
        if (!port)
            return E_POINTER;
        if (position == 0)
            return S_FALSE;
        *port = tagGWShaderPort{ports_[position - 1].index, id_, {position, 0, 0, 0}};
        return S_OK;
    }
    static HRESULT HandOut(const char* operation, NameSpaceObject* nameSpace, I3DGenericNameSpace** out) {
        if (!out)
            return E_POINTER;
        *out = nullptr;
        if (HRESULT hr = ut::sdk::CheckHostFault(operation); FAILED(hr))
            return hr;
        if (!nameSpace)
            return S_FALSE;
        *out = nameSpace;
        nameSpace->AddRef();
        return S_OK;
    }

    ULONG id_;
    ULONG skipped_;
    std::wstring preferred_;
    std::vector<FlatPort> ports_;
    std::vector<InterfaceEntry> map_;
};

} // namespace

struct ShaderNetwork::Parts {
    std::vector<ut::ComPtr<ShaderNode>> nodes;
    std::vector<ut::ComPtr<NameSpaceObject>> nameSpaces;

    ShaderNode* FindNode(std::wstring_view name) const {
        for (const auto& node : nodes)
            if (node->name_ == name)
                return node.Get();
        return nullptr;
    }
    NameSpaceObject* FindNameSpace(std::wstring_view name) const {
        for (const auto& nameSpace : nameSpaces)
            if (nameSpace->name_ == name)
                return nameSpace.Get();
        return nullptr;
    }
};

namespace {

HRESULT NameSpaceObject::Add(IUnknown* object) {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DGenericNameSpace::Add"); FAILED(hr))
        return hr;
    ut::ComPtr<ShaderNode> node;
    if (!object || FAILED(object->QueryInterface(IID_ReferenceShader, node.PutVoid())))
        return E_INVALIDARG;
    return ut::ExportBoundary([&] {
        members_.push_back(node->name_);
        if (NameSpaceObject* old = std::exchange(node->nameSpace_, this))
            old->members_.erase(std::find(old->members_.begin(), old->members_.end(), node->name_));
        return S_OK;
    });
}

ShaderNode::ShaderNode(const ShaderDescription& description, ULONG id, ShaderNetwork::Parts* network)
    : name_(description.name), network_(network), id_(id), skipped_(description.skippedPort),
      preferred_(description.preferredNameSpace) {
    Flatten(description.ports);
    map_ = {ut::sdk::Entry<ShaderNode, IGWComponentHierarchy>(IID_IGWComponentHierarchy),
            ut::sdk::Entry<ShaderNode, IGWNamedObject>(IID_IGWNamedObject),
            ut::sdk::Entry<ShaderNode, ShaderNode>(IID_ReferenceShader)};
    if (description.node) {
        map_.push_back(ut::sdk::Entry<ShaderNode, IGWComponentAccess>(IID_IGWShaderNode));
        map_.push_back(ut::sdk::Entry<ShaderNode, IGWShaderPorts>(IID_IGWShaderPorts));
    }
    if (description.opaque)
        map_.push_back(ut::sdk::Entry<ShaderNode, IGWShaderOpaque>(IID_IGWShaderOpaque));
    if (description.skippedPort != GWSHADERPORT_NONE)
        map_.push_back(ut::sdk::Entry<ShaderNode, IGWShaderPortIndex>(IID_IGWShaderPortIndex));
}

void ShaderNode::Flatten(const std::vector<PortDescription>& ports) {
    ULONG previous = 0;
    for (const PortDescription& port : ports) {
        ports_.push_back({port.index, port.connected});
        ULONG position = static_cast<ULONG>(ports_.size());
        if (previous)
            ports_[previous - 1].next = position;
        previous = position;
        if (!port.children.empty()) {
            ports_[position - 1].firstChild = position + 1;
            Flatten(port.children);
        }
    }
}

bool ShaderNode::Connected(const FlatPort& port) const {
    return network_ && !port.connected.empty() && network_->FindNode(port.connected);
}

HRESULT ShaderNode::GetConnectedHierarchy(const tagGWShaderPort& port, REFIID iid, void** connected) {
    if (!connected)
        return E_POINTER;
    *connected = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWShaderPorts::GetConnectedHierarchy"); FAILED(hr))
        return hr;
    const FlatPort* at = At(port);
    if (!at)
        return E_INVALIDARG;
    if (!Connected(*at))
        return S_FALSE;
    return network_->FindNode(at->connected)->QueryInterface(iid, connected);
}

HRESULT ShaderNode::GetPreferredNameSpace(I3DGenericNameSpace** preferred) {
    NameSpaceObject* found = network_ && !preferred_.empty() ? network_->FindNameSpace(preferred_) : nullptr;
    return HandOut("IGWNamedObject::GetPreferredNameSpace", found, preferred);
}

} // namespace

ShaderNetwork::ShaderNetwork(const std::vector<ShaderDescription>& shaders,
                             const std::vector<std::wstring>& nameSpaces)
    : parts_(std::make_unique<Parts>()) {
    for (const std::wstring& name : nameSpaces)
        parts_->nameSpaces.push_back(Make<NameSpaceObject>(name));
    for (const ShaderDescription& shader : shaders) {
        auto node = Make<ShaderNode>(shader, static_cast<ULONG>(parts_->nodes.size() + 1), parts_.get());
        if (!node)
            continue; // out of memory: the network lacks the node
        if (NameSpaceObject* nameSpace = parts_->FindNameSpace(shader.nameSpace)) {
            nameSpace->members_.push_back(shader.name);
            node->nameSpace_ = nameSpace;
        }
        parts_->nodes.push_back(std::move(node));
    }
}

ShaderNetwork::~ShaderNetwork() {
    for (const auto& node : parts_->nodes) {
        node->network_ = nullptr;
        node->nameSpace_ = nullptr;
    }
}

ut::ComPtr<IGWComponentHierarchy> ShaderNetwork::Node(std::wstring_view name) const {
    return ut::ComPtr<IGWComponentHierarchy>(parts_->FindNode(name));
}

ut::ComPtr<I3DGenericNameSpace> ShaderNetwork::NameSpace(std::wstring_view name) const {
    return ut::ComPtr<I3DGenericNameSpace>(parts_->FindNameSpace(name));
}

std::vector<std::wstring> ShaderNetwork::Members(std::wstring_view nameSpace) const {
    NameSpaceObject* found = parts_->FindNameSpace(nameSpace);
    return found ? found->members_ : std::vector<std::wstring>();
}

} // namespace ut::host
