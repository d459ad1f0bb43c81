// Byte order. Private.
#ifndef VARNEK_SOURCE_BYTES_H
#define VARNEK_SOURCE_BYTES_H

#include <stdint.h>
#include <string.h>

// Reads four bytes at any alignment, the most significant first.
inline uint32_t BigEndian(const unsigned char *p) {
    return static_cast<uint32_t>(p[0]) << 24 | static_cast<uint32_t>(p[1]) << 16 |
           static_cast<uint32_t>(p[2]) << 8 | p[3];
}

// Converts a word between the machine's byte order and little-endian order.
template <typename Word>
constexpr Word LittleEndian(Word word) {
    if constexpr (__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__) {
        return word;
    }
    return static_cast<Word>(sizeof word == 8 ? __builtin_bswap64(word)
                                              : __builtin_bswap32(static_cast<uint32_t>(word)));
}

// Loads a word in the machine's byte order, at any alignment.
template <typename Word>
Word Load(const unsigned char *p) {
    Word word = 0;
    memcpy(&word, p, sizeof word);
    return word;
}

#endif
