// The application's undo manager: complex undos, which make several edits one named undo step.
#pragma once

#include <ut/platform/com.h>

// {B8482532-4AD5-11CF-86AD-00AA006297D6}
inline constexpr CLSID CLSID_GWUndoManager = {
    0xB8482532, 0x4AD5, 0x11CF, {0x86, 0xAD, 0x00, 0xAA, 0x00, 0x62, 0x97, 0xD6}};
// {B8482530-4AD5-11CF-86AD-00AA006297D6}
inline constexpr IID IID_IGWUndoManager = {
    0xB8482530, 0x4AD5, 0x11CF, {0x86, 0xAD, 0x00, 0xAA, 0x00, 0x62, 0x97, 0xD6}};

// One complex undo is open at a time; they do not nest.
struct IGWUndoManager : IUnknown {
    // Whether a complex undo is open.
    virtual HRESULT STDMETHODCALLTYPE IsInComplexUndo(BOOL* inside) = 0;
    // Opens the undo step `name`; `flags` is reserved (0). E_UNEXPECTED when one is open already.
    virtual HRESULT STDMETHODCALLTYPE OpenComplexUndo(const wchar_t* name, LONG flags) = 0;
    // Closes the open step; E_UNEXPECTED when none is open.
    virtual HRESULT STDMETHODCALLTYPE CloseComplexUndo() = 0;

protected:
    ~IGWUndoManager() = default;
};

template <>
struct ut::InterfaceId<IGWUndoManager> : ut::Iid<IID_IGWUndoManager> {};
