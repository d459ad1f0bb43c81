/// @file
/// Text conversion between ISO/IEC 8859-15 bytes ("Latin-15"), 16-bit Unicode units ("PCode") and
/// UTF-8 as in RFC 3629 ("LCode").
///
/// Every text ends in a 0 byte or 0 unit. One unit is one character from U+0001 to U+FFFF;
/// surrogates are not paired. The caller provides the output buffers. Thread-safe; the operations
/// keep no state. A failure may be traced more than once, by the function that fails and by its
/// callers.
/// @see [Guide: text](docs/guide/text.md)
#ifndef VARNEK_LNGPACK_H
#define VARNEK_LNGPACK_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

/// Converts Latin-15 to units. Control characters are dropped; the no-break space becomes a space.
/// @param[out] pmszOutText  the units and a terminator
/// @param outBufSize        room in units without the terminator; the input may have at most as
///                          many bytes
/// @param szInText          the Latin-15 text
/// @return TRUE; FALSE for a null pointer or an input that is too long
VARNEK_API BOOL WmConvertLatin15Code2PCode(unsigned short *pmszOutText, int outBufSize,
                                           const char *szInText);

/// Counts units.
/// @return the number of units before the terminator; -1 for null
VARNEK_API int WmStrlen(const unsigned short *mszText);

/// Converts at most `nChar` units to UTF-8. The output takes up to three bytes for each unit, and
/// one for the terminator.
/// @return TRUE, with an empty output for an `nChar` of 0; FALSE for a null pointer
VARNEK_API BOOL WmConvertPCode2UTF(char *pszOutText, const unsigned short *mszInText, int nChar);

/// The encoder of WmConvertPCode2UTF.
/// @return the bytes written, without the terminator; -1 for a null pointer or an `nChar` of 0
VARNEK_API int __WmLngUnicode2UTF(char *des, const unsigned short *src, int nChar);

/// Converts a whole text of units to UTF-8. The output takes up to three bytes for each unit, and
/// one for the terminator.
/// @return TRUE; FALSE for a null pointer
VARNEK_API BOOL WmConvert2LCode(char *pszOutText, const unsigned short *mszInText);

/// Converts UTF-8 to units. It reads at most `length` bytes of input. A byte that starts no
/// character is converted to its low seven bits. U+00A0 becomes a space. Four-byte forms are not
/// decoded.
/// @param[out] pmszOutText  the units and a terminator
/// @param outBufSize        room in bytes with the terminator, which always needs two
/// @param szInText          the UTF-8 text
/// @param length            maximum number of input bytes
/// @return TRUE, with an empty output for a `length` of 0; FALSE, and nothing written, for a null
///         pointer or too little room
VARNEK_API BOOL WmConvertUTF2PCode(unsigned short *pmszOutText, int outBufSize,
                                   const char *szInText, int length);

/// Returns the output size of WmConvertUTF2PCode.
/// @return the bytes that WmConvertUTF2PCode needs for this input, terminator included; null counts
///         as an empty text
VARNEK_API int __WmLngStrlenByByte(const char *szText, int length);

/// Compares the size of a buffer with the required size. A buffer that is too small is traced with
/// the name `szName`.
/// @return TRUE when `OutBuffer` is at least `RequiredBufSize`
VARNEK_API BOOL __WmConvertCodeBufferSizeCheck(const char *szName, int OutBuffer,
                                               int RequiredBufSize);

/// The decoder of WmConvertUTF2PCode.
/// @return the units written, without the terminator; -1 for a null pointer
VARNEK_API int __WmLngUTF2Unicode(unsigned short *des, const char *src, int length);

/// Decode a character of one, two or three bytes. The bytes must be well-formed.
VARNEK_API unsigned short __WmLngConvert1ByteChar(unsigned char first);
/// As `__WmLngConvert1ByteChar`
VARNEK_API unsigned short __WmLngConvert2ByteChar(unsigned char first, unsigned char second);
/// As `__WmLngConvert1ByteChar`
VARNEK_API unsigned short __WmLngConvert3ByteChar(unsigned char first, unsigned char second,
                                                  unsigned char third);

/// Converts Latin-15 to a new UTF-8 text.
/// @param outputData   in: null or a block from malloc, which is freed; out: a block from malloc
///                     that the caller frees. Unchanged when the result is FALSE or the converted
///                     text is empty
/// @param szInput      the Latin-15 text
/// @param szInputSize  length of the input in bytes; a text of up to three times this length plus
///                     one byte is accepted and converted up to its NUL, so a slice needs a copy
/// @return TRUE; FALSE for a null pointer, a text that is longer still or too little memory
VARNEK_API BOOL VarnekPGL_ConvertLatin15toUTF8(char **outputData, const char *szInput,
                                               unsigned int szInputSize);

#ifdef __cplusplus
}
#endif

#endif
