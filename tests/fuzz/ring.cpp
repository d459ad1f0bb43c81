// The ring buffer: a sequence of operations, compared with a model that keeps the bytes written last.
#include <algorithm>
#include <cstdio>
#include <deque>
#include <numeric>

#include "Fuzz.h"
#include "support/RingFields.h"

namespace {

struct RingModel {
    explicit RingModel(int ringSize) : size(ringSize), last(static_cast<size_t>(ringSize)) {}

    int size;
    std::deque<unsigned char> last;  // the newest `size` bytes, where a ring that was never full has zeros
    int unread = 0, written = 0;

    int Flush() {
        std::fill(last.begin(), last.end(), static_cast<unsigned char>(0));
        return unread = written = 0;
    }
    int Reset(int newSize) {
        if (newSize < 1) {
            return VARNEK_RING_INVALID;
        }
        last.resize(static_cast<size_t>(size = newSize));
        return Flush();
    }
    int GetSpaceReading() const { return unread; }
    int GetSpaceWriting() const { return size - unread; }
    int GetDistance() const { return unread * 100 / size; }
    int Write(const unsigned char *data, int n) {
        if (n < 0 || n > size) {
            return VARNEK_RING_INVALID;
        }
        if (n > size - unread) {
            return VARNEK_RING_NO_SPACE;
        }
        last.insert(last.end(), data, data + n);
        last.erase(last.begin(), last.begin() + n);
        unread += n;
        written = (written + n) % size;
        return 0;
    }
    int Read(unsigned char *dest, int n) {
        if (n < 0 || n > size) {
            return VARNEK_RING_INVALID;
        }
        if (unread == 0 || n > unread) {
            return VARNEK_RING_NO_DATA;
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
    const int32_t mutex = FieldsOf(ring).mutex;
    Zero(ring, model.size);
    for (unsigned char next = 0; !input.Empty();) {
        const uint8_t kind = input.Byte();
        if (kind >= 245) {
            ring = VarnekCRingBuffer(ring);
            const VarnekCRingBuffer &same = ring;
            ring = same;
            CHECK(FieldsOf(ring).mutex == mutex);
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
        CHECK(ring.GetSpaceReading() == model.GetSpaceReading() && ring.GetSpaceWriting() == model.GetSpaceWriting());
        CHECK(ring.GetDistance() == model.GetDistance());
        if (operation <= 1 && expected == 0) {
            Zero(ring, model.size);
        } else if (operation == 2 && kind / 8 % 4 == SEEK_SET && count == model.size) {
            // A reader at the end of the storage must move before the next write.
            CHECK(ring.Seek(0, SEEK_CUR) == 0);
        }
    }
    return 0;
}
