// The header of an exported scene description file: frame range, step, fields, scene and translator.
#pragma once

#include <ut/export.h>

// The header is the first block of consecutive lines that begin with "set" (after leading spaces;
// tabs are not skipped); it must start within the first 100 lines. Each line of it is
// `set KEYWORD VALUE`. Keywords are case-sensitive: "begin", "end", "step" and "field" take an
// integer (read as atol reads it: no digits give 0); "scene_name" and "translator" take a text in
// double quotes. Nothing after the block is read.
//
// The quoted text is taken only when something other than a single space stands between the
// keyword and the opening quote: `set translator = "exporter"` gives exporter, while
// `set translator "exporter"` gives nothing. Lines are read up to 499 characters; a longer line
// is taken cut short and ends the file.
//
// begin, end and step default to 1 and field to 0. sceneName and translator are optional; when
// given and their keyword is found, they receive a copy that the caller frees with free() (a
// keyword found twice leaves the first copy to the caller's leak: write each keyword once); when
// the keyword is absent they are left as they were.
//
// S_OK when the header was read (some keywords may be missing); E_INVALIDARG when begin, end, step
// or field is null; E_FAIL when the file cannot be opened or no line of its first 100 begins with
// "set". `fileName` is the home's narrow file name.
UT_API long KXReadMIFileHeader(char* fileName, long* begin, long* end, long* step, long* field,
                               char** sceneName, char** translator);
