// Moves packets of 188 bytes through a byte ring, in one thread and from one thread to another.
#include <sched.h>
#include <string.h>

#include <algorithm>
#include <array>
#include <atomic>
#include <mutex>
#include <thread>

#include "Bench.h"
#include "Varnek_CRingBuffer.h"

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

// Two copies and a mutex.
class Bare {
  public:
    bool Write(const Packet &packet) {
        const std::lock_guard<std::mutex> hold(mutex_);
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
        const std::lock_guard<std::mutex> hold(mutex_);
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
    std::mutex mutex_;
    std::vector<unsigned char> bytes_ = std::vector<unsigned char>(kSize);
    size_t write_ = 0, read_ = 0, used_ = 0;
};

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
    std::atomic<bool> ends{false};
    std::thread reader([&] {
        bench::PinTo(1);
        Packet out = {};
        for (int64_t done = 0; !ends.load(std::memory_order_relaxed); sched_yield()) {
            for (; done < wanted.load(std::memory_order_relaxed); done++) {
                Insist([&] { return ring.Read(&out); });
            }
            taken.store(done, std::memory_order_relaxed);
        }
    });
    bench::PinTo(0);
    const Packet in = {};
    int64_t sent = 0;
    for (auto _ : state) {
        sent += kBatch;
        wanted.store(sent, std::memory_order_relaxed);
        for (int i = 0; i < kBatch; i++) {
            Insist([&] { return ring.Write(in); });
        }
        Insist([&] { return taken.load(std::memory_order_relaxed) == sent; });
    }
    state.SetItemsProcessed(state.iterations() * kBatch);
    ends.store(true, std::memory_order_relaxed);
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
}

}  // namespace

int main(int argc, char **argv) {
    return bench::Main(argc, argv, RegisterAll);
}
