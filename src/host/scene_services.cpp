// The reference host's undo manager, delete-all bracket and views.
#include "scene_services.h"

#include <ut/platform/detail/boundary.h>
#include <ut/sdk/testing.h>

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

} // namespace

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
