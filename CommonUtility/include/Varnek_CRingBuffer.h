/// @file
/// A ring of bytes between one writer and one reader. A ring is guarded by a named mutex, if it has
/// one.
/// @see [Guide: bits and ring](docs/guide/bits-and-ring.md)
#ifndef VARNEK_CRINGBUFFER_H
#define VARNEK_CRINGBUFFER_H

#include "Varnek_Common.h"

/// Results of a ring's operations other than 0.
#define VARNEK_RING_INVALID (-8)     ///< a length, size, origin or pointer that can never work
#define VARNEK_RING_NO_SPACE (-10)   ///< too little room, or a seek too far
#define VARNEK_RING_NO_DATA (-11)    ///< too few bytes to read
#define VARNEK_RING_OVERFLOW (-32)   ///< inconsistent state: the writer is too far ahead
#define VARNEK_RING_UNDERFLOW (-34)  ///< inconsistent state: the writer is behind the reader

#ifdef __cplusplus

/// Writes and reads move all of their bytes or none, and never wait. Each side has a position and a
/// loop count, which is the number of laps it has completed. Together they distinguish a full ring
/// from an empty one, and both from a ring in an inconsistent state. With W and R as the positions
/// and WL and RL as the loop counts:
///
///     state                    condition                        readable       writable
///     same lap                 WL = RL, R <= W                  W - R          size - (W - R)
///     writer one lap ahead     WL = RL + 1, W <= R              W - R + size   R - W
///     underflow                WL = RL, W < R; RL > WL          none           none
///     overflow                 WL = RL + 1, W > R; WL > RL + 1  none           none
///
/// A ring whose size is invalid or whose storage cannot be allocated has size 0. Its writes, reads
/// and seeks fail until a Reset succeeds. Each failure is traced.
///
/// Several threads may write one ring, or read it: no two writes mix, but the room that a query
/// reported may be gone, so check the result. In a ring that has its mutex, Reset, Flush, Seek, the
/// three queries, Write and Read run one at a time. One case is not atomic: an operation that finds
/// the ring in an inconsistent state releases the mutex briefly before it empties the ring.
/// Construction, destruction and assignment (on either side) are not guarded. A copy has no mutex
/// and is not thread-safe.
class VARNEK_API VarnekCRingBuffer {
  public:
    /// Creates an empty ring of `size` bytes. When all 40 mutexes are in use, the ring works
    /// without one.
    explicit VarnekCRingBuffer(int size);
    /// Copy the state and the bytes, not the mutex. The target of an assignment keeps its own
    /// mutex.
    VarnekCRingBuffer(const VarnekCRingBuffer &other);
    VarnekCRingBuffer &operator=(const VarnekCRingBuffer &other);  ///< copies likewise

    /// Frees the storage and deletes the mutex. No other thread may be inside the ring.
    ~VarnekCRingBuffer();

    /// Empties the ring, and reallocates its storage when the size changes. Returns 0;
    /// VARNEK_RING_INVALID for a size below 1, which changes nothing, and when there is no memory.
    int Reset(int size);
    /// Empties the ring. Returns 0.
    int Flush();

    /// Moves the reader: to the index `aOffset` (origin 0), forward by `aOffset` bytes (origin 1),
    /// or to the start of the last `aOffset` bytes written (origin 2). With origins 0 and 2 it does
    /// not check whether those bytes are unread, or were ever written. With origin 2, an offset of
    /// the whole size leaves nothing to read. With origin 0, an index equal to the size is
    /// accepted, but then the caller must read, or seek forward by 0, before the next write.
    /// Returns 0; VARNEK_RING_NO_SPACE for an offset that is negative, larger than the size or,
    /// with origin 1, larger than the number of readable bytes, and in a ring without storage or,
    /// with origin 1, in an inconsistent state; VARNEK_RING_INVALID for another origin.
    int Seek(int aOffset, int origin);

    /// Return the number of bytes that can be read and written now; in an inconsistent state,
    /// VARNEK_RING_OVERFLOW or VARNEK_RING_UNDERFLOW.
    int GetSpaceReading() const;
    int GetSpaceWriting() const;  ///< the bytes that fit
    /// Returns the readable bytes in per cent of the size. In an inconsistent state the result may
    /// lie outside 0 to 100.
    int GetDistance() const;

    /// Copy `writelen` bytes in or `readLen` bytes out. Return 0; VARNEK_RING_INVALID for a length
    /// below 0 or above the size, and for a null pointer with a length above 0 (after a panic
    /// report); VARNEK_RING_NO_SPACE when there is too little room; VARNEK_RING_NO_DATA when there
    /// are too few bytes, and when 0 bytes are read from an empty ring. In an inconsistent state, a
    /// write or read empties the ring and returns VARNEK_RING_NO_SPACE for an overflow and
    /// VARNEK_RING_NO_DATA for an underflow. There are two exceptions. A write that finds WL = RL
    /// and W < R returns VARNEK_RING_NO_DATA but leaves the ring unchanged. With W <= R and WL > RL
    /// + 1, writes and reads treat the writer as one lap ahead.
    int Write(const unsigned char *data, int writelen);
    int Read(unsigned char *dest, int readLen);  ///< copies out

  private:
    friend struct VarnekRingSteps;  // private to the library

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
