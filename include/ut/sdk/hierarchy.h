// The scene hierarchy as moves and measures see it: the node interface that says what kind of
// parent an object has, the item interfaces of objects placed under item parents, the marks that
// refuse a move, the scene manager's root lookup, and bounding boxes with the small math types
// they are measured in.
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/scene.h>
#include <ut/sdk/time.h>

// {EFF95861-6291-11D1-BE9E-00A024EE478D}
inline constexpr IID IID_IGWHierarchyNode = {
    0xEFF95861, 0x6291, 0x11D1, {0xBE, 0x9E, 0x00, 0xA0, 0x24, 0xEE, 0x47, 0x8D}};
// {EFF95864-6291-11D1-BE9E-00A024EE478D}
inline constexpr IID IID_IGWHierarchyItem = {
    0xEFF95864, 0x6291, 0x11D1, {0xBE, 0x9E, 0x00, 0xA0, 0x24, 0xEE, 0x47, 0x8D}};
// {EFF95863-6291-11D1-BE9E-00A024EE478D}
inline constexpr IID IID_IGWHierarchyItemProvider = {
    0xEFF95863, 0x6291, 0x11D1, {0xBE, 0x9E, 0x00, 0xA0, 0x24, 0xEE, 0x47, 0x8D}};
// {3DED5562-0BB6-11D3-AC82-00A02485CECB}
inline constexpr IID IID_IGWSecondaryItem = {
    0x3DED5562, 0x0BB6, 0x11D3, {0xAC, 0x82, 0x00, 0xA0, 0x24, 0x85, 0xCE, 0xCB}};
// {B0CBF80E-C0D5-11D0-A586-00A0C91412DE}: an object that must not be moved under a model.
inline constexpr IID IID_IGWNotUnderModel = {
    0xB0CBF80E, 0xC0D5, 0x11D0, {0xA5, 0x86, 0x00, 0xA0, 0xC9, 0x14, 0x12, 0xDE}};
// {60F7ADA0-7E12-11D0-9960-00A0243F0E60}: a plain container of objects.
inline constexpr CLSID CLSID_3DPlainContainer = {
    0x60F7ADA0, 0x7E12, 0x11D0, {0x99, 0x60, 0x00, 0xA0, 0x24, 0x3F, 0x0E, 0x60}};
// {7D3C54A1-19E2-4C55-9B0F-2E1F3A6B8C42}
inline constexpr IID IID_IGWHierarchyRoots = {
    0x7D3C54A1, 0x19E2, 0x4C55, {0x9B, 0x0F, 0x2E, 0x1F, 0x3A, 0x6B, 0x8C, 0x42}};
// {7D3C54A2-19E2-4C55-9B0F-2E1F3A6B8C42}
inline constexpr IID IID_I3DBoundingBox = {
    0x7D3C54A2, 0x19E2, 0x4C55, {0x9B, 0x0F, 0x2E, 0x1F, 0x3A, 0x6B, 0x8C, 0x42}};
// {7D3C54A3-19E2-4C55-9B0F-2E1F3A6B8C42}
inline constexpr IID IID_I3DView = {
    0x7D3C54A3, 0x19E2, 0x4C55, {0x9B, 0x0F, 0x2E, 0x1F, 0x3A, 0x6B, 0x8C, 0x42}};

// Where an object goes relative to its new parent: first or last under it (no reference), or
// before or after a reference sibling.
enum tagEGWDestination : LONG {
    GWDEST_FIRST = 0,
    GWDEST_BEFORE = 1,
    GWDEST_AFTER = 2,
    GWDEST_LAST = 3,
};

// The space a box is measured in.
enum E3DSpaceTag : LONG { E3DSPACE_LOCAL = 0, E3DSPACE_PARENT = 1, E3DSPACE_GLOBAL = 2 };

