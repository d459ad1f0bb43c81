// A ring's lines and mutexes, and one without storage. A fuzz target, which runs as a test, compares the operations
// with a model, and the soak has threads at both ends of a ring.
#include "Varnek_CRingBuffer.h"

#include <memory>
#include <set>

#include "Varnek_Semaphore.h"
#include "support/RingFields.h"
#include "support/VarnekTest.h"

namespace {

using ::testing::IsEmpty;
using ::testing::SizeIs;

class RingBuffer : public VarnekTest {};

using Bytes = std::vector<unsigned char>;

TEST_F(RingBuffer, WithoutStorageEverythingIsRefused) {
    VarnekCRingBuffer none(0), negative(-1), copy(none), target(4);
    unsigned char byte = 1;
    EXPECT_EQ(target.Write(nullptr, 0), 0);
    EXPECT_EQ(target.Write(nullptr, 1) + target.Read(nullptr, 1), -16);
    EXPECT_THAT(TakeBodies("Varnek"), SizeIs(2));
    target = none;
    for (VarnekCRingBuffer *ring : {&none, &negative, &copy, &target}) {
        EXPECT_EQ(ring->Write(&byte, 1) + ring->Write(&byte, 0) + ring->Read(&byte, 1), -24);
        EXPECT_EQ(ring->Seek(0, 0) + ring->Seek(0, 1) + ring->Seek(0, 2), -30);
        EXPECT_EQ(ring->Read(&byte, 0), -11);
        EXPECT_EQ(ring->GetDistance(), 0);
        EXPECT_EQ(ring->Reset(2) + ring->Write(&byte, 1), 0);
    }
    VarnekCRingBuffer large(30000000);
    EXPECT_EQ(large.Write(Bytes(25000000).data(), 25000000), 0);
    EXPECT_EQ(large.GetDistance(), 83);
}

TEST_F(RingBuffer, EveryRefusalHasItsLine) {
    VarnekCRingBuffer ring(8);
    unsigned char bytes[9] = {};
    NOTE(ring.Read(bytes, 1));
    NOTE(ring.Write(bytes, 5));
    NOTE(ring.Write(bytes, 4));
    NOTE(ring.Read(bytes, 6));
    for (const int count : {-1, 9}) {
        NOTE(ring.Write(bytes, count));
        NOTE(ring.Read(bytes, count));
        for (const int origin : {SEEK_SET, SEEK_CUR, SEEK_END, 3}) {
            NOTE(ring.Seek(count, origin));
        }
    }
    NOTE(ring.Flush());
    NOTE(ring.Reset(0));
    NOTE(ring.Reset(8));
    NOTE(VarnekCRingBuffer(-1).GetDistance());
    // The positions and the loop counts of writer and reader: an overflow, an underflow within a lap and over laps, and
    // one lap too many.
    Fields state = FieldsOf(ring);
    const int states[][4] = {{3, 2, 1, 0}, {2, 3, 0, 0}, {2, 2, 0, 1}, {2, 3, 2, 0}};
    for (const auto &[w, r, wl, rl] : states) {
        std::tie(state.w, state.r, state.wl, state.rl) = std::tie(w, r, wl, rl);
        SetFields(ring, state);
        NOTE(ring.GetSpaceReading());
        NOTE(ring.Seek(0, SEEK_CUR));
        NOTE(ring.Write(bytes, 1));
        SetFields(ring, state);
        NOTE(ring.Read(bytes, 1));
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
    EXPECT_THAT(TakeErrors(), IsEmpty());
    std::set<int32_t> mutexes;
    for (const auto &ring : rings) {
        mutexes.insert(FieldsOf(*ring).mutex);
    }
    EXPECT_THAT(mutexes, SizeIs(40));
    VarnekCRingBuffer without(4);
    EXPECT_EQ(TakeErrors().back(), "Ring Mutex Creation Fail!\n");
    EXPECT_EQ(without.Flush(), 0);
}

}  // namespace
