/// @file
/// Helpers for NUL-terminated texts: searching and comparing while ignoring case, numbers,
/// substrings, converting case and trimming.
///
/// Only ASCII letters have case. Whitespace is space, tab, line feed, vertical tab, form feed and
/// carriage return. The caller provides all buffers. Thread-safe. A null text counts as an empty
/// one; a null buffer is left alone.
/// @see [Guide: strings](docs/guide/strings.md)
#ifndef VARNEK_STRUTIL_H
#define VARNEK_STRUTIL_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

/// Searches, ignoring case.
/// @return where `needle` first occurs in `haystack`; `haystack` for an empty needle; else null
VARNEK_API char *VarnekPGL_Stristr(const char *haystack, const char *needle);

/// Writes a number with upper-case digits.
/// @param value   the number
/// @param buffer  room for the digits and the terminator: 11 bytes in radix 10, at most 33
/// @param radix   2 to 16; any other radix gives an empty text
/// @return `buffer`
VARNEK_API char *VarnekPGL_Itoa(uint32_t value, char *buffer, uint32_t radix);

/// Writes a number with lower-case digits: in radix 10 with a sign, else as unsigned 32 bits.
/// @param value   the number
/// @param buffer  room for sign, digits and terminator: 12 bytes in radix 10, at most 33
/// @param radix   2 to 36; any other radix gives an empty text
/// @return `buffer`
VARNEK_API char *VarnekPGL_Ltoa(int32_t value, char *buffer, uint32_t radix);

/// Compares, ignoring case.
/// @return the difference of the first two bytes that differ, in lower case and unsigned; else 0
VARNEK_API int32_t VarnekPGL_Stricmp(const char *a, const char *b);

/// Compares at most `count` bytes, ignoring case; a count of 0 compares equal.
VARNEK_API int32_t VarnekPGL_Strnicmp(const char *a, const char *b, uint32_t count);

/// Copies a part of a text as strncpy does: exactly `count` bytes, padded with NULs, and without a
/// terminator if the part fills them.
/// @param destination  room for `count` bytes, at least one
/// @param source       the text
/// @param start        position of the first byte; below 1 means the beginning
/// @param count        bytes to write; below 1 makes the destination empty
/// @return `destination`; a constant empty text, with nothing written, if `start` is beyond the end
VARNEK_API char *VarnekPGL_Strmcpy(char *destination, const char *source, int32_t start,
                                   int32_t count);

/// Converts to upper case in place and returns `text`.
VARNEK_API char *VarnekPGL_Strupr(char *text);
VARNEK_API char *VarnekPGL_Strlwr(char *text);  ///< to lower case

/// Removes whitespace from both ends in place.
VARNEK_API void VarnekPGL_Strtrim(char *text);
VARNEK_API void VarnekPGL_Strrtrim(char *text);  ///< from the right end only

#ifdef __cplusplus
}
#endif

#endif
