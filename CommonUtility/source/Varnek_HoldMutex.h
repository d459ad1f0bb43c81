// A scope that holds a named mutex. Private.
#ifndef VARNEK_SOURCE_HOLDMUTEX_H
#define VARNEK_SOURCE_HOLDMUTEX_H

#include "Varnek_MutexTable.h"
#include "Varnek_Semaphore.h"

// Holds a named mutex until the end of the scope or until Release, as if by VarnekPGL_AcquireMutex
// and VarnekPGL_ReleaseMutex. Where the short road here fails, these two are called, both of them,
// and write the lines of the failure.
class HoldMutex {
  public:
    static constexpr int32_t kNoMutex = -1;
    enum IfNone { kNothingToHold, kFailure };  // what kNoMutex means to the caller

    explicit HoldMutex(int32_t hMutex, IfNone ifNone = kNothingToHold)
        : hMutex_(hMutex), ifNone_(ifNone) {
        Acquire();
    }
    ~HoldMutex() { Release(); }
    HoldMutex(const HoldMutex &) = delete;
    HoldMutex &operator=(const HoldMutex &) = delete;

    bool IsHeld() const { return held_ != nullptr; }
    void Acquire() {
        tried_ = hMutex_ != kNoMutex || ifNone_ == kFailure;
        if (!tried_) {
            return;
        }
        auto *const slot = gMutexArr.Find(hMutex_);
        if (__builtin_expect(slot != nullptr && pthread_mutex_lock(&slot->info.linuxMutex) == 0,
                             1)) {
            held_ = &slot->info.linuxMutex;
        } else {
            VarnekPGL_AcquireMutex(hMutex_);
        }
    }
    // Needs no second lookup, because a held mutex cannot be deleted.
    void Release() {
        if (held_ != nullptr ? pthread_mutex_unlock(held_) != 0 : tried_) {
            VarnekPGL_ReleaseMutex(hMutex_);
        }
        tried_ = false;
        held_ = nullptr;
    }

  private:
    const int32_t hMutex_;
    const IfNone ifNone_;
    bool tried_ = false;
    pthread_mutex_t *held_ = nullptr;
};

#endif
