// The timer service. One lock guards the table and every OS call for a slot; it is never held
// during a callback. When a timer expires, the system runs the callback on a thread of its own,
// perhaps late, or not at all if the timer is armed again first. So if the timer is started again
// before an expiry has been delivered, the earlier start becomes an owed one, and a second OS
// timer, which serves only those, expires at once. Whichever timer calls, all starts that are due
// get their callback.
#include "Varnek_Timer.h"

#include <signal.h>
#include <stdlib.h>
#include <time.h>

#include "Varnek_Clock.h"
#include "Varnek_Lock.h"
#include "Varnek_Support.h"
#include "Varnek_Trace.h"

namespace {

constexpr int MAX_TIMER_MGR_INFO_ARR_SIZE = 32;
constexpr size_t kTimerNameSize = 41;  // with the terminator

// An earlier start that has expired but not called back yet.
struct OwedStart {
    TimerCallbackFunc pfnCallback;
    void *pUserData;
    OwedStart *next;
};

struct TIMER_MGR_INFO {
    bool bUsed;
    timer_t timerId;      // while bTimerCreated
    timer_t owedTimerId;  // while isOwedTimerCreated
    char szTmName[kTimerNameSize];
    TimerCallbackFunc pfnCallback;  // of the last start; null until the first
    void *pUserData;
    bool bTimerCreated;
    bool bAwaited;  // the last start has neither called back nor been cancelled
    bool isOwedTimerCreated;
    OwedStart *owed;  // oldest first; while there is one, a call of the second timer is pending
};

Lock gTimerArrLock;
TIMER_MGR_INFO gTimerArr[MAX_TIMER_MGR_INFO_ARR_SIZE] VARNEK_GUARDED_BY(gTimerArrLock);
int32_t gTimerArrSize VARNEK_GUARDED_BY(gTimerArrLock) = 0;

// Returns the record of a timer in use, null for an unknown handle.
TIMER_MGR_INFO *FindTimer(uint32_t timer) VARNEK_REQUIRES(gTimerArrLock) {
    return timer < MAX_TIMER_MGR_INFO_ARR_SIZE && gTimerArr[timer].bUsed ? &gTimerArr[timer]
                                                                         : nullptr;
}

// Returns the handle of the timer in use with this name, -1 for none.
int32_t FindName(const char *szTmName) VARNEK_REQUIRES(gTimerArrLock) {
    for (int32_t timer = 0; timer < MAX_TIMER_MGR_INFO_ARR_SIZE; timer++) {
        if (gTimerArr[timer].bUsed && strcmp(gTimerArr[timer].szTmName, szTmName) == 0) {
            return timer;
        }
    }
    return -1;
}

int32_t FirstFree() VARNEK_REQUIRES(gTimerArrLock) {
    for (int32_t timer = 0; timer < MAX_TIMER_MGR_INFO_ARR_SIZE; timer++) {
        if (!gTimerArr[timer].bUsed) {
            return timer;
        }
    }
    return -1;
}

timespec Milliseconds(int64_t milliseconds) {
    timespec time = {};
    time.tv_sec = SystemSeconds(milliseconds / 1000);
    time.tv_nsec = static_cast<long>(milliseconds % 1000) * 1000000;
    return time;
}

// Reads whether the last start has time left. Returns the result of the OS call.
int ReadArmed(const TIMER_MGR_INFO &info, bool *armed) {
    itimerspec left = {};
    const int result = timer_gettime(info.timerId, &left);
    *armed = left.it_value.tv_sec > 0 || left.it_value.tv_nsec > 0;
    return result;
}

constexpr timespec kAtOnce = {0, 1};

// Sets an OS timer to expire once; a time of 0 disarms it. Returns the result of the OS call.
int SetTime(timer_t timerId, const timespec &time) {
    itimerspec expiry = {};
    expiry.it_value = time;
    return timer_settime(timerId, 0, &expiry, nullptr);
}

// Takes the oldest start that is due out of the record, and returns it. The callback of the result
// is null if none is due.
OwedStart TakeDue(TIMER_MGR_INFO *info) {
    if (OwedStart *oldest = info->owed) {
        const OwedStart due = *oldest;
        info->owed = oldest->next;
        free(oldest);
        if (info->owed != nullptr) {
            SetTime(info->owedTimerId, kAtOnce);  // the next one does not wait for this callback
        }
        return due;
    }
    bool armed = false;
    if (!info->bAwaited || (ReadArmed(*info, &armed) == 0 && armed)) {
        return {};
    }
    info->bAwaited = false;
    return {info->pfnCallback, info->pUserData, nullptr};
}

// Empties a record that is no longer in use.
void Clear(TIMER_MGR_INFO *info) {
    while (OwedStart *start = info->owed) {
        info->owed = start->next;
        free(start);
    }
    *info = {};
}

// The OS calls this on one of its threads whenever either timer has expired.
void TimerCallbackEntry(sigval value) {
    const uint32_t timer = static_cast<uint32_t>(value.sival_int);
    TRACE_MID("Timer Callback: Timer=[%d]", static_cast<int>(timer));
    if (timer >= MAX_TIMER_MGR_INFO_ARR_SIZE) {
        TRACE_ERROR("Timer Callback! But timer is invalid! timer=[%d]", static_cast<int>(timer));
        return;
    }
    Hold hold(gTimerArrLock);
    TIMER_MGR_INFO *info = FindTimer(timer);
    if (info == nullptr) {
        TRACE_ERROR("Timer Callback! But Timer isn't used! timer=[%d]", static_cast<int>(timer));
        return;
    }
    if (info->pfnCallback == nullptr) {
        TRACE_ERROR("Timer Callback! But Timer Callback Function is NULL!");
        return;
    }
    // The timer may be deleted during a callback, and its slot may have another owner afterwards.
    for (OwedStart due = TakeDue(info); due.pfnCallback != nullptr;) {
        hold.Release();
        due.pfnCallback(timer, due.pUserData);
        hold.Acquire();
        info = FindTimer(timer);
        due = info != nullptr ? TakeDue(info) : OwedStart{};
    }
}

// Creates an OS timer for a slot. Returns the result of the OS call.
int MakeTimer(uint32_t timer, timer_t *timerId) {
    sigevent event = {};
    event.sigev_notify = SIGEV_THREAD;
    event.sigev_value.sival_int = static_cast<int>(timer);
    event.sigev_notify_function = TimerCallbackEntry;
    return timer_create(CLOCK_REALTIME, &event, timerId);
}

// Makes the last start, which has expired, an owed start, and lets the second timer call for it.
// If others are owed already, the second timer's call is still to come, and arming it again would
// cancel that. Returns false, after a line, when the system refuses or there is no memory; the last
// start then stays where it is, and gets its callback from there.
bool OweLastStart(uint32_t timer, TIMER_MGR_INFO *info) {
    if (!info->isOwedTimerCreated) {
        const int result = MakeTimer(timer, &info->owedTimerId);
        if (result != 0) {
            return VARNEK_FAIL(
                false, "VarnekPGL_StartTimer. Linux Timer Creation FAIL. errCode = [%d]!", result);
        }
        info->isOwedTimerCreated = true;
    }
    OwedStart *const start = static_cast<OwedStart *>(malloc(sizeof(OwedStart)));
    if (start == nullptr) {
        return VARNEK_FAIL(false, "VarnekPGL_StartTimer. memalloc failed");
    }
    const int result = info->owed == nullptr ? SetTime(info->owedTimerId, kAtOnce) : 0;
    if (result != 0) {
        free(start);
        return VARNEK_FAIL(false, "VarnekPGL_StartTimer. Set Timer is FAIL. errCode = [%d]!",
                           result);
    }
    *start = {info->pfnCallback, info->pUserData, nullptr};
    OwedStart **end = &info->owed;
    while (*end != nullptr) {
        end = &(*end)->next;
    }
    *end = start;
    info->bAwaited = false;
    return true;
}

}  // namespace

