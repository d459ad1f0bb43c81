// Each read claims its bits before it reads the stream.
#include "FieldReader.h"

namespace receiver {

// The bit stream takes a pointer to non-const data, but only reads through it.
FieldReader::FieldReader(const unsigned char *bytes, size_t size)
    : stream_(const_cast<unsigned char *>(bytes), static_cast<unsigned>(size), 0),
      bits_left_(static_cast<int>(size) * 8) {}

bool FieldReader::Claim(int bits) {
    if (bits > bits_left_) {
        bits_left_ = 0;
        success_ = 0;
        return false;
    }
    bits_left_ -= bits;
    return true;
}

uint8_t FieldReader::U8(int bits) {
    return Claim(bits) ? stream_.ReadByte(bits, success_) : uint8_t{0};
}

uint16_t FieldReader::U16(int bits) {
    return Claim(bits) ? stream_.ReadShort(bits, success_) : uint16_t{0};
}

uint32_t FieldReader::U32(int bits) {
    return Claim(bits) ? stream_.ReadInt(bits, success_) : 0;
}

void FieldReader::Skip(int bits) {
    if (Claim(bits)) {
        stream_.Skip(bits);
    }
}

std::string FieldReader::Bytes(int count) {
    if (!Claim(count * 8) || count == 0) {
        return {};
    }
    std::string bytes(static_cast<size_t>(count), '\0');
    if (stream_.GetByteArray(reinterpret_cast<unsigned char *>(bytes.data()), count) != 0) {
        success_ = 0;
        return {};
    }
    return bytes;
}

FieldReader FieldReader::Enter(int count) {
    FieldReader inner = *this;
    if (count < BytesLeft()) {
        inner.bits_left_ = count * 8;
    }
    Skip(count * 8);
    return inner;
}

}  // namespace receiver
