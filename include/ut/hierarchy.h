// Hierarchy moves and bounding boxes: moving an object under a new parent (a model, an item
// parent, or a layer, pass or plain container), finding the root of an object's hierarchy in the
// scene or below a model, and measuring the whole scene.
//
// Decided here: a null parent of a move answers E_POINTER rather than being followed; a parent
// whose kind cannot be read ends the move with that failure; a scene without a root object
// answers E_UNEXPECTED for its box; a null transform passes no matrix on.
#pragma once

#include <ut/export.h>
#include <ut/platform/com.h>
#include <ut/sdk/hierarchy.h>

// Moves `object` under `parent` at `destination` (GWDEST_BEFORE and GWDEST_AFTER relative to
// `reference`, which the other destinations ignore). `out`, when given, receives what the parent's
// active data hands out for the moved object (the reference host: its previous parent). An unknown
// destination answers S_FALSE after every check, and moves nothing.
UT_API HRESULT KXMoveObjectInHier(IUnknown* parent, IUnknown* object, tagEGWDestination destination,
                                  IUnknown* reference, IUnknown** out);
// The top of `object`'s hierarchy, from the scene manager.
UT_API HRESULT KXGet3DObjectHierarchyRoot(I3DObject* object, I3DObject** root);
// The ancestor of `object` (or the object itself) right below `model`: S_FALSE and null for an
// object without a parent, E_UNEXPECTED for one outside the model.
UT_API HRESULT KXGet3DObjectHierarchyRootInModel(I3DObject* object, I3DModel* model, I3DObject** root);
// The box of the whole scene at `time`, in `space`, under `transform`; through `view` when given.
UT_API HRESULT KXGetSceneBBox(tagGWTIME* time, I3DView* view, int first, E3DSpaceTag space,
                              C3DTransfo* transform, int second, C3DBBox* box);
