// Starts a timer and cancels it before it expires.
#include <signal.h>
#include <time.h>

#include "Bench.h"
#include "Varnek_Timer.h"

namespace {

constexpr uint32_t kTimeout = 60000;

void Ours(benchmark::State &state) {
    const auto timer = static_cast<uint32_t>(VarnekPGL_CreateTimer("bench"));
    for (auto _ : state) {
        if (VarnekPGL_StartTimer(
                timer, kTimeout, [](uint32_t, void *) {}, nullptr) == FALSE ||
            VarnekPGL_CancelTimer(timer) == FALSE) {
            state.SkipWithError("the timer is refused");
            break;
        }
    }
    VarnekPGL_DeleteTimer(timer);
}

// Arms and disarms a system timer, and with `asks` first asks each time whether the timer is armed,
// as the library has to.
template <bool asks>
void Raw(benchmark::State &state) {
    sigevent event = {};
    event.sigev_notify = SIGEV_THREAD;
    event.sigev_notify_function = [](sigval) {};
    timer_t timer = {};
    if (!bench::Require(state, timer_create(CLOCK_REALTIME, &event, &timer) == 0, "no timer")) {
        return;
    }
    itimerspec on = {};
    on.it_value.tv_sec = kTimeout / 1000;
    const itimerspec off = {};
    for (auto _ : state) {
        for (const itimerspec *time : {&std::as_const(on), &off}) {
            itimerspec left = {};
            if (asks) {
                benchmark::DoNotOptimize(timer_gettime(timer, &left));
            }
            benchmark::DoNotOptimize(timer_settime(timer, 0, time, nullptr));
        }
    }
    timer_delete(timer);
}

void RegisterAll() {
    bench::Add("timer:ours", Ours);
    bench::Add("timer:raw", Raw<false>);
    bench::Add("timer:bare", Raw<true>);
}

}  // namespace

int main(int argc, char **argv) {
    return bench::Main(argc, argv, RegisterAll);
}
