// A byte ring between one writing and one reading side, guarded by a named mutex of its own.
#ifndef VARNEK_CRINGBUFFER_H
#define VARNEK_CRINGBUFFER_H

#include "Varnek_Common.h"

// Results of a ring's operations, beside 0.
#define VARNEK_RING_INVALID (-8)     // a length, size, origin or pointer that can never work
#define VARNEK_RING_NO_SPACE (-10)   // too little room, or a seek too far
#define VARNEK_RING_NO_DATA (-11)    // too few bytes to read
#define VARNEK_RING_OVERFLOW (-32)   // in disorder: the writer is too far ahead
#define VARNEK_RING_UNDERFLOW (-34)  // in disorder: the writer is behind the reader

#ifdef __cplusplus

// Writes and reads take all of their bytes or none, and never wait. Besides its position, each side
// has a loop count, the laps that it has done; together they tell a full ring from an empty one,
// and a ring in disorder from both. With W, R the positions and WL, RL the loop counts:
//
//   state                    condition                        readable       writable
//   same lap                 WL = RL, R <= W                  W - R          size - (W - R)
//   writer one lap ahead     WL = RL + 1, W <= R              W - R + size   R - W
//   underflow                WL = RL, W < R; RL > WL          none           none
//   overflow                 WL = RL + 1, W > R; WL > RL + 1  none           none
//
// A ring whose size is invalid or whose storage cannot be allocated has size 0 and refuses
// everything. Each refusal is traced.
//
// Threads: every operation from Reset to Read is atomic towards the others, in a ring that has its
// mutex, but for one that finds the ring in disorder: it lets go of the mutex for a moment before
// it empties the ring. Construction, destruction and assignment (of either ring) are not guarded. A
// copy has no mutex and is for one thread.
class VARNEK_API VarnekCRingBuffer {
  public:
    // An empty ring of `size` bytes. Without a mutex (the pool of them is full) it works unguarded.
    explicit VarnekCRingBuffer(int size);
    // Takes state and bytes, not the mutex: the target keeps what it has.
    VarnekCRingBuffer(const VarnekCRingBuffer &other);
    VarnekCRingBuffer &operator=(const VarnekCRingBuffer &other);

    // Frees the storage and deletes the mutex. No other thread may be inside the ring.
    ~VarnekCRingBuffer();

    // Empties the ring, and gives it a new storage when the size is another one. Returns 0;
    // VARNEK_RING_INVALID for a size below 1, which changes nothing, and when there is no memory.
    int Reset(int size);
    // Empties the ring. Returns 0.
    int Flush();

    // Moves the reader to an index (origin 0), on by `aOffset` bytes (1), or to the last `aOffset`
    // bytes written (2), whatever the storage holds there; with origin 2, an offset of the whole
    // size leaves nothing to read. An index equal to the size is the storage's end: read, or move
    // on by 0, before the next write. Returns 0; VARNEK_RING_NO_SPACE for a negative
    // offset and for one beyond the size or, with origin 1, beyond the readable bytes;
    // VARNEK_RING_INVALID for another origin.
    int Seek(int aOffset, int origin);

    // The bytes that can be read and written now; in disorder VARNEK_RING_OVERFLOW
    // or VARNEK_RING_UNDERFLOW.
    int GetSpaceReading() const;
    int GetSpaceWriting() const;
    // The readable bytes in per cent of the size; in an abnormal state maybe not 0 to 100.
    int GetDistance() const;

    // Copies `writelen` bytes in or `readLen` bytes out. Returns 0. VARNEK_RING_INVALID
    // means a length below 0 or above the size, or a null pointer (after a panic report);
    // VARNEK_RING_NO_SPACE too little room; VARNEK_RING_NO_DATA too few bytes, and reading 0 bytes
    // from an empty ring. A ring that is found in an abnormal state is emptied, with
    // VARNEK_RING_NO_SPACE for an overflow and VARNEK_RING_NO_DATA for an underflow; only a write
    // that finds W < R in one lap leaves it as it is.
    int Write(const unsigned char *data, int writelen);
    int Read(unsigned char *dest, int readLen);

  private:
    friend struct VarnekRingState;  // the library's own

    unsigned char *pRingBuf = nullptr;
    int iRingSize = 0;
    int iWritePos = 0;
    int iReadPos = 0;
    int iWriteLoopCnt = 0;
    int iReadLoopCnt = 0;
    int32_t hRingMutex = -1;
};

#endif

#endif