int32_t VarnekPGL_CreateTimer(const char *szTmName) {
    TRACE_LOW("START: VarnekPGL_CreateTimer. szTmName=[%s]", Shown(szTmName));
    if (szTmName == nullptr || strnlen(szTmName, kTimerNameSize) >= kTimerNameSize) {
        return VARNEK_FAIL(-1, "VarnekPGL_CreateTimer. Invalid Timer Name=[%s]", Shown(szTmName));
    }
    Hold hold(gTimerArrLock);
    if (gTimerArrSize >= MAX_TIMER_MGR_INFO_ARR_SIZE) {
        return VARNEK_FAIL(-1, "VarnekPGL_CreateTimer. Timer pool is Full!");
    }
    if (FindName(szTmName) != -1) {
        return VARNEK_FAIL(-1, "VarnekPGL_CreateTimer. Duplicated Timer!! timer name = [%s]!",
                           szTmName);
    }
    const int32_t timer = FirstFree();
    if (timer == -1) {
        return VARNEK_FAIL(-1,
                           "VarnekPGL_CreateTimer. Duplicated Timer!! Can't find empty index!!!");
    }
    gTimerArr[timer] = {};
    gTimerArr[timer].bUsed = true;
    memcpy(gTimerArr[timer].szTmName, szTmName, strlen(szTmName) + 1);
    gTimerArrSize++;
    hold.Release();
    TRACE_MID("END: VarnekPG_CreateTimer. timer handle=[%d]!!!", timer);
    return timer;
}

