// Times in the system's types. Private.
#ifndef VARNEK_SOURCE_CLOCK_H
#define VARNEK_SOURCE_CLOCK_H

#include <stdint.h>
#include <time.h>

#include <limits>

// Converts seconds to the system's type. If that has 32 bits, times beyond its range become the
// last one that it can hold, on 19 January 2038.
inline time_t SystemSeconds(int64_t seconds) {
    constexpr time_t kLast = std::numeric_limits<time_t>::max();
    return seconds < kLast ? static_cast<time_t>(seconds) : kLast;
}

// Returns the time `timeout` milliseconds after `now`.
inline timespec DeadlineAfter(const timespec &now, uint32_t timeout) {
    constexpr int64_t kSecond = 1000000000;
    const int64_t nanoseconds = now.tv_nsec + int64_t{timeout} * 1000000;
    timespec deadline = {};
    deadline.tv_sec = SystemSeconds(now.tv_sec + nanoseconds / kSecond);
    deadline.tv_nsec = static_cast<long>(nanoseconds % kSecond);
    return deadline;
}

#endif
