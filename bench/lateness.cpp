// Measures how late a 5 ms timer calls back, on an idle machine and with every core busy. The
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
constexpr itimerspec kTime = {{}, {0, kMilliseconds * 1000000L}};

int64_t Now() {
    timespec now = {};
    clock_gettime(CLOCK_MONOTONIC, &now);
    return now.tv_sec * int64_t{1000000000} + now.tv_nsec;
}

// Where a callback notes the time of its call.
sem_t arrived;
int64_t arrival = 0;

void Arrive() {
    arrival = Now();
    sem_post(&arrived);
}

int64_t WaitForArrival() {
    while (sem_wait(&arrived) != 0) {
    }
    return arrival;
}

// A contender starts a timer, waits for it, and returns the nanoseconds that this took.

int64_t Ours() {
    static const auto timer = static_cast<uint32_t>(VarnekPGL_CreateTimer("lateness"));
    const int64_t start = Now();
    VarnekPGL_StartTimer(
        timer, kMilliseconds, [](uint32_t, void *) { Arrive(); }, nullptr);
    return WaitForArrival() - start;
}

int64_t Raw() {
    static const timer_t timer = [] {
        sigevent event = {};
        event.sigev_notify = SIGEV_THREAD;
        event.sigev_notify_function = [](sigval) { Arrive(); };
        timer_t created = {};
        timer_create(CLOCK_REALTIME, &event, &created);
        return created;
    }();
    const int64_t start = Now();
    timer_settime(timer, 0, &kTime, nullptr);
    return WaitForArrival() - start;
}

int64_t Descriptor() {
    static const int descriptor = timerfd_create(CLOCK_REALTIME, TFD_CLOEXEC);
    const int64_t start = Now();
    timerfd_settime(descriptor, 0, &kTime, nullptr);
    uint64_t expiries = 0;
    return read(descriptor, &expiries, sizeof expiries) > 0 ? Now() - start : 0;
}

// Keeps every core busy during its lifetime.
class Load {
  public:
    Load() {
        for (unsigned int i = 0; i < std::thread::hardware_concurrency(); i++) {
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

// Measures one round, and prints its results in Google Benchmark's format.
void Round(const char *state, int count) {
    struct {
        const char *name;
        int64_t (*measure)();
        std::vector<int64_t> late;
    } contenders[] = {{"ours", Ours, {}}, {"raw", Raw, {}}, {"timerfd", Descriptor, {}}};
    for (int i = 0; i < count; i++) {
        for (auto &contender : contenders) {
            contender.late.push_back(contender.measure() - kTime.it_value.tv_nsec);
        }
        // The first two take turns, because whichever goes first finds the system's timer thread
        // asleep for longer.
        std::swap(contenders[0], contenders[1]);
    }
    for (auto &contender : contenders) {
        std::sort(contender.late.begin(), contender.late.end());
        for (const size_t percent : {50u, 99u}) {
            static const char *separator = "";
            const int64_t late = contender.late[(contender.late.size() - 1) * percent / 100];
            std::printf(
                "%s\n{\"run_type\": \"iteration\", \"name\": \"lateness/%s_p%zu:%s\", "
                "\"real_time\": %lld, \"time_unit\": \"ns\"}",
                separator, state, percent, contender.name, static_cast<long long>(late));
            separator = ",";
        }
    }
}

}  // namespace

// lateness ROUNDS COUNT
int main(int argc, char **argv) {
    const int rounds = argc > 1 ? std::atoi(argv[1]) : 1;
    const int count = argc > 2 ? std::atoi(argv[2]) : 100;
    sem_init(&arrived, 0, 0);
    std::printf("{\"benchmarks\": [");
    for (int round = 0; round < rounds; round++) {
        Round("idle", count);
        const Load load;
        Round("busy", count);
    }
    std::printf("\n]}\n");
    return 0;
}
