// The ring buffer: a sequence of operations, from states in disorder too, against the model that
// moves single bytes.
#include <algorithm>
#include <numeric>

#include "Fuzz.h"
#include "RingModel.h"

namespace {

struct Operation {
    int kind;
    int count;
    int origin;
};

template <typename Ring>
int Apply(Ring &ring, const Operation &operation, std::vector<unsigned char> &bytes) {
    switch (operation.kind) {
        case 0:
            return ring.Flush();
        case 1:
            return ring.Reset(operation.count);
        case 2:
            return ring.Seek(operation.count, operation.origin);
        case 3:
        case 4:
            return ring.Read(bytes.data(), operation.count);
        default:
            return ring.Write(bytes.data(), operation.count);
    }
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    Input input(data, size);
    CollectTraces();
    VarnekCRingBuffer ring(input.Below(64) + 1);
    RingModel model{FieldsOf(ring), {}, {}};
    model.bytes.resize(static_cast<size_t>(model.size));
    memset(model.storage, 0, model.bytes.size());
    for (unsigned char next = 0; !input.Empty();) {
        const uint8_t kind = input.Byte();
        Fields before = FieldsOf(ring);
        if (kind >= 250) {
            // What no operation leaves behind, near the end of the loop counts too.
            const int laps = kind % 2 == 0 ? INT32_MAX - 2 : 0;
            before.w = input.Below(before.size);
            before.r = input.Below(before.size);
            before.wl = RingModel::Plus(laps, input.Below(4));
            before.rl = RingModel::Plus(laps, input.Below(4));
            memcpy(static_cast<void *>(&ring), &before, sizeof before);
            static_cast<Fields &>(model) = before;
        } else if (kind >= 245) {
            ring = VarnekCRingBuffer(ring);
            const VarnekCRingBuffer &same = ring;
            ring = same;
        }
        DropTraces();
        const Operation operation{kind % 8, input.Int() % 512, kind / 8 % 4};
        std::vector<unsigned char> bytes(static_cast<size_t>(std::max(operation.count, 0)));
        std::iota(bytes.begin(), bytes.end(), next);
        next = static_cast<unsigned char>(next + bytes.size());
        std::vector<unsigned char> expectedBytes = bytes;
        const int expected = Apply(model, operation, expectedBytes);
        CHECK(Apply(ring, operation, bytes) == expected && bytes == expectedBytes);
        CHECK(ring.GetSpaceReading() == model.GetSpaceReading());
        CHECK(ring.GetSpaceWriting() == model.GetSpaceWriting());
        CHECK(ring.GetDistance() == model.GetDistance());
        Fields after = FieldsOf(ring);
        CHECK(after.State() == model.State() && after.mutex == before.mutex);
        if (after.size != before.size) {
            // What was never written may be read.
            memcpy(after.storage, model.bytes.data(), model.bytes.size());
        }
        CHECK(std::equal(model.bytes.begin(), model.bytes.end(), after.storage));
        CheckTraces(model.log);
        model.log.clear();
    }
    return 0;
}
