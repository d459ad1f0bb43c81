/// @file
/// Text conversion from ISO/IEC 8859-15 bytes ("Latin-15") to 16-bit Unicode units ("PCode") or
/// UTF-8 ("LCode"), and between these two. Of UTF-8, only RFC 3629's forms of up to three bytes are
/// supported.
///
/// Every text ends in a 0 byte or unit. A unit is one character from U+0001 to U+FFFF; surrogates
/// are not paired. The caller provides the output buffers, except that of
/// VarnekPGL_ConvertLatin15toUTF8. Thread-safe. A failure may be traced more than once, by the
/// function that fails and by those that called it.
/// @see [Guide: text](docs/guide/text.md)
#ifndef VARNEK_LNGPACK_H
#define VARNEK_LNGPACK_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

/// Converts Latin-15 to units. Control characters are dropped; the no-break space becomes a space.
/// @param[out] pmszOutText  the units and a terminator
/// @param outBufSize        room in units without the terminator; also the most bytes of input
/// @param szInText          the Latin-15 text
/// @return TRUE; FALSE for a null pointer or too long an input
VARNEK_API BOOL WmConvertLatin15Code2PCode(unsigned short *pmszOutText, int outBufSize,
                                           const char *szInText);

/// Counts the units before the terminator; -1 for null.
VARNEK_API int WmStrlen(const unsigned short *mszText);

/// Converts at most `nChar` units to UTF-8, which takes up to three bytes each plus a terminator.
/// @return TRUE, with an empty output for an `nChar` of 0; FALSE for a null pointer
VARNEK_API BOOL WmConvertPCode2UTF(char *pszOutText, const unsigned short *mszInText, int nChar);

/// The encoder of WmConvertPCode2UTF.
/// @return the bytes written, without the terminator; -1 for a null pointer or an `nChar` of 0
VARNEK_API int __WmLngUnicode2UTF(char *des, const unsigned short *src, int nChar);

/// Converts a whole text of units to UTF-8, which takes up to three bytes each and a terminator.
/// @return TRUE; FALSE for a null pointer
VARNEK_API BOOL WmConvert2LCode(char *pszOutText, const unsigned short *mszInText);

/// Converts at most `length` bytes of UTF-8 to units. A byte that starts no character becomes its
/// low seven bits (a terminator if these are 0), and U+00A0 a space. Of a four-byte form, the first
/// three bytes become one wrong unit.
/// @param[out] pmszOutText  the units and a terminator
/// @param outBufSize        room in bytes with the terminator, which always needs two
/// @param szInText          the UTF-8 text
/// @param length            bytes of input to convert at most
/// @return TRUE, with an empty output for a `length` of 0; FALSE, and nothing written, for a null
///         pointer or too little room
VARNEK_API BOOL WmConvertUTF2PCode(unsigned short *pmszOutText, int outBufSize,
                                   const char *szInText, int length);

/// Returns the bytes, terminator included, that WmConvertUTF2PCode needs for this input; null
/// counts as an empty text.
VARNEK_API int __WmLngStrlenByByte(const char *szText, int length);

/// Says whether `OutBuffer` is at least `RequiredBufSize`, tracing a buffer that is too small under
/// the name `szName`.
VARNEK_API BOOL __WmConvertCodeBufferSizeCheck(const char *szName, int OutBuffer,
                                               int RequiredBufSize);

/// The decoder of WmConvertUTF2PCode.
/// @return the units written, without the terminator; -1 for a null pointer
VARNEK_API int __WmLngUTF2Unicode(unsigned short *des, const char *src, int length);

/// Decodes a one-byte character; the next two decode well-formed ones of two and three bytes.
VARNEK_API unsigned short __WmLngConvert1ByteChar(unsigned char first);
/// As `__WmLngConvert1ByteChar`
VARNEK_API unsigned short __WmLngConvert2ByteChar(unsigned char first, unsigned char second);
/// As `__WmLngConvert1ByteChar`
VARNEK_API unsigned short __WmLngConvert3ByteChar(unsigned char first, unsigned char second,
                                                  unsigned char third);

/// Converts Latin-15 to a new UTF-8 text.
/// @param outputData   in: null or a block from malloc, which is freed; out: a block from malloc
///                     that the caller frees; unchanged on failure and if the result is empty
/// @param szInput      the Latin-15 text, read up to its NUL, so copy a slice first
/// @param szInputSize  its length in bytes; up to three times as many, plus one, are accepted
/// @return TRUE; FALSE for a null pointer, a longer text or too little memory
VARNEK_API BOOL VarnekPGL_ConvertLatin15toUTF8(char **outputData, const char *szInput,
                                               unsigned int szInputSize);

#ifdef __cplusplus
}
#endif

#endif
