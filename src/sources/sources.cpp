// Sources and clips of the current scene, found through their containers, and operators through an
// object's active data.
#include <ut/sources.h>

#include <algorithm>

#include <ut/platform/detail/boundary.h>
#include <ut/scene.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/shaders.h>

#include "scene/scene_access.h"

namespace {

using ut::ComPtr;
using ut::scene::ClearOut;

// The next element of a list's enumeration; false after the last (or when the host fails).
bool NextElement(IEnum3DElemRef& elements, ComPtr<I3DElemRef>& element) {
    element.Reset();
    return elements.Next(1, element.Put(), nullptr) == S_OK && element;
}

bool NextObject(IGWEnumObjects& objects, ComPtr<IUnknown>& object) {
    object.Reset();
    return objects.Next(object.Put()) == S_OK && object;
}

bool HasClass(IUnknown* object, REFGUID classId) {
    ComPtr<IPersist> persist;
    CLSID clsid = GUID_NULL;
    return SUCCEEDED(object->QueryInterface(IID_IPersist, persist.PutVoid())) && persist &&
           SUCCEEDED(persist->GetClassID(&clsid)) && IsEqualGUID(clsid, classId);
}

// Reads a source's path into `path`, freeing the host's copy.
HRESULT PathOf(I3DSource& source, CKXString& path) {
    wchar_t* text = nullptr;
    HRESULT hr = source.GetPath(&text);
    if (SUCCEEDED(hr))
        path.Attach_OLE(text);
    else
        CoTaskMemFree(text);
    return hr;
}

HRESULT ChooseContainer(REFGUID key, IGWContentContainer& content,
                        ComPtr<I3DSourceClipContainer>& container) {
    if (IsEqualGUID(key, GUID_3DClipsContainerKey))
        return F3DGetClipsContainer(IID_I3DSourceClipContainer, container.PutVoid());
    if (IsEqualGUID(key, GUID_3DSourcesContainerKey))
        return F3DGetSourcesContainer(IID_I3DSourceClipContainer, container.PutVoid());
    return content.FindObject(key, IID_I3DSourceClipContainer, container.PutVoid());
}

HRESULT ObjectsList(REFGUID containerKey, REFGUID classId, I3DList** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    ComPtr<I3DList> list;
    ComPtr<IGWContentContainer> content;
    ComPtr<I3DSourceClipContainer> container;
    ComPtr<IGWEnumObjects> children;
    if (FAILED(KXCreateInstance(CLSID_3DList, IID_I3DList, list.PutVoid())) || !list ||
        FAILED(KXGet3DContentContainer(IID_IGWContentContainer, content.PutVoid(), 1)) || !content ||
        FAILED(ChooseContainer(containerKey, *content, container)) || !container ||
        FAILED(container->EnumChildren(classId, IID_IUnknown, children.Put())) || !children)
        return E_FAIL;
    ULONG appended = 0;
    for (ComPtr<IUnknown> child; NextObject(*children, child);) {
        if (!HasClass(child.Get(), classId)) // the host's filter is a hint: the class decides
            continue;
        if (FAILED(ut::scene::AppendToList(*list, child.Get())))
            return E_FAIL;
        ++appended;
    }
    if (FAILED(list->QueryInterface(IID_I3DList, reinterpret_cast<void**>(out))))
        return E_FAIL;
    return appended ? S_OK : S_FALSE;
}

// The elements of the listed members of class `classId` under `containerKey`.
HRESULT ListElements(REFGUID containerKey, REFGUID classId, ComPtr<IEnum3DElemRef>& elements) {
    ComPtr<I3DList> list;
    if (FAILED(F3DGetObjectsListFromContainer(containerKey, classId, list.Put())) || !list)
        return E_FAIL;
    return SUCCEEDED(list->EnumElements(elements.Put())) && elements ? S_OK : E_FAIL;
}

HRESULT FindSource(REFGUID sourceClass, const CKXString& path, REFIID iid, void** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    ComPtr<IEnum3DElemRef> elements;
    if (FAILED(ListElements(GUID_3DSourcesContainerKey, sourceClass, elements)))
        return E_FAIL;
    for (ComPtr<I3DElemRef> element; NextElement(*elements, element);) {
        ComPtr<I3DSource> source;
        (void)element->GetTarget(IID_I3DSource, source.PutVoid(), 1); // none: a member without a path
        element.Reset();
        CKXString sourcePath;
        if (source && FAILED(PathOf(*source, sourcePath)))
            return E_FAIL;
        // A member without a path ends the search, though a later one might match.
        if (sourcePath.IsEmpty() || path.IsEmpty())
            return S_FALSE;
        if (GWFilePathsEqual(sourcePath, path))
            return SUCCEEDED(source->QueryInterface(iid, out)) ? S_OK : E_FAIL;
    }
    return S_FALSE;
}

// Appends `source` itself (its IUnknown) to `list`; any failure is returned as it stands.
HRESULT AppendSource(I3DList& list, I3DSource& source) {
    ComPtr<IUnknown> identity;
    ComPtr<I3DElemRef> element;
    if (HRESULT hr = source.QueryInterface(IID_IUnknown, identity.PutVoid()); FAILED(hr))
        return hr;
    if (HRESULT hr = list.NewElement(IID_I3DElemRef, element.PutVoid()); FAILED(hr) || !element)
        return FAILED(hr) ? hr : E_UNEXPECTED;
    if (HRESULT hr = element->SetTarget(identity.Get(), nullptr); FAILED(hr))
        return hr;
    return list.Append(element.Get());
}

HRESULT FindAllSources(REFGUID sourceClass, const CKXString& path, I3DList** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    if (HRESULT hr = KXCreateInstance(CLSID_3DList, IID_I3DList, reinterpret_cast<void**>(out)); FAILED(hr))
        return hr;
    if (!*out)
        return E_UNEXPECTED;
    if (path.IsEmpty())
        return S_FALSE;
    ComPtr<I3DList> sources;
    ComPtr<IEnum3DElemRef> elements;
    if (HRESULT hr = F3DGetObjectsListFromContainer(GUID_3DSourcesContainerKey, sourceClass, sources.Put());
        FAILED(hr))
        return hr;
    if (HRESULT hr = sources->EnumElements(elements.Put()); FAILED(hr) || !elements)
        return FAILED(hr) ? hr : E_UNEXPECTED;
    ULONG appended = 0;
    for (ComPtr<I3DElemRef> element; NextElement(*elements, element);) {
        ComPtr<I3DSource> source;
        if (element->GetTarget(IID_I3DSource, source.PutVoid(), 1) != S_OK || !source)
            continue;
        CKXString sourcePath;
        if (HRESULT hr = PathOf(*source, sourcePath); FAILED(hr))
            return hr;
        if (!GWFilePathsEqual(sourcePath, path))
            continue;
        if (HRESULT hr = AppendSource(**out, *source); FAILED(hr))
            return hr; // what was found so far stays in the list
        ++appended;
    }
    return appended ? S_OK : S_FALSE;
}

HRESULT FindClip(REFGUID clipClass, IUnknown* source, REFIID iid, void** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    if (!source)
        return E_INVALIDARG;
    ComPtr<IEnum3DElemRef> elements;
    if (FAILED(ListElements(GUID_3DClipsContainerKey, clipClass, elements)))
        return E_FAIL;
    for (ComPtr<I3DElemRef> element; NextElement(*elements, element);) {
        ComPtr<I3DClip> clip;
        (void)element->GetTarget(IID_I3DClip, clip.PutVoid(), 1); // a member that is no clip matches nothing
        element.Reset();
        ComPtr<IUnknown> used;
        if (!clip || clip->GetSource(IID_IUnknown, used.PutVoid()) != S_OK || used.Get() != source)
            continue;
        return SUCCEEDED(clip->QueryInterface(iid, out)) ? S_OK : E_FAIL;
    }
    return S_FALSE;
}

HRESULT TopMostOperator(IUnknown* object, ULONG scope, ULONG depth, REFGUID classId, REFIID iid, void** out) {
    if (!object)
        return E_POINTER;
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    ComPtr<IGWActiveData> data;
    ComPtr<IGWEnumObjects> operators;
    if (FAILED(object->QueryInterface(IID_IGWActiveData, data.PutVoid())) || !data ||
        FAILED(
            data->QueryObjects(GWQUERY_OPERATORS, scope, depth, GUID_NULL, IID_IPersist, operators.Put())) ||
        !operators)
        return DISP_E_MEMBERNOTFOUND;
    for (ComPtr<IUnknown> stacked; NextObject(*operators, stacked);)
        if (HasClass(stacked.Get(), classId))
            return stacked->QueryInterface(iid, out);
    return DISP_E_MEMBERNOTFOUND;
}

// The name of a member that is to be listed; false for a hidden one or one that cannot say.
bool ListedName(I3DElemRef& element, CKXString& name) {
    ComPtr<IGWNamedObject> named;
    ComPtr<IGWActiveData> data;
    ULONG flags = 0;
    if (FAILED(element.GetTarget(IID_IGWNamedObject, named.PutVoid(), 1)) || !named ||
        FAILED(named->QueryInterface(IID_IGWActiveData, data.PutVoid())) || !data ||
        FAILED(data->GetFlags(&flags)) || (flags & GWACTIVEDATA_HIDDEN))
        return false;
    wchar_t* text = nullptr;
    if (FAILED(named->GetName(&text))) {
        CoTaskMemFree(text);
        return false;
    }
    name.Attach_OLE(text);
    return true;
}

using Entries = std::vector<std::pair<unsigned int, CKXString>>;

HRESULT MakeEntries(I3DList& list, Entries& entries, bool sort) {
    entries.clear();
    ULONG count = 0;
    if (SUCCEEDED(list.GetCount(&count)) && count == 0)
        return S_FALSE;
    ComPtr<IEnum3DElemRef> elements;
    if (FAILED(list.EnumElements(elements.Put())) || !elements)
        return E_FAIL;
    unsigned int index = 0;
    for (ComPtr<I3DElemRef> element; NextElement(*elements, element); ++index) {
        CKXString name;
        if (ListedName(*element, name))
            entries.emplace_back(index, std::move(name));
    }
    if (sort)
        std::stable_sort(entries.begin(), entries.end(),
                         [](const auto& a, const auto& b) { return a.second.Compare(b.second, true) < 0; });
    return S_OK;
}

// Appends the targets of every element of `from` to `to`.
HRESULT AppendAll(I3DList& from, I3DList& to) {
    ComPtr<IEnum3DElemRef> elements;
    if (FAILED(from.EnumElements(elements.Put())) || !elements)
        return E_FAIL;
    for (ComPtr<I3DElemRef> element; NextElement(*elements, element);) {
        ComPtr<IUnknown> target;
        if (FAILED(element->GetTarget(IID_IUnknown, target.PutVoid(), 1)) || !target ||
            FAILED(ut::scene::AppendToList(to, target.Get())))
            return E_FAIL;
    }
    return S_OK;
}

HRESULT SourceList(Entries& entries, bool sort) {
    ComPtr<I3DList> images, listed;
    if (HRESULT hr = F3DGetSourcesList(CLSID_3DImageSource, images.Put()); FAILED(hr))
        return hr;
    if (HRESULT hr = F3DGetSourcesList(CLSID_3DListedSource, listed.Put()); FAILED(hr))
        return hr;
    if (FAILED(AppendAll(*listed, *images)))
        return E_FAIL;
    return MakeEntries(*images, entries, sort);
}

HRESULT ClipList(Entries& entries, bool sort) {
    ComPtr<I3DList> clips;
    if (HRESULT hr = F3DGetClipsList(CLSID_3DImageClip, clips.Put()); FAILED(hr))
        return hr;
    return MakeEntries(*clips, entries, sort);
}

HRESULT PrimaryFolder(IUnknown* action, REFIID iid, void** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    ComPtr<IGWActiveData> data;
    ComPtr<IGWEnumObjects> owners;
    ComPtr<IUnknown> folder;
    if (!action || FAILED(action->QueryInterface(IID_IGWActiveData, data.PutVoid())) || !data ||
        FAILED(data->QueryObjects(GWQUERY_OWNERS, 0, 0, GUID_NULL, IID_IUnknown, owners.Put())) || !owners ||
        !NextObject(*owners, folder))
        return E_FAIL;
    return folder->QueryInterface(iid, out);
}

} // namespace