BOOL VarnekPGL_StartTimer(uint32_t timer, uint32_t timeout, TimerCallbackFunc callback,
                          void *userData) {
    TRACE_LOW("START: VarnekPGL_StartTimer. timer=[%d], timeout=[%d]", static_cast<int>(timer),
              static_cast<int>(timeout));
    if (timeout == 0) {
        return VARNEK_FAIL(FALSE, "VarnekPGL_StartTimer. timeout is less than 0=[%d]", 0);
    }
    if (callback == nullptr) {
        return VARNEK_FAIL(FALSE, "VarnekPGL_StartTimer. No timer callback!");
    }
    Hold hold(gTimerArrLock);
    TIMER_MGR_INFO *info = FindTimer(timer);
    if (info == nullptr) {
        return VARNEK_FAIL(FALSE, "VarnekPGL_StartTimer. Invalid Timer Handle=[%d]!",
                           static_cast<int>(timer));
    }
    if (info->bTimerCreated) {
        bool armed = false;
        const int result = ReadArmed(*info, &armed);
        if (result != 0) {
            return VARNEK_FAIL(
                FALSE, "VarnekPGL_StartTimer. Get Timer info is FAIL. errCode = [%d]!", result);
        }
        if (armed) {
            return VARNEK_FAIL(
                FALSE, "VarnekPGL_StartTimer. Timer is armed!!. Call VarnekPGL_CancelTimer first!");
        }
    } else {
        const int result = MakeTimer(timer, &info->timerId);
        if (result != 0) {
            return VARNEK_FAIL(
                FALSE, "VarnekPGL_StartTimer. Linux Timer Creation FAIL. errCode = [%d]!", result);
        }
        info->bTimerCreated = true;
    }
    if (info->bAwaited && !OweLastStart(timer, info)) {
        return FALSE;
    }
    const int result = SetTime(info->timerId, Milliseconds(timeout));
    if (result != 0) {
        TRACE_ERROR("VarnekPGL_StartTimer. Set Timer is FAIL. errCode = [%d]!", result);
        timer_delete(info->timerId);
        info->bTimerCreated = false;
        return FALSE;
    }
    // Even if the timer expires now, its call waits for the lock and finds these values.
    info->pfnCallback = callback;
    info->pUserData = userData;
    info->bAwaited = true;
    hold.Release();
    TRACE_MID("END: VarnekPGL_StartTimer. Success!");
    return TRUE;
}

