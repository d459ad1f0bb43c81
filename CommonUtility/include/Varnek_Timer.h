// Named one-shot timers that call their owner back, and sleeps.
//
// 32 timers; a handle is the slot's index, 0 to 31, and comes back after a deletion. Names have 0
// to 40 characters, compare exactly and are unique. A timer is created, then started and cancelled
// any number of times, then deleted. Any thread may call any operation, a callback included. A
// failure is traced at Error; a name that is not found is no failure.
#ifndef VARNEK_TIMER_H
#define VARNEK_TIMER_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

// What a timer calls. Runs on a thread of the OS timer service, with no lock held; callbacks may
// run at once, those of one timer included, or one after the other. A callback may use its own
// timer, start it again included. It may begin after its timer has been cancelled or deleted, when
// the expiry came first: `pUserData` should be a number, a handle, or memory that outlives the
// timer.
typedef void (*TimerCallbackFunc)(uint32_t hTimer, void *pUserData);

// Takes the lowest free slot; no OS timer exists before the first start.
//   returns  the handle; -1 for null, a name that is too long or in use, or a full table
VARNEK_API int32_t VarnekPGL_CreateTimer(const char *szTmName);

// Arms the timer once. A start that succeeds and is neither cancelled nor deleted in time calls
// back exactly once, with its own `callback` and `userData`, never before its time and at worst
// late: an expiry that the system has not delivered when the timer is started again is not lost.
// When the system can make no thread for an expiry, nothing is logged, and the call comes with the
// timer's next expiry; so it does when a later start takes the undelivered expiry along and fails.
//   timer     handle from VarnekPGL_CreateTimer
//   timeout   milliseconds from now, 1 or more; a step of the wall clock does not move it
//   callback  called once at the expiry
//   userData  handed to `callback` unchanged
//   returns   TRUE when armed; FALSE for an unknown handle, an armed timer, a null callback, a time
//             of 0, a failing OS call or, while an earlier expiry is not delivered yet, too little
//             memory
VARNEK_API BOOL VarnekPGL_StartTimer(uint32_t timer, uint32_t timeout, TimerCallbackFunc callback,
                                     void *userData);

// Disarms the timer: the last start does not call back unless it has expired by now. An expiry of
// an earlier start that is not delivered yet still calls back.
//   returns  TRUE when it is disarmed now, with an Error line when it was already; FALSE for an
//            unknown handle, a timer never started or a failing OS call
VARNEK_API BOOL VarnekPGL_CancelTimer(uint32_t timer);

// Frees the slot and disarms the timer. A callback of an expiry at the same moment may begin after
// the return; expiries that are not delivered yet are dropped.
//   returns  TRUE, whatever the OS says; FALSE for an unknown handle
VARNEK_API BOOL VarnekPGL_DeleteTimer(uint32_t timer);

// Finds a timer.
//   returns  the handle of the timer of this name; -1 for none and, after an Error line, for null
VARNEK_API int32_t VarnekPGL_GetTimerByName(const char *szTmName);

// Whether a timer is armed.
//   returns  TRUE while the timer is armed; FALSE otherwise and for an unknown handle
VARNEK_API BOOL VarnekPGL_IsTimerActive(uint32_t timer);

// Sleeps for milliseconds. A signal ends the sleep early; a negative time returns at once.
VARNEK_API void VarnekPGL_MSleep(int32_t msec);

// Sleeps for whole seconds, whatever the name says. A signal ends the sleep early.
VARNEK_API void VarnekPGL_USleep(uint32_t seconds);

// Does nothing; the timers live as long as the process.
VARNEK_API void VarnekPGL_DestoryTimerSystem(void);

#ifdef __cplusplus
}
#endif

#endif
