// The ring buffer: a sequence of operations, compared with a model that keeps the bytes written last. The loop counts
// begin shortly before they wrap around.
#include <algorithm>
#include <cstdio>
#include <deque>
#include <numeric>

#include "Fuzz.h"
#include "support/RingFields.h"

namespace {

struct RingModel {
    explicit RingModel(int ringSize) { Reset(ringSize); }

    int size = 0, unread = 0, written = 0;
    std::deque<unsigned char> last;  // the newest `size` bytes, where a ring that was never full has zeros

    int Flush() { return Reset(size); }
    int Reset(int newSize) {
        if (newSize < 1) {
            return VARNEK_RING_INVALID;
        }
        size = newSize;
        last.assign(static_cast<size_t>(size), 0);
        return unread = written = 0;
    }
    int Write(const unsigned char *data, int n) {
        if (n < 0 || n > size - unread) {
            return n < 0 || n > size ? VARNEK_RING_INVALID : VARNEK_RING_NO_SPACE;
        }
        last.insert(last.end(), data, data + n);
        last.erase(last.begin(), last.begin() + n);
        unread += n;
        written = (written + n) % size;
        return 0;
    }
    int Read(unsigned char *dest, int n) {
        if (n < 0 || n > unread || unread == 0) {
            return n < 0 || n > size ? VARNEK_RING_INVALID : VARNEK_RING_NO_DATA;
        }
        std::copy_n(last.end() - unread, n, dest);
        unread -= n;
        return 0;
    }
    int Seek(int n, int origin) {
        if (origin < SEEK_SET || origin > SEEK_END) {
            return VARNEK_RING_INVALID;
        }
        if (n < 0 || n > (origin == SEEK_CUR ? unread : size)) {
            return VARNEK_RING_NO_SPACE;
        }
        unread = origin == SEEK_CUR ? unread - n : (origin == SEEK_END ? n : size + written - n) % size;
        return 0;
    }
};

// Zeroes the storage of an empty ring, since seeking makes bytes readable that were never written.
void Zero(VarnekCRingBuffer &ring, int size) {
    const std::vector<unsigned char> zeros(static_cast<size_t>(size));
    CHECK(ring.Write(zeros.data(), size) == 0 && ring.Flush() == 0);
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    Input input(data, size);
    RingModel model(input.Below(64) + 1);
    VarnekCRingBuffer ring(model.size);
    Zero(ring, model.size);
    Fields state = FieldsOf(ring);
    state.wl = state.rl = INT32_MAX - 1;
    SetFields(ring, state);
    for (unsigned char next = 0; !input.Empty();) {
        const uint8_t kind = input.Byte();
        if (kind >= 245) {
            ring = VarnekCRingBuffer(ring);
            const VarnekCRingBuffer &same = ring;
            ring = same;
            CHECK(FieldsOf(ring).mutex == state.mutex);
        }
        const int count = input.Int() % 512;
        const int operation = kind % 8;
        const auto apply = [=](auto &target, std::vector<unsigned char> &bytes) {
            return operation == 0   ? target.Flush()
                   : operation == 1 ? target.Reset(count)
                   : operation == 2 ? target.Seek(count, kind / 8 % 4)
                   : operation <= 4 ? target.Read(bytes.data(), count)
                                    : target.Write(bytes.data(), count);
        };
        std::vector<unsigned char> bytes(static_cast<size_t>(std::max(count, 0)));
        std::iota(bytes.begin(), bytes.end(), next);
        next = static_cast<unsigned char>(next + bytes.size());
        std::vector<unsigned char> expectedBytes = bytes;
        const int expected = apply(model, expectedBytes);
        CHECK(apply(ring, bytes) == expected && bytes == expectedBytes);
        CHECK(ring.GetSpaceReading() == model.unread && ring.GetSpaceWriting() == model.size - model.unread);
        CHECK(ring.GetDistance() == model.unread * 100 / model.size);
        if (operation <= 1 && expected == 0) {
            Zero(ring, model.size);
        } else if (operation == 2 && kind / 8 % 4 == SEEK_SET && count == model.size) {
            // A reader at the end of the storage must move before the next write.
            CHECK(ring.Seek(0, SEEK_CUR) == 0);
        }
    }
    return 0;
}
