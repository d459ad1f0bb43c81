#include "support/FailingCalls.h"

#include <dirent.h>
#include <fcntl.h>
#include <pthread.h>
#include <semaphore.h>
#include <signal.h>
#include <sys/stat.h>
#include <sys/time.h>
#include <time.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <new>
#include <utility>

namespace {

struct Call {
    static inline Call *first = nullptr;

    const char *name;
    Call *next;
    std::atomic<int> left{0};
    int error = 0;

    explicit Call(const char *callName) : name(callName), next(std::exchange(first, this)) {}
    bool Fails() { return left > 0 && --left == 0; }
};

Call &Find(const char *name) {
    for (Call *call = Call::first; call != nullptr; call = call->next) {
        if (strcmp(call->name, name) == 0) {
            return *call;
        }
    }
    abort();
}

Call gDelivery("delivery");
void (*gDeliver)(sigval value) = nullptr;

// Sends the timer's deliveries through a function that drops the one that is to fail.
sigevent *Droppable(sigevent *event) {
    gDeliver = event->sigev_notify_function;
    event->sigev_notify_function = [](sigval value) {
        if (!gDelivery.Fails()) {
            gDeliver(value);
        }
    };
    return event;
}

// Ends a wait with this error, or with a time-out at the moment when the semaphore is posted.
int Missed(sem_t *semaphore, int error) {
    for (int units = 0; error == ETIMEDOUT && units == 0; sem_getvalue(semaphore, &units)) {
        usleep(100);
    }
    errno = error;
    return -1;
}

int Nameless(int result, struct stat64 *file) {
    file->st_nlink = 0;
    return result;
}

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
WRAP_POSIX(sem_wait, (sem_t * s), s)
// If it is made to time out, it does so at the moment when the semaphore is posted.
WRAP(int, Missed(s, errno), sem_timedwait, (sem_t * s, const timespec *time), s, time)
WRAP_POSIX(clock_gettime, (clockid_t clock, timespec *time), clock, time)
WRAP_POSIX(timer_create, (clockid_t clock, sigevent *event, timer_t *id), clock, Droppable(event), id)
WRAP_POSIX(timer_settime, (timer_t id, int flags, const itimerspec *now, itimerspec *old), id, flags, now, old)
WRAP_POSIX(timer_gettime, (timer_t id, itimerspec *left), id, left)
WRAP_POSIX(timer_delete, (timer_t id), id)
WRAP_PTHREAD(pthread_create, (pthread_t * id, const pthread_attr_t *attributes, void *(*run)(void *), void *arg), id,
             attributes, run, arg)
WRAP_PTHREAD(pthread_mutex_init, (pthread_mutex_t * mutex, const pthread_mutexattr_t *attributes), mutex, attributes)
WRAP_PTHREAD(pthread_mutex_lock, (pthread_mutex_t * mutex), mutex)
WRAP_PTHREAD(pthread_mutex_unlock, (pthread_mutex_t * mutex), mutex)
WRAP_PTHREAD(pthread_mutex_destroy, (pthread_mutex_t * mutex), mutex)

WRAP(FILE *, nullptr, fopen, (const char *path, const char *mode), path, mode)
WRAP(size_t, 0, fread, (void *to, size_t size, size_t count, FILE *file), to, size, count, file)
WRAP(size_t, 0, fwrite, (const void *from, size_t size, size_t count, FILE *file), from, size, count, file)
WRAP_POSIX(fseek, (FILE * file, long offset, int base), file, offset, base)
WRAP(long, -1, ftell, (FILE * file), file)
WRAP_POSIX(fflush, (FILE * file), file)
// A close that fails has closed the stream.
WRAP(int, (__real_fclose(file), errno = gCall_fclose.error, EOF), fclose, (FILE * file), file)
WRAP_POSIX(open, (const char *path, int flags, mode_t mode), path, flags, mode)
WRAP(ssize_t, -1, read, (int fd, void *to, size_t count), fd, to, count)
WRAP(ssize_t, -1, write, (int fd, const void *from, size_t count), fd, from, count)
WRAP(off64_t, -1, lseek64, (int fd, off64_t offset, int base), fd, offset, base)
WRAP_POSIX(remove, (const char *path), path)
WRAP(char *, nullptr, strndup, (const char *text, size_t length), text, length)
WRAP_POSIX(mkdir, (const char *path, mode_t mode), path, mode)
WRAP(DIR *, nullptr, opendir, (const char *path), path)
WRAP_POSIX(stat64, (const char *path, struct stat64 *info), path, info)
// With the error 0 it succeeds, but says that the file has lost its name since.
WRAP(int, errno != 0 ? -1 : Nameless(__real_lstat64(p, s), s), lstat64, (const char *p, struct stat64 *s), p, s)
WRAP_POSIX(openat, (int directory, const char *path, int flags, mode_t mode), directory, path, flags, mode)
WRAP(DIR *, nullptr, fdopendir, (int fd), fd)
WRAP_POSIX(unlinkat, (int directory, const char *path, int flags), directory, path, flags)
WRAP_POSIX(renameat, (int fromDir, const char *from, int toDir, const char *to), fromDir, from, toDir, to)
WRAP(ssize_t, -1, pread, (int fd, void *to, size_t count, off_t offset), fd, to, count, offset)
WRAP(ssize_t, -1, pwrite, (int fd, const void *from, size_t count, off_t offset), fd, from, count, offset)
WRAP_POSIX(ftruncate, (int fd, off_t size), fd, size)
WRAP_POSIX(kill, (pid_t process, int number), process, number)
WRAP_POSIX(fchown, (int fd, uid_t user, gid_t group), fd, user, group)
WRAP_POSIX(fchmod, (int fd, mode_t mode), fd, mode)
WRAP_POSIX(access, (const char *path, int mode), path, mode)
WRAP_POSIX(fsync, (int fd), fd)
WRAP(int, (__real_close(fd), errno = gCall_close.error, -1), close, (int fd), fd)
WRAP(dirent64 *, nullptr, readdir64, (DIR * directory), directory)
WRAP(int, (__real_closedir(directory), errno = gCall_closedir.error, -1), closedir, (DIR * directory), directory)
WRAP_POSIX(gettimeofday, (timeval * time, void *zone), time, zone)
WRAP_POSIX(system, (const char *command), command)

// The only operator new that the library uses is new[](size_t, const std::nothrow_t &). Its mangled name depends on
// size_t.
#if __SIZEOF_POINTER__ == 8
#define NEW_ARRAY _ZnamRKSt9nothrow_t
#else
#define NEW_ARRAY _ZnajRKSt9nothrow_t
#endif
#define WRAP_NAMED(...) WRAP(__VA_ARGS__)
WRAP_NAMED(void *, nullptr, NEW_ARRAY, (size_t size, const std::nothrow_t &tag), size, tag)
#define NAME_OF(name) #name
#define NAME(name) NAME_OF(name)

std::vector<const char *> FailingCalls() {
    std::vector<const char *> names;
    for (const Call *call = Call::first; call != nullptr; call = call->next) {
        names.push_back(call->name);
    }
    return names;
}

void FailCall(const char *function, int nth, int error) {
    Call &call = Find(strcmp(function, "operator new[]") == 0 ? NAME(NEW_ARRAY) : function);
    call.error = error;
    call.left = nth;
}

bool IsStillToFail(const char *function) { return Find(function).left > 0; }
