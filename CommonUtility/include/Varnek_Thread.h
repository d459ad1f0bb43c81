// The registry of named threads, and the message queue that each of them owns.
//
// A thread is a detached OS thread; the registry keeps the record through which it is known and
// reached, and never stops, joins or cancels it. A thread must not be cancelled inside a call of
// this library. 20 records; names have 1 to 31 characters, compare exactly and are unique, unless
// two threads create one at the same moment. Any thread may call any operation. A failure is traced
// at Error; a name that is not found is no failure. The named mutex "VarnekThreadMutex" is the
// registry's own.
#ifndef VARNEK_THREAD_H
#define VARNEK_THREAD_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

// Threads ----------------------------------------------------------------------------------------

// Starts a thread. Its record is visible before `function` runs, and the first 15 characters of its
// name are the thread's name in the system. A record of this name is removed first, whatever the
// other arguments are, and its unread messages are freed; that thread runs on without a record.
//   szThreadName  1 to 31 characters
//   priority      1 to 99, kept for the scheduler's policy, which is the ordinary one
//   stackSize     bytes; what the system refuses gives its default size
//   function      runs in the new thread; its result is dropped
//   argument      handed to `function` unchanged
//   returns       the handle, never given out twice; -1 on failure, and for good after 2147483647
//                 creations
VARNEK_API int32_t VarnekPGL_CreateThread(const char *szThreadName, int32_t priority,
                                          uint32_t stackSize, void *(*function)(void *),
                                          void *argument);

// Removes a thread's record and frees its unread messages: what they point to is not freed. Other
// creations and deletions wait meanwhile (0.26 s for ten million messages on a PC). The thread runs
// on; if it waits in a receive, that returns FALSE.
//   returns  TRUE, or FALSE for an unknown handle
VARNEK_API BOOL VarnekPGL_DeleteThread(int32_t hThread);

// Finds a thread.
//   returns  the handle of the thread of this name; -1 for none and for null
VARNEK_API int32_t VarnekPGL_GetThreadByName(const char *szThreadName);

// Tells which thread of the registry the calling thread is.
//   returns  the calling thread's handle; -1, after an Error line, when the registry has not
//   started
//            it (as for main and timer callbacks) or its record has been removed
VARNEK_API int32_t VarnekPGL_GetCurrentThread(void);

// Messages ---------------------------------------------------------------------------------------
// A message is copied in and copied out. A queue is bounded only by memory. What one thread sends
// with VarnekPGL_SendMessage is received in that order.

// One message of 40 bytes, aligned to 8, so that modules may lay a record of their own over it.
// What is in it is up to the modules that communicate; the library copies it as bytes, from and to
// any address.
typedef struct THREAD_MSG {
    unsigned char data[40];
} __attribute__((aligned(8))) THREAD_MSG;

// Appends a message to a thread's queue.
//   returns  TRUE when it is queued and its reader signalled; FALSE for an unknown handle, a null
//            message, too little memory, or a failing OS call (the message stays queued then)
VARNEK_API BOOL VarnekPGL_SendMessage(int32_t hThread, const THREAD_MSG *message);

// Puts a message in front of everything that is queued now, earlier urgent messages included.
// Results are those of VarnekPGL_SendMessage.
VARNEK_API BOOL VarnekPGL_SendUrgentMessage(int32_t hThread, const THREAD_MSG *message);

// Takes the first message of the calling thread's queue, waiting up to `timeout` for one.
//   timeout  milliseconds on the wall clock, or WAIT_FOREVER; 0 does not wait
//   message  out: the message
//   count    out: the messages left
//   returns  TRUE; FALSE, and nothing written, on a time-out, an interrupted wait, for a thread
//            without a record or whose record is removed meanwhile, and for null pointers
VARNEK_API BOOL VarnekPGL_ReceiveMessage(uint32_t timeout, THREAD_MSG *message, int32_t *count);

// Takes the first message without waiting. It leaves the queue's count of signals as it is: for
// each message that was peeked, one later receive returns FALSE at once.
//   returns  TRUE; FALSE, and nothing written, when there is none
VARNEK_API BOOL VarnekPGL_PeekMessage(THREAD_MSG *message, int32_t *count);

#ifdef __cplusplus
}
#endif

#endif
