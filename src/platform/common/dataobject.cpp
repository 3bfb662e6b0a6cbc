// A data object in memory, the same on both homes, and the helpers that fill one.
#include <algorithm>
#include <cstring>
#include <new>
#include <vector>

#include <ut/platform/dataobject.h>
#include <ut/platform/detail/boundary.h>

#include "common/list_enumerator.h"

namespace ut::platform {
namespace {

constexpr DWORD kCopyableMedia = TYMED_HGLOBAL | TYMED_FILE | TYMED_ISTREAM | TYMED_ISTORAGE;

HGLOBAL CopyBlock(HGLOBAL block) {
    SIZE_T size = GlobalSize(block);
    GlobalLockGuard source(block);
    if (!source.Data())
        return nullptr;
    UniqueGlobal copy(GlobalAlloc(GMEM_MOVEABLE, size));
    if (!copy)
        return nullptr;
    GlobalLockGuard target(copy.get());
    if (!target.Data())
        return nullptr;
    std::memcpy(target.Data(), source.Data(), size);
    return copy.release();
}

wchar_t* CopyName(const wchar_t* name) {
    std::size_t bytes = (std::wcslen(name) + 1) * sizeof(wchar_t);
    auto* copy = static_cast<wchar_t*>(CoTaskMemAlloc(bytes));
    if (copy)
        std::memcpy(copy, name, bytes);
    return copy;
}

// Copies a medium for a caller: blocks and names are duplicated, interfaces shared. A file's
// copy names `keeper` as its releaser, so that releasing it never deletes the file.
HRESULT CopyMedium(const STGMEDIUM& from, STGMEDIUM& to, IUnknown* keeper) {
    std::memset(&to, 0, sizeof to);
    to.tymed = from.tymed;
    switch (from.tymed) {
    case TYMED_HGLOBAL:
        to.hGlobal = CopyBlock(from.hGlobal);
        return to.hGlobal ? S_OK : E_OUTOFMEMORY;
    case TYMED_FILE:
        to.lpszFileName = from.lpszFileName ? CopyName(from.lpszFileName) : nullptr;
        if (from.lpszFileName && !to.lpszFileName)
            return E_OUTOFMEMORY;
        to.pUnkForRelease = keeper;
        keeper->AddRef();
        return S_OK;
    case TYMED_ISTREAM:
        to.pstm = from.pstm;
        if (to.pstm)
            to.pstm->AddRef();
        return S_OK;
    case TYMED_ISTORAGE:
        to.pstg = from.pstg;
        if (to.pstg)
            to.pstg->AddRef();
        return S_OK;
    default:
        to.tymed = TYMED_NULL;
        return DV_E_TYMED;
    }
}

class FormatList final : public ListEnumerator<FormatList, IEnumFORMATETC, FORMATETC> {
public:
    using ListEnumerator::ListEnumerator;

    static constexpr HRESULT kNullArray = E_INVALIDARG;
    static bool CopyOut(const FORMATETC& from, FORMATETC& to) {
        to = from;
        return true;
    }
    static void Discard(FORMATETC&) {}
};

class DataObject final : public Object<IDataObject> {
public:
    HRESULT STDMETHODCALLTYPE GetData(FORMATETC* format, STGMEDIUM* medium) override {
        if (!medium)
            return E_INVALIDARG;
        std::memset(medium, 0, sizeof *medium);
        const Held* held = nullptr;
        if (HRESULT hr = Find(format, held); FAILED(hr))
            return hr;
        return CopyMedium(held->medium, *medium, static_cast<IDataObject*>(this));
    }

    HRESULT STDMETHODCALLTYPE GetDataHere(FORMATETC*, STGMEDIUM*) override { return E_NOTIMPL; }

    HRESULT STDMETHODCALLTYPE QueryGetData(FORMATETC* format) override {
        const Held* held = nullptr;
        return Find(format, held);
    }

    HRESULT STDMETHODCALLTYPE GetCanonicalFormatEtc(FORMATETC* format, FORMATETC* canonical) override {
        if (!format || !canonical)
            return E_INVALIDARG;
        *canonical = *format;
        canonical->ptd = nullptr;
        return DATA_S_SAMEFORMATETC;
    }

    HRESULT STDMETHODCALLTYPE SetData(FORMATETC* format, STGMEDIUM* medium, BOOL release) override {
        if (!format || !medium)
            return E_INVALIDARG;
        if (!(medium->tymed & kCopyableMedia) && !release)
            return DV_E_TYMED;
        return ut::ExportBoundary([&] {
            Held held{*format, {}};
            held.format.ptd = nullptr;
            held.format.tymed = medium->tymed;
            if (release) {
                held.medium = *medium;
            } else if (HRESULT hr = CopyMedium(*medium, held.medium, static_cast<IDataObject*>(this));
                       FAILED(hr)) {
                return hr;
            }
            held_.reserve(held_.size() + 1);
            Forget(format->cfFormat, format->dwAspect);
            held_.push_back(held);
            return S_OK;
        });
    }

