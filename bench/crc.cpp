// CRC-32 of sections: a short one, a packet's payload, the longest.
#include "Bench.h"
#include "Varnek_Util.h"

#ifdef HAVE_AVUTIL
extern "C" {
#include <libavutil/crc.h>
}
#endif
namespace {

template <typename Crc>
void Register(const std::string &name, size_t length, Crc crc) {
    bench::Add(name, [length, crc](benchmark::State &state) {
        const std::vector<unsigned char> data = bench::Noise(length);
        if (!bench::Require(state,
                            crc(data.data(), length) ==
                                VarnekUtil_MakeCRC32(data.data(), static_cast<int32_t>(length)),
                            "another result than ours")) {
            return;
        }
        for (auto _ : state) {
            benchmark::DoNotOptimize(crc(data.data(), length));
        }
    });
}

uint32_t OurCrc(const unsigned char *data, size_t length) {
    return VarnekUtil_MakeCRC32(data, static_cast<int32_t>(length));
}

void RegisterPeers(const std::string &row, [[maybe_unused]] size_t length) {
#ifdef HAVE_AVUTIL
    const AVCRC *table = av_crc_get_table(AV_CRC_32_IEEE);
    Register(row + "av_crc", length, [table](const unsigned char *data, size_t size) {
        // The bytes of this peer's result are in the opposite order.
        return __builtin_bswap32(av_crc(table, 0xFFFFFFFFu, data, size));
    });
#else
    bench::AddMissing(row + "av_crc");
#endif
}

void RegisterAll() {
    for (const size_t length : {12u, 184u, 4096u}) {
        const std::string row = "crc/" + std::to_string(length) + ":";
        Register(row + "ours", length, OurCrc);
        RegisterPeers(row, length);
    }
    for (const size_t length : {16u, 1024u, 65536u}) {
        Register("grow_crc/" + std::to_string(length) + ":ours", length, OurCrc);
    }
}

}  // namespace

int main(int argc, char **argv) {
    return bench::Main(argc, argv, RegisterAll);
}
