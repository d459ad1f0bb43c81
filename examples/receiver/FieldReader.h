// Reads fields from borrowed bytes with the library's bit stream. A reader knows where its fields
// end, so no length in a stream makes it read outside the section; it also remembers whether every
// read so far was inside.
#ifndef RECEIVER_FIELDREADER_H
#define RECEIVER_FIELDREADER_H

#include <cstddef>
#include <cstdint>
#include <string>

#include "Varnek_CBitInputStream.h"

namespace receiver {

class FieldReader {
  public:
    // The bytes must outlive the reader and all readers entered from it.
    FieldReader(const unsigned char *bytes, size_t size);

    // Returns the next `bits` bits. If fewer are left, returns 0, and Ok() is false from then on.
    uint8_t U8(int bits = 8);
    uint16_t U16(int bits = 16);
    uint32_t U32(int bits = 32);
    void Skip(int bits);
    // Returns the next `count` bytes, from a byte boundary; empty when fewer are left.
    std::string Bytes(int count);

    // Returns a reader for the next `count` bytes, which this one skips. If fewer are left, the new
    // reader gets those, so that the entries before the overrun are used, but this one is no longer
    // Ok().
    FieldReader Enter(int count);

    bool Ok() const { return success_ != 0; }
    int BytesLeft() const { return bits_left_ / 8; }

  private:
    bool Claim(int bits);

    VarnekCBitInputStream stream_;
    int bits_left_;
    unsigned char success_ = 1;
};

}  // namespace receiver

#endif
