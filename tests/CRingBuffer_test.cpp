// A ring without storage, its mutexes, and threads at both ends. Its operations are held against a model
// by a fuzz target, which runs as a test.
#include "Varnek_CRingBuffer.h"

#include <algorithm>
#include <memory>
#include <numeric>
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

TEST_F(RingBuffer, OneWriterAndOneReaderKeepTheOrder) {
    constexpr int kPackets = 20000;
    VarnekCRingBuffer ring(188 * 7 + 5);
    const auto packet = [](int number) {
        Bytes bytes(188);
        std::iota(bytes.begin(), bytes.end(), static_cast<unsigned char>(number * 31));
        return bytes;
    };
    std::thread writer([&] {
        for (int i = 0; i < kPackets; ++i) {
            while (ring.GetSpaceWriting() < 188) {
                std::this_thread::yield();
            }
            ring.Write(packet(i).data(), 188);
        }
    });
    int wrong = 0;
    for (int i = 0; i < kPackets; ++i) {
        Bytes bytes(188);
        while (ring.GetSpaceReading() < 188) {
            const int distance = ring.GetDistance();
            wrong += distance < 0 || distance > 100 ? 1 : 0;
        }
        wrong += ring.Read(bytes.data(), 188) != 0 || bytes != packet(i) ? 1 : 0;
    }
    writer.join();
    EXPECT_EQ(wrong, 0);
    EXPECT_THAT(TakeErrors(), IsEmpty());
}

}  // namespace
