/// @file
/// Named mutexes and named counting semaphores, at most 40 of each in a process.
///
/// Each family hands out the handles 1 to 2147483647 in order, never the same one twice, and
/// creates nothing after the last. Names have 1 to 31 characters, are case-sensitive and are
/// unique, unless two threads create objects of one name at the same time. All calls are
/// thread-safe. Failures are traced at Error, but a time-out is not, and looking up a name traces
/// nothing.
/// @see [Guide: mutexes and semaphores](docs/guide/mutexes-and-semaphores.md)
#ifndef VARNEK_SEMAPHORE_H
#define VARNEK_SEMAPHORE_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

/// @name Mutexes
/// Mutexes are not recursive. Whoever acquires one sees all that its last holder did. Delete one
/// only when no thread can still acquire or release it. The names "VarnekThreadMutex" and
/// "VarnekRingBuf" with a number are the library's own.
/// @{

/// Creates a mutex, deleting a live one of this name first. If a thread holds that one, it stays,
/// and nothing is created.
/// @return the handle; -1 for a bad name, a full table or a failing OS call
VARNEK_API int32_t VarnekPGL_CreateMutex(const char *szMutexName);

/// Deletes a mutex.
/// @return TRUE; FALSE for an unknown handle or a mutex that some thread holds
VARNEK_API BOOL VarnekPGL_DeleteMutex(int32_t hMutex);

/// Waits without limit until the calling thread holds the mutex. Traces nothing on success.
/// @return TRUE once it is held; FALSE for an unknown handle or a failing OS call
VARNEK_API BOOL VarnekPGL_AcquireMutex(int32_t hMutex);

/// Releases the mutex that the calling thread holds. Traces nothing on success.
/// @return TRUE; FALSE for an unknown handle or a failing OS call
VARNEK_API BOOL VarnekPGL_ReleaseMutex(int32_t hMutex);

/// Finds the live mutex of this name; -1 if there is none, and for null.
VARNEK_API int32_t VarnekPGL_GetMutexByName(const char *szMutexName);
/// @}
/// @name Semaphores
/// Whoever takes a unit sees all that its signaller did before. Delete a semaphore only when no
/// thread waits on it or can still use it.
/// @{

/// Creates a semaphore, deleting a live one of this name first, even if `count` is invalid.
/// @param szSemName  1 to 31 characters
/// @param count      initial units, at most the maximum of the system's semaphores
/// @return the handle; -1 for a bad name, a full table or a failing OS call
VARNEK_API int32_t VarnekPGL_CreateSemaphore(const char *szSemName, uint32_t count);

/// Deletes a semaphore.
/// @return TRUE, even if the OS call fails; FALSE for an unknown handle
VARNEK_API BOOL VarnekPGL_DeleteSemaphore(int32_t hSem);

/// Takes one unit, waiting for it if need be. A POSIX signal ends the wait.
/// @param hSem     a live semaphore
/// @param timeout  milliseconds by the wall clock, or WAIT_FOREVER; 0 does not wait
/// @return TRUE if a unit was taken; FALSE, with errno set (ETIMEDOUT, EINTR), if the wait failed
/// @par Traces
/// Low on entry and after waiting without limit; Error for an unknown handle or a failing wait.
VARNEK_API BOOL VarnekPGL_WaitSemaphore(int32_t hSem, uint32_t timeout);

/// Adds one unit, which wakes one waiter.
/// @return TRUE; FALSE for an unknown handle or a failing OS call
VARNEK_API BOOL VarnekPGL_SignalSemaphore(int32_t hSem);

/// Finds the live semaphore of this name; -1 if there is none, and for null.
VARNEK_API int32_t VarnekPGL_SemaphoreByName(const char *szSemName);
/// @}

#ifdef __cplusplus
}
#endif

#endif
