// Reads bit fields as a PSI parser does, from 960 bytes.
#include "Bench.h"
#include "Varnek_CBitInputStream.h"

#ifdef HAVE_GSTREAMER
// Calls the peer's exported functions, as callers in other languages do, instead of the inlined
// ones that C and C++ get by default.
#define GST_BIT_READER_DISABLE_INLINES
#include <gst/base/gstbitreader.h>
#endif

namespace {

constexpr size_t kRound = 12;           // bytes of the fields below
constexpr size_t kBytes = 80 * kRound;  // 1200 fields

// Reads rounds of fields with widths that the compiler knows, as a parser does. Returns 0 if a read
// fails.
template <typename Reader, int... counts>
uint32_t ReadFields(const unsigned char *data) {
    Reader reader(data);
    uint32_t sum = 0;
    for (size_t at = 0; at < kBytes; at += kRound) {
        ((sum = sum * 31 + reader.template Read<counts>()), ...);
    }
    return reader.Succeeded() ? sum : 0;
}

template <typename Reader>
uint32_t ReadAll(const unsigned char *data) {
    return ReadFields<Reader, 8, 1, 1, 2, 12, 16, 2, 5, 1, 8, 8, 3, 13, 4, 12>(data);
}

class OurReader {
  public:
    explicit OurReader(const unsigned char *data)
        // The stream borrows the bytes and only reads them.
        : stream_(const_cast<unsigned char *>(data), kBytes, 0) {}
    template <int count>
    uint32_t Read() {
        if constexpr (count == 1) {
            return stream_.ReadBit(success_);
        } else if constexpr (count <= 8) {
            return stream_.ReadByte(count, success_);
        } else {
            return stream_.ReadShort(count, success_);
        }
    }
    bool Succeeded() const { return success_ == 1; }

  private:
    VarnekCBitInputStream stream_;
    unsigned char success_ = 1;
};

#ifdef HAVE_GSTREAMER
class GstReader {
  public:
    explicit GstReader(const unsigned char *data) { gst_bit_reader_init(&reader_, data, kBytes); }
    template <int count>
    uint32_t Read() {
        guint32 value = 0;
        success_ &= gst_bit_reader_get_bits_uint32(&reader_, &value, count);
        return value;
    }
    bool Succeeded() const { return success_ == TRUE; }

  private:
    GstBitReader reader_ = {};
    gboolean success_ = TRUE;
};
#endif

template <typename Reader>
void Run(benchmark::State &state) {
    const std::vector<unsigned char> data = bench::Noise(kBytes);
    const bool same = ReadAll<Reader>(data.data()) == ReadAll<OurReader>(data.data());
    if (!bench::Require(state, same, "other fields than ours")) {
        return;
    }
    for (auto _ : state) {
        benchmark::DoNotOptimize(ReadAll<Reader>(data.data()));
    }
}

void RegisterAll() {
    bench::Add("bits:ours", Run<OurReader>);
#ifdef HAVE_GSTREAMER
    bench::Add("bits:gstreamer", Run<GstReader>);
#endif
}

}  // namespace

int main(int argc, char **argv) {
    return bench::Main(argc, argv, RegisterAll);
}
