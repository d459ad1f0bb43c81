// CRC-32 over sections and over stored files.
//
// The algorithm is the one of ISO/IEC 13818-1 sections (CRC-32/MPEG-2): polynomial 0x04C11DB7, most
// significant bit first, register starting at 0xFFFFFFFF, no final exclusive-or. All operations may
// run in any thread and keep no state.
#ifndef VARNEK_UTIL_H
#define VARNEK_UTIL_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

// Computes the CRC of `length` bytes. Over data that ends in its own CRC, most significant byte
// first, the result is 0. To go on over a further piece, of 4 bytes or more, combine its first four
// bytes with the complement of the CRC so far, most significant byte first, by exclusive-or.
//   data     the bytes, of any alignment
//   length   4 or more; less is reported by a panic report, and less than 1 reads nothing
//   returns  the register; 0xFFFFFFFF when `length` is below 1, and for null after a panic report
VARNEK_API uint32_t VarnekUtil_MakeCRC32(const unsigned char *data, int32_t length);

// Checks a section whose last four bytes are its CRC_32.
//   section  the complete section from its table_id on: section_length + 3 bytes are read
//   returns  TRUE when the CRC is right; FALSE when not, and for null after a panic report
VARNEK_API BOOL VarnekUtil_CheckSectionCRC32(const unsigned char *section);

// Checks a file of at least 8 bytes and less than 2 GiB, which is read into memory as a whole, and
// whose last four bytes are the CRC of the rest, most significant byte first.
//   returns  TRUE when they are equal; FALSE when not, or when the file is too small or unreadable
VARNEK_API BOOL VarnekUtil_CheckFileCRC32(const char *path);

// Appends the CRC of a file's whole content to the file: at least 4 bytes and less than 2 GiB,
// which are read into memory as a whole. Doing it twice appends a CRC of content and first CRC.
//   returns  TRUE once the append was issued, whatever became of it; FALSE when the file is too
//            small or unreadable, and then unchanged
VARNEK_API BOOL VarnekUtil_AppendCRC32ToFile(const char *path);

#ifdef __cplusplus
}
#endif

#endif
