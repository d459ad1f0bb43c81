// The byte ring. Positions are below the size, except that seeking may put the reader at the end of
// the storage, from where the next read starts over at the first byte.
#include "Varnek_CRingBuffer.h"

#include <stdio.h>
#include <stdlib.h>
#include <string.h>

#include <atomic>

#include "Varnek_HoldMutex.h"
#include "Varnek_Semaphore.h"
#include "Varnek_Trace.h"

// Steps that several operations share, under the ring's mutex, if it has one.
struct VarnekRingSteps {
    enum Order {
        kInOrder,
        kOverflow,   // the writer has lapped the reader
        kUnderflow,  // the reader is one or more laps ahead of the writer
        kOvertaken,  // both are in the same lap, and the reader is ahead of the writer
    };

    // Returns the laps by which the writer is ahead, even when a loop count has wrapped around.
    static int Ahead(const VarnekCRingBuffer &ring) {
        return static_cast<int>(static_cast<unsigned int>(ring.iWriteLoopCnt) -
                                static_cast<unsigned int>(ring.iReadLoopCnt));
    }

    static Order OrderOf(const VarnekCRingBuffer &ring) {
        const int ahead = Ahead(ring);
        if (ahead < 0) {
            return kUnderflow;
        }
        if (ahead == 0) {
            return ring.iWritePos < ring.iReadPos ? kOvertaken : kInOrder;
        }
        return ring.iReadPos < ring.iWritePos ? kOverflow : kInOrder;
    }

    // Returns how many bytes can be read from a ring whose order is kInOrder; a writer several laps
    // ahead counts as one lap ahead.
    static int Used(const VarnekCRingBuffer &ring) {
        return ring.iWritePos - ring.iReadPos + (Ahead(ring) > 0 ? ring.iRingSize : 0);
    }

    // Checks the state for the queries, to which a writer several laps ahead is an overflow, too.
    // Returns 0 for a consistent state, else the result of the query, after two lines.
    static int Check(const VarnekCRingBuffer &ring) {
        const int ahead = Ahead(ring);
        if (OrderOf(ring) == kInOrder && ahead <= 1) {
            return 0;
        }
        TRACE_ERROR("[Abnormal State] reading loop count=[%d], writing loop count=[%d]\n",
                    ring.iReadLoopCnt, ring.iWriteLoopCnt);
        TRACE_ERROR("[Abnormal State] Reading Position=[%d], Writing Position=[%d]\n",
                    ring.iReadPos, ring.iWritePos);
        return ahead > 0 ? VARNEK_RING_OVERFLOW : VARNEK_RING_UNDERFLOW;
    }

    static void Empty(VarnekCRingBuffer *ring) {
        ring->iWritePos = ring->iReadPos = ring->iWriteLoopCnt = ring->iReadLoopCnt = 0;
    }

    // Empties a ring that was found inconsistent, as Reset with its own size does: the trace is
    // written without the mutex. Inlined, so that `hold` can stay in registers.
    inline __attribute__((always_inline)) static void Recover(VarnekCRingBuffer *ring,
                                                              HoldMutex *hold) {
        hold->Release();
        TRACE_MID("Ring Buffer will be reset!!!\n");
        const HoldMutex again(ring->hRingMutex);
        Empty(ring);
    }

    // Sets the reader to a position: in the writer's lap or, if the position is ahead of the
    // writer's, in the lap before.
    static void SetReader(VarnekCRingBuffer *ring, int pos) {
        ring->iReadPos = pos;
        ring->iReadLoopCnt = AddLaps(ring->iWriteLoopCnt, ring->iWritePos < pos ? -1 : 0);
    }

    static int AddLaps(int laps, int more) {
        return static_cast<int>(static_cast<unsigned int>(laps) + static_cast<unsigned int>(more));
    }
};

