// The bit input stream. A field within the current byte, and one that four more bytes follow, is
// taken as a whole; the others go piece by piece through GetBits, which is the only place where the
// end is found.
#include "Varnek_CBitInputStream.h"

#include <limits.h>
#include <string.h>

#include <new>

#include "Varnek_Support.h"
#include "Varnek_Trace.h"

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
    // The index is signed: what lies beyond 2 GiB cannot be reached.
    const unsigned int reachable = length > INT_MAX ? INT_MAX : length;
    pBuffer = copyMode == 1 ? CopyOf(source, reachable) : source;
    if (pBuffer == nullptr) {
        return;
    }
    bCopied = copyMode == 1 ? 1 : 0;
    bEndOfStream = 0;
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
        bEndOfStream = 1;
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
    if (bEndOfStream == 1) {
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
        bEndOfStream = 1;
        return value;
    }
    ucCurByte = pBuffer[++iCurByteIdx];
    iBitIdxInCurByte = 0;
    return value;
}

unsigned int VarnekCBitInputStream::ReadBit(unsigned char &success) {
    return ReadInt(1, success);
}

unsigned char VarnekCBitInputStream::ReadByte(int count, unsigned char &success) {
    if (count > 8) {
        success = 0;
        return 0;
    }
    return static_cast<unsigned char>(ReadInt(count, success));
}

unsigned short VarnekCBitInputStream::ReadShort(int count, unsigned char &success) {
    if (count > 16) {
        success = 0;
        return 0;
    }
    return static_cast<unsigned short>(ReadInt(count, success));
}

// The `left` bits of the current byte and `rest` more. Kept out of line, so that the other fields
// need no registers saved.
__attribute__((noinline)) static unsigned int ReadByPieces(VarnekCBitInputStream &stream, int left,
                                                           unsigned int rest,
                                                           unsigned char &success) {
    unsigned int value = stream.GetBits(left, success);
    for (; rest > 8; rest -= 8) {
        value = value << 8 | stream.GetBits(8, success);
    }
    return rest > 0 ? value << rest | stream.GetBits(static_cast<int>(rest), success) : value;
}

unsigned int VarnekCBitInputStream::ReadInt(int count, unsigned char &success) {
    if (count < 0 || count > 32 || bEndOfStream == 1) {
        success = 0;
        return 0;
    }
    const int left = 8 - iBitIdxInCurByte;
    if (count < left) {
        const unsigned int value = static_cast<unsigned int>(ucCurByte) >> (8 - count);
        ucCurByte = static_cast<unsigned char>(ucCurByte << count);
        iBitIdxInCurByte += count;
        return value;
    }
    const unsigned int rest = static_cast<unsigned int>(count - left);
    const unsigned int next = static_cast<unsigned int>(iCurByteIdx) + 1;
    if (next + sizeof(uint32_t) <= uiBufLen) {
        // After a rewind from inside a byte, ucCurByte is not what the buffer and the bit index
        // give. `rest` may be 0, which no shift by 32 - rest allows.
        const unsigned int begun = static_cast<unsigned int>(ucCurByte) >> iBitIdxInCurByte;
        const unsigned int value = begun << rest | BigEndian(pBuffer + next) >> 1 >> (31 - rest);
        iCurByteIdx = static_cast<int>(next + rest / 8);
        iBitIdxInCurByte = static_cast<int>(rest % 8);
        ucCurByte = static_cast<unsigned char>(pBuffer[iCurByteIdx] << iBitIdxInCurByte);
        return value;
    }
    return ReadByPieces(*this, left, rest, success);
}

int VarnekCBitInputStream::GetByteArray(unsigned char *dest, int count) {
    if (bEndOfStream == 1) {
        return -22;
    }
    if (iBitIdxInCurByte != 0) {
        return -1;
    }
    const int remaining = static_cast<int>(uiBufLen) - iCurByteIdx;
    if (remaining < count || count < 0 || (dest == nullptr && count > 0)) {
        return -10;
    }
    if (count > 0) {
        memcpy(dest, pBuffer + iCurByteIdx, static_cast<size_t>(count));
    }
    iCurByteIdx += count;
    iBitIdxInCurByte = 0;
    if (count == remaining) {
        bEndOfStream = 1;
        return 0;
    }
    ucCurByte = pBuffer[iCurByteIdx];
    return 0;
}

void VarnekCBitInputStream::Skip(int count) {
    if (count == 0 || bEndOfStream == 1) {
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
        ucCurByte = pBuffer[iCurByteIdx];
        rest -= (jump - 1) * 8;
    }
    for (; rest > 8; rest -= 8) {
        GetBits(8, ignored);
    }
    GetBits(static_cast<int>(rest), ignored);
}

int VarnekCBitInputStream::RewindBytes(int count) {
    const int64_t from = bEndOfStream == 1 ? static_cast<int64_t>(uiBufLen) : iCurByteIdx;
    const int64_t target = from - count;
    if (target < 0 || target >= static_cast<int64_t>(uiBufLen)) {
        return 0;
    }
    if (bEndOfStream == 1) {
        bEndOfStream = 0;
        iBitIdxInCurByte = 0;
    }
    iCurByteIdx = static_cast<int>(target);
    ucCurByte = pBuffer[iCurByteIdx];
    return 0;
}

int VarnekCBitInputStream::RwindToFirst() {
    if (pBuffer == nullptr) {
        return 0;
    }
    bEndOfStream = 0;
    iCurByteIdx = 0;
    ucCurByte = pBuffer[0];
    iBitIdxInCurByte = 0;
    return 0;
}
