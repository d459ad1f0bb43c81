// CRC-32 over memory, sections and stored files: 16 bytes a step on 64-bit systems, then 4, then
// one, with as many tables. The register is kept with its bytes reversed, so that a little-endian
// machine need not swap words of data; byte order and alignment do not affect the result.
#include "Varnek_Util.h"

#include <stdlib.h>

#include "Varnek_Bytes.h"
#include "Varnek_File.h"
#include "Varnek_Storage.h"
#include "Varnek_Support.h"
#include "Varnek_Trace.h"

namespace {

constexpr uint32_t kPolynomial = 0x04C11DB7u;
constexpr uint32_t kInitial = 0xFFFFFFFFu;
constexpr int32_t kTrailer = 4;     // bytes of a stored CRC
constexpr int32_t kMinPayload = 4;  // the fewest bytes that a stored CRC covers

// On the 32-bit target, 16 tables of 1 KiB would fill half of the first-level cache, which does not
// pay for sections of a few hundred bytes at one or two megabytes a second.
constexpr bool kWide = sizeof(void *) == 8;

// word[i] is the reversed register after byte i and a number of zero bytes.
struct CrcTable {
    uint32_t word[256];
};

constexpr CrcTable MakeCrcTable(int zeros) {
    CrcTable table = {};
    for (uint32_t i = 0; i < 256; ++i) {
        uint32_t crc = i << 24;
        for (int bit = 0; bit < 8 * (1 + zeros); ++bit) {
            crc = (crc << 1) ^ ((crc >> 31) != 0 ? kPolynomial : 0);
        }
        table.word[i] = __builtin_bswap32(crc);
    }
    return table;
}

// The tables are separate objects, so that the compiler keeps the address of each in a register.
template <int zeros>
constexpr CrcTable kCrc = MakeCrcTable(zeros);
static_assert(kCrc<0>.word[1] == 0xB71DC104u && kCrc<0>.word[255] == 0xB440F7B1u);

uint32_t Word(const unsigned char *data) {
    return LittleEndian(Load<uint32_t>(data));
}

// Returns the reversed register after the four bytes of `word` and `zeros` zero bytes.
template <int zeros>
uint32_t After(uint32_t word) {
    return kCrc<zeros + 3>.word[word & 0xFF] ^ kCrc<zeros + 2>.word[word >> 8 & 0xFF] ^
           kCrc<zeros + 1>.word[word >> 16 & 0xFF] ^ kCrc<zeros>.word[word >> 24];
}

// Reads a whole file of at least `least` bytes into a block that the caller frees. Returns null,
// after a trace, on failure.
unsigned char *ReadWhole(const char *operation, const char *path, int32_t least, int32_t *size) {
    *size = VarnekPGL_GetFileSize(path);
    if (*size < least) {
        VARNEK_TRACE(VARNEK_LEVEL_ERROR | VARNEK_MODULE_DSMCC_DC,
                     "%s: Invalid File! file path=[%s], fileSize=[%d]\n", operation, Shown(path),
                     *size);
        return nullptr;
    }
    char *data = ReadWholeFile(path, *size);
    if (data == nullptr) {
        VARNEK_TRACE(VARNEK_LEVEL_ERROR | VARNEK_MODULE_DSMCC_DC, "File Reading Fail!\n");
    }
    return reinterpret_cast<unsigned char *>(data);
}

}  // namespace

uint32_t VarnekUtil_MakeCRC32(const unsigned char *data, int32_t length) {
    if (__builtin_expect(length < 4 || data == nullptr, 0)) {
        VARNEK_PANIC();
        if (length < 1 || data == nullptr) {
            return kInitial;
        }
    }
    uint32_t crc = kInitial;
    size_t left = static_cast<size_t>(length);
    if constexpr (kWide) {
        for (; left >= 16; left -= 16, data += 16) {
            crc = After<12>(crc ^ Word(data)) ^ After<8>(Word(data + 4)) ^
                  After<4>(Word(data + 8)) ^ After<0>(Word(data + 12));
        }
    }
    for (const unsigned char *const stop = data + (left & ~size_t{3}); data != stop; data += 4) {
        crc = After<0>(crc ^ Word(data));
    }
    for (const unsigned char *const stop = data + left % 4; data != stop; ++data) {
        crc = kCrc<0>.word[(*data ^ crc) & 0xFF] ^ crc >> 8;
    }
    return __builtin_bswap32(crc);
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
    int32_t size = 0;
    unsigned char *buffer = ReadWhole(__func__, path, kMinPayload + kTrailer, &size);
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
    int32_t size = 0;
    unsigned char *buffer = ReadWhole(__func__, path, kMinPayload, &size);
    if (buffer == nullptr) {
        return FALSE;
    }
    const uint32_t crc = VarnekUtil_MakeCRC32(buffer, size);
    const unsigned char trailer[kTrailer] = {
        static_cast<unsigned char>(crc >> 24), static_cast<unsigned char>(crc >> 16),
        static_cast<unsigned char>(crc >> 8), static_cast<unsigned char>(crc)};
    TRACE_MID("Append CRC Value, File=[%s], CRC32=[0x%08x]\n", path, crc);
    free(buffer);
    // File logs a failed append; by contract it does not change the result.
    VarnekPGL_AppendFile(path, trailer, sizeof trailer);
    return TRUE;
}
