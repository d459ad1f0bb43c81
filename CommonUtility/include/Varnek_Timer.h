/// @file
/// Named one-shot timers with a callback, and functions that sleep.
///
/// A process has at most 32 timers. A handle is the index of a slot, 0 to 31, and is reused once
/// the timer is deleted. Names have 0 to 40 characters, are case-sensitive and unique. All calls
/// are thread-safe, even from a callback. Failures are traced at Error; a lookup that finds nothing
/// is not one.
/// @see [Guide: timers](docs/guide/timers.md)
#ifndef VARNEK_TIMER_H
#define VARNEK_TIMER_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

/// The callback of a timer. It runs on a thread of the OS timer service, with no lock held, maybe
/// at the same time as other callbacks, even of the same timer, and sees all that the starting
/// thread did before. It may use the timer and start it again. Once the timer has expired, the
/// callback may begin even after the timer is cancelled or deleted, so `pUserData` should be a
/// number, a handle, or memory that outlives the timer.
typedef void (*TimerCallbackFunc)(uint32_t hTimer, void *pUserData);

/// Creates a timer in the lowest free slot. The first start creates the OS timer.
/// @return the handle; -1 for null, a name that is too long or in use, or a full table
VARNEK_API int32_t VarnekPGL_CreateTimer(const char *szTmName);

/// Arms the timer for one expiry. Unless it is cancelled before that or deleted before the callback
/// begins, `callback` runs exactly once for each successful call, with the `userData` of that call:
/// never early, and as promptly as the system delivers an expiry, even if the timer has been
/// started again meanwhile. If the system cannot create a thread for an expiry, no log line says
/// so, and the callback does not run until the timer is started again.
/// @param timer     handle from VarnekPGL_CreateTimer
/// @param timeout   milliseconds from now, 1 or more; setting the wall clock does not change it
/// @param callback  called once at the expiry
/// @param userData  passed to `callback` unchanged
/// @return TRUE when armed; FALSE for an unknown handle, an armed timer, a null callback, a time of
///         0, a failing OS call, and if an earlier start has expired without calling back yet and
///         memory or OS timers run out
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

/// Says whether a timer is armed; FALSE for an unknown handle.
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
