// Codes of languages and countries.
#ifndef RECEIVER_CODE_H
#define RECEIVER_CODE_H

#include <cstdint>
#include <string>

namespace receiver {

// A three-character code of a language (ISO 639) or a country (ISO 3166); empty when there is none.
class Code {
  public:
    constexpr Code() = default;
    // Takes the bytes of a descriptor, which give an empty code if they cannot be one.
    explicit constexpr Code(uint32_t bytes) {
        if (MayBeOfCode(bytes >> 16) && MayBeOfCode(bytes >> 8) && MayBeOfCode(bytes)) {
            bytes_ = bytes;
        }
    }

    // Takes a text, which is no code unless it has three characters.
    static constexpr Code Of(const char *text) {
        uint32_t bytes = 0;
        int length = 0;
        for (; length < 4 && text[length] != '\0'; ++length) {
            bytes = bytes << 8 | static_cast<unsigned char>(text[length]);
        }
        return length == 3 ? Code(bytes) : Code();
    }

    bool IsEmpty() const { return bytes_ == 0; }
    std::string Text() const {
        return IsEmpty() ? std::string()
                         : std::string{static_cast<char>(bytes_ >> 16),
                                       static_cast<char>(bytes_ >> 8), static_cast<char>(bytes_)};
    }
    bool operator==(const Code &other) const { return bytes_ == other.bytes_; }

  private:
    static constexpr bool MayBeOfCode(uint32_t bytes) {
        const uint32_t byte = bytes & 0xFF;
        return (byte >= 'a' && byte <= 'z') || (byte >= 'A' && byte <= 'Z') ||
               (byte >= '0' && byte <= '9');
    }

    uint32_t bytes_ = 0;
};

}  // namespace receiver

#endif
