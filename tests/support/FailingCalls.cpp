#include "support/FailingCalls.h"

#include <pthread.h>
#include <semaphore.h>
#include <signal.h>
#include <time.h>

#include <atomic>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <new>

namespace {

struct Call {
    const char *name;
    std::atomic<int> left{0};
    int error = 0;

    bool Fails() { return left > 0 && --left == 0; }
};

}  // namespace

// The library's call goes to __wrap_NAME, which hands it on to __real_NAME.
#define WRAP(result, failure, name, parameters, ...) \
    static Call gCall_##name{#name};                 \
    extern "C" result __real_##name parameters;      \
    extern "C" result __wrap_##name parameters;      \
    extern "C" result __wrap_##name parameters {     \
        if (gCall_##name.Fails()) {                  \
            errno = gCall_##name.error;              \
            return failure;                          \
        }                                            \
        return __real_##name(__VA_ARGS__);           \
    }
#define WRAP_POSIX(name, parameters, ...) WRAP(int, -1, name, parameters, __VA_ARGS__)
#define WRAP_PTHREAD(name, parameters, ...) WRAP(int, gCall_##name.error, name, parameters, __VA_ARGS__)

WRAP(void *, nullptr, malloc, (size_t size), size)
WRAP_POSIX(sem_init, (sem_t * s, int shared, unsigned value), s, shared, value)
WRAP_POSIX(sem_destroy, (sem_t * s), s)
WRAP_POSIX(sem_post, (sem_t * s), s)
WRAP_POSIX(sem_getvalue, (sem_t * s, int *value), s, value)
WRAP_POSIX(sem_wait, (sem_t * s), s)
WRAP_POSIX(sem_timedwait, (sem_t * s, const timespec *time), s, time)
WRAP_POSIX(clock_gettime, (clockid_t clock, timespec *time), clock, time)
WRAP_POSIX(timer_create, (clockid_t clock, sigevent *event, timer_t *id), clock, event, id)
WRAP_POSIX(timer_settime, (timer_t id, int flags, const itimerspec *now, itimerspec *old), id, flags, now, old)
WRAP_POSIX(timer_gettime, (timer_t id, itimerspec *left), id, left)
WRAP_POSIX(timer_delete, (timer_t id), id)
WRAP_PTHREAD(pthread_create, (pthread_t * id, const pthread_attr_t *attributes, void *(*run)(void *), void *arg), id,
             attributes, run, arg)
WRAP_PTHREAD(pthread_mutex_init, (pthread_mutex_t * mutex, const pthread_mutexattr_t *attributes), mutex, attributes)
WRAP_PTHREAD(pthread_mutex_lock, (pthread_mutex_t * mutex), mutex)
WRAP_PTHREAD(pthread_mutex_unlock, (pthread_mutex_t * mutex), mutex)
WRAP_PTHREAD(pthread_mutex_destroy, (pthread_mutex_t * mutex), mutex)

// operator new[](size_t, const std::nothrow_t &), under its mangled name.
#if __SIZEOF_POINTER__ == 8
#define NEW_ARRAY _ZnamRKSt9nothrow_t
#else
#define NEW_ARRAY _ZnajRKSt9nothrow_t
#endif
#define WRAP_NAMED(...) WRAP(__VA_ARGS__)
WRAP_NAMED(void *, nullptr, NEW_ARRAY, (size_t size, const std::nothrow_t &tag), size, tag)
#define CALL_OF(name) gCall_##name
#define CALL_NAMED(name) CALL_OF(name)

void FailCall(const char *function, int nth, int error) {
    Call *const calls[] = {
        &gCall_malloc,
        &gCall_sem_init,
        &gCall_sem_destroy,
        &gCall_sem_post,
        &gCall_sem_getvalue,
        &gCall_sem_wait,
        &gCall_sem_timedwait,
        &gCall_clock_gettime,
        &gCall_timer_create,
        &gCall_timer_settime,
        &gCall_timer_gettime,
        &gCall_timer_delete,
        &gCall_pthread_create,
        &gCall_pthread_mutex_init,
        &gCall_pthread_mutex_lock,
        &gCall_pthread_mutex_unlock,
        &gCall_pthread_mutex_destroy,
    };
    for (Call *call : calls) {
        if (strcmp(call->name, function) == 0) {
            call->error = error;
            call->left = nth;
            return;
        }
    }
    if (strcmp(function, "operator new[]") == 0) {
        CALL_NAMED(NEW_ARRAY).left = nth;
        return;
    }
    abort();
}
