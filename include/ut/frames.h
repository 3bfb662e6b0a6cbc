// Frame numbers in file names: patterns where a run of '#' stands for a zero-padded frame number.
#pragma once

#include <ut/export.h>

// A padding run is a maximal run of '#' (there is no escape for a literal '#'); its width is the
// number of '#' in it. Every run of a pattern is replaced on its own, by its own width. `out`
// must hold at least ut::kPathCapacity (260) wide characters and must not overlap the pattern.
// Patterns and results are cut at 259 characters and terminated; nothing is written beyond.
// Locale-free; null arguments are not checked.

// Replaces each run by the frame, zero-padded to the run's width ("%0*d"): shot.###.pic with
// frame 7 gives shot.007.pic. A wider number is written whole; a minus sign counts in the width
// (x.###.y with -5 gives x.-05.y). Without a run the pattern is copied unchanged.
UT_API void KXExpandFramePadding(const wchar_t* pattern, long frame, wchar_t* out);

// The same with the range first_last, both padded to the run's width ("%0*d_%0*d"):
// shot.###.pic with 7 and 12 gives shot.007_012.pic. Every run receives the whole range.
UT_API void KXExpandFramePadding_Range(const wchar_t* pattern, long first, long last, wchar_t* out);

// Drops every '#'; a run that follows a full stop or a backslash takes that character with it:
// shot.###.pic gives shot.pic, shot_####.tga gives shot_.tga, and C:\img\###.pic gives
// C:\img.pic (the folder separator goes too, on purpose).
UT_API void KXRemoveFramePadding(const wchar_t* pattern, wchar_t* out);
