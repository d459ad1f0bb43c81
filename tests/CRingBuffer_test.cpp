// The ring against a model that moves single bytes, also from states that only a fault can bring
// about; its mutexes; and threads at both ends.
#include "Varnek_CRingBuffer.h"

#include <algorithm>
#include <memory>
#include <numeric>
#include <random>
#include <set>
#include <thread>
#include <tuple>

#include "Varnek_Semaphore.h"
#include "support/RingModel.h"
#include "support/VarnekTest.h"

namespace {

using ::testing::IsEmpty;
using ::testing::SizeIs;

class RingBuffer : public VarnekTest {};

using Bytes = std::vector<unsigned char>;

// One operation, as `random` has it, on a ring or on its model.
template <typename Ring>
auto Apply(Ring &ring, std::mt19937 random) {
    const int operation = static_cast<int>(random() % 16);
    const int n = static_cast<int>(random() % 10) - (random() % 16 == 0 ? 3 : 0);
    // Exactly the room for it, so that a sanitizer sees a byte too many.
    Bytes data(static_cast<size_t>(std::max(n, 0)));
    std::generate(data.begin(), data.end(), random);
    const int result = operation == 0   ? ring.Flush()
                       : operation == 1 ? ring.Reset(n)
                       : operation < 5  ? ring.Seek(n, operation - 2 + (n < 0 ? 1 : 0))
                       : operation < 10 ? ring.Read(data.data(), n)
                                        : ring.Write(data.data(), n);
    return std::make_tuple(result, data, ring.GetSpaceReading(), ring.GetSpaceWriting(), ring.GetDistance());
}

TEST_F(RingBuffer, BehavesLikeTheModel) {
    std::mt19937 random(188);
    const auto below = [&random](int limit) { return static_cast<int>(random() % static_cast<unsigned int>(limit)); };
    for (int round = 0; round < 500; ++round) {
        VarnekCRingBuffer ring(below(12) + 1);
        RingModel model{FieldsOf(ring), {}, {}};
        model.bytes.resize(static_cast<size_t>(model.size));
        memset(model.storage, 0, model.bytes.size());
        for (int step = 0; step < 60; ++step) {
            Fields now = FieldsOf(ring);
            if (below(12) == 0) {
                // Near the end of the loop counts too.
                const int laps = below(2) == 0 ? INT32_MAX - 8 : 0;
                now = {now.storage,     now.size,        below(now.size), below(now.size),
                       laps + below(4), laps + below(4), now.mutex};
                memcpy(static_cast<void *>(&ring), &now, sizeof now);
                static_cast<Fields &>(model) = now;
            } else if (below(12) == 0) {
                ring = VarnekCRingBuffer(ring);
                const VarnekCRingBuffer &same = ring;
                ring = same;
                ASSERT_EQ(FieldsOf(ring).mutex, now.mutex);
            }
            TakeLog();
            ASSERT_EQ(Apply(ring, random), Apply(model, random)) << round << "." << step;
            random.discard(1);
            ASSERT_EQ(TakeBodies(), model.log) << round << "." << step;
            ASSERT_EQ(FieldsOf(ring).State(), model.State()) << round << "." << step;
            model.log.clear();
            // What was never written may be read, so a new storage starts with what the model has.
            Fields after = FieldsOf(ring);
            if (after.size != now.size) {
                memcpy(after.storage, model.bytes.data(), model.bytes.size());
            }
            ASSERT_TRUE(std::equal(model.bytes.begin(), model.bytes.end(), after.storage));
        }
    }
}

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
