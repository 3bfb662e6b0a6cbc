// The reference host's undo manager, delete-all bracket, views and parameter dictionary.
#include "scene_services.h"

#include <ut/platform/detail/boundary.h>
#include <ut/sdk/properties.h>
#include <ut/sdk/testing.h>
#include <ut/sdk/variant.h>

#include "host_support.h"

namespace ut::host {
namespace {

class ViewerController final : public ut::sdk::ComObject<IGWViewerController> {
public:
    std::span<const InterfaceEntry> GetInterfaceMap() const override {
        static const InterfaceEntry map[] = {
            ut::sdk::Entry<ViewerController, IGWViewerController>(IID_IGWViewerController)};
        return map;
    }
};

// A dictionary entry: only its alias parameter can be read.
class DictionaryEntry final : public ut::sdk::ComObject<IGWProperties> {
public:
    explicit DictionaryEntry(const GUID& alias) : alias_(alias) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override {
        static const InterfaceEntry map[] = {
            ut::sdk::Entry<DictionaryEntry, IGWProperties>(IID_IGWProperties)};
        return map;
    }
    HRESULT STDMETHODCALLTYPE GetParameterValue(REFGUID id, GWVARIANT* value) override {
        if (HRESULT hr = ut::sdk::CheckHostFault("IGWProperties::GetParameterValue"); FAILED(hr))
            return hr;
        if (!value)
            return E_POINTER;
        return IsEqualGUID(id, GUID_GWParamAlias) ? GWVariantSetGUID(value, alias_) : DISP_E_MEMBERNOTFOUND;
    }
    HRESULT STDMETHODCALLTYPE SetValue(const tagGWREQUEST*, const GWVARIANT*) override { return E_NOTIMPL; }
    HRESULT STDMETHODCALLTYPE Refresh(const tagGWREQUEST*, BOOL, LONG, LONG) override { return E_NOTIMPL; }
    HRESULT STDMETHODCALLTYPE GetProperty(REFGUID, GWVARIANT*, LONG) override { return E_NOTIMPL; }
    HRESULT STDMETHODCALLTYPE CountMembers(REFGUID, ULONG*) override { return E_NOTIMPL; }
    HRESULT STDMETHODCALLTYPE GetMembers(REFGUID, ULONG, ULONG, IGWProperties**) override {
        return E_NOTIMPL;
    }
    HRESULT STDMETHODCALLTYPE EnumProperties(ULONG, IEnumGWProperties**) override { return E_NOTIMPL; }

private:
    GUID alias_;
};

} // namespace

std::span<const CGWCOMObject::InterfaceEntry> ParamDictionary::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {ut::sdk::Entry<ParamDictionary, IGWParamDict>(IID_IGWParamDict)};
    return map;
}

HRESULT ParamDictionary::FindEntry(REFGUID id, IGWProperties** entry) {
    if (!entry)
        return E_POINTER;
    *entry = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWParamDict::FindEntry"); FAILED(hr))
        return hr;
    for (const auto& [parameter, alias] : aliases_) {
        if (IsEqualGUID(parameter, id)) {
            *entry = Make<DictionaryEntry>(alias).Detach();
            return *entry ? S_OK : E_OUTOFMEMORY;
        }
    }
    return DISP_E_MEMBERNOTFOUND;
}

std::span<const CGWCOMObject::InterfaceEntry> UndoManager::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {ut::sdk::Entry<UndoManager, IGWUndoManager>(IID_IGWUndoManager)};
    return map;
}

HRESULT UndoManager::IsInComplexUndo(BOOL* inside) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWUndoManager::IsInComplexUndo"); FAILED(hr))
        return hr;
    if (!inside)
        return E_POINTER;
    *inside = open_ ? TRUE : FALSE;
    return S_OK;
}

HRESULT UndoManager::OpenComplexUndo(const wchar_t* name, LONG) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWUndoManager::OpenComplexUndo"); FAILED(hr))
        return hr;
    if (open_)
        return E_UNEXPECTED;
    return ut::ExportBoundary([&] {
        open_ = name ? name : L"";
        return S_OK;
    });
}

HRESULT UndoManager::CloseComplexUndo() {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWUndoManager::CloseComplexUndo"); FAILED(hr))
        return hr;
    if (!open_)
        return E_UNEXPECTED;
    return ut::ExportBoundary([&] {
        steps_.push_back(std::move(*open_));
        open_.reset();
        return S_OK;
    });
}

std::span<const CGWCOMObject::InterfaceEntry> DeleteAllBracket::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {
        ut::sdk::Entry<DeleteAllBracket, IGWDeleteAllBracket>(IID_IGWDeleteAllBracket)};
    return map;
}

HRESULT DeleteAllBracket::Begin() {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWDeleteAllBracket::Begin"); FAILED(hr))
        return hr;
    ++open_;
    return S_OK;
}

HRESULT DeleteAllBracket::End() {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWDeleteAllBracket::End"); FAILED(hr))
        return hr;
    if (open_ == 0)
        return E_UNEXPECTED;
    --open_;
    return S_OK;
}

std::span<const CGWCOMObject::InterfaceEntry> ViewerControllerFactory::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {
        ut::sdk::Entry<ViewerControllerFactory, IGWViewerControllerFactory>(IID_IGWViewerControllerFactory)};
    return map;
}

HRESULT ViewerControllerFactory::CreateController(REFIID iid, void** controller) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWViewerControllerFactory::CreateController"); FAILED(hr))
        return hr;
    return HandOut(Make<ViewerController>(), iid, controller);
}

} // namespace ut::host
