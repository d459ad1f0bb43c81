// What a ring logs, its mutex, and rings without storage. fuzz/ring.cpp compares the operations with a model, and the
// soak has threads at both ends of a ring.
#include "Varnek_CRingBuffer.h"

#include <cstdio>
#include <memory>
#include <tuple>

#include "Varnek_Semaphore.h"
#include "support/RingFields.h"
#include "support/VarnekTest.h"

namespace {

using ::testing::IsEmpty, ::testing::SizeIs;

class RingBuffer : public VarnekTest {
  protected:
    RingBuffer() {
        resultNames_ = {NAMED(VARNEK_RING_INVALID), NAMED(VARNEK_RING_NO_SPACE), NAMED(VARNEK_RING_NO_DATA),
                        NAMED(VARNEK_RING_OVERFLOW), NAMED(VARNEK_RING_UNDERFLOW)};
    }
};

using Bytes = std::vector<unsigned char>;

TEST_F(RingBuffer, WithoutStorageEverythingIsRefused) {
    VarnekCRingBuffer none(0), negative(-1), copy(none), target(4);
    unsigned char byte = 1;
    EXPECT_EQ(target.Write(nullptr, 0), 0);
    EXPECT_EQ(target.Write(nullptr, 1), VARNEK_RING_INVALID);
    EXPECT_EQ(target.Read(nullptr, 1), VARNEK_RING_INVALID);
    EXPECT_THAT(TakeBodies("Varnek"), SizeIs(2));
    target = none;
    for (VarnekCRingBuffer *ring : {&none, &negative, &copy, &target}) {
        EXPECT_EQ(ring->Write(&byte, 1), VARNEK_RING_INVALID);
        EXPECT_EQ(ring->Write(&byte, 0), VARNEK_RING_INVALID);
        EXPECT_EQ(ring->Read(&byte, 1), VARNEK_RING_INVALID);
        EXPECT_EQ(ring->Read(&byte, 0), VARNEK_RING_NO_DATA);
        for (const int origin : {SEEK_SET, SEEK_CUR, SEEK_END}) {
            EXPECT_EQ(ring->Seek(0, origin), VARNEK_RING_NO_SPACE);
        }
        EXPECT_EQ(ring->GetDistance(), 0);
        EXPECT_EQ(ring->Reset(2), 0);
        EXPECT_EQ(ring->Write(&byte, 1), 0);
    }
    VarnekCRingBuffer large(30000000);
    EXPECT_EQ(large.Write(Bytes(25000000).data(), 25000000), 0);
    EXPECT_EQ(large.GetDistance(), 83);
}

TEST_F(RingBuffer, EveryRefusalHasItsLine) {
    VarnekCRingBuffer ring(8);
    unsigned char bytes[8] = {};
    const auto write = Noting("Write", [&](int count) { return ring.Write(bytes, count); });
    const auto read = Noting("Read", [&](int count) { return ring.Read(bytes, count); });
    const auto reset = Noting("Reset", [&](int size) { return ring.Reset(size); });
    read(1);
    EXPECT_EQ(ring.Write(bytes, 5), 0);
    write(4);
    read(6);
    Noting("Seek", [&](int offset, int origin) { return ring.Seek(offset, origin); })(0, 3);
    write(-1);
    read(-1);
    for (const auto &[origin, name] : {NAMED(SEEK_SET), NAMED(SEEK_CUR), NAMED(SEEK_END)}) {
        const int base = origin;
        Noting(std::string(name) + ": Seek", [&](int offset) { return ring.Seek(offset, base); })(-1);
    }
    Noting("Flush", [&] { return ring.Flush(); })();
    reset(0);
    reset(8);
    // States that no operation leaves behind: an overflow, an underflow within a lap, one over laps where the loop
    // counts wrap around, and one lap too many. The distances are those at first, after writing and after reading.
    const struct {
        int w, r, wl, rl, distance, written, read;
    } states[] = {{3, 2, 1, 0, 112, 0, 0},
                  {2, 3, 0, 0, -13, -13, 0},
                  {2, 2, INT32_MAX, INT32_MIN, -101, 0, 0},
                  {2, 3, 2, 0, 187, 200, 175}};
    for (const auto &expected : states) {
        Fields state = FieldsOf(ring);
        std::tie(state.w, state.r, state.wl, state.rl) = std::tie(expected.w, expected.r, expected.wl, expected.rl);
        SetFields(ring, state);
        Noting("GetSpaceReading", [&] { return ring.GetSpaceReading(); })();
        EXPECT_EQ(ring.GetSpaceWriting(), ring.GetSpaceReading());
        EXPECT_EQ(ring.GetDistance(), expected.distance);
        TakeLog();
        EXPECT_EQ(ring.Seek(0, SEEK_CUR), VARNEK_RING_NO_SPACE);
        EXPECT_THAT(TakeBodies("SBTVD_COM"), SizeIs(3)) << "the two of an inconsistent state and that of the seek";
        write(1);
        EXPECT_EQ(ring.GetDistance(), expected.written);
        SetFields(ring, state);
        read(1);
        EXPECT_EQ(ring.GetDistance(), expected.read);
    }
}

TEST_F(RingBuffer, EachHasAMutexOfItsOwn) {
    {
        const VarnekCRingBuffer first(8), invalid(0), copy(first), second(8);
        EXPECT_EQ(VarnekPGL_GetMutexByName("VarnekRingBuf000"), FieldsOf(first).mutex);
        EXPECT_EQ(VarnekPGL_GetMutexByName("VarnekRingBuf001"), FieldsOf(second).mutex);
        EXPECT_EQ(FieldsOf(copy).mutex, -1);
        TakeLog();
    }
    EXPECT_EQ(VarnekPGL_GetMutexByName("VarnekRingBuf000"), -1);
    std::vector<std::unique_ptr<VarnekCRingBuffer>> rings(40);
    AtOnce(8, [&rings](int thread) {
        for (size_t i = static_cast<size_t>(thread); i < rings.size(); i += 8) {
            rings[i] = std::make_unique<VarnekCRingBuffer>(4);
        }
    });
    EXPECT_THAT(TakeErrors(), IsEmpty()) << "forty is the limit, so a ring that took the mutex of another left room";
    VarnekCRingBuffer without(4);
    EXPECT_EQ(TakeErrors().back(), "Ring Mutex Creation Fail!\n");
    EXPECT_EQ(without.Flush(), 0);
}

}  // namespace
