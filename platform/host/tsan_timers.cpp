// POSIX timers with thread notification, made of ordinary threads, one for each timer. A program
// that runs under ThreadSanitizer, which cannot handle the C library's timers, compiles this file
// to replace the timer_ functions. It supports only relative times and one-shot timers, because
// varnekutils_ltn uses no others.
#include <signal.h>
#include <time.h>

#include <chrono>
#include <condition_variable>
#include <mutex>
#include <new>
#include <thread>

namespace {

using Clock = std::chrono::steady_clock;

struct Timer {
    sigevent event = {};
    std::mutex lock;
    std::condition_variable changed;
    bool armed = false;
    bool deleted = false;
    Clock::time_point due;

    // Each expiry calls back on a new thread, as the system's does.
    void Run() {
        std::unique_lock<std::mutex> guard(lock);
        while (!deleted) {
            if (!armed) {
                changed.wait(guard);
            } else if (Clock::now() < due) {
                changed.wait_until(guard, Clock::time_point(due));
            } else {
                armed = false;
                std::thread(event.sigev_notify_function, event.sigev_value).detach();
            }
        }
        guard.unlock();
        delete this;
    }
};

Timer *Of(timer_t id) {
    return static_cast<Timer *>(id);
}

}  // namespace

extern "C" {

// The C library's headers name the parameters differently.
// NOLINTBEGIN(readability-inconsistent-declaration-parameter-name)
int timer_create(clockid_t, sigevent *event, timer_t *id) {
    Timer *timer = new (std::nothrow) Timer;
    if (timer == nullptr) {
        return -1;
    }
    timer->event = *event;
    *id = timer;
    std::thread(&Timer::Run, timer).detach();
    return 0;
}

int timer_settime(timer_t id, int, const itimerspec *time, itimerspec *) {
    const std::lock_guard<std::mutex> guard(Of(id)->lock);
    const auto span = std::chrono::seconds(time->it_value.tv_sec) +
                      std::chrono::nanoseconds(time->it_value.tv_nsec);
    Of(id)->armed = span.count() > 0;
    Of(id)->due = Clock::now() + span;
    Of(id)->changed.notify_one();
    return 0;
}

int timer_gettime(timer_t id, itimerspec *time) {
    const std::lock_guard<std::mutex> guard(Of(id)->lock);
    *time = {};
    const auto left = Of(id)->due - Clock::now();
    if (Of(id)->armed) {
        const int64_t nanoseconds = left.count() > 0 ? left.count() : 1;
        time->it_value.tv_sec = nanoseconds / 1000000000;
        time->it_value.tv_nsec = nanoseconds % 1000000000;
    }
    return 0;
}

int timer_delete(timer_t id) {
    const std::lock_guard<std::mutex> guard(Of(id)->lock);
    Of(id)->deleted = true;
    Of(id)->changed.notify_one();
    return 0;
}
// NOLINTEND(readability-inconsistent-declaration-parameter-name)
}
