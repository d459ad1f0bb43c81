// The byte ring. Loop counts wrap around, so the state is told from their difference. A position
// stays below the size, but for a reader that was set to the end of the storage: its next byte is
// the first.
#include "Varnek_CRingBuffer.h"

#include <stdio.h>
#include <stdlib.h>
#include <string.h>

#include <atomic>

#include "Varnek_Semaphore.h"
#include "Varnek_Trace.h"

namespace {

constexpr int kRefused = -8;
constexpr int kNoSpace = -10;
constexpr int kOffsetTooLong = -10;
constexpr int kNoData = -11;
constexpr int kOverflow = -32;
constexpr int kUnderflow = -34;

// Numbers the mutex names of the process: a name that came twice would destroy another ring's
// mutex.
std::atomic<int32_t> gRingBufCount{0};

// Holds a ring's mutex, if it has one.
class RingLock {
  public:
    explicit RingLock(int32_t hMutex) : hMutex_(hMutex) { Acquire(); }
    ~RingLock() { Release(); }
    RingLock(const RingLock &) = delete;
    RingLock &operator=(const RingLock &) = delete;

    void Acquire() const {
        if (hMutex_ != -1) {
            VarnekPGL_AcquireMutex(hMutex_);
        }
    }
    void Release() const {
        if (hMutex_ != -1) {
            VarnekPGL_ReleaseMutex(hMutex_);
        }
    }

  private:
    int32_t hMutex_;
};

// A ring's size, positions and loop counts at one moment.
struct State {
    int size;
    int writePos;
    int readPos;
    int writeLaps;
    int readLaps;
};

int AddLaps(int laps, int more) {
    return static_cast<int>(static_cast<unsigned int>(laps) + static_cast<unsigned int>(more));
}

int LapsAhead(int writeLaps, int readLaps) {
    return static_cast<int>(static_cast<unsigned int>(writeLaps) -
                            static_cast<unsigned int>(readLaps));
}

int ReportAbnormal(const State &s) {
    TRACE_ERROR("[Abnormal State] reading loop count=[%d], writing loop count=[%d]\n", s.readLaps,
                s.writeLaps);
    TRACE_ERROR("[Abnormal State] Reading Position=[%d], Writing Position=[%d]\n", s.readPos,
                s.writePos);
    return LapsAhead(s.writeLaps, s.readLaps) > 0 ? kOverflow : kUnderflow;
}

int SpaceReading(const State &s) {
    const int ahead = LapsAhead(s.writeLaps, s.readLaps);
    if (ahead == 0 && s.writePos >= s.readPos) {
        return s.writePos - s.readPos;
    }
    if (ahead == 1 && s.writePos <= s.readPos) {
        return s.writePos - s.readPos + s.size;
    }
    return ReportAbnormal(s);
}

int SpaceWriting(const State &s) {
    const int ahead = LapsAhead(s.writeLaps, s.readLaps);
    if (ahead == 0 && s.readPos <= s.writePos) {
        return s.readPos - s.writePos + s.size;
    }
    if (ahead == 1 && s.readPos >= s.writePos) {
        return s.readPos - s.writePos;
    }
    return ReportAbnormal(s);
}

// Moves a position on by `length` bytes, at most `size`.
void Advance(int *pos, int *laps, int length, int size) {
    const int tail = size - *pos;
    if (length < tail) {
        *pos += length;
        return;
    }
    *pos = length - tail;
    *laps = AddLaps(*laps, 1);
}

// A null pointer comes with nothing to copy.
void Copy(unsigned char *to, const unsigned char *from, int count) {
    if (count > 0 && to != nullptr && from != nullptr) {
        memcpy(to, from, static_cast<size_t>(count));
    }
}

unsigned char *AllocateStorage(int size) {
    unsigned char *storage = static_cast<unsigned char *>(malloc(static_cast<size_t>(size)));
    return storage != nullptr
               ? storage
               : VARNEK_FAIL(storage, "Ring Buffer: Out of memory! size=[%d]\n", size);
}

}  // namespace

VarnekCRingBuffer::VarnekCRingBuffer(int size) {
    if (size <= 0) {
        TRACE_ERROR("Invalid Ring Size! size=[%d]\n", size);
        return;
    }
    char name[32];
    snprintf(name, sizeof name, "VarnekRingBuf%03d",
             static_cast<int>(gRingBufCount.fetch_add(1, std::memory_order_relaxed)));
    pRingBuf = AllocateStorage(size);
    iRingSize = pRingBuf != nullptr ? size : 0;
    hRingMutex = VarnekPGL_CreateMutex(name);
    if (hRingMutex == -1) {
        TRACE_ERROR("Ring Mutex Creation Fail!\n");
    }
}

VarnekCRingBuffer::VarnekCRingBuffer(const VarnekCRingBuffer &other) {
    *this = other;
}

