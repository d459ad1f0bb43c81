// Measures how late a timer of 5 ms calls back, on an idle machine and with every core busy. The
// contenders alternate. Each round gives the median and the 99th percentile of its deliveries.
#include <semaphore.h>
#include <signal.h>
#include <sys/timerfd.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <thread>

#include "Bench.h"
#include "Varnek_Timer.h"

namespace {

constexpr uint32_t kMilliseconds = 5;

int64_t Now() {
    timespec now = {};
    clock_gettime(CLOCK_MONOTONIC, &now);
    return now.tv_sec * int64_t{1000000000} + now.tv_nsec;
}

itimerspec After(uint32_t milliseconds) {
    itimerspec time = {};
    time.it_value.tv_nsec = static_cast<long>(milliseconds) * 1000000;
    return time;
}

// Here a callback stores the time of its call.
struct Arrival {
    Arrival() { sem_init(&arrived, 0, 0); }
    ~Arrival() { sem_destroy(&arrived); }
    Arrival(const Arrival &) = delete;
    Arrival &operator=(const Arrival &) = delete;

    void Arrive() {
        at = Now();
        sem_post(&arrived);
    }
    int64_t Wait() {
        while (sem_wait(&arrived) != 0) {
        }
        return at;
    }

    sem_t arrived = {};
    int64_t at = 0;
};

class Ours {
  public:
    Ours() : timer_(static_cast<uint32_t>(VarnekPGL_CreateTimer("lateness"))) {}
    ~Ours() { VarnekPGL_DeleteTimer(timer_); }
    Ours(const Ours &) = delete;
    Ours &operator=(const Ours &) = delete;

    int64_t Measure() {
        const int64_t start = Now();
        VarnekPGL_StartTimer(
            timer_, kMilliseconds,
            [](uint32_t, void *arrival) { static_cast<Arrival *>(arrival)->Arrive(); }, &arrival_);
        return arrival_.Wait() - start;
    }

  private:
    const uint32_t timer_;
    Arrival arrival_;
};

class Raw {
  public:
    Raw() {
        sigevent event = {};
        event.sigev_notify = SIGEV_THREAD;
        event.sigev_value.sival_ptr = &arrival_;
        event.sigev_notify_function = [](sigval value) {
            static_cast<Arrival *>(value.sival_ptr)->Arrive();
        };
        timer_create(CLOCK_REALTIME, &event, &timer_);
    }
    ~Raw() { timer_delete(timer_); }
    Raw(const Raw &) = delete;
    Raw &operator=(const Raw &) = delete;

    int64_t Measure() {
        const itimerspec time = After(kMilliseconds);
        const int64_t start = Now();
        timer_settime(timer_, 0, &time, nullptr);
        return arrival_.Wait() - start;
    }

  private:
    timer_t timer_ = {};
    Arrival arrival_;
};

class Descriptor {
  public:
    Descriptor() = default;
    ~Descriptor() { close(descriptor_); }
    Descriptor(const Descriptor &) = delete;
    Descriptor &operator=(const Descriptor &) = delete;

    int64_t Measure() {
        const itimerspec time = After(kMilliseconds);
        const int64_t start = Now();
        timerfd_settime(descriptor_, 0, &time, nullptr);
        uint64_t expiries = 0;
        return read(descriptor_, &expiries, sizeof expiries) > 0 ? Now() - start : 0;
    }

  private:
    const int descriptor_ = timerfd_create(CLOCK_REALTIME, TFD_CLOEXEC);
};

// Keeps every core busy during its lifetime.
class Load {
  public:
    explicit Load(bool on) {
        const unsigned int cores = on ? std::thread::hardware_concurrency() : 0;
        for (unsigned int i = 0; i < cores; i++) {
            threads_.emplace_back([this] {
                for (uint64_t turns = 0; !ends_.load(std::memory_order_relaxed); turns++) {
                    benchmark::DoNotOptimize(turns);
                }
            });
        }
    }
    ~Load() {
        ends_.store(true, std::memory_order_relaxed);
        for (std::thread &thread : threads_) {
            thread.join();
        }
    }
    Load(const Load &) = delete;
    Load &operator=(const Load &) = delete;

  private:
    std::atomic<bool> ends_{false};
    std::vector<std::thread> threads_;
};

struct Samples {
    std::vector<int64_t> ours, raw, timerfd;
};

Samples Measure(bool busy, int count) {
    const Load load(busy);
    Samples samples;
    Ours ours;
    Raw raw;
    Descriptor timerfd;
    constexpr int64_t kAsked = int64_t{kMilliseconds} * 1000000;
    for (int i = 0; i < count; i++) {
        // The contenders change their order, because the first one finds the thread of the timer
        // service asleep for longer.
        if (i % 2 == 0) {
            samples.ours.push_back(ours.Measure() - kAsked);
        }
        samples.raw.push_back(raw.Measure() - kAsked);
        if (i % 2 != 0) {
            samples.ours.push_back(ours.Measure() - kAsked);
        }
        samples.timerfd.push_back(timerfd.Measure() - kAsked);
    }
    return samples;
}

void Print(const std::string &row, const char *contender, std::vector<int64_t> *samples,
           size_t percent) {
    const size_t at = (samples->size() - 1) * percent / 100;
    std::nth_element(samples->begin(), samples->begin() + static_cast<std::ptrdiff_t>(at),
                     samples->end());
    static bool first = true;
    std::printf(
        "%s\n{\"run_type\": \"iteration\", \"name\": \"%s_p%zu:%s\", \"real_time\": %lld, "
        "\"time_unit\": \"ns\"}",
        first ? "" : ",", row.c_str(), percent, contender, static_cast<long long>((*samples)[at]));
    first = false;
}

}  // namespace

// lateness ROUNDS COUNT: prints the results in Google Benchmark's format.
int main(int argc, char **argv) {
    const int rounds = argc > 1 ? std::atoi(argv[1]) : 1;
    const int count = argc > 2 ? std::atoi(argv[2]) : 100;
    std::printf("{\"benchmarks\": [");
    for (int round = 0; round < rounds; round++) {
        for (const bool busy : {false, true}) {
            const std::string row = busy ? "lateness/busy" : "lateness/idle";
            Samples samples = Measure(busy, count);
            for (const size_t percent : {50u, 99u}) {
                Print(row, "ours", &samples.ours, percent);
                Print(row, "raw", &samples.raw, percent);
                Print(row, "timerfd", &samples.timerfd, percent);
            }
        }
    }
    std::printf("\n]}\n");
    return 0;
}
