/// @file
/// Named threads, at most 20 in a process, each with a message queue.
///
/// The registry keeps a record of each thread so that others can find it and send it messages. The
/// threads are detached; the registry never stops, joins or cancels one, and none may be cancelled
/// inside a call of this library. Names have 1 to 31 characters, are case-sensitive and are unique,
/// unless two threads create threads of one name at the same time. All calls are thread-safe.
/// Failures are traced at Error; a lookup that finds nothing is not one.
/// @see [Guide: threads and messages](docs/guide/threads-and-messages.md)
#ifndef VARNEK_THREAD_H
#define VARNEK_THREAD_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

/// @name Threads
/// @{

/// Starts a thread; its record is visible before `function` runs. A record that already has this
/// name is removed first, as VarnekPGL_DeleteThread does, even if the other arguments are invalid;
/// here, though, the line that counts its unread messages has the level Low.
/// @param szThreadName  1 to 31 characters; the system shows the first 15
/// @param priority      1 to 99; has no effect, because threads use the ordinary scheduling policy
/// @param stackSize     bytes; the default replaces a size that the system refuses. A thread that
///                      calls this library needs at least 12 KiB, of which some systems take one
///                      page as a guard
/// @param function      runs in the new thread, and sees all that the caller did before; its result
///                      is ignored
/// @param argument      passed to `function` unchanged
/// @return the handle, which is never reused; -1 on failure, and always after 2147483647 creations
VARNEK_API int32_t VarnekPGL_CreateThread(const char *szThreadName, int32_t priority,
                                          uint32_t stackSize, void *(*function)(void *),
                                          void *argument);

/// Removes a thread's record and frees its unread messages, but not the memory they point to; if
/// there are any, an Error line counts them. No other operation waits while they are freed. The
/// thread runs on; if it is waiting to receive, it gets FALSE.
/// @return TRUE, or FALSE for an unknown handle
VARNEK_API BOOL VarnekPGL_DeleteThread(int32_t hThread);

/// Finds a thread.
/// @return the handle of the thread of this name; -1 if there is none, and for null
VARNEK_API int32_t VarnekPGL_GetThreadByName(const char *szThreadName);

/// Finds the calling thread.
/// @return its handle; -1, after an Error line, if the registry did not start it (main, a timer
///         callback), its record has been removed, or it has reached a late round of destructors
///         of thread-specific data
VARNEK_API int32_t VarnekPGL_GetCurrentThread(void);
/// @}
/// @name Messages
/// Messages are copied in and out. Only memory limits the length of a queue. What one thread sends
/// with VarnekPGL_SendMessage arrives in order, and whoever takes a message sees all that its
/// sender did before.
/// @{

/// A message of 40 bytes, whose content the modules agree on. The alignment lets them overlay it
/// with a struct of their own; the library copies it as bytes, from and to any address.
typedef struct THREAD_MSG {
    unsigned char data[40];  ///< defined by the modules
} __attribute__((aligned(8))) THREAD_MSG;

/// Appends a message to a thread's queue. This also succeeds after the thread's function has
/// returned: nobody empties the queue then, so it grows until the record is deleted.
/// @return TRUE once the message is queued and its reader signalled; FALSE for an unknown handle, a
///         null message or too little memory, and if the reader cannot be signalled (the message
///         then stays queued)
VARNEK_API BOOL VarnekPGL_SendMessage(int32_t hThread, const THREAD_MSG *message);

/// Puts a message in front of all queued ones, earlier urgent messages included.
/// @return as VarnekPGL_SendMessage
VARNEK_API BOOL VarnekPGL_SendUrgentMessage(int32_t hThread, const THREAD_MSG *message);

/// Takes the first message of the calling thread's queue, waiting for one if need be.
/// @param timeout       milliseconds by the wall clock, or WAIT_FOREVER; 0 does not wait
/// @param[out] message  the message
/// @param[out] count    the number of messages left
/// @return TRUE, even if a message comes just as the wait ends; FALSE, after an Error line and with
///         `message` and `count` unchanged, if time ran out (errno ETIMEDOUT), a signal ended the
///         wait (EINTR), the thread has no record or lost it meanwhile, or a pointer is null, and
///         once for each message that was peeked
/// @par Traces
/// If a message is there, it is taken before the last two Low lines are written, so a log function
/// that receives while it writes them gets the next message.
VARNEK_API BOOL VarnekPGL_ReceiveMessage(uint32_t timeout, THREAD_MSG *message, int32_t *count);

/// Takes the first message without waiting. The message leaves the queue but stays counted, so each
/// peek makes one later receive return FALSE at once.
/// @return TRUE; FALSE, after an Error line and with `message` and `count` unchanged, if there is
///         no message, the thread has no record or a pointer is null
VARNEK_API BOOL VarnekPGL_PeekMessage(THREAD_MSG *message, int32_t *count);
/// @}

#ifdef __cplusplus
}
#endif

#endif
