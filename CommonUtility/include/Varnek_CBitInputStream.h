// Reads unsigned fields of 0 to 32 bits out of a byte array, most significant bit first.
#ifndef VARNEK_CBITINPUTSTREAM_H
#define VARNEK_CBITINPUTSTREAM_H

#include "Varnek_Common.h"

// Results of GetByteArray, beside 0.
#define VARNEK_BITS_NOT_ALIGNED (-1)  // inside a byte
#define VARNEK_BITS_TOO_FEW (-10)     // fewer bytes remain
#define VARNEK_BITS_END (-22)         // at the end of the stream

#ifdef __cplusplus

// A read position in a byte array that is either borrowed from the caller, who keeps it alive and
// unchanged, or copied.
//
// The success flag that the reads take is cleared by a read that fails and never set: set it to 1
// before a run of reads and test it once after the run. At the end of the stream every read fails.
// Fields come right-aligned and unsigned. One thread uses a stream at a time.
//
//   state            iCurByteIdx        iBitIdxInCurByte   bEndOfStream
//   reading          current byte       0 to 7             0
//   end, by bits     last byte          8                  1
//   end, by bytes    uiBufLen           0                  1
//   no source        0                  0                  1
class VARNEK_API VarnekCBitInputStream {
  public:
    // Starts at the first bit of `length` bytes. `copyMode` 1 keeps a private copy; any other value
    // reads the caller's array. A null or empty source gives a stream at its end, and so does a
    // copy for which there is no memory. Bytes beyond 2 GiB are not read.
    VarnekCBitInputStream(unsigned char *source, unsigned int length, unsigned char copyMode);
    // Takes the position; a private copy is copied, a borrowed array is shared. Without memory for
    // the copy the stream is at its end, as without a source.
    VarnekCBitInputStream(const VarnekCBitInputStream &other);
    VarnekCBitInputStream &operator=(const VarnekCBitInputStream &other);

    // Frees a private copy.
    ~VarnekCBitInputStream();

    // The next bit, 0 or 1.
    unsigned int ReadBit(unsigned char &success);
    // `aNum` bits, 0 to 8, which must lie within the current byte; otherwise nothing is read. Of
    // the reads, only this one traces what it refuses.
    unsigned int GetBits(int aNum, unsigned char &success);
    // `count` bits, 0 to 8, 16 and 32. A count out of range reads nothing. When the stream ends
    // before the field does, the bits that are missing read as 0.
    unsigned char ReadByte(int count, unsigned char &success);
    unsigned short ReadShort(int count, unsigned char &success);
    unsigned int ReadInt(int count, unsigned char &success);

    // Copies `count` bytes from a byte boundary. Returns 0; VARNEK_BITS_END at the end of the
    // stream, VARNEK_BITS_NOT_ALIGNED inside a byte, VARNEK_BITS_TOO_FEW when fewer bytes remain,
    // for a negative count and for a null destination: nothing moves then.
    int GetByteArray(unsigned char *dest, int count);
    // Discards `count` bits, and stops at the end of the stream; each byte's worth beyond it is one
    // trace.
    void Skip(int count);
    // Moves back by `count` bytes; meant for byte boundaries: inside a byte, the next reads take
    // the top bits of the byte it lands on. A step that would leave the buffer moves nothing.
    // Returns 0.
    int RewindBytes(int count);
    // Moves to the first bit, if there is a source. Returns 0.
    int RwindToFirst();

  private:
    template <typename Value, unsigned int most>
    Value Read(int count, unsigned char &success);

    unsigned char bCopied = 0;
    unsigned char bEndOfStream = 1;
    int iCurByteIdx = 0;
    unsigned char *pBuffer = nullptr;
    unsigned int uiBufLen = 0;
    unsigned char ucCurByte = 0;  // the current byte, its consumed bits shifted out at the top
    int iBitIdxInCurByte = 0;
};

#endif

#endif
