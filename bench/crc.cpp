// CRC-32 over sections, from a short one through a packet's payload to the longest.
#include <string.h>

#include "Bench.h"
#include "Varnek_Util.h"

#ifdef HAVE_AVUTIL
extern "C" {
#include <libavutil/crc.h>
}
#endif
#ifdef HAVE_DVBPSI
// The peer's header expects these headers before it.
#include <stdbool.h>
#include <stdint.h>
extern "C" {
#include <dvbpsi/dvbpsi.h>
#include <dvbpsi/psi.h>
}
#endif
#ifdef HAVE_BOOST
#include <boost/crc.hpp>
#endif

namespace {

// The limit: 16 bytes for each step with 16 tables, inlined here.
struct Tables {
    uint32_t word[16][256];
};

constexpr Tables MakeTables() {
    Tables tables = {};
    for (uint32_t i = 0; i < 256; i++) {
        uint32_t crc = i << 24;
        for (int bit = 0; bit < 8; bit++) {
            crc = crc << 1 ^ (crc >> 31 != 0 ? 0x04C11DB7u : 0);
        }
        tables.word[0][i] = crc;
    }
    for (int n = 1; n < 16; n++) {
        for (int i = 0; i < 256; i++) {
            const uint32_t crc = tables.word[n - 1][i];
            tables.word[n][i] = crc << 8 ^ tables.word[0][crc >> 24];
        }
    }
    return tables;
}

constexpr Tables kTables = MakeTables();

// Returns the register after the four bytes of `word` and `n` zero bytes.
template <int n>
uint32_t Through(uint32_t word) {
    return kTables.word[n + 3][word >> 24] ^ kTables.word[n + 2][word >> 16 & 0xFF] ^
           kTables.word[n + 1][word >> 8 & 0xFF] ^ kTables.word[n][word & 0xFF];
}

uint32_t WordAt(const unsigned char *data) {
    uint32_t word = 0;
    memcpy(&word, data, sizeof word);
    return __builtin_bswap32(word);
}

uint32_t LimitCrc(const unsigned char *data, size_t length) {
    uint32_t crc = 0xFFFFFFFFu;
    for (; length >= 16; length -= 16, data += 16) {
        crc = Through<12>(crc ^ WordAt(data)) ^ Through<8>(WordAt(data + 4)) ^
              Through<4>(WordAt(data + 8)) ^ Through<0>(WordAt(data + 12));
    }
    for (; length > 0; length--, data++) {
        crc = kTables.word[0][*data ^ crc >> 24] ^ crc << 8;
    }
    return crc;
}

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
#ifdef HAVE_DVBPSI
    Register(row + "dvbpsi", length, [](const unsigned char *data, size_t size) {
        // This peer writes the result after the section, so it works on a copy with room for it.
        static std::vector<unsigned char> copy;
        if (copy.size() != size + 4) {
            copy.assign(data, data + size);
            copy.resize(size + 4);
        }
        dvbpsi_psi_section_t section = {};
        section.b_syntax_indicator = true;
        section.p_data = copy.data();
        section.p_payload_end = copy.data() + size;
        dvbpsi_CalculateCRC32(&section);
        return section.i_crc;
    });
#else
    bench::AddMissing(row + "dvbpsi");
#endif
#ifdef HAVE_BOOST
    Register(row + "boost", length, [](const unsigned char *data, size_t size) {
        boost::crc_optimal<32, 0x04C11DB7, 0xFFFFFFFF, 0, false, false> crc;
        crc.process_bytes(data, size);
        return crc.checksum();
    });
#else
    bench::AddMissing(row + "boost");
#endif
}

void RegisterAll() {
    for (const size_t length : {12u, 184u, 1024u, 4096u}) {
        const std::string row = "crc/" + std::to_string(length) + ":";
        Register(row + "ours", length, OurCrc);
        Register(row + "limit", length, LimitCrc);
        RegisterPeers(row, length);
    }
    for (const size_t length : {16u, 64u, 256u, 1024u, 4096u, 16384u, 65536u}) {
        Register("grow_crc/" + std::to_string(length) + ":ours", length, OurCrc);
    }
}

}  // namespace

int main(int argc, char **argv) {
    return bench::Main(argc, argv, RegisterAll);
}
