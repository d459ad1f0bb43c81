// Reads fields out of borrowed bytes with the library's bit stream. A reader knows where its fields
// end, so a length that the stream claims can never lead outside the section, and remembers whether
// every read so far was inside.
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

    // The next `bits` bits; 0, and Ok() false from then on, when the fields end before.
    uint8_t U8(int bits = 8);
    uint16_t U16(int bits = 16);
    uint32_t U32(int bits = 32);
    void Skip(int bits);
    // The next `count` bytes, from a byte boundary; empty when fewer are left.
    std::string Bytes(int count);

    // A reader for the next `count` bytes, which this one steps over. When fewer are left, it gets
    // those, and this one is no longer Ok(): loops stop, and whole entries before stay in use.
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
