// Bit fields as a parser of PSI sections reads them, over 1020 bytes.
#include "Bench.h"
#include "Varnek_CBitInputStream.h"
#include "limit.h"

#ifdef HAVE_GSTREAMER
// Calls its library, as callers in other languages and of unusual widths do.
#define GST_BIT_READER_DISABLE_INLINES
#include <gst/base/gstbitreader.h>
#endif

namespace {

constexpr int kFields[] = {8, 1, 1, 2, 12, 16, 2, 5, 1, 8, 8, 3, 13, 4, 12};
constexpr size_t kRound = 12;  // bytes of these fields
constexpr size_t kBytes = 85 * kRound;

uint32_t Ours(const unsigned char *data, size_t size) {
    // Borrowed, and only read.
    VarnekCBitInputStream stream(const_cast<unsigned char *>(data), static_cast<unsigned int>(size),
                                 0);
    unsigned char success = 1;
    uint32_t sum = 0;
    for (size_t at = 0; at < size; at += kRound) {
        for (const int count : kFields) {
            if (count == 1) {
                sum = sum * 31 + stream.ReadBit(success);
            } else if (count <= 8) {
                sum = sum * 31 + stream.ReadByte(count, success);
            } else {
                sum = sum * 31 + stream.ReadShort(count, success);
            }
        }
    }
    return success == 1 ? sum : 0;
}

uint32_t Limit(const unsigned char *data, size_t size) {
    LimitReader reader = {data, size * 8, 0};
    uint32_t sum = 0;
    for (size_t at = 0; at < size; at += kRound) {
        for (const int count : kFields) {
            uint32_t value = 0;
            if (LimitReadBits(&reader, count, &value) == 0) {
                return 0;
            }
            sum = sum * 31 + value;
        }
    }
    return sum;
}

#ifdef HAVE_GSTREAMER
uint32_t GStreamer(const unsigned char *data, size_t size) {
    GstBitReader reader;
    gst_bit_reader_init(&reader, data, static_cast<guint>(size));
    uint32_t sum = 0;
    for (size_t at = 0; at < size; at += kRound) {
        for (const int count : kFields) {
            guint32 value = 0;
            if (!gst_bit_reader_get_bits_uint32(&reader, &value, static_cast<guint>(count))) {
                return 0;
            }
            sum = sum * 31 + value;
        }
    }
    return sum;
}
#endif

void Register(const std::string &name, size_t size,
              uint32_t (*read)(const unsigned char *, size_t)) {
    bench::Add(name, [size, read](benchmark::State &state) {
        const std::vector<unsigned char> data = bench::Noise(size);
        if (!bench::Require(state, read(data.data(), size) == Ours(data.data(), size),
                            "other fields than ours")) {
            return;
        }
        for (auto _ : state) {
            benchmark::DoNotOptimize(read(data.data(), size));
        }
    });
}

void RegisterAll() {
    Register("bits:ours", kBytes, Ours);
    Register("bits:limit", kBytes, Limit);
#ifdef HAVE_GSTREAMER
    Register("bits:gstreamer", kBytes, GStreamer);
#else
    bench::AddMissing("bits:gstreamer");
#endif
    for (const size_t rounds : {1u, 10u, 100u, 341u}) {
        const size_t size = rounds * kRound;
        Register("grow_bits/" + std::to_string(size) + ":ours", size, Ours);
    }
}

}  // namespace

int main(int argc, char **argv) {
    return bench::Main(argc, argv, RegisterAll);
}
