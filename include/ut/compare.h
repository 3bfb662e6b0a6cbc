// Name comparisons in which a trailing number compares by its value: clip9 before clip10.
#pragma once

#include <ut/export.h>

// Drop-in replacements for the C library's case-insensitive comparisons, with C linkage so that
// they can be handed to sorting routines. Each answers negative, zero or positive as lhs orders
// before, with or after rhs; only the sign means anything.
//
// Only a run of digits at the very end of a string takes part: the text before it (the prefix)
// compares case-insensitively first, then the shorter prefix orders first, then the values of the
// runs, and at equal values the longer run orders first: x007 before x7, abc0 before abc. Two
// strings without trailing digits compare as the plain case-insensitive comparison does, and
// digits elsewhere compare as text (shot2a after shot10a). Case folding and digit tests follow the
// C library's current locale; values too large for 32 bits saturate. Nothing is allocated; null
// strings are not checked.
extern "C" {

// Wide text; digits are what iswdigit accepts.
UT_API int F3Dwcsicmpnum(const wchar_t* lhs, const wchar_t* rhs);

// Multibyte text of the current encoding. As it always has, it takes the character count for a
// byte offset where its trailing digits are sought, so in text with multibyte characters the
// search starts before the real end; for single-byte text it agrees with F3Dstricmpnum.
UT_API int F3Dmbsicmpnum(const unsigned char* lhs, const unsigned char* rhs);

// Single bytes; bytes from 0x80 upwards are never digits.
UT_API int F3Dstricmpnum(const char* lhs, const char* rhs);

} // extern "C"
