// Shader traversal: the walk of a shader network through connected ports, and the traverser that
// names every shader it meets.
#include <vector>

#include <ut/platform/detail/boundary.h>
#include <ut/shaders.h>

namespace {

// Whether `node` answers `iid`; what it hands out is released at once.
bool Answers(IGWComponentHierarchy* node, REFIID iid) {
    ut::ComPtr<IUnknown> part;
    return SUCCEEDED(node->QueryInterface(iid, part.PutVoid())) && part;
}

} // namespace

HRESULT C3DShaderTraverser::Traverse(IGWComponentHierarchy* root, C3DShaderTraverserCallback* callback,
                                     bool once) {
    if (!root || !callback)
        return E_POINTER;
    callback_ = callback;
    stopped_ = false;
    stopResult_ = 0;
    if (once && !ut::ExportBoundary([&] { return traversed_.insert(root).second; }, true))
        return S_FALSE;
    return Start(root);
}

HRESULT C3DShaderTraverser::Start(IGWComponentHierarchy* root) {
    tagGWComponent component{};
    if (HRESULT hr = root->GetRootComponent(&component); FAILED(hr))
        return hr;
    return TraverseRecursively(root, component);
}

HRESULT C3DShaderTraverser::TraverseRecursively(IGWComponentHierarchy* node, const tagGWComponent&) {
    if (stopped_)
        return stopResult_;
    ut::ComPtr<IGWShaderPorts> ports;
    (void)node->QueryInterface(IID_IGWShaderPorts, ports.PutVoid()); // a node without ports is a leaf
    ut::ComPtr<IGWShaderPortIndex> portIndex;
    (void)node->QueryInterface(IID_IGWShaderPortIndex, portIndex.PutVoid()); // optional
    if (!ports && !Answers(node, IID_IGWShaderNode) && !Answers(node, IID_IGWShaderNodeEx))
        return S_OK;
    if (long answer = callback_->OnShader(node); answer != 0) {
        stopped_ = true;
        stopResult_ = answer;
        return answer;
    }
    ULONG skipped = GWSHADERPORT_NONE;
    if (portIndex && FAILED(portIndex->GetSkippedPort(&skipped)))
        skipped = GWSHADERPORT_NONE;
    tagGWShaderPort first{};
    if (!ports || ports->GetFirstPort(GWSHADERPORT_ANY, &first) != S_OK)
        return S_OK;
    return ut::ExportBoundary([&]() -> HRESULT {
        std::vector<tagGWShaderPort> stack{first};
        while (!stack.empty()) {
            tagGWShaderPort port = stack.back();
            stack.pop_back();
            for (;;) {
                if (port.index != skipped) {
                    HRESULT hr = ports->IsPortConnected(port);
                    if (FAILED(hr))
                        return hr;
                    if (hr == S_OK) {
                        ut::ComPtr<IGWComponentHierarchy> connected;
                        hr = ports->GetConnectedHierarchy(port, IID_IGWComponentHierarchy,
                                                          connected.PutVoid());
                        if (FAILED(hr))
                            return hr;
                        if (connected && !Answers(connected.Get(), IID_IGWShaderOpaque)) {
                            tagGWComponent component{};
                            if (hr = connected->GetRootComponent(&component); FAILED(hr))
                                return hr;
                            hr = TraverseRecursively(connected.Get(), component);
                            if (FAILED(hr) || stopped_)
                                return stopped_ ? stopResult_ : hr;
                        }
                    }
                }
                tagGWShaderPort next{};
                if (ports->GetFirstChildPort(port, GWSHADERPORT_ANY, &next) == S_OK)
                    stack.push_back(next);
                if (ports->GetNextSiblingPort(port, GWSHADERPORT_ANY, &next) != S_OK)
                    break; // the last sibling, or a host that cannot say: this run ends
                port = next;
            }
        }
        return S_OK;
    });
}

C3DShaderNameSpaceTraverser::C3DShaderNameSpaceTraverser(const C3DShaderNameSpaceTraverser& other)
    : C3DShaderTraverserCallback(other), nameSpace_(other.nameSpace_), traverser_(other.traverser_) {
    traverser_.callback_ = this;
}

C3DShaderNameSpaceTraverser&
C3DShaderNameSpaceTraverser::operator=(const C3DShaderNameSpaceTraverser& other) {
    nameSpace_ = other.nameSpace_;
    traverser_ = other.traverser_;
    traverser_.callback_ = this;
    return *this;
}

HRESULT C3DShaderNameSpaceTraverser::Traverse(IGWComponentHierarchy* root, I3DGenericNameSpace* nameSpace) {
    nameSpace_ = nameSpace;
    traverser_.callback_ = this;
    traverser_.stopped_ = false;
    traverser_.stopResult_ = 0;
    if (!root)
        return E_POINTER;
    if (!ut::ExportBoundary([&] { return traverser_.traversed_.insert(root).second; }, true))
        return S_FALSE;
    return traverser_.Start(root);
}

long C3DShaderNameSpaceTraverser::OnShader(IUnknown* shader) {
    ut::ComPtr<IGWNamedObject> named;
    if (!shader || FAILED(shader->QueryInterface(IID_IGWNamedObject, named.PutVoid())) || !named)
        return 0;
    ut::ComPtr<I3DGenericNameSpace> current, preferred;
    (void)named->GetNameSpace(current.Put()); // none when it cannot say
    I3DGenericNameSpace* target = nameSpace_;
    if (named->GetPreferredNameSpace(preferred.Put()) == S_OK && preferred)
        target = preferred.Get();
    if (target && target != current.Get())
        (void)target->Add(shader); // a shader that cannot be named keeps its name space
    return 0;
}
