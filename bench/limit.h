// The functions that the "limit" contenders call: the minimal code that does the same work, in a
// shared library.
#ifndef VARNEK_BENCH_LIMIT_H
#define VARNEK_BENCH_LIMIT_H

#include <pthread.h>
#include <stddef.h>
#include <stdint.h>

#define LIMIT_API __attribute__((visibility("default")))

extern "C" {

// A bit reader that checks its bounds. Returns 1, or 0 beyond the end.
struct LimitReader {
    const unsigned char *data;
    size_t bits;
    size_t position;
};
LIMIT_API int LimitReadBits(LimitReader *reader, int count, uint32_t *value);

LIMIT_API int LimitLock(pthread_mutex_t *mutex);
LIMIT_API int LimitUnlock(pthread_mutex_t *mutex);

// Drops the line unless `mask` contains an enabled bit. No bit is enabled.
LIMIT_API void LimitTrace(uint32_t mask, const char *format, ...)
    __attribute__((format(printf, 2, 3)));

}  // extern "C"

#endif