BOOL VarnekPGL_CancelTimer(uint32_t timer) {
    TRACE_LOW("START: VarnekPGL_CancelTimer. timer=[%d]", static_cast<int>(timer));
    Hold hold(gTimerArrLock);
    TIMER_MGR_INFO *info = FindTimer(timer);
    if (info == nullptr) {
        // A free slot has an empty name, and an invalid handle has none.
        return VARNEK_FAIL(FALSE, "VarnekPGL_CancelTimer. Invalid Timer Handle=[%d]..name = %s",
                           static_cast<int>(timer), "");
    }
    if (!info->bTimerCreated) {
        return VARNEK_FAIL(FALSE,
                           "VarnekPGL_CancelTimer. Timer(%s) hasn't been started! timer=[%d]!",
                           info->szTmName, static_cast<int>(timer));
    }
    bool armed = false;
    const int result = ReadArmed(*info, &armed);
    if (result != 0) {
        return VARNEK_FAIL(FALSE, "VarnekPGL_CancelTimer. Get Timer info FAIL. %s : errCode = [%d]",
                           info->szTmName, result);
    }
    if (!armed) {
        TRACE_ERROR("VarnekPGL_CancelTimer. This timer(%s) is disarmed currently", info->szTmName);
    } else if (SetTime(info->timerId, timespec{}) != 0) {
        const int error = VarnekPGL_SysGetLastErro();
        return VARNEK_FAIL(FALSE, "VarnekPGL_CancelTimer. Set Timer FAIL. errCode = [%d][%s]",
                           error, ErrorText(error));
    } else {
        info->bAwaited = false;
    }
    hold.Release();
    TRACE_MID("END: VarnekPGL_CancelTimer. timer=[%d]", static_cast<int>(timer));
    return TRUE;
}

BOOL VarnekPGL_DeleteTimer(uint32_t timer) {
    TRACE_LOW("START: VarnekPGL_DeleteTimer. timer=[%d]", static_cast<int>(timer));
    Hold hold(gTimerArrLock);
    TIMER_MGR_INFO *info = FindTimer(timer);
    if (info == nullptr) {
        return VARNEK_FAIL(FALSE, "VarnekPGL_DeleteTimer. Invalid Timer Handle=[%d]!",
                           static_cast<int>(timer));
    }
    const int result = (info->bTimerCreated ? timer_delete(info->timerId) : 0) |
                       (info->isOwedTimerCreated ? timer_delete(info->owedTimerId) : 0);
    if (result != 0) {
        TRACE_ERROR("VarnekPGL_DeleteTimer. Delete Timer is FAIL. errCode = [%d]!", result);
    }
    Clear(info);
    gTimerArrSize--;
    hold.Release();
    TRACE_MID("END: VarnekPGL_DeleteTimer.");
    return TRUE;
}

int32_t VarnekPGL_GetTimerByName(const char *szTmName) {
    if (szTmName == nullptr) {
        return VARNEK_FAIL(-1, "VarnekPGL_GetTimerByName: Timer Name is NULL!");
    }
    const Hold hold(gTimerArrLock);
    return FindName(szTmName);
}

BOOL VarnekPGL_IsTimerActive(uint32_t timer) {
    Hold hold(gTimerArrLock);
    const TIMER_MGR_INFO *info = FindTimer(timer);
    if (info == nullptr) {
        hold.Release();
        return VARNEK_FAIL(FALSE, "VarnekPGL_IsTimerActive. Invalid Timer Handle=[%d]!",
                           static_cast<int>(timer));
    }
    if (!info->bTimerCreated) {
        return FALSE;
    }
    bool armed = false;
    const int result = ReadArmed(*info, &armed);
    hold.Release();
    if (result != 0) {
        return VARNEK_FAIL(FALSE, "VarnekPGL_IsTimerActive. Get Timer info FAIL. errCode = [%d]!",
                           result);
    }
    return armed ? TRUE : FALSE;
}

void VarnekPGL_MSleep(int32_t msec) {
    const timespec time = Milliseconds(msec);
    nanosleep(&time, nullptr);
}

// Sleeps for seconds, although the name suggests microseconds. Callers rely on it.
void VarnekPGL_USleep(uint32_t seconds) {
    const timespec time = Milliseconds(int64_t{seconds} * 1000);
    nanosleep(&time, nullptr);
}

void VarnekPGL_DestoryTimerSystem() {}
