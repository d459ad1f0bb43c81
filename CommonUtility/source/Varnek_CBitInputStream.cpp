// The bit input stream. Nearly every field comes from the current byte or, if it ends beyond that,
// from a word of the buffer. Near the end, and after rewinding from inside a byte, GetBits reads a
// field piece by piece; no other way to read bits reaches the end of the stream.
#include "Varnek_CBitInputStream.h"

#include <limits.h>
#include <string.h>

#include <new>

#include "Varnek_Bytes.h"
#include "Varnek_Trace.h"

// Values of bEndOfStream. Rewinding from inside a byte loads the whole target byte into ucCurByte
// but keeps the bit index, so the two no longer match. In that state, kRewound, GetBits reads all
// fields up to the end of the byte.
static constexpr unsigned char kReading = 0;
static constexpr unsigned char kAtEnd = 1;
static constexpr unsigned char kRewound = 2;

static unsigned char *CopyOf(const unsigned char *source, unsigned int length) {
    unsigned char *copy = new (std::nothrow) unsigned char[length];
    if (copy == nullptr) {
        return VARNEK_FAIL(copy, "BIS: Out of memory! length=[%u]\n", length);
    }
    memcpy(copy, source, length);
    return copy;
}

VarnekCBitInputStream::VarnekCBitInputStream(unsigned char *source, unsigned int length,
                                             unsigned char copyMode) {
    if (source == nullptr || length == 0) {
        TRACE_ERROR("Source Array is NULL!\n");
        return;
    }
    // The index is signed, so it cannot reach bytes beyond 2 GiB.
    const unsigned int reachable = length > INT_MAX ? INT_MAX : length;
    pBuffer = copyMode == 1 ? CopyOf(source, reachable) : source;
    if (pBuffer == nullptr) {
        return;
    }
    bCopied = copyMode == 1 ? 1 : 0;
    bEndOfStream = kReading;
    uiBufLen = reachable;
    ucCurByte = pBuffer[0];
}

VarnekCBitInputStream::VarnekCBitInputStream(const VarnekCBitInputStream &other) {
    *this = other;
}

VarnekCBitInputStream &VarnekCBitInputStream::operator=(const VarnekCBitInputStream &other) {
    if (this == &other) {
        return *this;
    }
    if (bCopied == 1) {
        delete[] pBuffer;
    }
    bCopied = other.bCopied;
    bEndOfStream = other.bEndOfStream;
    iCurByteIdx = other.iCurByteIdx;
    pBuffer = other.pBuffer;
    uiBufLen = other.uiBufLen;
    ucCurByte = other.ucCurByte;
    iBitIdxInCurByte = other.iBitIdxInCurByte;
    if (bCopied == 0) {
        return *this;
    }
    pBuffer = CopyOf(other.pBuffer, uiBufLen);
    if (pBuffer == nullptr) {
        bCopied = 0;
        bEndOfStream = kAtEnd;
        iCurByteIdx = 0;
        uiBufLen = 0;
        ucCurByte = 0;
        iBitIdxInCurByte = 0;
    }
    return *this;
}

VarnekCBitInputStream::~VarnekCBitInputStream() {
    if (bCopied == 1) {
        delete[] pBuffer;
        pBuffer = nullptr;
    }
}

unsigned int VarnekCBitInputStream::GetBits(int aNum, unsigned char &success) {
    if (aNum > 8 - iBitIdxInCurByte) {
        TRACE_HIGH("BIS: GetBits Warning: aNum=[%d], iBitIdxInCurByte=[%d]\n", aNum,
                   iBitIdxInCurByte);
        success = 0;
        return 0;
    }
    if (bEndOfStream == kAtEnd) {
        TRACE_HIGH("BIS: GetBits Warning: End of Stream!\n");
        success = 0;
        return 0;
    }
    if (aNum < 0) {
        TRACE_ERROR("BIS: GetBits. Wrong bits number! aNum=[%d]\n", aNum);
        success = 0;
        return 0;
    }
    const unsigned int value = static_cast<unsigned int>(ucCurByte) >> (8 - aNum);
    ucCurByte = static_cast<unsigned char>(ucCurByte << aNum);
    iBitIdxInCurByte += aNum;
    if (iBitIdxInCurByte < 8) {
        return value;
    }
    if (static_cast<unsigned int>(iCurByteIdx) == uiBufLen - 1) {
        bEndOfStream = kAtEnd;
        return value;
    }
    ucCurByte = pBuffer[++iCurByteIdx];
    iBitIdxInCurByte = 0;
    bEndOfStream = kReading;
    return value;
}

// Reads a field of `width` bits when the current byte has `left` unread bits. Out of line and
// called last, so that reading the usual fields does not have to save registers.
template <typename Value>
__attribute__((noinline, cold)) static Value ReadByPieces(VarnekCBitInputStream &stream, int left,
                                                          int width, unsigned char &success) {
    unsigned int value = stream.GetBits(width < left ? width : left, success);
    for (width -= left; width > 8; width -= 8) {
        value = value << 8 | stream.GetBits(8, success);
    }
    if (width > 0) {
        value = value << width | stream.GetBits(width, success);
    }
    return static_cast<Value>(value);
}

