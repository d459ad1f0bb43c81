// The ring against a model that moves single bytes, also from states that only a fault can bring
// about; its mutexes; and threads at both ends.
#include "Varnek_CRingBuffer.h"

#include <algorithm>
#include <cstring>
#include <memory>
#include <numeric>
#include <random>
#include <set>
#include <sstream>
#include <thread>
#include <tuple>

#include "Varnek_Semaphore.h"
#include "support/VarnekTest.h"

namespace {

using ::testing::IsEmpty;
using ::testing::SizeIs;

class RingBuffer : public VarnekTest {};

using Bytes = std::vector<unsigned char>;

// A ring's memory: how a test brings about what no operation does.
struct Fields {
    unsigned char *storage;
    int size, w, r, wl, rl;
    int32_t mutex;
    auto State() const { return std::tie(size, w, r, wl, rl); }
};

Fields FieldsOf(const VarnekCRingBuffer &ring) {
    Fields fields;
    static_assert(sizeof fields == sizeof ring);
    // A look at the object's memory is the purpose. NOLINTNEXTLINE(bugprone-undefined-memory-manipulation)
    memcpy(&fields, &ring, sizeof fields);
    return fields;
}

template <typename... Parts>
std::string Text(const Parts &...parts) {
    std::ostringstream text;
    (text << ... << parts);
    return text.str();
}

struct Model : Fields {
    Bytes bytes;
    std::vector<std::string> log;

    template <typename... Parts>
    int Say(int result, const Parts &...parts) {
        log.push_back(Text(parts..., "\n"));
        return result;
    }
    int Ahead() const { return static_cast<int>(int64_t{wl} - rl); }
    int Flush() {
        w = r = wl = rl = 0;
        return Say(0, "Ring Buffer will be flushed!!!");
    }
    int Reset(int newSize) {
        if (newSize < 1) {
            return Say(-8, "Invalid Ring Size! size=[", newSize, "]");
        }
        bytes.resize(static_cast<size_t>(size = newSize));
        w = r = wl = rl = 0;
        return Say(0, "Ring Buffer will be reset!!!");
    }
    int Used() const { return w - r + Ahead() * size; }
    int Space(bool reading) {
        if ((Ahead() == 0 && r <= w) || (Ahead() == 1 && w <= r)) {
            return reading ? Used() : size - Used();
        }
        Say(0, "[Abnormal State] reading loop count=[", rl, "], writing loop count=[", wl, "]");
        return Say(Ahead() > 0 ? -32 : -34, "[Abnormal State] Reading Position=[", r, "], Writing Position=[", w, "]");
    }
    int GetSpaceReading() { return Space(true); }
    int GetSpaceWriting() { return Space(false); }
    int GetDistance() const { return Used() * 100 / size - (Used() < 0 ? 1 : 0); }
    void Step(int &pos, int &laps) const {
        laps += ++pos == size ? 1 : 0;
        pos %= size;
    }
    int Write(const unsigned char *data, int n) {
        const std::string lost = "This data will be discarded";
        const std::string underflow = "Invalid Ring Buffer State! Underflow! " + lost + "!";
        const int space = Ahead() > 0 ? r - w : size - (w - r);
        if (n < 0 || n > size) {
            return Say(-8, "Too long writelen=[", n, "]! Ring buffer size=[", size, "]");
        }
        if (Ahead() > 0 && r < w) {
            Say(0, "[Abnormal Sate] Ring Buffer is already overflowed! ", lost);
            return Reset(size), -10;
        }
        if (Ahead() < 0) {
            Say(0, "[Abnormal State] ", underflow);
            return Reset(size), -11;
        }
        if (w < r && Ahead() == 0) {
            return Say(-11, underflow);
        }
        if (space < n) {
            return Say(-10, "Remaing Writing Space=[", space, "], Wrting Len=[", n, "]!! ", lost, "!");
        }
        for (int i = 0; i < n; ++i, Step(w, wl)) {
            bytes[static_cast<size_t>(w)] = data[i];
        }
        return 0;
    }
    int Read(unsigned char *dest, int n) {
        const int used = w - r + (Ahead() > 0 ? size : 0);
        if (n < 0 || n > size) {
            return Say(-8, "Too long readLen=[", n, "]! Ring buffer size=[", size, "]");
        }
        if (Ahead() == 0 && w == r) {
            return Say(-11, "No reading data!");
        }
        if (Ahead() < 0 || (Ahead() == 0 ? w < r : r < w)) {
            const int result = Ahead() > 0 ? -10 : -11;
            Say(0, "Abnormal Sate!! Buffer Already ", Ahead() == 0 ? "Under" : "Over", "flow!");
            return Reset(size), result;
        }
        if (used < n) {
            return Say(-11, "Not enough reading buffer space. readLen=[", n, "], readiing buf=[", used, "]!");
        }
        rl += r / size;  // a reader that was set to the end starts over
        r %= size;
        for (int i = 0; i < n; ++i, Step(r, rl)) {
            dest[i] = bytes[static_cast<size_t>(r)];
        }
        return 0;
    }
    int Seek(int n, int origin) {
        const char *const names[] = {"[SEEK_SET]", "[SEEK_CUR]", "[SEEK_END]"};
        if (origin < 0 || origin > 2) {
            return Say(-8, "Invalid origin value=[", origin, "]");
        }
        const int most = origin == 1 ? Space(true) : size;
        if (n < 0 || n > most) {
            return Say(-10, names[origin], " Too long offset. aOffset=[", n, "]");
        }
        r = origin == 0 ? n : origin == 1 ? r + n : (size - n + w) % size;
        rl = origin == 1 ? rl + r / size : w < r ? wl - 1 : wl;
        r = origin == 1 ? r % size : r;
        return 0;
    }
};

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
                       : operation < 5  ? ring.Seek(n, operation % 5 - 1 + (n < 0 ? 2 : 0))
                       : operation < 10 ? ring.Read(data.data(), n)
                                        : ring.Write(data.data(), n);
    return std::make_tuple(result, data, ring.GetSpaceReading(), ring.GetSpaceWriting(), ring.GetDistance());
}

TEST_F(RingBuffer, BehavesLikeTheModel) {
    std::mt19937 random(188);
    const auto below = [&random](int limit) { return static_cast<int>(random() % static_cast<unsigned int>(limit)); };
    for (int round = 0; round < 500; ++round) {
        VarnekCRingBuffer ring(below(12) + 1);
        Model model{FieldsOf(ring), {}, {}};
        model.bytes.resize(static_cast<size_t>(model.size));
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
            // What was never written may be read.
            memcpy(FieldsOf(ring).storage, model.bytes.data(), model.bytes.size());
            TakeLog();
            ASSERT_EQ(Apply(ring, random), Apply(model, random)) << round << "." << step;
            random.discard(1);
            ASSERT_EQ(TakeBodies(), model.log) << round << "." << step;
            ASSERT_EQ(FieldsOf(ring).State(), model.State()) << round << "." << step;
            model.log.clear();
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