// A transformation: scale, then translation, kept apart and combined into a row-major 4x4 matrix
// (points are rows, multiplied on the left) when the combined form is asked for.
class C3DTransfo {
public:
    C3DTransfo() = default;
    void SetScale(double x, double y, double z) { Set(scale_, x, y, z); }
    void SetTranslation(double x, double y, double z) { Set(translation_, x, y, z); }
    bool IsStale() const { return stale_; }
    // Brings the matrix up to date with the scale and translation.
    void Combine() {
        for (int i = 0; i < 16; ++i)
            matrix_[i] = 0;
        for (int i = 0; i < 3; ++i) {
            matrix_[i * 5] = scale_[i];
            matrix_[12 + i] = translation_[i];
        }
        matrix_[15] = 1;
        stale_ = false;
    }
    const double* Matrix() const { return matrix_; }

private:
    void Set(double (&to)[3], double x, double y, double z) {
        to[0] = x;
        to[1] = y;
        to[2] = z;
        stale_ = true;
    }
    double scale_[3] = {1, 1, 1};
    double translation_[3] = {0, 0, 0};
    double matrix_[16] = {1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1};
    bool stale_ = false;
};

// An axis-aligned box; empty until a point is added.
struct C3DBBox {
    double min[3] = {0, 0, 0};
    double max[3] = {0, 0, 0};
    bool empty = true;

    void Add(const double (&point)[3]) {
        for (int i = 0; i < 3; ++i) {
            min[i] = empty || point[i] < min[i] ? point[i] : min[i];
            max[i] = empty || point[i] > max[i] ? point[i] : max[i];
        }
        empty = false;
    }
};

// The kind of parent a node is: GWHIERNODE_ITEMS holds hierarchy items; any other kind is a model.
inline constexpr ULONG GWHIERNODE_ITEMS = 3;
struct tagGWHierNodeInfo {
    ULONG size;
    ULONG kind;
};

struct IGWHierarchyNode : IUnknown {
    // Fills the record; `kind` comes preset by the caller.
    virtual HRESULT STDMETHODCALLTYPE GetNodeInfo(tagGWHierNodeInfo* info) = 0;

protected:
    ~IGWHierarchyNode() = default;
};

struct IGWHierarchyItemProvider : IUnknown {
    // The item that stands for the object under an item parent; S_FALSE and null for none.
    virtual HRESULT STDMETHODCALLTYPE GetHierarchyItem(IUnknown** item) = 0;

protected:
    ~IGWHierarchyItemProvider() = default;
};

struct IGWHierarchyRoots : IUnknown {
    // The top object of the hierarchy `object` is in (the object itself when it has no parent).
    virtual HRESULT STDMETHODCALLTYPE GetHierarchyRoot(I3DObject* object, I3DObject** root) = 0;

protected:
    ~IGWHierarchyRoots() = default;
};

// A box over the object and everything below it at `time`, in `space`, under the row-major
// `matrix`; `withChildren`, `flags` and `exact` are the application's options. S_FALSE with an
// empty box when nothing below has extent.
struct I3DBoundingBox : IUnknown {
    virtual HRESULT STDMETHODCALLTYPE GetBoundingBox(const tagGWTIME* time, LONG withChildren, LONG flags,
                                                     E3DSpaceTag space, const double* matrix, LONG option,
                                                     LONG exact, C3DBBox* box) = 0;

protected:
    ~I3DBoundingBox() = default;
};

// A view of the scene; it measures what it shows.
struct I3DView : IUnknown {
    virtual HRESULT STDMETHODCALLTYPE GetObjectBoundingBox(const tagGWTIME* time, IUnknown* object,
                                                           LONG withChildren, E3DSpaceTag space,
                                                           const double* matrix, LONG option,
                                                           C3DBBox* box) = 0;

protected:
    ~I3DView() = default;
};

template <>
struct ut::InterfaceId<IGWHierarchyNode> : ut::Iid<IID_IGWHierarchyNode> {};
template <>
struct ut::InterfaceId<IGWHierarchyItemProvider> : ut::Iid<IID_IGWHierarchyItemProvider> {};
template <>
struct ut::InterfaceId<IGWHierarchyRoots> : ut::Iid<IID_IGWHierarchyRoots> {};
template <>
struct ut::InterfaceId<I3DBoundingBox> : ut::Iid<IID_I3DBoundingBox> {};
template <>
struct ut::InterfaceId<I3DView> : ut::Iid<IID_I3DView> {};
