// Reads bit fields as a parser of PSI sections does, from 960 bytes.
#include "Bench.h"
#include "Varnek_CBitInputStream.h"

#ifdef HAVE_GSTREAMER
// Calls the library's functions, as callers in other languages and with unusual widths do, instead
// of the inlined ones.
#define GST_BIT_READER_DISABLE_INLINES
#include <gst/base/gstbitreader.h>
#endif

namespace {

template <int... counts>
struct Fields {};
using Psi = Fields<8, 1, 1, 2, 12, 16, 2, 5, 1, 8, 8, 3, 13, 4, 12>;
constexpr size_t kRound = 12;           // bytes of these fields
constexpr size_t kBytes = 80 * kRound;  // 1200 fields

// Reads fields one after the other, with widths that the compiler knows, as a parser does. Returns
// 0 when a read fails.
template <typename Reader, int... counts>
uint32_t ReadAll(Reader *reader, size_t size, Fields<counts...>) {
    uint32_t sum = 0;
    for (size_t at = 0; at < size; at += kRound) {
        ((sum = sum * 31 + reader->template Read<counts>()), ...);
    }
    return reader->Succeeded() ? sum : 0;
}

class OurReader {
  public:
    OurReader(const unsigned char *data, size_t size)
        // The stream borrows the bytes and only reads them.
        : stream_(const_cast<unsigned char *>(data), static_cast<unsigned int>(size), 0) {}
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
    GstReader(const unsigned char *data, size_t size) {
        gst_bit_reader_init(&reader_, data, static_cast<guint>(size));
    }
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
uint32_t ReadWith(const unsigned char *data, size_t size) {
    Reader reader(data, size);
    return ReadAll(&reader, size, Psi());
}

void Register(const std::string &name, size_t size,
              uint32_t (*read)(const unsigned char *, size_t)) {
    bench::Add(name, [size, read](benchmark::State &state) {
        const std::vector<unsigned char> data = bench::Noise(size);
        if (!bench::Require(state,
                            read(data.data(), size) == ReadWith<OurReader>(data.data(), size),
                            "other fields than ours")) {
            return;
        }
        for (auto _ : state) {
            benchmark::DoNotOptimize(read(data.data(), size));
        }
    });
}

void RegisterAll() {
    Register("bits:ours", kBytes, ReadWith<OurReader>);
#ifdef HAVE_GSTREAMER
    Register("bits:gstreamer", kBytes, ReadWith<GstReader>);
#else
    bench::AddMissing("bits:gstreamer");
#endif
    for (const size_t rounds : {1u, 100u, 341u}) {
        const size_t size = rounds * kRound;
        Register("grow_bits/" + std::to_string(size) + ":ours", size, ReadWith<OurReader>);
    }
}

}  // namespace

int main(int argc, char **argv) {
    return bench::Main(argc, argv, RegisterAll);
}
