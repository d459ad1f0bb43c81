// What the fuzz targets share: taking the input apart and writing the library's files. Every trace is on, so a run
// also formats them all.
#ifndef VARNEK_TESTS_FUZZ_FUZZ_H
#define VARNEK_TESTS_FUZZ_FUZZ_H

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "support/Check.h"
#include "support/Platform.h"

extern "C" int LLVMFuzzerInitialize(int *argc, char ***argv);
extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size);

// Writes a file in place, since a new file each time would cost more than all the rest.
void WriteInPlace(const char *path, const std::string &content);

// The input's bytes in order, and zeros after its end.
class Input {
  public:
    Input(const uint8_t *data, size_t size) : data_(data), left_(size) {}

    bool Empty() const { return left_ == 0; }
    uint8_t Byte() { return left_ == 0 ? uint8_t{0} : (--left_, *data_++); }
    int Below(int limit) { return Byte() % limit; }
    // A number that is mostly small, and now and then of any size.
    int Int() {
        const int byte = Byte();
        return byte != 128 ? (byte < 128 ? byte : byte - 256) : static_cast<int>(uint32_t{Byte()} << 24 | Byte());
    }
    // Up to `limit` bytes, in a block of exactly their size, so a sanitizer notices a read past them.
    template <typename Char = uint8_t>
    std::vector<Char> Bytes(size_t limit = SIZE_MAX) {
        const size_t count = left_ < limit ? left_ : limit;
        std::vector<Char> bytes(data_, data_ + count);
        data_ += count;
        left_ -= count;
        return bytes;
    }
    // The bytes up to a 0 or the end, with a terminator, in a block of exactly their size.
    std::vector<char> Text() {
        std::vector<char> text;
        for (char c = '\0'; !Empty() && (c = static_cast<char>(Byte())) != '\0';) {
            text.push_back(c);
        }
        text.push_back('\0');
        return {text.begin(), text.end()};
    }

  private:
    const uint8_t *data_;
    size_t left_;
};

#endif