HRESULT F3DGetSourcesContainer(const GUID& iid, void** out) {
    return ut::scene::CurrentSceneContainer(GUID_3DSourcesContainerKey, iid, out);
}

HRESULT F3DGetClipsContainer(const GUID& iid, void** out) {
    return ut::scene::CurrentSceneContainer(GUID_3DClipsContainerKey, iid, out);
}

HRESULT F3DGetObjectsListFromContainer(const GUID& containerKey, const GUID& classId, I3DList** out) {
    return ut::ExportBoundary([&] { return ObjectsList(containerKey, classId, out); });
}

HRESULT F3DGetSourcesList(const GUID& classId, I3DList** out) {
    return F3DGetObjectsListFromContainer(GUID_3DSourcesContainerKey, classId, out);
}

HRESULT F3DGetClipsList(const GUID& classId, I3DList** out) {
    return F3DGetObjectsListFromContainer(GUID_3DClipsContainerKey, classId, out);
}

HRESULT F3DFindSource(const GUID& sourceClass, const CKXString& path, const GUID& iid, void** out) {
    return ut::ExportBoundary([&] { return FindSource(sourceClass, path, iid, out); });
}

HRESULT F3DFindAllSources(const GUID& sourceClass, const CKXString& path, I3DList** out) {
    return ut::ExportBoundary([&] { return FindAllSources(sourceClass, path, out); });
}

