// A ring's lines and mutexes, and one without storage. A fuzz target, which runs as a test, compares the operations
// with a model, and the soak has threads at both ends of a ring.
#include "Varnek_CRingBuffer.h"

#include <cstdio>
#include <map>
#include <memory>
#include <set>
#include <tuple>

#include "Varnek_Semaphore.h"
#include "support/RingFields.h"
#include "support/VarnekTest.h"

namespace {

using ::testing::IsEmpty;
using ::testing::SizeIs;

class RingBuffer : public VarnekTest {};

using Bytes = std::vector<unsigned char>;

#define NAME(result) \
    { result, #result }
std::string Named(int result) {
    static const std::map<int, const char *> names = {
        NAME(VARNEK_RING_INVALID),  NAME(VARNEK_RING_NO_SPACE),  NAME(VARNEK_RING_NO_DATA),
        NAME(VARNEK_RING_OVERFLOW), NAME(VARNEK_RING_UNDERFLOW), {0, "0"},
    };
    return names.at(result);
}

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
    unsigned char bytes[9] = {};
    const auto label = [](const char *call, int count) { return call + ("(" + std::to_string(count) + ")"); };
    const auto write = [&](int count) { NOTE_AS(label("Write", count), Named(ring.Write(bytes, count))); };
    const auto read = [&](int count) { NOTE_AS(label("Read", count), Named(ring.Read(bytes, count))); };
    const auto seek = [&](int offset, int origin) {
        NOTE_AS("Seek(" + std::to_string(offset) + ", " + std::to_string(origin) + ")",
                Named(ring.Seek(offset, origin)));
    };
    read(1);
    write(5);
    write(4);
    read(6);
    seek(0, 3);
    for (const int count : {-1, 9}) {
        write(count);
        read(count);
        for (const int origin : {SEEK_SET, SEEK_CUR, SEEK_END}) {
            seek(count, origin);
        }
    }
    NOTE(ring.Flush());
    NOTE_AS("Reset(0)", Named(ring.Reset(0)));
    NOTE(ring.Reset(8));
    NOTE(VarnekCRingBuffer(-1).GetDistance());
    // States that no operation leaves behind: an overflow, an underflow within a lap and, where the loop counts wrap
    // around, over laps, and one lap too many.
    const struct {
        int w, r, wl, rl;
    } states[] = {{3, 2, 1, 0}, {2, 3, 0, 0}, {2, 2, INT32_MAX, INT32_MIN}, {2, 3, 2, 0}};
    for (const auto &[w, r, wl, rl] : states) {
        Fields state = FieldsOf(ring);
        std::tie(state.w, state.r, state.wl, state.rl) = std::tie(w, r, wl, rl);
        SetFields(ring, state);
        NOTE_AS("GetSpaceReading()", Named(ring.GetSpaceReading()));
        EXPECT_EQ(ring.GetSpaceWriting(), ring.GetSpaceReading());
        NOTE(ring.GetDistance());
        TakeLog();
        EXPECT_EQ(ring.Seek(0, SEEK_CUR), VARNEK_RING_NO_SPACE);
        EXPECT_THAT(TakeBodies("SBTVD_COM"), SizeIs(3)) << "the two of an inconsistent state and that of the seek";
        write(1);
        NOTE(ring.GetDistance());
        SetFields(ring, state);
        read(1);
        NOTE(ring.GetDistance());
    }
}

TEST_F(RingBuffer, LoopCountsWrapAround) {
    VarnekCRingBuffer ring(8);
    Fields state = FieldsOf(ring);
    state.w = state.r = 6;
    state.wl = state.rl = INT32_MAX;
    SetFields(ring, state);
    unsigned char bytes[8] = {1, 2, 3, 4};
    EXPECT_EQ(ring.Write(bytes, 4), 0);
    EXPECT_EQ(ring.GetSpaceReading(), 4);
    EXPECT_EQ(ring.GetDistance(), 50);
    EXPECT_EQ(ring.Read(bytes, 3), 0);
    EXPECT_EQ(bytes[2], 3);
    EXPECT_EQ(ring.GetSpaceWriting(), 7);
    EXPECT_EQ(ring.Seek(6, SEEK_SET), 0) << "back into the lap before";
    EXPECT_EQ(ring.GetSpaceReading(), 4);
    EXPECT_EQ(ring.Seek(3, SEEK_CUR), 0);
    EXPECT_EQ(ring.GetSpaceReading(), 1);
    EXPECT_EQ(ring.Seek(3, SEEK_END), 0);
    EXPECT_EQ(ring.Read(bytes, 3), 0);
    EXPECT_EQ(bytes[0], 2);
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