namespace {

using Steps = VarnekRingSteps;

// Numbers the names of the rings' mutexes, since a ring that reused a name would delete the mutex
// of the other.
std::atomic<int32_t> gRingBufCount{0};

// Advances a position by `length` bytes; `length` is at most `size`.
void Advance(int *pos, int *laps, int length, int size) {
    const int tail = size - *pos;
    if (length < tail) {
        *pos += length;
        return;
    }
    *pos = length - tail;
    *laps = Steps::AddLaps(*laps, 1);
}

inline void Copy(unsigned char *to, const unsigned char *from, int count) {
    if (count > 0) {
        // NOLINTNEXTLINE(clang-analyzer-core.NonNullParamChecker): null comes with nothing to copy
        memcpy(to, from, static_cast<size_t>(count));
    }
}

unsigned char *AllocateStorage(int size) {
    unsigned char *storage = static_cast<unsigned char *>(malloc(static_cast<size_t>(size)));
    if (storage == nullptr) {
        TRACE_ERROR("Ring Buffer: Out of memory! size=[%d]\n", size);
    }
    return storage;
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
        Steps::Empty(this);
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
        return VARNEK_FAIL(VARNEK_RING_INVALID, "Invalid Ring Size! size=[%d]\n", size);
    }
    TRACE_MID("Ring Buffer will be reset!!!\n");
    const HoldMutex hold(hRingMutex);
    Steps::Empty(this);
    if (size == iRingSize) {
        return 0;
    }
    free(pRingBuf);
    pRingBuf = AllocateStorage(size);
    iRingSize = pRingBuf != nullptr ? size : 0;
    return pRingBuf != nullptr ? 0 : VARNEK_RING_INVALID;
}

int VarnekCRingBuffer::Flush() {
    TRACE_MID("Ring Buffer will be flushed!!!\n");
    const HoldMutex hold(hRingMutex);
    Steps::Empty(this);
    return 0;
}

int VarnekCRingBuffer::Seek(int aOffset, int origin) {
    const HoldMutex hold(hRingMutex);
    const bool possible = aOffset >= 0 && pRingBuf != nullptr;
    switch (origin) {
        case SEEK_SET:
            if (!possible || aOffset > iRingSize) {
                TRACE_HIGH("[SEEK_SET] Too long offset. aOffset=[%d]\n", aOffset);
                return VARNEK_RING_NO_SPACE;
            }
            Steps::SetReader(this, aOffset);
            return 0;
        case SEEK_CUR:
            if (Steps::Check(*this) != 0 || !possible || aOffset > Steps::Used(*this)) {
                TRACE_HIGH("[SEEK_CUR] Too long offset. aOffset=[%d]\n", aOffset);
                return VARNEK_RING_NO_SPACE;
            }
            Advance(&iReadPos, &iReadLoopCnt, aOffset, iRingSize);
            return 0;
        case SEEK_END:
            if (!possible || aOffset > iRingSize) {
                TRACE_HIGH("[SEEK_END] Too long offset. aOffset=[%d]\n", aOffset);
                return VARNEK_RING_NO_SPACE;
            }
            Steps::SetReader(this, iWritePos - aOffset + (aOffset > iWritePos ? iRingSize : 0));
            return 0;
        default:
            return VARNEK_FAIL(VARNEK_RING_INVALID, "Invalid origin value=[%d]\n", origin);
    }
}

int VarnekCRingBuffer::GetSpaceReading() const {
    const HoldMutex hold(hRingMutex);
    const int abnormal = Steps::Check(*this);
    return abnormal != 0 ? abnormal : Steps::Used(*this);
}

int VarnekCRingBuffer::GetSpaceWriting() const {
    const HoldMutex hold(hRingMutex);
    const int abnormal = Steps::Check(*this);
    return abnormal != 0 ? abnormal : iRingSize - Steps::Used(*this);
}

int VarnekCRingBuffer::GetDistance() const {
    const HoldMutex hold(hRingMutex);
    if (iRingSize == 0) {
        return 0;
    }
    // Computed in 64 bits, because a hundred times the fill level of a large ring overflows 32
    // bits. Unlike Used, this counts every lap.
    const int64_t distance =
        static_cast<int64_t>(Steps::Ahead(*this)) * iRingSize + iWritePos - iReadPos;
    const int64_t percent = distance * 100 / iRingSize;
    return static_cast<int>(distance < 0 ? percent - 1 : percent);
}

