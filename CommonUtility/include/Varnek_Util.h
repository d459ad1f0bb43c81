/// @file
/// CRC-32 over sections and over stored files.
///
/// The algorithm is the one of ISO/IEC 13818-1 sections (CRC-32/MPEG-2): polynomial 0x04C11DB7,
/// most significant bit first, initial register 0xFFFFFFFF, no final exclusive-or. Thread-safe; the
/// operations keep no state.
/// @see [Guide: CRC](docs/guide/crc.md)
#ifndef VARNEK_UTIL_H
#define VARNEK_UTIL_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

/// Computes the CRC of `length` bytes. The CRC of data that ends in its own CRC, most significant
/// byte first, is 0. To extend a CRC over another piece of at least 4 bytes, combine the first four
/// bytes of the piece with the complement of the CRC so far, most significant byte first, by
/// exclusive-or, and compute the CRC of the piece.
/// @param data    the bytes, at any alignment
/// @param length  4 or more; a smaller length causes a panic report, and below 1 nothing is read
/// @return the register; 0xFFFFFFFF when `length` is below 1, and for null after a panic report
VARNEK_API uint32_t VarnekUtil_MakeCRC32(const unsigned char *data, int32_t length);

/// Checks a section whose last four bytes are its CRC_32.
/// @param section  the complete section from its table_id on: section_length + 3 bytes are read
/// @return TRUE when the CRC is correct; FALSE when not, and for null after a panic report
VARNEK_API BOOL VarnekUtil_CheckSectionCRC32(const unsigned char *section);

/// Checks a file whose last four bytes are the CRC of the rest, most significant byte first. The
/// file has at least 8 bytes and less than 2 GiB, and is read into memory as a whole.
/// @return TRUE when the CRC is correct; FALSE when not, or when the file is too small or
///         unreadable
VARNEK_API BOOL VarnekUtil_CheckFileCRC32(const char *path);

/// Appends the CRC of a file's whole content to the file. The file has at least 4 bytes and less
/// than 2 GiB, and is read into memory as a whole. A second call appends a second CRC, which covers
/// the content and the first CRC.
/// @return TRUE, even when the append fails; FALSE when the file is too small or unreadable, and
///         therefore unchanged
VARNEK_API BOOL VarnekUtil_AppendCRC32ToFile(const char *path);

#ifdef __cplusplus
}
#endif

#endif
