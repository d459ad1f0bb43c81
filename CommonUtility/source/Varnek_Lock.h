// The library's own locks, a scope that holds one, and work that only one thread at a time does.
// Under clang, -Wthread-safety checks that only the holder of a lock uses the data that is
// VARNEK_GUARDED_BY it. Private.
#ifndef VARNEK_SOURCE_LOCK_H
#define VARNEK_SOURCE_LOCK_H

#include <pthread.h>

#include <atomic>

#if defined(__clang__)
#define VARNEK_THREAD_SAFETY(attribute) __attribute__((attribute))
#else
#define VARNEK_THREAD_SAFETY(attribute)
#endif
#define VARNEK_GUARDED_BY(lock) VARNEK_THREAD_SAFETY(guarded_by(lock))
#define VARNEK_REQUIRES(lock) VARNEK_THREAD_SAFETY(requires_capability(lock))

// A lock in static storage, never destroyed. All zero, as at the start, is unlocked on every
// target.
struct VARNEK_THREAD_SAFETY(capability("mutex")) Lock {
    pthread_mutex_t mutex;

    void Acquire() VARNEK_THREAD_SAFETY(acquire_capability()) { pthread_mutex_lock(&mutex); }
    void Release() VARNEK_THREAD_SAFETY(release_capability()) { pthread_mutex_unlock(&mutex); }
};

// Holds a lock until the end of the scope, or until Release, for what must not or need not run
// under it, such as a callback, a wait or a trace. After that it may be acquired again.
class VARNEK_THREAD_SAFETY(scoped_lockable) Hold {
  public:
    explicit Hold(Lock &lock) VARNEK_THREAD_SAFETY(acquire_capability(lock)) : lock_(lock) {
        Acquire();
    }
    ~Hold() VARNEK_THREAD_SAFETY(release_capability()) { Release(); }
    Hold(const Hold &) = delete;
    Hold &operator=(const Hold &) = delete;

    void Acquire() VARNEK_THREAD_SAFETY(acquire_capability()) {
        lock_.Acquire();
        held_ = true;
    }
    void Release() VARNEK_THREAD_SAFETY(release_capability()) {
        if (held_) {
            held_ = false;
            lock_.Release();
        }
    }

  private:
    Lock &lock_;
    bool held_ = false;
};

// Lets one thread at a time do a piece of work that calls the log function, such as what the first
// caller of an operation has to prepare. The log function may call back into that operation, and
// would wait for its own thread there; such a call is refused instead. Static storage only.
class OneAtATime {
  public:
    // Does the work, after waiting for a thread that is doing it. Returns false, without having
    // done anything, if that thread is the caller.
    template <typename Work>
    bool Do(Work work) {
        // Relaxed, because only the thread that stored its own id can find it there.
        if (pthread_equal(worker_.load(std::memory_order_relaxed), pthread_self())) {
            return false;
        }
        const Hold hold(lock_);
        worker_.store(pthread_self(), std::memory_order_relaxed);
        work();
        worker_.store(pthread_t{}, std::memory_order_relaxed);
        return true;
    }

  private:
    Lock lock_;
    std::atomic<pthread_t> worker_;
};

#endif
