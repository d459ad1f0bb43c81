// The library's own locks, a scope that holds one, and a scope that holds a named mutex. Under
// clang, -Wthread-safety checks that only the holder of a lock uses the data that is
// VARNEK_GUARDED_BY it. Private.
#ifndef VARNEK_SOURCE_LOCK_H
#define VARNEK_SOURCE_LOCK_H

#include <pthread.h>

#include "Varnek_Semaphore.h"
#include "Varnek_SlotTable.h"

#if defined(__clang__)
#define VARNEK_THREAD_SAFETY(attribute) __attribute__((attribute))
#else
#define VARNEK_THREAD_SAFETY(attribute)
#endif
#define VARNEK_GUARDED_BY(lock) VARNEK_THREAD_SAFETY(guarded_by(lock))
#define VARNEK_REQUIRES(lock) VARNEK_THREAD_SAFETY(requires_capability(lock))

// A lock in static storage. It is zero at the start, which means unlocked on every target. It is
// never destroyed.
struct VARNEK_THREAD_SAFETY(capability("mutex")) Lock {
    pthread_mutex_t mutex;

    void Acquire() VARNEK_THREAD_SAFETY(acquire_capability()) { pthread_mutex_lock(&mutex); }
    void Release() VARNEK_THREAD_SAFETY(release_capability()) { pthread_mutex_unlock(&mutex); }
};

// Holds a lock until the end of the scope, or until Release, which callers use before a trace or a
// callback. After a release the lock may be acquired again.
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

// The table of the named mutexes, for the two operations below. Varnek_Semaphore.cpp owns it and
// logs their failures.
constexpr int MAX_MUTEX_MGR_INFO_ARR_SIZE = 40;
struct MUTEX_MGR_INFO {
    pthread_mutex_t linuxMutex;
};
extern __attribute__((visibility("hidden"))) SlotTable<MUTEX_MGR_INFO, MAX_MUTEX_MGR_INFO_ARR_SIZE>
    gMutexArr;
pthread_mutex_t *LockFailed(const void *slot, int32_t hMutex, int error);  // always returns null
BOOL UnlockFailed(int error);                                              // always returns FALSE

// LockMutex does what VarnekPGL_AcquireMutex does, but returns the mutex, or null on failure.
// UnlockMutex does what VarnekPGL_ReleaseMutex does. It needs no second lookup, because a held
// mutex cannot be deleted.
inline pthread_mutex_t *LockMutex(int32_t hMutex) {
    auto *const slot = gMutexArr.Find(hMutex);
    const int error = slot != nullptr ? pthread_mutex_lock(&slot->info.linuxMutex) : 0;
    return __builtin_expect(slot != nullptr && error == 0, 1) ? &slot->info.linuxMutex
                                                              : LockFailed(slot, hMutex, error);
}

inline BOOL UnlockMutex(pthread_mutex_t *mutex) {
    const int error = pthread_mutex_unlock(mutex);
    return __builtin_expect(error == 0, 1) ? TRUE : UnlockFailed(error);
}

// Holds a named mutex until the end of the scope or until Release. With kNoMutex it does nothing.
// IsHeld says whether the acquisition succeeded. If it failed, the release is called nevertheless,
// so that the log has the lines of both failures.
class HoldMutex {
  public:
    static constexpr int32_t kNoMutex = -1;

    explicit HoldMutex(int32_t hMutex) : hMutex_(hMutex) { Acquire(); }
    ~HoldMutex() { Release(); }
    HoldMutex(const HoldMutex &) = delete;
    HoldMutex &operator=(const HoldMutex &) = delete;

    bool IsHeld() const { return held_ != nullptr; }
    void Acquire() {
        tried_ = hMutex_ != kNoMutex;
        held_ = tried_ ? LockMutex(hMutex_) : nullptr;
    }
    void Release() {
        if (held_ != nullptr) {
            UnlockMutex(held_);
        } else if (tried_) {
            VarnekPGL_ReleaseMutex(hMutex_);
        }
        tried_ = false;
        held_ = nullptr;
    }

  private:
    const int32_t hMutex_;
    bool tried_ = false;
    pthread_mutex_t *held_ = nullptr;
};

#endif