HRESULT F3DFindImageSource(const wchar_t* path, const GUID& iid, void** out) {
    return ut::ExportBoundary([&] { return FindSource(CLSID_3DImageSource, CKXString(path), iid, out); });
}

HRESULT F3DFindClip(const GUID& clipClass, IUnknown* source, const GUID& iid, void** out) {
    return ut::ExportBoundary([&] { return FindClip(clipClass, source, iid, out); });
}

HRESULT F3DFindImageClip(IUnknown* source, const GUID& iid, void** out) {
    return F3DFindClip(CLSID_3DImageClip, source, iid, out);
}

HRESULT F3DGetTopMostOp(IUnknown* object, unsigned long scope, unsigned long depth, const GUID& classId,
                        const GUID& iid, void** out) {
    return TopMostOperator(object, scope, depth, classId, iid, out);
}

HRESULT F3DMakeClipList(std::vector<std::pair<unsigned int, CKXString>>& entries, bool sort) {
    return ut::ExportBoundary([&] { return ClipList(entries, sort); });
}

HRESULT F3DMakeSourceList(std::vector<std::pair<unsigned int, CKXString>>& entries, bool sort) {
    return ut::ExportBoundary([&] { return SourceList(entries, sort); });
}

HRESULT KXGetPrimaryFolderForAction(IUnknown* action, const GUID& iid, void** out) {
    return PrimaryFolder(action, iid, out);
}
