// Shader traversal: C3DShaderTraverser walks a shader network from one component hierarchy through
// its connected ports and calls a callback on every shader node; C3DShaderNameSpaceTraverser puts
// every named shader it meets into a name space.
//
// A walk does not notice cycles: a callback that may meet one stops the walk itself. The once-only
// option guards only against walking the same root twice with the same traverser.
//
// Decided here: a node's ports are read through IGWShaderPorts (a node without it has none); a
// first port or first child port that the host does not answer with S_OK is taken as none; the
// port not to follow stays GWSHADERPORT_NONE when the node cannot say which it is.
#pragma once

#include <set>

#include <ut/export.h>
#include <ut/platform/com.h>
#include <ut/sdk/shaders.h>

class UT_API C3DShaderTraverserCallback {
public:
    // Called once per shader node visited: 0 goes on, any other value stops the whole walk and is
    // its result.
    virtual long OnShader(IUnknown* shader) = 0;

protected:
    ~C3DShaderTraverserCallback() = default;
};

class UT_API C3DShaderTraverser {
public:
    C3DShaderTraverser() = default;
    C3DShaderTraverser(const C3DShaderTraverser&) = default;
    C3DShaderTraverser& operator=(const C3DShaderTraverser&) = default;
    ~C3DShaderTraverser() = default;

    // Walks the network below `root`: E_POINTER for a null argument; with `once`, S_FALSE for a
    // root this traverser walked with `once` before. Otherwise S_OK, a host failure, or the
    // callback's stop value.
    HRESULT Traverse(IGWComponentHierarchy* root, C3DShaderTraverserCallback* callback, bool once);

protected:
    friend class C3DShaderNameSpaceTraverser;

    // Visits `node` and what its connected ports lead to. Once stopped, answers the stop value
    // until the next Traverse.
    HRESULT TraverseRecursively(IGWComponentHierarchy* node, const tagGWComponent& component);
    // Reads the root's component and walks from it.
    HRESULT Start(IGWComponentHierarchy* root);

    C3DShaderTraverserCallback* callback_ = nullptr;
    bool stopped_ = false;
    long stopResult_ = 0;
    std::set<IGWComponentHierarchy*> traversed_;
};

class UT_API C3DShaderNameSpaceTraverser : public C3DShaderTraverserCallback {
public:
    C3DShaderNameSpaceTraverser() = default;
    C3DShaderNameSpaceTraverser(const C3DShaderNameSpaceTraverser& other);
    C3DShaderNameSpaceTraverser& operator=(const C3DShaderNameSpaceTraverser& other);
    virtual ~C3DShaderNameSpaceTraverser() = default;

    // Walks `root` once (S_FALSE for a root walked before) and adds every named shader to
    // `nameSpace`, or to the name space the shader prefers.
    HRESULT Traverse(IGWComponentHierarchy* root, I3DGenericNameSpace* nameSpace);
    // Always 0: naming never stops the walk.
    long OnShader(IUnknown* shader) override;

private:
    I3DGenericNameSpace* nameSpace_ = nullptr;
    C3DShaderTraverser traverser_;
};
