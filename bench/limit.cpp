#include "limit.h"

#include <stdarg.h>
#include <stdio.h>

#include <atomic>

static std::atomic<uint32_t> enabled{0};

int LimitReadBits(LimitReader *reader, int count, uint32_t *value) {
    if (count < 0 || count > 32 || reader->bits - reader->position < static_cast<size_t>(count)) {
        return 0;
    }
    const size_t first = reader->position / 8;
    const size_t last = (reader->position + static_cast<size_t>(count) + 7) / 8;
    uint64_t bits = 0;
    for (size_t i = first; i < last; i++) {
        bits = bits << 8 | reader->data[i];
    }
    reader->position += static_cast<size_t>(count);
    const size_t below = last * 8 - reader->position;
    *value = static_cast<uint32_t>(bits >> below & ((uint64_t{1} << count) - 1));
    return 1;
}

int LimitLock(pthread_mutex_t *mutex) {
    return pthread_mutex_lock(mutex);
}

int LimitUnlock(pthread_mutex_t *mutex) {
    return pthread_mutex_unlock(mutex);
}

void LimitTrace(uint32_t mask, const char *format, ...) {
    if ((enabled.load(std::memory_order_relaxed) & mask) == 0) {
        return;
    }
    char line[2048];
    va_list args;
    va_start(args, format);
    vsnprintf(line, sizeof line, format, args);
    va_end(args);
    fputs(line, stderr);
}