// cppcheck-suppress operatorEqVarError  // the mutex belongs to this ring
VarnekCRingBuffer &VarnekCRingBuffer::operator=(const VarnekCRingBuffer &other) {
    if (this == &other) {
        return *this;
    }
    iWritePos = other.iWritePos;
    iReadPos = other.iReadPos;
    iWriteLoopCnt = other.iWriteLoopCnt;
    iReadLoopCnt = other.iReadLoopCnt;
    iRingSize = other.iRingSize;
    free(pRingBuf);
    pRingBuf = nullptr;
    if (other.pRingBuf == nullptr) {
        return *this;
    }
    pRingBuf = AllocateStorage(iRingSize);
    if (pRingBuf == nullptr) {
        iWritePos = iReadPos = iWriteLoopCnt = iReadLoopCnt = 0;
        iRingSize = 0;
        return *this;
    }
    Copy(pRingBuf, other.pRingBuf, iRingSize);
    return *this;
}

VarnekCRingBuffer::~VarnekCRingBuffer() {
    free(pRingBuf);
    pRingBuf = nullptr;
    if (hRingMutex != -1) {
        VarnekPGL_DeleteMutex(hRingMutex);
        hRingMutex = -1;
    }
}

int VarnekCRingBuffer::Reset(int size) {
    if (size < 1) {
        return VARNEK_FAIL(kRefused, "Invalid Ring Size! size=[%d]\n", size);
    }
    TRACE_MID("Ring Buffer will be reset!!!\n");
    const RingLock lock(hRingMutex);
    iWritePos = iReadPos = iWriteLoopCnt = iReadLoopCnt = 0;
    if (size == iRingSize) {
        return 0;
    }
    free(pRingBuf);
    pRingBuf = AllocateStorage(size);
    iRingSize = pRingBuf != nullptr ? size : 0;
    return pRingBuf != nullptr ? 0 : kRefused;
}

int VarnekCRingBuffer::Flush() {
    TRACE_MID("Ring Buffer will be flushed!!!\n");
    const RingLock lock(hRingMutex);
    iWritePos = iReadPos = iWriteLoopCnt = iReadLoopCnt = 0;
    return 0;
}

int VarnekCRingBuffer::Seek(int aOffset, int origin) {
    const RingLock lock(hRingMutex);
    const bool possible = aOffset >= 0 && pRingBuf != nullptr;
    switch (origin) {
        case SEEK_SET:
            if (!possible || aOffset > iRingSize) {
                TRACE_HIGH("[SEEK_SET] Too long offset. aOffset=[%d]\n", aOffset);
                return kOffsetTooLong;
            }
            iReadPos = aOffset;
            iReadLoopCnt = AddLaps(iWriteLoopCnt, iWritePos < iReadPos ? -1 : 0);
            return 0;
        case SEEK_CUR: {
            const int readable =
                SpaceReading({iRingSize, iWritePos, iReadPos, iWriteLoopCnt, iReadLoopCnt});
            if (!possible || aOffset > readable) {
                TRACE_HIGH("[SEEK_CUR] Too long offset. aOffset=[%d]\n", aOffset);
                return kOffsetTooLong;
            }
            Advance(&iReadPos, &iReadLoopCnt, aOffset, iRingSize);
            return 0;
        }
        case SEEK_END:
            if (!possible || aOffset > iRingSize) {
                TRACE_HIGH("[SEEK_END] Too long offset. aOffset=[%d]\n", aOffset);
                return kOffsetTooLong;
            }
            iReadPos = iWritePos - aOffset + (aOffset > iWritePos ? iRingSize : 0);
            iReadLoopCnt = AddLaps(iWriteLoopCnt, iWritePos < iReadPos ? -1 : 0);
            return 0;
        default:
            return VARNEK_FAIL(kRefused, "Invalid origin value=[%d]\n", origin);
    }
}

int VarnekCRingBuffer::GetSpaceReading() const {
    const RingLock lock(hRingMutex);
    return SpaceReading({iRingSize, iWritePos, iReadPos, iWriteLoopCnt, iReadLoopCnt});
}

int VarnekCRingBuffer::GetSpaceWriting() const {
    const RingLock lock(hRingMutex);
    return SpaceWriting({iRingSize, iWritePos, iReadPos, iWriteLoopCnt, iReadLoopCnt});
}

int VarnekCRingBuffer::GetDistance() const {
    const RingLock lock(hRingMutex);
    if (iRingSize == 0) {
        return 0;
    }
    // In 64 bits: a hundred times the fill level of a large ring.
    const int64_t distance =
        static_cast<int64_t>(LapsAhead(iWriteLoopCnt, iReadLoopCnt)) * iRingSize + iWritePos -
        iReadPos;
    const int64_t percent = distance * 100 / iRingSize;
    return static_cast<int>(distance < 0 ? percent - 1 : percent);
}

