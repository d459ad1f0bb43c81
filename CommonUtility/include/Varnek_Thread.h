// The registry of named threads. Each thread has a message queue.
//
// Each thread is a detached OS thread. The registry keeps a record of it, so that other threads can
// find it and send messages to it. The registry never stops, joins or cancels a thread. A thread
// must not be cancelled inside a call of this library. The registry has room for 20 records. Names
// have 1 to 31 characters and compare exactly. They are unique, unless two threads create threads
// of one name at the same time. Thread-safe. A failure is traced at Error; a lookup that does not
// find its name is not a failure. The named mutex "VarnekThreadMutex" is reserved for the registry.
#ifndef VARNEK_THREAD_H
#define VARNEK_THREAD_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

// Threads ----------------------------------------------------------------------------------------

// Starts a thread. Its record is visible before `function` runs. The first 15 characters of its
// name are the thread's name in the system. An existing record of this name is removed first, even
// when the other arguments are invalid, and its unread messages are freed; the thread of that
// record runs on without one.
//   szThreadName  1 to 31 characters
//   priority      1 to 99; it has no effect, since threads use the ordinary scheduling policy
//   stackSize     bytes; a size that the system refuses is replaced by the default size. A thread
//                 that calls this library needs at least 12 KiB, of which some systems use one page
//                 as a guard
//   function      runs in the new thread; its result is ignored
//   argument      passed to `function` unchanged
//   returns       the handle, which is never reused; -1 on failure, and always after 2147483647
//                 creations
VARNEK_API int32_t VarnekPGL_CreateThread(const char *szThreadName, int32_t priority,
                                          uint32_t stackSize, void *(*function)(void *),
                                          void *argument);

// Removes a thread's record and frees its unread messages, but not the memory that they point to.
// If there are any, an Error line gives their number. This takes 0.26 s for ten million messages on
// a PC; no other operation waits for it. The thread runs on; if it waits in a receive, the receive
// returns FALSE.
//   returns  TRUE, or FALSE for an unknown handle
VARNEK_API BOOL VarnekPGL_DeleteThread(int32_t hThread);

// Finds a thread.
//   returns  the handle of the thread of this name; -1 for none and for null
VARNEK_API int32_t VarnekPGL_GetThreadByName(const char *szThreadName);

// Returns the handle of the calling thread.
//   returns  the calling thread's handle; -1, after an Error line, in a thread that the registry
//            has not started (such as main or a timer callback) or whose record has been removed
VARNEK_API int32_t VarnekPGL_GetCurrentThread(void);

// Messages ---------------------------------------------------------------------------------------
// A message is copied in and copied out. Only memory limits the length of a queue. Messages that
// one thread sends with VarnekPGL_SendMessage are received in the order of sending.

// One message of 40 bytes. It is aligned to 8 bytes, so that modules may overlay it with their own
// struct. The modules that communicate define its content; the library copies it as bytes, from and
// to any address.
typedef struct THREAD_MSG {
    unsigned char data[40];  // defined by the modules
} __attribute__((aligned(8))) THREAD_MSG;

// Appends a message to a thread's queue.
//   returns  TRUE when the message is queued and its reader signalled; FALSE for an unknown handle,
//            a null message or too little memory, and when the reader cannot be signalled (then the
//            message stays queued)
VARNEK_API BOOL VarnekPGL_SendMessage(int32_t hThread, const THREAD_MSG *message);

// Puts a message in front of all queued messages, earlier urgent messages included.
//   returns  TRUE or FALSE, as VarnekPGL_SendMessage does
VARNEK_API BOOL VarnekPGL_SendUrgentMessage(int32_t hThread, const THREAD_MSG *message);

// Takes the first message of the calling thread's queue, waiting up to `timeout` for one.
//   timeout  milliseconds on the wall clock, or WAIT_FOREVER; 0 does not wait
//   message  out: the message
//   count    out: the number of messages left
//   returns  TRUE; FALSE, after an Error line and with `message` and `count` unchanged, on a
//            time-out or an interrupted wait, when the thread has no record or the record is
//            removed during the wait, once for each message that was peeked, and for null pointers
VARNEK_API BOOL VarnekPGL_ReceiveMessage(uint32_t timeout, THREAD_MSG *message, int32_t *count);

// Takes the first message without waiting. The message is removed from the queue but stays counted,
// so for each message that was peeked, one later receive returns FALSE at once.
//   returns  TRUE; FALSE, after an Error line and with `message` and `count` unchanged, when there
//            is none, when the thread has no record, and for null pointers
VARNEK_API BOOL VarnekPGL_PeekMessage(THREAD_MSG *message, int32_t *count);

#ifdef __cplusplus
}
#endif

#endif
