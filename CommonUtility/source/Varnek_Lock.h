// The library's own locks, the scope that holds one, and the scope that holds a named mutex. Under
// clang, -Wthread-safety checks that what is VARNEK_GUARDED_BY a lock is used by its holder only.
// Private.
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

// Unlocked when zero, as static storage is: that is so on every target. Never destroyed.
struct VARNEK_THREAD_SAFETY(capability("mutex")) Lock {
    pthread_mutex_t mutex;

    void Acquire() VARNEK_THREAD_SAFETY(acquire_capability()) { pthread_mutex_lock(&mutex); }
    void Release() VARNEK_THREAD_SAFETY(release_capability()) { pthread_mutex_unlock(&mutex); }
};

// Holds a lock to the end of the scope, or up to its release where a trace or a callback comes
// after. It may be taken again after that.
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

// The table of the named mutexes, for the two operations below. Varnek_Semaphore.cpp owns it, and
// writes the lines of their failures.
constexpr int MAX_MUTEX_MGR_INFO_ARR_SIZE = 40;
struct MUTEX_MGR_INFO {
    pthread_mutex_t linuxMutex;
};
extern __attribute__((visibility("hidden"))) SlotTable<MUTEX_MGR_INFO, MAX_MUTEX_MGR_INFO_ARR_SIZE>
    gMutexArr;
pthread_mutex_t *LockFailed(const void *slot, int32_t hMutex, int error);  // null
BOOL UnlockFailed(int error);                                              // FALSE

// What VarnekPGL_AcquireMutex does; hands the mutex out, null when it was not taken. It cannot be
// deleted while it is held, so UnlockMutex, which is the rest of VarnekPGL_ReleaseMutex, looks for
// nothing.
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

// Holds a named mutex to the end of the scope, or up to its release; nothing for an object without
// a mutex (kNoMutex). IsHeld says whether the mutex could be taken; one that could not is released
// all the same, so that the log has the lines of both calls.
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
