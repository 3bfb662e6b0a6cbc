// Data transfer on both homes: IDataObject with FORMATETC and STGMEDIUM, ReleaseStgMedium,
// dropped-file lists (CF_HDROP: a DROPFILES header and the names, read with DragQueryFileW) and
// RegisterClipboardFormatW; and a data object in memory that an application or a test fills.
#pragma once

#include <string>
#include <vector>

#include <ut/platform/com.h>
#include <ut/platform/global.h>
#include <ut/platform/native/dataobject.h>
#include <ut/platform/storage.h>

namespace ut::platform {

// A data object that offers what is set on it. SetData keeps the medium (release TRUE) or a
// copy of it (global memory blocks are copied, streams and storages shared); a format set again
// for the same aspect replaces the old one. GetData hands out a copy of a global memory block
// and a new reference to a stream or storage. QueryGetData and GetData answer DV_E_FORMATETC for
// a format not held, DV_E_DVASPECT, DV_E_LINDEX (an index other than -1) and DV_E_TYMED for a
// medium not asked for. EnumFormatEtc lists the held formats; notifications are not offered.
UT_PLATFORM_API HRESULT CreateDataObject(IDataObject** object);

// Sets `format` on `object` as a global memory block holding a copy of `size` bytes.
UT_PLATFORM_API HRESULT SetGlobalData(IDataObject* object, CLIPFORMAT format, const void* bytes, SIZE_T size);

// A CF_HDROP block listing `names` as wide text: a DROPFILES header, each name with its
// terminator, and an empty name at the end. The caller owns the block.
UT_PLATFORM_API HGLOBAL CreateDropFiles(const std::vector<std::wstring>& names);

// Sets a CF_HDROP list of `names` on `object`.
UT_PLATFORM_API HRESULT SetDropFiles(IDataObject* object, const std::vector<std::wstring>& names);

} // namespace ut::platform

template <>
struct ut::InterfaceId<IDataObject> : ut::Iid<IID_IDataObject> {};
template <>
struct ut::InterfaceId<IEnumFORMATETC> : ut::Iid<IID_IEnumFORMATETC> {};
