// Moves packets of 188 bytes through a byte ring, in one thread and from one thread to another.
#include <pthread.h>
#include <sched.h>
#include <string.h>

#include <array>
#include <atomic>
#include <memory>
#include <thread>

#include "Bench.h"
#include "Varnek_CRingBuffer.h"

#ifdef HAVE_JACK
#include <jack/ringbuffer.h>
#endif

namespace {

constexpr int kPacket = 188;
constexpr int kSize = 64 * kPacket;
constexpr int kBatch = 2000;  // packets between two synchronisations of the threads

using Packet = std::array<unsigned char, kPacket>;

class Ours {
  public:
    bool Write(const Packet &packet) { return ring_.Write(packet.data(), kPacket) == 0; }
    bool Read(Packet *packet) { return ring_.Read(packet->data(), kPacket) == 0; }

  private:
    VarnekCRingBuffer ring_{kSize};
};

class Lock {
  public:
    explicit Lock(pthread_mutex_t *mutex) : mutex_(mutex) { pthread_mutex_lock(mutex_); }
    ~Lock() { pthread_mutex_unlock(mutex_); }
    Lock(const Lock &) = delete;
    Lock &operator=(const Lock &) = delete;

  private:
    pthread_mutex_t *mutex_;
};

// Two copies and a mutex.
class Bare {
  public:
    bool Write(const Packet &packet) {
        const Lock lock(&mutex_);
        if (used_ + packet.size() > bytes_.size()) {
            return false;
        }
        const size_t tail = std::min(packet.size(), bytes_.size() - write_);
        memcpy(&bytes_[write_], packet.data(), tail);
        memcpy(bytes_.data(), packet.data() + tail, packet.size() - tail);
        write_ = (write_ + packet.size()) % bytes_.size();
        used_ += packet.size();
        return true;
    }
    bool Read(Packet *packet) {
        const Lock lock(&mutex_);
        if (used_ < packet->size()) {
            return false;
        }
        const size_t tail = std::min(packet->size(), bytes_.size() - read_);
        memcpy(packet->data(), &bytes_[read_], tail);
        memcpy(packet->data() + tail, bytes_.data(), packet->size() - tail);
        read_ = (read_ + packet->size()) % bytes_.size();
        used_ -= packet->size();
        return true;
    }

  private:
    pthread_mutex_t mutex_ = PTHREAD_MUTEX_INITIALIZER;
    std::vector<unsigned char> bytes_ = std::vector<unsigned char>(kSize);
    size_t write_ = 0, read_ = 0, used_ = 0;
};

#ifdef HAVE_JACK
class Jack {
  public:
    Jack() = default;
    ~Jack() { jack_ringbuffer_free(ring_); }
    Jack(const Jack &) = delete;
    Jack &operator=(const Jack &) = delete;

    bool Write(const Packet &packet) {
        if (jack_ringbuffer_write_space(ring_) < packet.size()) {
            return false;
        }
        jack_ringbuffer_write(ring_, reinterpret_cast<const char *>(packet.data()), packet.size());
        return true;
    }
    bool Read(Packet *packet) {
        if (jack_ringbuffer_read_space(ring_) < packet->size()) {
            return false;
        }
        jack_ringbuffer_read(ring_, reinterpret_cast<char *>(packet->data()), packet->size());
        return true;
    }

  private:
    jack_ringbuffer_t *ring_ = jack_ringbuffer_create(kSize);
};
#endif

// Calls `once` until it succeeds, and lets the other side run in between.
template <typename Try>
void Insist(Try once) {
    while (!once()) {
        sched_yield();
    }
}

template <typename Ring>
void OneThread(benchmark::State &state) {
    Ring ring;
    Packet in = {};
    memcpy(in.data(), bench::Noise(kPacket).data(), kPacket);
    Packet out = {};
    for (auto _ : state) {
        in[0]++;
        if (!ring.Write(in) || !ring.Read(&out) || out[0] != in[0]) {
            state.SkipWithError("a packet is lost");
            return;
        }
        benchmark::DoNotOptimize(out);
    }
}

// The reader is a thread that lives as long as the benchmark. An iteration is a batch of packets.
template <typename Ring>
void TwoThreads(benchmark::State &state) {
    Ring ring;
    std::atomic<int64_t> wanted{0};
    std::atomic<int64_t> taken{0};
    std::thread reader([&ring, &wanted, &taken] {
        bench::PinTo(1);
        Packet out = {};
        for (int64_t done = 0;;) {
            const int64_t until = wanted.load(std::memory_order_acquire);
            if (until < 0) {
                return;
            }
            if (done == until) {
                sched_yield();
                continue;
            }
            for (; done < until; done++) {
                Insist([&ring, &out] { return ring.Read(&out); });
            }
            taken.store(done, std::memory_order_release);
        }
    });
    bench::PinTo(0);
    const Packet in = {};
    int64_t sent = 0;
    for (auto _ : state) {
        sent += kBatch;
        wanted.store(sent, std::memory_order_release);
        for (int i = 0; i < kBatch; i++) {
            Insist([&ring, &in] { return ring.Write(in); });
        }
        Insist([&taken, sent] { return taken.load(std::memory_order_acquire) == sent; });
    }
    state.SetItemsProcessed(state.iterations() * kBatch);
    wanted.store(-1, std::memory_order_release);
    reader.join();
}

template <typename Ring>
void Register(const std::string &contender) {
    bench::Add("ring/one:" + contender, OneThread<Ring>);
    bench::Add("ring/two:" + contender, TwoThreads<Ring>);
}

void RegisterAll() {
    Register<Ours>("ours");
    Register<Bare>("bare");
#ifdef HAVE_JACK
    Register<Jack>("jack");
#else
    bench::AddMissing("ring/one:jack");
    bench::AddMissing("ring/two:jack");
#endif
}

}  // namespace

int main(int argc, char **argv) {
    return bench::Main(argc, argv, RegisterAll);
}
