// Diagnostic dumps: readable descriptions of live objects for a developer at a debugger. They never
// fail the caller; a missing interface or an unreadable value ends a dump quietly.
//
// Lines go to the debugger's output channel: the system's debugger output on Windows, standard
// error on POSIX, or the sink an application sets with ut::SetDumpOutput.
//
// KXDumpActiveData appends to a log file as well (ut::platform::DumpLogPath: UT_DUMP_LOG when
// set, else "c:\KXDumpActiveData.log" on Windows and ~/.local/state/ut/KXDumpActiveData.log on
// POSIX; ut::SetDumpLogPath overrides both). It writes only while the application object allows
// dumps (IGWApplication::AllowsDumps answers S_OK). Below its header it writes the component
// hierarchy of the object, one component per line, indented three spaces per depth:
//
//   "%03d" the depth, " %04X" the component's kind and size byte, ": %s" its GUID,
//   then ": IUnknown %08lX\n" with the nested hierarchy the component stands for (whose
//   components follow one depth further), or ": VT_EMPTY\n" when it stands for none.
//
// `level` is the deepest depth written (negative: no limit); where children are cut off, one
// "<more...>\n" line stands for them, as it does for a nested hierarchy already being written
// above (a model that references itself). The dump ends with the line "KXDumpActiveData end".
// Addresses are written with all their digits.
#pragma once

#include <cstdio>
#include <functional>
#include <string>
#include <string_view>

#include <ut/export.h>
#include <ut/sdk/properties.h>
#include <ut/sdk/string.h>

// Writes every property of `container` (selection 27: parameters and member sets) with its GUID,
// flags, name and value; member sets are written below their property, three spaces further in.
// Always S_OK.
UT_API long KXDumpPropertyContainer(IGWProperties* container, wchar_t* label);

// Names a class by its registered in-process server: with `name`, "[CLSID\{guid}]" and, when
// the server is registered, " : " and its path; else the path goes to `file` ("<path>") or the
// debugger. A class without a server path gives "This GUID is NOT registered Properly, (no
// Default Value)" on `file` or the debugger.
UT_API void F3DMapGuidToName(const GUID& guid, std::FILE* file, CKXString* name);

// Appends the component hierarchy of `object` to the dump log (see above). Always S_OK.
UT_API long KXDumpActiveData(IUnknown* object, wchar_t* label, int level, double* time);

namespace ut {

// Receives each line (or part of a line) that a dump sends to the debugger.
using DumpOutput = std::function<void(std::wstring_view text)>;

// Sends the dumps' debugger output to `output` (empty: back to the platform's channel); answers
// the previous sink.
UT_API DumpOutput SetDumpOutput(DumpOutput output);

// Makes KXDumpActiveData append to `path` (empty: back to ut::platform::DumpLogPath()); answers
// the previous override.
UT_API std::wstring SetDumpLogPath(std::wstring path);

} // namespace ut
