// The numbered texts of string dictionaries and message catalogs, read from text files.
//
// A table file is UTF-8 text, one entry per line: a decimal number, blanks (spaces or tabs), and
// the text up to the end of the line, in which \n, \t and \\ stand for a line break, a tab and a
// backslash (any other backslash is itself). Blank lines, lines starting with '#' and lines that
// do not start with a number are skipped; a number given twice keeps its last text.
//
// The file of table <name> is "<name>.dict" for a dictionary and "<name>.cat" for a catalog, found
// in "../share/ut" from the folder of a module (the build tree's layout), or where installation
// puts the texts from there: first beside the module given with the lookup, then beside this library.
#pragma once

#include <map>
#include <string>
#include <string_view>

#include <ut/platform/com.h>

namespace ut::sdk {

enum class TextKind { Dictionary, Catalog };

using TextEntries = std::map<unsigned, std::wstring>;

// Parses a table file's content; never fails (what it cannot read it skips).
TextEntries ParseTextTable(std::string_view content);

// The text of entry `id` of table `name`, the table read on first use from beside `owner` (may be
// null) or this library. Null when the entry or the table does not exist; otherwise valid for the
// life of the process. *found (may be null) receives S_OK, or why the table could not be read.
// May throw std::bad_alloc.
const wchar_t* FindText(TextKind kind, std::wstring_view name, unsigned id, HINSTANCE owner, HRESULT* found);

// Reads table `name` from `path`, replacing what was read before (texts handed out stay valid).
HRESULT LoadTextTable(TextKind kind, std::wstring_view name, const wchar_t* path);

} // namespace ut::sdk
