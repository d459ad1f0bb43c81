// Reads a file in memory: packets through a stream, blocks through a descriptor.
#include <fcntl.h>
#include <stdio.h>
#include <unistd.h>

#include "Bench.h"
#include "Varnek_File.h"

namespace {

constexpr uint32_t kPacket = 188;
constexpr uint32_t kBlock = 64 * 1024;
constexpr size_t kFileSize = size_t{kPacket} * kBlock / 4;  // a multiple of both sizes

// A file for one benchmark.
class File {
  public:
    File() {
        const std::vector<unsigned char> data = bench::Noise(kFileSize);
        VarnekPGL_WriteFile(path, data.data(), static_cast<uint32_t>(data.size()));
    }
    ~File() { VarnekPGL_DeleteFile(path); }
    File(const File &) = delete;
    File &operator=(const File &) = delete;

    const char *const path = VARNEK_DATA_DIR "bench.ts";
};

// Starts again at the beginning of the file when `read` finds no complete piece.
template <typename Read, typename Rewind>
void Run(benchmark::State &state, Read read, Rewind rewind) {
    for (auto _ : state) {
        if (!read()) {
            rewind();
            if (!read()) {
                state.SkipWithError("nothing to read");
                break;
            }
        }
        benchmark::ClobberMemory();
    }
}

void OurStream(benchmark::State &state) {
    const File file;
    const PglFileHandle handle = VarnekPGL_OpenFile(file.path, PGL_FILE_MODE_READ);
    unsigned char packet[kPacket];
    Run(
        state, [&] { return VarnekPGL_ReadFileByHandle(handle, packet, kPacket) == kPacket; },
        [&] { VarnekPGL_SeekFile(handle, 0, 0); });
    VarnekPGL_CloseFile(handle);
}

void Fread(benchmark::State &state) {
    const File file;
    FILE *stream = fopen(file.path, "rb");
    unsigned char packet[kPacket];
    Run(
        state, [&] { return fread(packet, 1, kPacket, stream) == kPacket; },
        [&] { fseek(stream, 0, SEEK_SET); });
    fclose(stream);
}

void OurBlocks(benchmark::State &state) {
    const File file;
    const int32_t handle = VarnekPGL_OpenFile64Bits(file.path, PGL_FILE_MODE_READ);
    std::vector<unsigned char> block(kBlock);
    Run(
        state,
        [&] {
            return VarnekPGL_ReadFileByHandle64Bits(handle, block.data(), kBlock) ==
                   static_cast<int32_t>(kBlock);
        },
        [&] { VarnekPGL_SeekFile64Bits(handle, 0, 0); });
    VarnekPGL_CloseFile64Bits(handle);
}

void SystemRead(benchmark::State &state) {
    const File file;
    const int descriptor = open(file.path, O_RDONLY | O_CLOEXEC);
    std::vector<unsigned char> block(kBlock);
    Run(
        state, [&] { return read(descriptor, block.data(), kBlock) == ssize_t{kBlock}; },
        [&] { lseek(descriptor, 0, SEEK_SET); });
    close(descriptor);
}

void RegisterAll() {
    bench::Add("file/188:ours", OurStream);
    bench::Add("file/188:libc", Fread);
    bench::Add("file/64k:ours", OurBlocks);
    bench::Add("file/64k:libc", SystemRead);
}

}  // namespace

int main(int argc, char **argv) {
    return bench::Main(argc, argv, RegisterAll);
}
