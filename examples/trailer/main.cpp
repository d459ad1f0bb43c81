// trailer FILE: appends the CRC-32 of a file to it, which is how data carousels are stored.
// trailer --check FILE: exits with 1 unless a file ends in its CRC-32.
// Files are read in pieces, so they may have any size of 4 bytes or more.
#include <algorithm>
#include <cstdio>
#include <cstring>
#include <vector>

#include "Varnek_File.h"
#include "Varnek_Util.h"

namespace {

constexpr int32_t kPiece = 64 * 1024;
constexpr int32_t kSmallest = 4;  // of a piece and of a file

// Extends a CRC over the next piece of the data, whose first four bytes it changes.
uint32_t GoOn(uint32_t crc, unsigned char *piece, int32_t length) {
    for (int i = 0; i < 4; ++i) {
        piece[i] ^= static_cast<unsigned char>(~crc >> (24 - 8 * i));
    }
    return VarnekUtil_MakeCRC32(piece, length);
}

bool ReadAll(int32_t hFile, unsigned char *to, int32_t length) {
    for (int32_t count = 0; length > 0; to += count, length -= count) {
        count = VarnekPGL_ReadFileByHandle64Bits(hFile, to, static_cast<uint32_t>(length));
        if (count <= 0) {
            return false;
        }
    }
    return true;
}

// Computes the CRC of a file's whole content.
bool Measure(int32_t hFile, uint32_t &crc) {
    int64_t left = VarnekPGL_GetFileSizeByHandle64Bits(hFile);
    if (left < kSmallest) {
        std::fputs("trailer: the file is too small\n", stderr);
        return false;
    }
    std::vector<unsigned char> piece(kPiece);
    crc = 0xFFFFFFFF;  // the register before the first byte
    while (left > 0) {
        // What is left after this piece is empty or no smaller than the smallest piece.
        const bool tail = left > kPiece && left < kPiece + kSmallest;
        const auto length =
            static_cast<int32_t>(std::min<int64_t>(left, tail ? kPiece - kSmallest : kPiece));
        if (!ReadAll(hFile, piece.data(), length)) {
            std::fputs("trailer: the file cannot be read\n", stderr);
            return false;
        }
        crc = GoOn(crc, piece.data(), length);
        left -= length;
    }
    return true;
}

bool Append(int32_t hFile, uint32_t crc) {
    const unsigned char trailer[] = {
        static_cast<unsigned char>(crc >> 24), static_cast<unsigned char>(crc >> 16),
        static_cast<unsigned char>(crc >> 8), static_cast<unsigned char>(crc)};
    VarnekPGL_SeekFile64Bits(hFile, 0, SEEK_END);
    return VarnekPGL_WriteFileByHandle64Bits(hFile, trailer, sizeof trailer) == sizeof trailer;
}

}  // namespace

int main(int argc, char **argv) {
    const bool check = argc == 3 && std::strcmp(argv[1], "--check") == 0;
    if (argc != 2 && !check) {
        std::fputs("usage: trailer [--check] FILE\n", stderr);
        return 2;
    }
    const char *const path = argv[argc - 1];
    const int32_t hFile = VarnekPGL_OpenFile64Bits(
        path, check ? PGL_FILE_MODE_READ : PGL_FILE_MODE_READ | PGL_FILE_MODE_WRITE);
    if (hFile < 0) {
        std::fprintf(stderr, "trailer: %s cannot be opened\n", path);
        return 1;
    }
    uint32_t crc = 0;
    bool done = Measure(hFile, crc);
    if (done && check) {
        // The CRC of data that ends in its own CRC is 0.
        std::printf("%s: CRC %s\n", path, crc == 0 ? "right" : "wrong");
        done = crc == 0;
    } else if (done) {
        std::printf("%s: CRC 0x%08X\n", path, static_cast<unsigned>(crc));
        done = Append(hFile, crc);
    }
    VarnekPGL_CloseFile64Bits(hFile);
    return done ? 0 : 1;
}
