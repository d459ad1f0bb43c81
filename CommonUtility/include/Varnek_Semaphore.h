/// @file
/// Named mutexes and named counting semaphores. A process has at most 40 of each.
///
/// Handles start at 1, rise by one with every creation and are never reused; mutexes and semaphores
/// count separately. Names have 1 to 31 characters and compare exactly. They are unique, unless two
/// threads create objects of one name at the same time. Thread-safe; no call is needed to set up
/// the tables. A failure is traced at Error. A time-out, and a lookup that does not find its name,
/// are not failures and are not traced. Mutexes and semaphores have 2147483647 handles each; when
/// these are used up, every creation fails.
/// @see [Guide: mutexes and semaphores](docs/guide/mutexes-and-semaphores.md)
#ifndef VARNEK_SEMAPHORE_H
#define VARNEK_SEMAPHORE_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

/// @name Mutexes
/// Mutexes are not recursive. Whoever acquires one sees all that its last holder did. Delete a
/// mutex only when no thread can still acquire or release it. The names "VarnekThreadMutex" and
/// "VarnekRingBuf" with a number are reserved for the library.
/// @{

/// Creates a mutex. A live mutex of this name is deleted first. If a thread holds that mutex, it
/// stays, and the creation fails.
/// @return the handle; -1 for a bad name, a full table or a failing OS call
VARNEK_API int32_t VarnekPGL_CreateMutex(const char *szMutexName);

/// Deletes a mutex that no thread holds.
/// @return TRUE when the mutex is deleted; FALSE for an unknown handle or a mutex that is held
VARNEK_API BOOL VarnekPGL_DeleteMutex(int32_t hMutex);

/// Waits without limit until the calling thread holds the mutex. Traces nothing on success.
/// @return TRUE once it is held; FALSE for an unknown handle or a failing OS call
VARNEK_API BOOL VarnekPGL_AcquireMutex(int32_t hMutex);

/// Releases the mutex that the calling thread holds. Traces nothing on success.
/// @return TRUE; FALSE for an unknown handle or a failing OS call
VARNEK_API BOOL VarnekPGL_ReleaseMutex(int32_t hMutex);

/// Finds a mutex. Traces nothing.
/// @return the handle of the live mutex of this name; -1 for none and for null
VARNEK_API int32_t VarnekPGL_GetMutexByName(const char *szMutexName);
/// @}
/// @name Semaphores
/// Whoever takes a unit sees all that its signaller did before. Delete a semaphore only when no
/// thread waits on it or can still use it.
/// @{

/// Creates a semaphore. A live semaphore of this name is deleted first, even when `count` is
/// invalid.
/// @param szSemName  1 to 31 characters
/// @param count      initial units, at most the maximum of the system's semaphores
/// @return the handle; -1 for a bad name, a full table or a failing OS call
VARNEK_API int32_t VarnekPGL_CreateSemaphore(const char *szSemName, uint32_t count);

/// Deletes a semaphore.
/// @return TRUE, even when the OS call fails; FALSE for an unknown handle
VARNEK_API BOOL VarnekPGL_DeleteSemaphore(int32_t hSem);

/// Takes one unit, waiting up to `timeout`.
/// @param hSem     handle of a live semaphore
/// @param timeout  milliseconds on the wall clock, or WAIT_FOREVER; 0 does not wait
/// @return TRUE when a unit was taken; FALSE on a time-out and on a failure. A wait that a POSIX
///         signal interrupts fails and is not resumed
/// @par Traces
/// Low on entry, and after an unlimited wait; Error for an unknown handle or a failing OS wait; a
/// time-out adds no line
VARNEK_API BOOL VarnekPGL_WaitSemaphore(int32_t hSem, uint32_t timeout);

/// Adds one unit, which wakes one waiter.
/// @return TRUE; FALSE for an unknown handle or a failing OS call
VARNEK_API BOOL VarnekPGL_SignalSemaphore(int32_t hSem);

/// Finds a semaphore. Traces nothing.
/// @return the handle of the live semaphore of this name; -1 for none and for null
VARNEK_API int32_t VarnekPGL_SemaphoreByName(const char *szSemName);
/// @}

#ifdef __cplusplus
}
#endif

#endif
