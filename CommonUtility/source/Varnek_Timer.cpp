// The timer service: one POSIX timer a slot, made at the first start and kept until the deletion.
// Every access to the table, the OS calls for a slot included, is under one lock, which is never
// held while a callback runs.
#include "Varnek_Timer.h"

#include <signal.h>
#include <time.h>

#include "Varnek_Lock.h"
#include "Varnek_Support.h"
#include "Varnek_Trace.h"

namespace {

constexpr int MAX_TIMER_MGR_INFO_ARR_SIZE = 32;
constexpr size_t kTimerNameSize = 41;  // with the terminator

struct TIMER_MGR_INFO {
    bool bUsed;
    timer_t timerId;  // while bTimerCreated
    char szTmName[kTimerNameSize];
    TimerCallbackFunc pfnCallback;  // null until the first start
    void *pUserData;
    bool bTimerCreated;
    bool bAwaited;  // the last start has not called back yet
};

Lock gTimerArrLock;
TIMER_MGR_INFO gTimerArr[MAX_TIMER_MGR_INFO_ARR_SIZE] VARNEK_GUARDED_BY(gTimerArrLock);
int32_t gTimerArrSize VARNEK_GUARDED_BY(gTimerArrLock) = 0;

// The record of a timer in use, null for an unknown handle.
TIMER_MGR_INFO *FindTimer(uint32_t timer) VARNEK_REQUIRES(gTimerArrLock) {
    return timer < MAX_TIMER_MGR_INFO_ARR_SIZE && gTimerArr[timer].bUsed ? &gTimerArr[timer]
                                                                         : nullptr;
}

// The handle of the timer in use under this name, -1 for none.
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

// Reads whether the OS timer has time left. Returns the call's result.
int ReadArmed(const TIMER_MGR_INFO &info, bool *armed) {
    itimerspec left = {};
    const int result = timer_gettime(info.timerId, &left);
    *armed = left.it_value.tv_sec > 0 || left.it_value.tv_nsec > 0;
    return result;
}

// Arms the OS timer once, or disarms it with a time of 0. Returns the call's result.
int SetTime(const TIMER_MGR_INFO &info, uint32_t timeout) {
    itimerspec time = {};
    time.it_value = Milliseconds(timeout);
    return timer_settime(info.timerId, 0, &time, nullptr);
}

// Runs on a thread of the OS timer service at each expiry.
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
    // A late delivery of an earlier start finds the timer armed or called off, or takes the place
    // of the last start's own delivery, which then finds nobody waiting for it: at most one call a
    // start, and never early.
    bool armed = false;
    if (!info->bAwaited || (info->bTimerCreated && ReadArmed(*info, &armed) == 0 && armed)) {
        return;
    }
    info->bAwaited = false;
    const TimerCallbackFunc pfnCallback = info->pfnCallback;
    void *pUserData = info->pUserData;
    hold.Release();
    pfnCallback(timer, pUserData);
}

// Makes the OS timer of a slot. Returns the call's result.
int MakeTimer(uint32_t timer, timer_t *timerId) {
    sigevent event = {};
    event.sigev_notify = SIGEV_THREAD;
    event.sigev_value.sival_int = static_cast<int>(timer);
    event.sigev_notify_function = TimerCallbackEntry;
    return timer_create(CLOCK_REALTIME, &event, timerId);
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
    const int result = SetTime(*info, timeout);
    if (result != 0) {
        TRACE_ERROR("VarnekPGL_StartTimer. Set Timer is FAIL. errCode = [%d]!", result);
        timer_delete(info->timerId);
        info->bTimerCreated = false;
        return FALSE;
    }
    // An expiry in between waits for the lock and then finds these.
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
        // A free slot's name is empty, and no other handle has a name.
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
    } else if (SetTime(*info, 0) != 0) {
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
    if (info->bTimerCreated) {
        const int result = timer_delete(info->timerId);
        if (result != 0) {
            TRACE_ERROR("VarnekPGL_DeleteTimer. Delete Timer is FAIL. errCode = [%d]!", result);
        }
    }
    *info = {};
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
    const Hold hold(gTimerArrLock);
    const TIMER_MGR_INFO *info = FindTimer(timer);
    if (info == nullptr) {
        return VARNEK_FAIL(FALSE, "VarnekPGL_IsTimerActive. Invalid Timer Handle=[%d]!",
                           static_cast<int>(timer));
    }
    if (!info->bTimerCreated) {
        return FALSE;
    }
    bool armed = false;
    const int result = ReadArmed(*info, &armed);
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

// Counts seconds under a name that says otherwise; that is so on purpose, its callers rely on it.
void VarnekPGL_USleep(uint32_t seconds) {
    const timespec time = Milliseconds(int64_t{seconds} * 1000);
    nanosleep(&time, nullptr);
}

void VarnekPGL_DestoryTimerSystem() {}
