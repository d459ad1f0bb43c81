/// @file
/// Reads unsigned fields of 0 to 32 bits out of a byte array, most significant bit first.
/// @see [Guide: bits and ring](docs/guide/bits-and-ring.md)
#ifndef VARNEK_CBITINPUTSTREAM_H
#define VARNEK_CBITINPUTSTREAM_H

#include "Varnek_Common.h"

/// Results of GetByteArray other than 0.
#define VARNEK_BITS_NOT_ALIGNED (-1)  ///< inside a byte
#define VARNEK_BITS_TOO_FEW (-10)     ///< fewer bytes remain
#define VARNEK_BITS_END (-22)         ///< at the end of the stream

#ifdef __cplusplus

/// A read position in a byte array, which the stream copies or borrows; a borrowed one has to stay
/// alive and unchanged.
///
/// A read that fails clears its success flag and none sets it, so set the flag to 1, read many
/// fields, then test it once. At the end of the stream every read fails. Fields come right-aligned
/// and unsigned. Not thread-safe: one thread at a time may use a stream.
///
///     state            iCurByteIdx        iBitIdxInCurByte   bEndOfStream
///     reading          current byte       0 to 7             0
///     rewound          current byte       1 to 7             2
///     end, by bits     last byte          8                  1
///     end, by bytes    uiBufLen           0                  1
///     no source        0                  0                  1
class VARNEK_API VarnekCBitInputStream {
  public:
    /// Starts at the first bit of `length` bytes: of a private copy if `copyMode` is 1, else of the
    /// caller's array. The stream is at its end if the source is null or empty, or there is no
    /// memory for the copy. Bytes beyond 2 GiB are not read.
    VarnekCBitInputStream(unsigned char *source, unsigned int length, unsigned char copyMode);
    /// Copies the position and a private copy, or shares a borrowed array. If memory runs out, the
    /// new stream has no source and is at its end.
    VarnekCBitInputStream(const VarnekCBitInputStream &other);
    VarnekCBitInputStream &operator=(const VarnekCBitInputStream &other);  ///< copies likewise

    /// Frees a private copy.
    ~VarnekCBitInputStream();

    /// Reads the next bit, 0 or 1.
    unsigned int ReadBit(unsigned char &success);
    /// Reads 0 to 8 bits that are all in the current byte, else nothing. Traces every failure; the
    /// other reads trace only if the stream ends inside the field.
    unsigned int GetBits(int aNum, unsigned char &success);
    /// Reads at most 8 bits (the next two read at most 16 and 32), and nothing if `count` is out of
    /// range. If the stream ends inside the field, the missing bits read as 0.
    unsigned char ReadByte(int count, unsigned char &success);
    unsigned short ReadShort(int count, unsigned char &success);  ///< at most 16
    unsigned int ReadInt(int count, unsigned char &success);      ///< at most 32

    /// Copies `count` bytes from a byte boundary. Returns 0 or, without moving, VARNEK_BITS_END at
    /// the end of the stream, VARNEK_BITS_NOT_ALIGNED inside a byte, and VARNEK_BITS_TOO_FEW if
    /// fewer bytes remain, for a negative count and for a null destination.
    int GetByteArray(unsigned char *dest, int count);
    /// Skips `count` bits, at most to the end. Each byte or part of one beyond it writes one trace,
    /// unless the stream was at its end before.
    void Skip(int count);
    /// Moves back by `count` bytes, or not at all if that would leave the buffer. Call it on a byte
    /// boundary: inside a byte, the next reads take the top bits of the byte it moved to. Returns
    /// 0.
    int RewindBytes(int count);
    /// Moves to the first bit if the stream has a source. Returns 0.
    int RwindToFirst();

  private:
    template <typename Value, unsigned int most>
    Value Read(int count, unsigned char &success);

    unsigned char bCopied = 0;
    unsigned char bEndOfStream = 1;
    int iCurByteIdx = 0;
    unsigned char *pBuffer = nullptr;
    unsigned int uiBufLen = 0;
    // The current byte, its consumed bits shifted out at the top. Its low bits may be those of the
    // next byte; they are never read.
    unsigned char ucCurByte = 0;
    int iBitIdxInCurByte = 0;
};

#endif

#endif
