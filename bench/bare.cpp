#include "bare.h"

#include <stdarg.h>
#include <stdio.h>

#include <atomic>

static std::atomic<uint32_t> enabled{0};

void BareTrace(uint32_t mask, const char *format, ...) {
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
