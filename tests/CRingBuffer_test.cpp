// A ring without storage, and its mutexes. Its operations are held against a model by a fuzz target, which
// runs as a test, and the soak has threads at both ends.
#include "Varnek_CRingBuffer.h"

#include <algorithm>
#include <memory>
#include <set>
#include <thread>

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
    std::vector<std::thread> threads;
    for (size_t t = 0; t < 8; ++t) {
        threads.emplace_back([&rings, t] {
            for (size_t i = t; i < rings.size(); i += 8) {
                rings[i] = std::make_unique<VarnekCRingBuffer>(4);
            }
        });
    }
    std::for_each(threads.begin(), threads.end(), [](std::thread &thread) { thread.join(); });
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