namespace {

// Empties a ring that was found in an abnormal state, as Reset does with the ring's own size: the
// lock is given back and taken afresh, and whatever size the ring has then it keeps.
void Recover(const RingLock &lock, int *writePos, int *readPos, int *writeLaps, int *readLaps) {
    lock.Release();
    TRACE_MID("Ring Buffer will be reset!!!\n");
    lock.Acquire();
    *writePos = *readPos = *writeLaps = *readLaps = 0;
}

}  // namespace

int VarnekCRingBuffer::Write(const unsigned char *data, int writelen) {
    const RingLock lock(hRingMutex);
    if (writelen < 0 || writelen > iRingSize || pRingBuf == nullptr) {
        return VARNEK_FAIL(kRefused, "Too long writelen=[%d]! Ring buffer size=[%d]\n", writelen,
                           iRingSize);
    }
    if (data == nullptr && writelen > 0) {
        VARNEK_PANIC();
        return kRefused;
    }
    const int ahead = LapsAhead(iWriteLoopCnt, iReadLoopCnt);
    if (ahead > 0 && iReadPos < iWritePos) {
        TRACE_ERROR(
            "[Abnormal Sate] Ring Buffer is already overflowed! This data will be discarded\n");
        Recover(lock, &iWritePos, &iReadPos, &iWriteLoopCnt, &iReadLoopCnt);
        return kNoSpace;
    }
    if (ahead < 0) {
        TRACE_ERROR(
            "[Abnormal State] Invalid Ring Buffer State! Underflow! This data will be "
            "discarded!\n");
        Recover(lock, &iWritePos, &iReadPos, &iWriteLoopCnt, &iReadLoopCnt);
        return kNoData;
    }
    if (ahead == 0 && iWritePos < iReadPos) {
        // On purpose not emptied here; the next read does that.
        return VARNEK_FAIL(kNoData,
                           "Invalid Ring Buffer State! Underflow! This data will be discarded!\n");
    }
    const int space = iReadPos - iWritePos + (ahead == 0 ? iRingSize : 0);
    if (space < writelen) {
        return VARNEK_FAIL(
            kNoSpace,
            "Remaing Writing Space=[%d], Wrting Len=[%d]!! This data will be discarded!\n", space,
            writelen);
    }
    const int tail = iRingSize - iWritePos;
    const int first = writelen < tail ? writelen : tail;
    Copy(pRingBuf + iWritePos, data, first);
    Copy(pRingBuf, data + first, writelen - first);
    Advance(&iWritePos, &iWriteLoopCnt, writelen, iRingSize);
    return 0;
}

int VarnekCRingBuffer::Read(unsigned char *dest, int readLen) {
    const RingLock lock(hRingMutex);
    if (readLen < 0 || readLen > iRingSize) {
        return VARNEK_FAIL(kRefused, "Too long readLen=[%d]! Ring buffer size=[%d]\n", readLen,
                           iRingSize);
    }
    if (dest == nullptr && readLen > 0) {
        VARNEK_PANIC();
        return kRefused;
    }
    const int ahead = LapsAhead(iWriteLoopCnt, iReadLoopCnt);
    if (ahead > 0 && iReadPos < iWritePos) {
        TRACE_ERROR("Abnormal Sate!! Buffer Already Overflow!\n");
        Recover(lock, &iWritePos, &iReadPos, &iWriteLoopCnt, &iReadLoopCnt);
        return kNoSpace;
    }
    if (ahead < 0) {
        TRACE_ERROR("Abnormal Sate!! Buffer Already Overflow!\n");
        Recover(lock, &iWritePos, &iReadPos, &iWriteLoopCnt, &iReadLoopCnt);
        return kNoData;
    }
    if (ahead == 0 && iWritePos == iReadPos) {
        return VARNEK_FAIL(kNoData, "No reading data!\n");
    }
    if (ahead == 0 && iWritePos < iReadPos) {
        TRACE_ERROR("Abnormal Sate!! Buffer Already Underflow!\n");
        Recover(lock, &iWritePos, &iReadPos, &iWriteLoopCnt, &iReadLoopCnt);
        return kNoData;
    }
    const int available = iWritePos - iReadPos + (ahead == 0 ? 0 : iRingSize);
    if (available < readLen) {
        return VARNEK_FAIL(kNoData,
                           "Not enough reading buffer space. readLen=[%d], readiing buf=[%d]!\n",
                           readLen, available);
    }
    const int tail = iRingSize - iReadPos;
    const int first = readLen < tail ? readLen : tail;
    Copy(dest, pRingBuf + iReadPos, first);
    Copy(dest + first, pRingBuf, readLen - first);
    Advance(&iReadPos, &iReadLoopCnt, readLen, iRingSize);
    return 0;
}
