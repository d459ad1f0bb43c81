// CRC-32 of a short section, of one in a single packet, and of the longest.
#include "Bench.h"
#include "Varnek_Util.h"

#ifdef HAVE_AVUTIL
extern "C" {
#include <libavutil/crc.h>
}
#endif

namespace {

uint32_t OurCrc(const unsigned char *data, size_t length) {
    return VarnekUtil_MakeCRC32(data, static_cast<int32_t>(length));
}

template <typename Crc>
void Register(const std::string &name, size_t length, Crc crc) {
    bench::Add(name, [length, crc](benchmark::State &state) {
        const std::vector<unsigned char> data = bench::Noise(length);
        const bool same = crc(data.data(), length) == OurCrc(data.data(), length);
        if (!bench::Require(state, same, "another result than ours")) {
            return;
        }
        for (auto _ : state) {
            benchmark::DoNotOptimize(crc(data.data(), length));
        }
    });
}

void RegisterAll() {
    for (const size_t length : {12u, 184u, 4096u}) {
        const std::string row = "crc/" + std::to_string(length) + ":";
        Register(row + "ours", length, OurCrc);
#ifdef HAVE_AVUTIL
        const AVCRC *table = av_crc_get_table(AV_CRC_32_IEEE);
        Register(row + "av_crc", length, [table](const unsigned char *data, size_t size) {
            // This peer's result has its bytes in the opposite order.
            return __builtin_bswap32(av_crc(table, 0xFFFFFFFFu, data, size));
        });
#endif
    }
}

}  // namespace

int main(int argc, char **argv) {
    return bench::Main(argc, argv, RegisterAll);
}
