// The library's own locks, and the scope that holds one. Under clang, -Wthread-safety checks that
// what is VARNEK_GUARDED_BY a lock is used by its holder only. Private.
#ifndef VARNEK_SOURCE_LOCK_H
#define VARNEK_SOURCE_LOCK_H

#include <pthread.h>

#if defined(__clang__)
#define VARNEK_THREAD_SAFETY(attribute) __attribute__((attribute))
#else
#define VARNEK_THREAD_SAFETY(attribute)
#endif
#define VARNEK_GUARDED_BY(lock) VARNEK_THREAD_SAFETY(guarded_by(lock))
#define VARNEK_REQUIRES(lock) VARNEK_THREAD_SAFETY(requires_capability(lock))

// Unlocked when zero, as static storage is: that is so on every target. Never destroyed.
struct VARNEK_THREAD_SAFETY(capability("mutex")) Lock {
    pthread_mutex_t mutex;

    void Acquire() VARNEK_THREAD_SAFETY(acquire_capability()) { pthread_mutex_lock(&mutex); }
    void Release() VARNEK_THREAD_SAFETY(release_capability()) { pthread_mutex_unlock(&mutex); }
};

// Holds a lock to the end of the scope, or up to its release where a trace or a callback comes
// after.
class VARNEK_THREAD_SAFETY(scoped_lockable) Hold {
  public:
    explicit Hold(Lock &lock) VARNEK_THREAD_SAFETY(acquire_capability(lock)) : lock_(lock) {
        lock.Acquire();
    }
    ~Hold() VARNEK_THREAD_SAFETY(release_capability()) { Release(); }
    Hold(const Hold &) = delete;
    Hold &operator=(const Hold &) = delete;

    void Release() VARNEK_THREAD_SAFETY(release_capability()) {
        if (held_) {
            held_ = false;
            lock_.Release();
        }
    }

  private:
    Lock &lock_;
    bool held_ = true;
};

#endif
