// The ring buffer: a sequence of operations, from inconsistent states too, compared with the model that moves single
// bytes.
#include <algorithm>
#include <numeric>

#include "Fuzz.h"
#include "RingModel.h"

int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    Input input(data, size);
    VarnekCRingBuffer ring(input.Below(64) + 1);
    RingModel model{FieldsOf(ring), {}};
    model.bytes.resize(static_cast<size_t>(model.size));
    memset(model.storage, 0, model.bytes.size());
    for (unsigned char next = 0; !input.Empty();) {
        const uint8_t kind = input.Byte();
        Fields before = FieldsOf(ring);
        if (kind >= 250) {
            // A state that no operation leaves behind, which may be near the end of the loop counts.
            const int laps = kind % 2 == 0 ? INT32_MAX - 2 : 0;
            before.w = input.Below(before.size);
            before.r = input.Below(before.size);
            before.wl = RingModel::Plus(laps, input.Below(4));
            before.rl = RingModel::Plus(laps, input.Below(4));
            SetFields(ring, before);
            static_cast<Fields &>(model) = before;
        } else if (kind >= 245) {
            ring = VarnekCRingBuffer(ring);
            const VarnekCRingBuffer &same = ring;
            ring = same;
        }
        const int count = input.Int() % 512;
        const auto apply = [=](auto &target, std::vector<unsigned char> &bytes) {
            return kind % 8 == 0   ? target.Flush()
                   : kind % 8 == 1 ? target.Reset(count)
                   : kind % 8 == 2 ? target.Seek(count, kind / 8 % 4)
                   : kind % 8 <= 4 ? target.Read(bytes.data(), count)
                                   : target.Write(bytes.data(), count);
        };
        std::vector<unsigned char> bytes(static_cast<size_t>(std::max(count, 0)));
        std::iota(bytes.begin(), bytes.end(), next);
        next = static_cast<unsigned char>(next + bytes.size());
        std::vector<unsigned char> expectedBytes = bytes;
        const int expected = apply(model, expectedBytes);
        CHECK(apply(ring, bytes) == expected && bytes == expectedBytes);
        CHECK(ring.GetSpaceReading() == model.Space(true) && ring.GetSpaceWriting() == model.Space(false));
        CHECK(ring.GetDistance() == model.GetDistance());
        Fields after = FieldsOf(ring);
        CHECK(after.State() == model.State() && after.mutex == before.mutex);
        if (after.size != before.size) {
            // A read may return bytes that were never written.
            memcpy(after.storage, model.bytes.data(), model.bytes.size());
        }
        CHECK(std::equal(model.bytes.begin(), model.bytes.end(), after.storage));
    }
    return 0;
}
