/// @file
/// Helpers on NUL-terminated byte strings: search and comparison without case, numbers to text,
/// substrings, case and trimming.
///
/// Only the ASCII letters have upper and lower case. Whitespace is tab, line feed, vertical tab,
/// form feed, carriage return and space. The caller provides all buffers. Thread-safe. A null text
/// counts as an empty one; nothing is written to a null buffer.
/// @see [Guide: strings](docs/guide/strings.md)
#ifndef VARNEK_STRUTIL_H
#define VARNEK_STRUTIL_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

/// Searches without case.
/// @return the first occurrence of `needle` in `haystack`, `haystack` itself for an empty needle;
///         null when there is none and for a null haystack
VARNEK_API char *VarnekPGL_Stristr(const char *haystack, const char *needle);

/// Writes a number with upper-case digits.
/// @param value   the number
/// @param buffer  room for the digits and the terminator: 11 bytes in radix 10, at most 33
/// @param radix   2 to 16; any other radix gives an empty text
/// @return `buffer`
VARNEK_API char *VarnekPGL_Itoa(uint32_t value, char *buffer, uint32_t radix);

/// Writes a number with lower-case digits. Radix 10 writes a sign; every other radix writes the
/// number as unsigned 32 bits.
/// @param value   the number
/// @param buffer  room for sign, digits and terminator: 12 bytes in radix 10, at most 33
/// @param radix   2 to 36; any other radix gives an empty text
/// @return `buffer`
VARNEK_API char *VarnekPGL_Ltoa(int32_t value, char *buffer, uint32_t radix);

/// Compares without case.
/// @return the difference between the first two bytes that differ, as unsigned lower-case
///         characters; 0 when the texts are equal
VARNEK_API int32_t VarnekPGL_Stricmp(const char *a, const char *b);

/// Compares at most `count` bytes without case; a count of 0 compares equal.
VARNEK_API int32_t VarnekPGL_Strnicmp(const char *a, const char *b, uint32_t count);

/// Copies a part of a text, as strncpy does: it writes exactly `count` bytes, padded with NULs, and
/// no terminator when the part has `count` bytes or more.
/// @param destination  room for `count` bytes, at least one
/// @param source       the text
/// @param start        position of the first byte; below 1 means the beginning
/// @param count        bytes to write; below 1 makes the destination empty
/// @return `destination`; a constant empty text, with nothing written, when `start` is beyond the
///         end of the source
VARNEK_API char *VarnekPGL_Strmcpy(char *destination, const char *source, int32_t start,
                                   int32_t count);

/// Convert to upper and to lower case in place.
/// @return `text`
VARNEK_API char *VarnekPGL_Strupr(char *text);
VARNEK_API char *VarnekPGL_Strlwr(char *text);  ///< to lower case

/// Remove whitespace in place: from both ends, and from the right end.
VARNEK_API void VarnekPGL_Strtrim(char *text);
VARNEK_API void VarnekPGL_Strrtrim(char *text);  ///< from the right end only

#ifdef __cplusplus
}
#endif

#endif