// Inlined into each of the public reads, since a table has thousands of short fields.
template <typename Value, unsigned int most>
__attribute__((always_inline)) inline Value VarnekCBitInputStream::Read(int count,
                                                                        unsigned char &success) {
    const unsigned int width = static_cast<unsigned int>(count);
    const unsigned int begin = static_cast<unsigned int>(iBitIdxInCurByte);
    const unsigned int end = begin + width;
    if (__builtin_expect(width <= most && bEndOfStream == kReading, 1)) {
        if (end < 8) {
            const unsigned int current = ucCurByte;
            ucCurByte = static_cast<unsigned char>(current << width);
            iBitIdxInCurByte = static_cast<int>(end);
            return static_cast<Value>(current >> (8 - width));
        }
        if (__builtin_expect(uiBufLen - static_cast<unsigned int>(iCurByteIdx) > 4, 1)) {
            const unsigned char *const from = pBuffer + iCurByteIdx;
            const uint32_t word = BigEndian(from);
            const uint32_t value = word << begin >> (32 - width);
            iCurByteIdx += static_cast<int>(end / 8);
            iBitIdxInCurByte = static_cast<int>(end % 8);
            if constexpr (most <= 16) {
                ucCurByte = static_cast<unsigned char>(word << end >> 24);
                return static_cast<Value>(value);
            }
            ucCurByte = static_cast<unsigned char>(from[end / 8] << (end % 8));
            return static_cast<Value>(end <= 32 ? value : value | from[4] >> (40 - end));
        }
    } else if (width > most || bEndOfStream == kAtEnd) {
        success = 0;
        return 0;
    }
    return ReadByPieces<Value>(*this, 8 - iBitIdxInCurByte, count, success);
}

unsigned int VarnekCBitInputStream::ReadBit(unsigned char &success) {
    return Read<unsigned int, 1>(1, success);
}

unsigned char VarnekCBitInputStream::ReadByte(int count, unsigned char &success) {
    return Read<unsigned char, 8>(count, success);
}

unsigned short VarnekCBitInputStream::ReadShort(int count, unsigned char &success) {
    return Read<unsigned short, 16>(count, success);
}

unsigned int VarnekCBitInputStream::ReadInt(int count, unsigned char &success) {
    return Read<unsigned int, 32>(count, success);
}

int VarnekCBitInputStream::GetByteArray(unsigned char *dest, int count) {
    if (bEndOfStream == kAtEnd) {
        return VARNEK_BITS_END;
    }
    if (iBitIdxInCurByte != 0) {
        return VARNEK_BITS_NOT_ALIGNED;
    }
    const int remaining = static_cast<int>(uiBufLen) - iCurByteIdx;
    if (remaining < count || count < 0 || (dest == nullptr && count > 0)) {
        return VARNEK_BITS_TOO_FEW;
    }
    if (count > 0) {
        memcpy(dest, pBuffer + iCurByteIdx, static_cast<size_t>(count));
    }
    iCurByteIdx += count;
    if (count == remaining) {
        bEndOfStream = kAtEnd;
        return 0;
    }
    ucCurByte = pBuffer[iCurByteIdx];
    return 0;
}

void VarnekCBitInputStream::Skip(int count) {
    if (count == 0 || bEndOfStream == kAtEnd) {
        return;
    }
    unsigned char ignored = 1;
    const int left = 8 - iBitIdxInCurByte;
    if (count <= left) {
        GetBits(count, ignored);
        return;
    }
    unsigned int rest = static_cast<unsigned int>(count - left);
    const unsigned int wanted = (rest + 7) / 8;
    const unsigned int ahead = uiBufLen - 1 - static_cast<unsigned int>(iCurByteIdx);
    const unsigned int jump = wanted < ahead ? wanted : ahead;
    if (jump == 0) {
        GetBits(left, ignored);
    } else {
        iCurByteIdx += static_cast<int>(jump);
        iBitIdxInCurByte = 0;
        bEndOfStream = kReading;
        ucCurByte = pBuffer[iCurByteIdx];
        rest -= (jump - 1) * 8;
    }
    for (; rest > 8; rest -= 8) {
        GetBits(8, ignored);
    }
    GetBits(static_cast<int>(rest), ignored);
}

int VarnekCBitInputStream::RewindBytes(int count) {
    const int64_t from = bEndOfStream == kAtEnd ? static_cast<int64_t>(uiBufLen) : iCurByteIdx;
    const int64_t target = from - count;
    if (target < 0 || target >= static_cast<int64_t>(uiBufLen)) {
        return 0;
    }
    if (bEndOfStream == kAtEnd) {
        iBitIdxInCurByte = 0;
    }
    bEndOfStream = iBitIdxInCurByte == 0 ? kReading : kRewound;
    iCurByteIdx = static_cast<int>(target);
    ucCurByte = pBuffer[iCurByteIdx];
    return 0;
}

int VarnekCBitInputStream::RwindToFirst() {
    if (pBuffer == nullptr) {
        return 0;
    }
    bEndOfStream = kReading;
    iCurByteIdx = 0;
    ucCurByte = pBuffer[0];
    iBitIdxInCurByte = 0;
    return 0;
}
