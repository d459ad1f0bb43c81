// CRC-32 over memory, sections and stored files. The register takes 16 bytes a step through 16
// tables where there is room for them, then 4, then single bytes; bytes are combined by value, so
// neither the byte order of the machine nor the alignment of the data matters.
#include "Varnek_Util.h"

#include <stdlib.h>

#include "Varnek_File.h"
#include "Varnek_Storage.h"
#include "Varnek_Support.h"
#include "Varnek_Trace.h"

namespace {

constexpr uint32_t kPolynomial = 0x04C11DB7u;
constexpr uint32_t kInitial = 0xFFFFFFFFu;
constexpr int32_t kTrailer = 4;     // bytes of a stored CRC
constexpr int32_t kMinPayload = 4;  // bytes that a stored CRC covers at least

// A table is 1 KiB. On the 32-bit target 16 would be half of the first cache and a quarter of the
// library, for sections of a few hundred bytes at a megabyte or two a second.
constexpr int kTables = sizeof(void *) == 8 ? 16 : 1;

// word[n][i] is the register after byte i in its top 8 bits and n more bytes of 0.
struct CrcTables {
    uint32_t word[kTables][256];
};

constexpr CrcTables MakeCrcTables() {
    CrcTables tables = {};
    for (uint32_t i = 0; i < 256; ++i) {
        uint32_t crc = i << 24;
        for (int bit = 0; bit < 8; ++bit) {
            crc = (crc << 1) ^ ((crc >> 31) != 0 ? kPolynomial : 0);
        }
        tables.word[0][i] = crc;
    }
    for (int n = 1; n < kTables; ++n) {
        for (int i = 0; i < 256; ++i) {
            const uint32_t crc = tables.word[n - 1][i];
            tables.word[n][i] = (crc << 8) ^ tables.word[0][crc >> 24];
        }
    }
    return tables;
}

constexpr CrcTables kCrc = MakeCrcTables();
static_assert(kCrc.word[0][1] == 0x04C11DB7u && kCrc.word[0][255] == 0xB1F740B4u);

// The register after `word` and `n` more bytes of 0.
template <int n>
uint32_t Shifted(uint32_t word) {
    return kCrc.word[n + 3][word >> 24] ^ kCrc.word[n + 2][word >> 16 & 0xFF] ^
           kCrc.word[n + 1][word >> 8 & 0xFF] ^ kCrc.word[n][word & 0xFF];
}

// The whole file in a block that the caller frees, or null after the trace.
unsigned char *ReadWhole(const char *path, int32_t size) {
    char *data = ReadWholeFile(path, size);
    if (data == nullptr) {
        VARNEK_TRACE(VARNEK_LEVEL_ERROR | VARNEK_MODULE_DSMCC_DC, "File Reading Fail!\n");
    }
    return reinterpret_cast<unsigned char *>(data);
}

}  // namespace

uint32_t VarnekUtil_MakeCRC32(const unsigned char *data, int32_t length) {
    if (length < 4 || data == nullptr) {
        VARNEK_PANIC();
    }
    if (length < 1 || data == nullptr) {
        return kInitial;
    }
    uint32_t crc = kInitial;
    if constexpr (kTables >= 16) {
        for (; length >= 16; length -= 16, data += 16) {
            crc = Shifted<12>(crc ^ BigEndian(data)) ^ Shifted<8>(BigEndian(data + 4)) ^
                  Shifted<4>(BigEndian(data + 8)) ^ Shifted<0>(BigEndian(data + 12));
        }
        for (; length >= 4; length -= 4, data += 4) {
            crc = Shifted<0>(crc ^ BigEndian(data));
        }
    }
    for (; length > 0; --length, ++data) {
        crc = kCrc.word[0][*data ^ crc >> 24] ^ crc << 8;
    }
    return crc;
}

BOOL VarnekUtil_CheckSectionCRC32(const unsigned char *section) {
    if (section == nullptr) {
        VARNEK_PANIC();
        return FALSE;
    }
    const int32_t length = ((section[1] & 0x0F) << 8 | section[2]) + 3;
    const uint32_t crc = VarnekUtil_MakeCRC32(section, length);
    if (crc != 0) {
        TRACE_HIGH("CRC32 Invalid! calculated crc32=[0x%08x]\n", crc);
        return FALSE;
    }
    return TRUE;
}

BOOL VarnekUtil_CheckFileCRC32(const char *path) {
    const int32_t size = VarnekPGL_GetFileSize(path);
    if (size < kMinPayload + kTrailer) {
        VARNEK_TRACE(VARNEK_LEVEL_ERROR | VARNEK_MODULE_DSMCC_DC,
                     "VarnekUtil_CheckFileCRC32: Invalid File! file path=[%s], fileSize=[%d]\n",
                     Shown(path), size);
        return FALSE;
    }
    unsigned char *buffer = ReadWhole(path, size);
    if (buffer == nullptr) {
        return FALSE;
    }
    const uint32_t calculated = VarnekUtil_MakeCRC32(buffer, size - kTrailer);
    const uint32_t included = BigEndian(buffer + size - kTrailer);
    TRACE_MID("Check CRC Value, File=[%s], Calulated=[0x%08x], Included=[0x%08x]\n", path,
              calculated, included);
    free(buffer);
    return calculated == included ? TRUE : FALSE;
}

BOOL VarnekUtil_AppendCRC32ToFile(const char *path) {
    const int32_t size = VarnekPGL_GetFileSize(path);
    if (size < kMinPayload) {
        VARNEK_TRACE(VARNEK_LEVEL_ERROR | VARNEK_MODULE_DSMCC_DC,
                     "VarnekUtil_AppendCRC32ToFile: Invalid File! file path=[%s], fileSize=[%d]\n",
                     Shown(path), size);
        return FALSE;
    }
    unsigned char *buffer = ReadWhole(path, size);
    if (buffer == nullptr) {
        return FALSE;
    }
    const uint32_t crc = VarnekUtil_MakeCRC32(buffer, size);
    const unsigned char trailer[kTrailer] = {
        static_cast<unsigned char>(crc >> 24), static_cast<unsigned char>(crc >> 16),
        static_cast<unsigned char>(crc >> 8), static_cast<unsigned char>(crc)};
    TRACE_MID("Append CRC Value, File=[%s], CRC32=[0x%08x]\n", path, crc);
    free(buffer);
    // A failed append is logged by the file layer; by contract it does not change the result.
    VarnekPGL_AppendFile(path, trailer, sizeof trailer);
    return TRUE;
}
