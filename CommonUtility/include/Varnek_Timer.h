/// @file
/// Named one-shot timers with a callback, and functions that sleep.
///
/// A process has at most 32 timers. A handle is the index of a slot, 0 to 31, and is reused after a
/// deletion. Names have 0 to 40 characters, compare exactly and are unique. A timer is created,
/// then started and cancelled any number of times, then deleted. Thread-safe, also for calls from a
/// callback. A failure is traced at Error; a lookup that does not find its name is not a failure.
/// @see [Guide: timers](docs/guide/timers.md)
#ifndef VARNEK_TIMER_H
#define VARNEK_TIMER_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

/// The callback of a timer. It runs on a thread of the OS timer service, with no lock held. Several
/// callbacks may run at the same time, even several of one timer. A callback may use its own timer,
/// and may start it again. If the timer expires before it is cancelled or deleted, its callback may
/// begin after the cancellation or deletion. So `pUserData` should be a number, a handle, or memory
/// that outlives the timer.
typedef void (*TimerCallbackFunc)(uint32_t hTimer, void *pUserData);

/// Creates a timer in the lowest free slot. The first start creates the OS timer.
/// @return the handle; -1 for null, a name that is too long or in use, or a full table
VARNEK_API int32_t VarnekPGL_CreateTimer(const char *szTmName);

/// Arms the timer for one expiry. If the start succeeds, and the timer is neither cancelled before
/// the expiry nor deleted before the callback begins, the start calls back exactly once, with its
/// own `callback` and `userData`. The callback may come late but never early. It is not lost when
/// the timer is started again before the system delivers the expiry. In two cases the callback is
/// delayed until the timer's next expiry: when the system cannot create a thread for the expiry,
/// which writes no log line, and when a later start fails and thereby discards the expiry.
/// @param timer     handle from VarnekPGL_CreateTimer
/// @param timeout   milliseconds from now, 1 or more; setting the wall clock does not change it
/// @param callback  called once at the expiry
/// @param userData  passed to `callback` unchanged
/// @return TRUE when armed; FALSE for an unknown handle, an armed timer, a null callback, a time of
///         0, a failing OS call, and when an earlier expiry is not delivered yet and there is no
///         memory to remember it
VARNEK_API BOOL VarnekPGL_StartTimer(uint32_t timer, uint32_t timeout, TimerCallbackFunc callback,
                                     void *userData);

/// Disarms the timer: the last start does not call back unless it has expired already. If an
/// earlier start has expired but not called back yet, its callback still runs.
/// @return TRUE when the timer is disarmed, with an Error line if it was disarmed before the call;
///         FALSE for an unknown handle, a timer that was never started or a failing OS call
VARNEK_API BOOL VarnekPGL_CancelTimer(uint32_t timer);

/// Frees the slot and disarms the timer. Expiries that are not delivered yet are dropped; the
/// callback of an expiry that is being delivered may begin after the return.
/// @return TRUE, even when an OS call fails; FALSE for an unknown handle
VARNEK_API BOOL VarnekPGL_DeleteTimer(uint32_t timer);

/// Finds a timer.
/// @return the handle of the timer of this name; -1 for none and, after an Error line, for null
VARNEK_API int32_t VarnekPGL_GetTimerByName(const char *szTmName);

/// Checks whether a timer is armed.
/// @return TRUE while the timer is armed; FALSE otherwise and for an unknown handle
VARNEK_API BOOL VarnekPGL_IsTimerActive(uint32_t timer);

/// Sleeps for milliseconds. A signal ends the sleep early; a negative time returns at once.
VARNEK_API void VarnekPGL_MSleep(int32_t msec);

/// Sleeps for whole seconds, in spite of its name. A signal ends the sleep early.
VARNEK_API void VarnekPGL_USleep(uint32_t seconds);

/// Does nothing: the timers live as long as the process.
VARNEK_API void VarnekPGL_DestoryTimerSystem(void);

#ifdef __cplusplus
}
#endif

#endif
