// The least code that drops a trace, in a shared library, so that calls reach it as they reach
// ours.
#ifndef VARNEK_BENCH_BARE_H
#define VARNEK_BENCH_BARE_H

#include <stdint.h>

// Drops the line unless `mask` contains an enabled bit. No bit is enabled.
extern "C" __attribute__((visibility("default"), format(printf, 2, 3))) void BareTrace(
    uint32_t mask, const char *format, ...);

#endif
