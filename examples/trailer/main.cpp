// trailer FILE: makes a file with a CRC-32 behind its content, as data carousels are stored, checks
// it, changes one byte and checks again.
#include <cstdio>
#include <cstring>

#include "Varnek_File.h"
#include "Varnek_Util.h"

namespace {

constexpr char kContent[] = "What a carousel brought, to be checked when it is read again.";

bool Make(const char *path) {
    constexpr uint32_t kLength = sizeof kContent - 1;
    // The append reports nothing; the check that follows does.
    return VarnekPGL_WriteFile(path, kContent, kLength) == static_cast<int32_t>(kLength) &&
           VarnekUtil_AppendCRC32ToFile(path) != FALSE;
}

// Changes the byte at `offset`, where a stream would have to write the whole file again.
bool Damage(const char *path, int64_t offset) {
    const int32_t hFile = VarnekPGL_OpenFile64Bits(path, PGL_FILE_MODE_READ | PGL_FILE_MODE_WRITE);
    if (hFile < 0) {
        return false;
    }
    unsigned char byte = 0;
    VarnekPGL_SeekFile64Bits(hFile, offset, SEEK_SET);
    bool done = VarnekPGL_ReadFileByHandle64Bits(hFile, &byte, 1) == 1;
    byte ^= 0x01;
    VarnekPGL_SeekFile64Bits(hFile, offset, SEEK_SET);
    done = done && VarnekPGL_WriteFileByHandle64Bits(hFile, &byte, 1) == 1;
    VarnekPGL_CloseFile64Bits(hFile);
    return done;
}

bool Check(const char *path) {
    const bool right = VarnekUtil_CheckFileCRC32(path) != FALSE;
    std::printf("%d bytes, CRC %s\n", static_cast<int>(VarnekPGL_GetFileSize(path)),
                right ? "right" : "wrong");
    return right;
}

}  // namespace

int main(int argc, char **argv) {
    if (argc != 2) {
        std::fputs("usage: trailer FILE\n", stderr);
        return 2;
    }
    const char *path = argv[1];
    if (!Make(path) || !Check(path) || !Damage(path, 5) || Check(path)) {
        std::fprintf(stderr, "trailer: %s: the log says more\n", path);
        return 1;
    }
    return 0;
}