    HRESULT STDMETHODCALLTYPE EnumFormatEtc(DWORD direction, IEnumFORMATETC** formats) override {
        if (!formats)
            return E_INVALIDARG;
        *formats = nullptr;
        if (direction != DATADIR_GET)
            return E_NOTIMPL;
        return ut::ExportBoundary([&] {
            auto list = std::make_shared<FormatList::Items>();
            for (const Held& held : held_)
                list->push_back(held.format);
            *formats = new FormatList(std::move(list), 0);
            return S_OK;
        });
    }

    HRESULT STDMETHODCALLTYPE DAdvise(FORMATETC*, DWORD, IAdviseSink*, DWORD*) override {
        return OLE_E_ADVISENOTSUPPORTED;
    }
    HRESULT STDMETHODCALLTYPE DUnadvise(DWORD) override { return OLE_E_ADVISENOTSUPPORTED; }
    HRESULT STDMETHODCALLTYPE EnumDAdvise(IEnumSTATDATA**) override { return OLE_E_ADVISENOTSUPPORTED; }

private:
    struct Held {
        FORMATETC format;
        STGMEDIUM medium;
    };

    ~DataObject() override {
        for (Held& held : held_)
            ReleaseStgMedium(&held.medium);
    }

    // The held format that answers `format`, or why none does: the format, then its aspect,
    // then its medium.
    HRESULT Find(const FORMATETC* format, const Held*& found) const {
        if (!format)
            return E_INVALIDARG;
        if (format->lindex != -1)
            return DV_E_LINDEX;
        HRESULT hr = DV_E_FORMATETC;
        for (const Held& held : held_) {
            if (held.format.cfFormat != format->cfFormat)
                continue;
            if (held.format.dwAspect != format->dwAspect) {
                hr = hr == DV_E_FORMATETC ? DV_E_DVASPECT : hr;
                continue;
            }
            if (!(held.format.tymed & format->tymed)) {
                hr = DV_E_TYMED;
                continue;
            }
            found = &held;
            return S_OK;
        }
        return hr;
    }

    void Forget(CLIPFORMAT format, DWORD aspect) {
        auto old = std::find_if(held_.begin(), held_.end(), [&](const Held& held) {
            return held.format.cfFormat == format && held.format.dwAspect == aspect;
        });
        if (old == held_.end())
            return;
        ReleaseStgMedium(&old->medium);
        held_.erase(old);
    }

    std::vector<Held> held_;
};

// Hands `block` to `object` as `format`; the object owns it once it accepts it.
HRESULT SetBlock(IDataObject* object, CLIPFORMAT format, UniqueGlobal block) {
    FORMATETC description{format, nullptr, DVASPECT_CONTENT, -1, TYMED_HGLOBAL};
    STGMEDIUM medium{};
    medium.tymed = TYMED_HGLOBAL;
    medium.hGlobal = block.get();
    HRESULT hr = object->SetData(&description, &medium, TRUE);
    if (SUCCEEDED(hr))
        (void)block.release(); // the data object owns it now
    return hr;
}

} // namespace

HRESULT CreateDataObject(IDataObject** object) {
    if (!object)
        return E_POINTER;
    *object = new (std::nothrow) DataObject();
    return *object ? S_OK : E_OUTOFMEMORY;
}

HRESULT SetGlobalData(IDataObject* object, CLIPFORMAT format, const void* bytes, SIZE_T size) {
    if (!object || (!bytes && size))
        return E_POINTER;
    UniqueGlobal block(GlobalAlloc(GMEM_MOVEABLE, size));
    if (!block)
        return E_OUTOFMEMORY;
    {
        GlobalLockGuard lock(block.get());
        if (!lock.Data())
            return E_OUTOFMEMORY;
        if (size)
            std::memcpy(lock.Data(), bytes, size);
    }
    return SetBlock(object, format, std::move(block));
}

HGLOBAL CreateDropFiles(const std::vector<std::wstring>& names) {
    // The list ends with an empty name; an empty list still holds two terminators, since readers
    // step over a first name before they look for the end.
    SIZE_T size = sizeof(DROPFILES) + (names.empty() ? 2 : 1) * sizeof(wchar_t);
    for (const std::wstring& name : names)
        size += (name.size() + 1) * sizeof(wchar_t);
    UniqueGlobal block(GlobalAlloc(GHND, size));
    if (!block)
        return nullptr;
    GlobalLockGuard lock(block.get());
    if (!lock.Data())
        return nullptr;
    DROPFILES header{};
    header.pFiles = sizeof(DROPFILES);
    header.fWide = TRUE;
    auto* bytes = static_cast<unsigned char*>(lock.Data());
    std::memcpy(bytes, &header, sizeof header);
    SIZE_T at = sizeof header;
    for (const std::wstring& name : names) {
        std::memcpy(bytes + at, name.c_str(), (name.size() + 1) * sizeof(wchar_t));
        at += (name.size() + 1) * sizeof(wchar_t);
    }
    return block.release();
}

HRESULT SetDropFiles(IDataObject* object, const std::vector<std::wstring>& names) {
    if (!object)
        return E_POINTER;
    UniqueGlobal block(CreateDropFiles(names));
    if (!block)
        return E_OUTOFMEMORY;
    return SetBlock(object, CF_HDROP, std::move(block));
}

} // namespace ut::platform
