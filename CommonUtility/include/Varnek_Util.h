/// @file
/// CRC-32 over sections and over stored files.
///
/// This is the CRC of ISO/IEC 13818-1 sections (CRC-32/MPEG-2): polynomial 0x04C11DB7, most
/// significant bit first, initial register 0xFFFFFFFF, no final exclusive-or. Thread-safe.
/// @see [Guide: CRC](docs/guide/crc.md)
#ifndef VARNEK_UTIL_H
#define VARNEK_UTIL_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

/// Computes the CRC of `length` bytes. Data that ends in its own CRC, most significant byte first,
/// gives 0. To go on over another piece of at least 4 bytes, exclusive-or its first four bytes with
/// the complement of the CRC so far, most significant byte first, and compute the piece's CRC.
/// @param data    the bytes, at any alignment
/// @param length  4 or more; less causes a panic report, and below 1 nothing is read
/// @return the register; 0xFFFFFFFF if `length` is below 1, and for null after a panic report
VARNEK_API uint32_t VarnekUtil_MakeCRC32(const unsigned char *data, int32_t length);

/// Checks a section whose last four bytes are its CRC_32.
/// @param section  the complete section from its table_id on: section_length + 3 bytes are read
/// @return TRUE if the CRC is right; FALSE if not, and for null after a panic report
VARNEK_API BOOL VarnekUtil_CheckSectionCRC32(const unsigned char *section);

/// Checks a file whose last four bytes are the CRC of the rest, most significant byte first. The
/// file, of 8 bytes to 2 GiB less one, is read into memory as a whole.
/// @return TRUE if the CRC is right; FALSE if not, or if the file is too small or unreadable
VARNEK_API BOOL VarnekUtil_CheckFileCRC32(const char *path);

/// Appends to a file the CRC of all that is in it, an earlier CRC included. The file, of 4 bytes to
/// 2 GiB less one, is read into memory as a whole.
/// @return TRUE, even if appending fails; FALSE, with the file unchanged, if it is too small or
///         unreadable
VARNEK_API BOOL VarnekUtil_AppendCRC32ToFile(const char *path);

#ifdef __cplusplus
}
#endif

#endif
