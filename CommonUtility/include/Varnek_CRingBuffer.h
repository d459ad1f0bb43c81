/// @file
/// A ring of bytes, guarded by a named mutex.
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

/// Writing and reading move all of the bytes or none, and never wait for room or data. Each side
/// has a position and counts its laps, which tells a full ring from an empty one, and both from an
/// inconsistent state. With W and R as the positions and WL and RL as the laps completed:
///
///     state                    condition                        readable       writable
///     same lap                 WL = RL, R <= W                  W - R          size - (W - R)
///     writer one lap ahead     WL = RL + 1, W <= R              W - R + size   R - W
///     underflow                WL = RL, W < R; RL > WL          none           none
///     overflow                 WL = RL + 1, W > R; WL > RL + 1  none           none
///
/// A ring whose size is invalid or whose storage cannot be allocated has size 0: it refuses to
/// write, read and seek until a Reset succeeds. Failures are traced.
///
/// Any number of threads may write and read one ring that has its mutex: no two writes mix, but the
/// room that a query reported may be gone, so check the result. Reset, Flush, Seek, the queries,
/// Write and Read run one at a time; a Write or Read that finds the ring inconsistent, though,
/// releases the mutex for a moment before it empties the ring. Constructing, destroying and
/// assigning (on either side) are not guarded. A copy has no mutex, so it is not thread-safe.
class VARNEK_API VarnekCRingBuffer {
  public:
    /// Creates an empty ring of `size` bytes. It has no mutex, even after a Reset, if `size` is
    /// invalid or no mutex can be created.
    explicit VarnekCRingBuffer(int size);
    /// Copies the state and the bytes, not the mutex; an assigned ring keeps its own.
    VarnekCRingBuffer(const VarnekCRingBuffer &other);
    VarnekCRingBuffer &operator=(const VarnekCRingBuffer &other);  ///< copies likewise

    /// Frees the storage and deletes the mutex. No other thread may be inside the ring.
    ~VarnekCRingBuffer();

    /// Empties the ring, reallocating its storage if the size changes. Returns 0;
    /// VARNEK_RING_INVALID for a size below 1, which changes nothing, and if there is no memory.
    int Reset(int size);
    /// Empties the ring. Returns 0.
    int Flush();

    /// Moves the reader to the index `aOffset` (origin 0), forward by `aOffset` bytes (1), or to
    /// the start of the last `aOffset` bytes written (2). Origins 0 and 2 do not check that those
    /// bytes are unread or were ever written. With 2, an offset of the whole size leaves nothing to
    /// read. With 0, an index equal to the size leaves the reader past the end: before the next
    /// write it has to read, or to seek forward, if only by 0. Returns 0; VARNEK_RING_NO_SPACE for
    /// an offset that is negative, beyond the size or, with origin 1, beyond the readable bytes,
    /// for a ring without storage and, with origin 1, for an inconsistent one; VARNEK_RING_INVALID
    /// for another origin.
    int Seek(int aOffset, int origin);

    /// Returns how many bytes can be read now, and GetSpaceWriting how many can be written; in an
    /// inconsistent state, VARNEK_RING_OVERFLOW or VARNEK_RING_UNDERFLOW.
    int GetSpaceReading() const;
    int GetSpaceWriting() const;  ///< the bytes that fit
    /// Returns the readable bytes as a percentage of the size; in an inconsistent state, it may be
    /// outside 0 to 100.
    int GetDistance() const;

    /// Copies `writelen` bytes in; Read copies `readLen` bytes out. Both return 0;
    /// VARNEK_RING_INVALID for a length below 0 or above the size and, after a panic report, for a
    /// null pointer with a length above 0; VARNEK_RING_NO_SPACE if there is too little room;
    /// VARNEK_RING_NO_DATA if there are too few bytes, or 0 bytes are read from an empty ring. In
    /// an inconsistent state both empty the ring and return VARNEK_RING_NO_SPACE for an overflow
    /// and VARNEK_RING_NO_DATA for an underflow, with two exceptions: a write that finds WL = RL
    /// and W < R leaves the ring as it is, and with W <= R and WL > RL + 1 both treat the writer as
    /// one lap ahead.
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
