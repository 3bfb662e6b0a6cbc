// Data-object transfer helpers: what a drop target asks of a dropped or pasted data object —
// files, a URL or text, how many, and their names.
#pragma once

#include <ut/export.h>
#include <ut/platform/dataobject.h>
#include <ut/sdk/string.h>

// S_OK when a file list, Unicode text or a URL is offered (tried in that order), else the URL
// query's answer; E_UNEXPECTED for null.
UT_API HRESULT KXIsDataObjectFile(IDataObject* data);
// S_OK when the URL format is offered, else S_FALSE; E_UNEXPECTED for null.
UT_API HRESULT KXIsURLDataObject(IDataObject* data);
// The number of dropped files, or 1 for text or a URL; 0 and E_FAIL for none.
UT_API HRESULT KXGetNbrFileFromDataObject(IDataObject* data, unsigned int* count);
// The one dropped file, at most size - 1 characters; E_FAIL for more than one.
UT_API HRESULT KXGetFileNameFromDataObject(IDataObject* data, wchar_t* buffer, unsigned int size);
// Up to `maxNames` dropped files (each cut to nameSize - 1 characters) with the full number in
// `count`, or the one URL (a path-like one with backslashes and without its "file:" scheme) or
// the first line of the text.
UT_API HRESULT KXGetFileNamesFromDataObject(IDataObject* data, CKXString* names, unsigned int maxNames,
                                            unsigned int* count, unsigned int nameSize);
// S_OK when `name` ends with `extension`, letter case ignored, else S_FALSE.
UT_API HRESULT KXIsFileNameType(CKXString* name, const wchar_t* extension);