int VarnekCRingBuffer::Write(const unsigned char *data, int writelen) {
    HoldMutex hold(hRingMutex);
    if (writelen < 0 || writelen > iRingSize || pRingBuf == nullptr) {
        return VARNEK_FAIL(VARNEK_RING_INVALID, "Too long writelen=[%d]! Ring buffer size=[%d]\n",
                           writelen, iRingSize);
    }
    if (__builtin_expect(data == nullptr, 0) && writelen > 0) {
        VARNEK_PANIC();
        return VARNEK_RING_INVALID;
    }
    switch (Steps::OrderOf(*this)) {
        case Steps::kInOrder:
            break;
        case Steps::kOverflow:
            TRACE_ERROR(
                "[Abnormal Sate] Ring Buffer is already overflowed! This data will be discarded\n");
            Steps::Recover(this, &hold);
            return VARNEK_RING_NO_SPACE;
        case Steps::kUnderflow:
            TRACE_ERROR(
                "[Abnormal State] Invalid Ring Buffer State! Underflow! This data will be "
                "discarded!\n");
            Steps::Recover(this, &hold);
            return VARNEK_RING_NO_DATA;
        case Steps::kOvertaken:
            // The ring stays unchanged; the next read empties it.
            return VARNEK_FAIL(
                VARNEK_RING_NO_DATA,
                "Invalid Ring Buffer State! Underflow! This data will be discarded!\n");
    }
    const int space = iRingSize - Steps::Used(*this);
    if (space < writelen) {
        return VARNEK_FAIL(
            VARNEK_RING_NO_SPACE,
            "Remaing Writing Space=[%d], Wrting Len=[%d]!! This data will be discarded!\n", space,
            writelen);
    }
    const int tail = iRingSize - iWritePos;
    if (writelen < tail) {
        Copy(pRingBuf + iWritePos, data, writelen);
        iWritePos += writelen;
        return 0;
    }
    Copy(pRingBuf + iWritePos, data, tail);
    Copy(pRingBuf, data + tail, writelen - tail);
    iWritePos = writelen - tail;
    iWriteLoopCnt = Steps::AddLaps(iWriteLoopCnt, 1);
    return 0;
}

int VarnekCRingBuffer::Read(unsigned char *dest, int readLen) {
    HoldMutex hold(hRingMutex);
    if (readLen < 0 || readLen > iRingSize) {
        return VARNEK_FAIL(VARNEK_RING_INVALID, "Too long readLen=[%d]! Ring buffer size=[%d]\n",
                           readLen, iRingSize);
    }
    if (__builtin_expect(dest == nullptr, 0) && readLen > 0) {
        VARNEK_PANIC();
        return VARNEK_RING_INVALID;
    }
    switch (Steps::OrderOf(*this)) {
        case Steps::kInOrder:
            break;
        case Steps::kOverflow:
            TRACE_ERROR("Abnormal Sate!! Buffer Already Overflow!\n");
            Steps::Recover(this, &hold);
            return VARNEK_RING_NO_SPACE;
        case Steps::kUnderflow:
            TRACE_ERROR("Abnormal Sate!! Buffer Already Overflow!\n");
            Steps::Recover(this, &hold);
            return VARNEK_RING_NO_DATA;
        case Steps::kOvertaken:
            TRACE_ERROR("Abnormal Sate!! Buffer Already Underflow!\n");
            Steps::Recover(this, &hold);
            return VARNEK_RING_NO_DATA;
    }
    if (iReadPos == iWritePos && iReadLoopCnt == iWriteLoopCnt) {
        return VARNEK_FAIL(VARNEK_RING_NO_DATA, "No reading data!\n");
    }
    const int available = Steps::Used(*this);
    if (available < readLen) {
        return VARNEK_FAIL(VARNEK_RING_NO_DATA,
                           "Not enough reading buffer space. readLen=[%d], readiing buf=[%d]!\n",
                           readLen, available);
    }
    const int tail = iRingSize - iReadPos;
    if (readLen < tail) {
        Copy(dest, pRingBuf + iReadPos, readLen);
        iReadPos += readLen;
        return 0;
    }
    Copy(dest, pRingBuf + iReadPos, tail);
    Copy(dest + tail, pRingBuf, readLen - tail);
    iReadPos = readLen - tail;
    iReadLoopCnt = Steps::AddLaps(iReadLoopCnt, 1);
    return 0;
}
