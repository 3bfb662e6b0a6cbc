// The reference host's editing services around the scene: the undo manager with its complex-undo
// steps, the delete-all bracket, the view manager, the factory of viewer controllers and the
// parameter dictionary.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include <ut/sdk/comobject.h>
#include <ut/sdk/components.h>
#include <ut/sdk/scene.h>
#include <ut/sdk/undo.h>
#include <ut/sdk/views.h>

namespace ut::host {

// Records the complex-undo steps closed, by name; refuses to open one inside another.
class UndoManager final : public ut::sdk::ComObject<IGWUndoManager> {
public:
    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE IsInComplexUndo(BOOL* inside) override;
    HRESULT STDMETHODCALLTYPE OpenComplexUndo(const wchar_t* name, LONG flags) override;
    HRESULT STDMETHODCALLTYPE CloseComplexUndo() override;

    const std::vector<std::wstring>& Steps() const { return steps_; }

private:
    std::optional<std::wstring> open_;
    std::vector<std::wstring> steps_;
};

// Knows the parameters that are also known by another id: the entry of such a parameter answers
// that id (a GW_VT_GUID) as its GUID_GWParamAlias parameter; other ids have no entry.
class ParamDictionary final : public ut::sdk::ComObject<IGWParamDict> {
public:
    explicit ParamDictionary(std::vector<std::pair<GUID, GUID>> aliases) : aliases_(std::move(aliases)) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE FindEntry(REFGUID id, IGWProperties** entry) override;

private:
    std::vector<std::pair<GUID, GUID>> aliases_;
};

// Counts the brackets open; an End without a Begin is refused.
class DeleteAllBracket final : public ut::sdk::ComObject<IGWDeleteAllBracket> {
public:
    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE Begin() override;
    HRESULT STDMETHODCALLTYPE End() override;

    ULONG Open() const { return open_; }

private:
    ULONG open_ = 0;
};

class ViewerControllerFactory final : public ut::sdk::ComObject<IGWViewerControllerFactory> {
public:
    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE CreateController(REFIID iid, void** controller) override;
};

} // namespace ut::host
