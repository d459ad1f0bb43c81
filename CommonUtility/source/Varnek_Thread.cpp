// The thread registry and the message queues.
//
// The registry's guard, the mutex "VarnekThreadMutex", is held while a record is created or made
// invisible. Each queue has a lock of its own. A thread that holds this lock can check whether the
// record is still there; if it is, the record's semaphore stays alive until the lock is released. A
// thread that uses the semaphore without the lock, to wait or to wake the owner, counts as a user
// of the record. The last user of a removed record disposes of it. So no thread holds a lock while
// it waits for a message. No thread takes one of these locks while it holds another.
//
// A thread starts in ThreadEntry, which waits until the record is visible. Only then does it call
// the function that the creator passed. The entry stores the handle under a thread-specific key,
// where the thread finds its own handle. A search by the thread's id could find a wrong record,
// because the system gives the id of an ended thread to a new one. The value under the key
// disappears with its thread.
#include "Varnek_Thread.h"

#include <limits.h>
#include <pthread.h>
#include <sched.h>
#include <semaphore.h>
#include <stdlib.h>

#include "Varnek_ListLink.h"
#include "Varnek_Lock.h"
#include "Varnek_Semaphore.h"
#include "Varnek_SlotTable.h"
#include "Varnek_Support.h"
#include "Varnek_Timer.h"
#include "Varnek_Trace.h"

static_assert(sizeof(THREAD_MSG) == 40 && alignof(THREAD_MSG) == 8,
              "every module of the stack counts on this size and alignment");

namespace {

constexpr int MAX_THREAD_MGR_INFO_ARR_SIZE = 20;
constexpr size_t kSystemNameSize = 16;  // of a thread's name in the system, with the terminator

struct THREAD_MGR_INFO {
    Lock queueLock;
    list_t MsgQ VARNEK_GUARDED_BY(queueLock);  // empty while the record is free
    // A unit is the permission to take one message. Each message that is sent adds one unit. If the
    // owner waits, the sender posts the unit to the semaphore. If not, it adds the unit to `units`,
    // which is faster.
    sem_t msgQSem;
    int32_t units VARNEK_GUARDED_BY(queueLock);
    uint32_t waits VARNEK_GUARDED_BY(queueLock);  // of the owner so far
    bool mustWake VARNEK_GUARDED_BY(queueLock);   // the owner waits, and no post has succeeded yet
    uint32_t users VARNEK_GUARDED_BY(queueLock);  // threads that use msgQSem without the lock
    // The name of the operation that removed the record, for the last user; null before that.
    const char *removedBy VARNEK_GUARDED_BY(queueLock);
    // True from the removal, which sets it under the guard, until the disposal.
    std::atomic<bool> isLeftover;
    pthread_t linuxThread;  // for a debugger
};

// What the creator passes to the entry of a new thread. The creator allocates it and the entry
// frees it, so the record may be removed before the thread runs.
struct Start {
    int32_t hHandle;
    void *(*function)(void *);
    void *argument;
    char systemName[kSystemNameSize];
};

constexpr int kLeaveTries = 1000;  // one per millisecond
// A thread that only peeks takes no units, so `units` needs a maximum. With this one, adding the
// posted units does not overflow.
constexpr int32_t kMostUnits = SEM_VALUE_MAX / 2;

using Threads = SlotTable<THREAD_MGR_INFO, MAX_THREAD_MGR_INFO_ARR_SIZE>;
Threads gThreadInfoArr;

// The handle of the guard "VarnekThreadMutex"; kNoGuard until the first creation of a thread
// creates it.
constexpr int32_t kNoGuard = HoldMutex::kNoMutex;
constexpr int32_t kGuardInTheMaking = -2;
std::atomic<int32_t> gThreadMutex{kNoGuard};
std::atomic<pthread_t> gGuardMaker{};  // the thread that is creating it

// One more than the key under which a registered thread finds its handle; 0 until the key exists.
std::atomic<uint32_t> gSelfKey{0};

int32_t Guard() {
    const int32_t guard = gThreadMutex.load(std::memory_order_acquire);
    return guard != kGuardInTheMaking ? guard : kNoGuard;
}

// Runs when a thread ends. The system has cleared the value by then, but the destructors of other
// keys may still call VarnekPGL_GetCurrentThread or receive messages. So the handle is stored
// again, negated, for one more round of destructors.
void KeepSelf(void *self) {
    const intptr_t hThread = reinterpret_cast<intptr_t>(self);
    if (hThread > 0) {
        pthread_setspecific(
            static_cast<pthread_key_t>(gSelfKey.load(std::memory_order_relaxed) - 1),
            reinterpret_cast<void *>(-hThread));
    }
}

// Creates the key, unless an earlier call has created it.
bool MakeSelfKey() {
    if (gSelfKey.load(std::memory_order_relaxed) != 0) {
        return true;
    }
    pthread_key_t key = 0;
    if (pthread_key_create(&key, KeepSelf) != 0) {
        return false;
    }
    gSelfKey.store(static_cast<uint32_t>(key) + 1, std::memory_order_release);
    return true;
}

// Creates the guard and the key on first use. One thread creates them while others wait, since a
// second mutex of the guard's name would destroy the first. Returns false if they cannot be
// created. It also returns false if the calling thread is already creating them, which happens when
// the log function creates a thread while it writes a line of the guard's creation. Such a call
// would wait for itself.
bool EnsureGuard() {
    for (;;) {
        int32_t guard = gThreadMutex.load(std::memory_order_acquire);
        if (guard != kNoGuard && guard != kGuardInTheMaking) {
            return true;
        }
        if (guard == kNoGuard && gThreadMutex.compare_exchange_strong(guard, kGuardInTheMaking)) {
            gGuardMaker.store(pthread_self(), std::memory_order_relaxed);
            guard = MakeSelfKey() ? VarnekPGL_CreateMutex("VarnekThreadMutex") : kNoGuard;
            gGuardMaker.store(pthread_t{}, std::memory_order_relaxed);
            gThreadMutex.store(guard, std::memory_order_release);
            return guard != kNoGuard;
        }
        if (pthread_equal(gGuardMaker.load(std::memory_order_relaxed), pthread_self())) {
            return false;
        }
        VarnekPGL_MSleep(1);  // a yield would not let a creator of lower priority run
    }
}

// Users of a record ------------------------------------------------------------------------------

// Returns the name of the operation that removed the record, if it has been removed and no user is
// left; null if not. Only one thread gets the name, either the removal itself or the last user.
// That thread has to dispose of the record.
const char *LastUseOf(THREAD_MGR_INFO &info) VARNEK_REQUIRES(info.queueLock) {
    if (info.users > 0) {
        return nullptr;
    }
    const char *const operation = info.removedBy;
    info.removedBy = nullptr;
    return operation;
}

// Destroys the semaphore of a removed record, and frees its slot. Does nothing if `operation` is
// null.
void Dispose(THREAD_MGR_INFO &info, const char *operation) {
    if (operation == nullptr) {
        return;
    }
    if (sem_destroy(&info.msgQSem) != 0) {
        TRACE_ERROR("***** %s : semaphore destroy FAIL!! errCode = [%d]", operation,
                    VarnekPGL_SysGetLastErro());
    }
    info.isLeftover.store(false, std::memory_order_release);
}

// Threads ----------------------------------------------------------------------------------------

// Removes the record of a handle. The log lines show the name `operation`; the line about unread
// messages has the mask `unreadMask`. For an unknown handle it writes a line and returns FALSE.
BOOL RemoveRecord(int32_t hThread, const char *operation, uint32_t unreadMask) {
    const int32_t guard = Guard();
    if (guard == kNoGuard) {
        VarnekPGL_AcquireMutex(guard);  // logs that the guard is missing, as the release below does
    }
    HoldMutex hold(guard);
    Threads::Slot *const slot = hold.IsHeld() ? gThreadInfoArr.Find(hThread) : nullptr;
    if (slot == nullptr) {
        TRACE_ERROR("***** %s : Can't find thread info. thread handle = [%d]", operation, hThread);
        if (guard == kNoGuard) {
            VarnekPGL_ReleaseMutex(guard);
        }
        return FALSE;
    }
    THREAD_MGR_INFO &info = slot->info;
    info.isLeftover.store(true, std::memory_order_relaxed);
    const int32_t count = gThreadInfoArr.Withdraw(slot);
    hold.Release();

    // A thread that takes the lock of the queue after this does not find the handle. If the owner
    // waits for a message, the post wakes it. If not, the post disappears with the semaphore.
    Hold queue(info.queueLock);
    const list_t unread = info.MsgQ;
    list_initialize(&info.MsgQ);
    info.units = 0;
    info.removedBy = operation;
    sem_post(&info.msgQSem);
    const char *const lastUse = LastUseOf(info);
    queue.Release();
    Dispose(info, lastUse);

    if (unread.count > 0) {
        VARNEK_TRACE(unreadMask, "***** %s : MsgQ is not empty!!size = [%d]", operation,
                     unread.count);
    }
    for (list_node_t *node = unread.head; node != nullptr;) {
        list_node_t *const next = node->next;
        free(node);
        node = next;
    }
    TRACE_LOW("***** END : %s, %d", operation, count);
    return TRUE;
}

void __Varnek_delete_thread_info(int32_t hThread) {
    TRACE_LOW("***** START : __Varnek_delete_thread_info. thread handle=[%d]", hThread);
    RemoveRecord(hThread, __func__, VARNEK_LEVEL_LOW | VARNEK_MODULE_COMMON);
}

// Every thread of the registry starts here. The creator holds the guard until the record is
// visible, so a thread that does not see its record yet waits for the guard.
void *ThreadEntry(void *begin) {
    const Start start = *static_cast<Start *>(begin);
    free(begin);
    if (gThreadInfoArr.Find(start.hHandle) == nullptr) {
        const HoldMutex created(Guard());
    }
    const pthread_key_t key =
        static_cast<pthread_key_t>(gSelfKey.load(std::memory_order_relaxed) - 1);
    if (!Succeeded(pthread_setspecific(key, reinterpret_cast<void *>(intptr_t{start.hHandle})))) {
        TRACE_ERROR("***** %s : thread handle cannot be kept!! errCode = [%d]", __func__,
                    VarnekPGL_SysGetLastErro());
    }
    pthread_setname_np(pthread_self(), start.systemName);
    return start.function(start.argument);
}

// Starts a detached OS thread. Returns pthread_create's result; if that is 0, the thread owns
// `start`.
int StartThread(pthread_t *linuxThread, int32_t priority, uint32_t stackSize, Start *start) {
    pthread_attr_t attributes;
    const int result = pthread_attr_init(&attributes);
    if (result != 0) {
        return result;
    }
    // An attribute that the system refuses (a stack below its minimum, a priority that the policy
    // does not allow) keeps its default.
    sched_param parameter = {};
    parameter.sched_priority = priority;
    pthread_attr_setstacksize(&attributes, stackSize);
    pthread_attr_setdetachstate(&attributes, PTHREAD_CREATE_DETACHED);
    pthread_attr_setschedparam(&attributes, &parameter);
    pthread_attr_setschedpolicy(&attributes, SCHED_OTHER);
    const int created = pthread_create(linuxThread, &attributes, ThreadEntry, start);
    pthread_attr_destroy(&attributes);
    return created;
}

// Fills the record at `slot` and starts its thread; the guard is held. The record becomes visible
// only when its thread exists. So the next creation can use the handle of a failed one, which no
// other thread has seen.
int32_t StartRecord(Threads::Slot *slot, const char *szThreadName, int32_t priority,
                    uint32_t stackSize, void *(*function)(void *), void *argument) {
    THREAD_MGR_INFO &info = slot->info;
    if (sem_init(&info.msgQSem, 0, 0) != 0) {
        return VARNEK_FAIL(-1,
                           "***** __Varnek_create_thread : MsgQ Sem creation FAIL!! errCode = [%d]",
                           VarnekPGL_SysGetLastErro());
    }
    Start *start = static_cast<Start *>(malloc(sizeof(Start)));
    int result = ENOMEM;
    if (start != nullptr) {
        *start = {gThreadInfoArr.NextHandle(), function, argument, ""};
        memcpy(start->systemName, szThreadName, strnlen(szThreadName, kSystemNameSize - 1));
        result = StartThread(&info.linuxThread, priority, stackSize, start);
    }
    if (result != 0) {
        TRACE_ERROR("***** __Varnek_create_thread : pthread creation FAIL!! errCode = [%d]",
                    result);
        free(start);
        sem_destroy(&info.msgQSem);
        return -1;
    }
    return gThreadInfoArr.Publish(slot, szThreadName);
}

// Returns the lowest slot whose record is neither in use nor left over. The guard is held.
Threads::Slot *FirstFreeRecord() {
    Threads::Slot *slot = gThreadInfoArr.FirstFree();
    while (slot != nullptr && slot->info.isLeftover.load(std::memory_order_acquire)) {
        slot = gThreadInfoArr.FirstFree(slot);
    }
    return slot;
}

// Returns a slot for a new record; the guard is held. If no slot is free but some are left over, it
// waits up to about a second for their last users, with the guard released. Returns null if no slot
// becomes free; it is possible that the guard is no longer held then.
Threads::Slot *ClaimRecord(HoldMutex *guard) {
    Threads::Slot *slot = FirstFreeRecord();
    for (int i = 0; i < kLeaveTries && slot == nullptr &&
                    gThreadInfoArr.Count() < MAX_THREAD_MGR_INFO_ARR_SIZE &&
                    gThreadInfoArr.HasHandles() && guard->IsHeld();
         i++) {
        guard->Release();
        VarnekPGL_MSleep(1);
        guard->Acquire();
        slot = guard->IsHeld() ? FirstFreeRecord() : nullptr;
    }
    return slot;
}

int32_t __Varnek_create_thread(const char *szThreadName, int32_t priority, uint32_t stackSize,
                               void *(*function)(void *), void *argument) {
    TRACE_LOW("***** START : __Varnek_create_thread. Thread Name=[%s]", Shown(szThreadName));
    if (!EnsureGuard()) {
        return VARNEK_FAIL(-1, "***** __Varnek_create_thread : Thread Mutex Creation Fail!!");
    }
    if (szThreadName == nullptr) {
        return VARNEK_FAIL(-1, "***** __Varnek_create_thread : Thread name is null!!");
    }
    const int len = static_cast<int>(strlen(szThreadName));
    if (len == 0 || len >= static_cast<int>(kNameSize)) {
        return VARNEK_FAIL(
            -1,
            "***** __Varnek_create_thread : Invalid Thread Name. szThreadName = [%s], Len = [%d]",
            szThreadName, len);
    }
    if (priority < 1 || priority > 99 || function == nullptr) {
        return VARNEK_FAIL(
            -1, "***** __Varnek_create_thread : Invalid argument. priority=[%d], pFunc=[%x]",
            priority, static_cast<unsigned>(reinterpret_cast<uintptr_t>(function)));
    }
    const int32_t count = gThreadInfoArr.Count();
    if (count >= MAX_THREAD_MGR_INFO_ARR_SIZE) {
        return VARNEK_FAIL(
            -1, "***** __Varnek_create_thread : Thread pool is full. gThreadInfoArrSize = [%d]",
            count);
    }
    if (gThreadInfoArr.FindByName(szThreadName) != kInvalidHandle) {
        return VARNEK_FAIL(-1,
                           "***** __Varnek_create_thread : Duplicated thread. thread name = [%s]",
                           szThreadName);
    }

    HoldMutex guard(Guard());
    Threads::Slot *const slot = guard.IsHeld() ? ClaimRecord(&guard) : nullptr;
    if (slot == nullptr) {
        return VARNEK_FAIL(-1, "***** __Varnek_create_thread : Can't find empty index!!!!");
    }
    const int32_t hHandle =
        StartRecord(slot, szThreadName, priority, stackSize, function, argument);
    const int linuxThread = static_cast<int>(slot->info.linuxThread);
    guard.Release();
    if (hHandle == -1) {
        return VARNEK_FAIL(-1, "***** END : __Varnek_create_thread, thread creation failed");
    }
    TRACE_LOW("***** END : __Varnek_create_thread thread handle = %d, linuxThread=[%d]\n", hHandle,
              linuxThread);
    return hHandle;
}

// The calling thread's handle and slot.
struct Self {
    int32_t hThread;
    Threads::Slot *slot;
};

// Returns kInvalidHandle in a thread whose record has been removed, and in one that the registry
// has not started, which has no value under the key. Inlined, since each receive begins with it.
inline __attribute__((always_inline)) Self FindSelf() {
    TRACE_LOW_QUICK("***** VarnekPGL_GetCurrentThread : curPthreadId = [%d]",
                    static_cast<int>(pthread_self()));
    const uint32_t key = gSelfKey.load(std::memory_order_acquire);
    const void *const held =
        key != 0 ? pthread_getspecific(static_cast<pthread_key_t>(key - 1)) : nullptr;
    const int32_t kept = static_cast<int32_t>(reinterpret_cast<intptr_t>(held));
    const int32_t hThread = kept < 0 ? -kept : kept;  // negative while the thread ends
    Threads::Slot *const slot = gThreadInfoArr.Find(hThread, std::memory_order_relaxed);
    if (slot == nullptr) {
        TRACE_ERROR("***** VarnekPGL_GetCurrentThread : Can't find thread Info. pthreadID = [%d]",
                    static_cast<int>(pthread_self()));
        return {kInvalidHandle, nullptr};
    }
    TRACE_LOW_QUICK("***** END : VarnekPGL_GetCurrentThread. thread handle = [%d]", hThread);
    return {hThread, slot};
}

}  // namespace

int32_t VarnekPGL_CreateThread(const char *szThreadName, int32_t priority, uint32_t stackSize,
                               void *(*function)(void *), void *argument) {
    TRACE_LOW("***** START : __Varnek_get_thread_by_name, szThreadName=[%s]", Shown(szThreadName));
    const int32_t hOld = gThreadInfoArr.FindByName(szThreadName);
    if (hOld != kInvalidHandle) {
        TRACE_LOW("***** END : __Varnek_get_thread_by_name. thread handle = [%d]\n", hOld);
        TRACE_ERROR("szThreadName=[%s]. Duplicated Thread. Old one will be destroyed!\n",
                    szThreadName);
        __Varnek_delete_thread_info(hOld);
    }
    const int32_t hHandle =
        __Varnek_create_thread(szThreadName, priority, stackSize, function, argument);
    if (hHandle == -1) {
        return VARNEK_FAIL(-1, "Thread Creation Fail! szThreadName=[%s]\n", Shown(szThreadName));
    }
    TRACE_LOW("Thread Succefully Created! ThreadName=[%s], Created Handle=[%d]\n", szThreadName,
              hHandle);
    return hHandle;
}

BOOL VarnekPGL_DeleteThread(int32_t hThread) {
    TRACE_HIGH("***** START : VarnekPGL_DeleteThread. thread handle=[%d]", hThread);
    return RemoveRecord(hThread, __func__, VARNEK_LEVEL_ERROR | VARNEK_MODULE_COMMON);
}

int32_t VarnekPGL_GetThreadByName(const char *szThreadName) {
    TRACE_LOW("***** START : VarnekPGL_GetThreadByName, szThreadName=[%s]", Shown(szThreadName));
    const int32_t hThread = gThreadInfoArr.FindByName(szThreadName);
    if (hThread != kInvalidHandle) {
        TRACE_LOW("***** END : VarnekPGL_GetThreadByName. thread handle = [%d]", hThread);
    }
    return hThread;
}

int32_t VarnekPGL_GetCurrentThread() {
    return FindSelf().hThread;
}

// Messages ---------------------------------------------------------------------------------------

namespace {

// A queued message, in one block with its node.
struct Queued {
    list_node_t node;
    THREAD_MSG message;
};

// Returns a block with a copy of the message, null when there is no memory. Messages are copied as
// bytes, because a caller's message may have any alignment.
inline Queued *CopyOf(const THREAD_MSG *message) {
    Queued *const queued = static_cast<Queued *>(malloc(sizeof(Queued)));
    if (queued != nullptr) {
        memcpy(&queued->message, static_cast<const void *>(message), sizeof queued->message);
    }
    return queued;
}

// Reads the number of units. Returns the result of sem_getvalue; on failure the number is -1.
inline int ReadUnits(THREAD_MGR_INFO &info, int *units) VARNEK_REQUIRES(info.queueLock) {
    int posted = 0;
    const int result = sem_getvalue(&info.msgQSem, &posted);
    *units = result == 0 ? posted + info.units : -1;
    return result;
}

// Takes a unit. Returns false when there is none.
inline bool TakeUnit(THREAD_MGR_INFO &info) VARNEK_REQUIRES(info.queueLock) {
    if (info.units > 0) {
        info.units--;
        return true;
    }
    return sem_trywait(&info.msgQSem) == 0;
}

// The result of a send. The errors are error numbers, 0 for none.
struct Sent {
    bool found;  // whether the record still exists
    int postError;
    int valueError;
    int semCount;  // the units after the send, -1 on failure; not read for an urgent message
};

// Puts a block into the queue, in front if it is urgent, and adds a unit for it. The queue owns the
// block afterwards, unless the record is gone. Inlined, because the modules send messages all the
// time.
inline __attribute__((always_inline)) Sent Enqueue(Threads::Slot *slot, int32_t hThread,
                                                   Queued *queued, bool urgent) {
    THREAD_MGR_INFO &info = slot->info;
    Sent sent = {};
    Hold hold(info.queueLock);
    sent.found = slot->Has(hThread, std::memory_order_relaxed);
    if (!sent.found) {
        return sent;
    }
    LinkBefore(&info.MsgQ, urgent ? info.MsgQ.head : nullptr, &queued->node, &queued->message);
    const char *lastUse = nullptr;
    if (info.mustWake) {
        const uint32_t wait = info.waits;
        info.users++;
        hold.Release();  // the owner takes the lock as soon as it wakes
        sent.postError = sem_post(&info.msgQSem) == 0 ? 0 : VarnekPGL_SysGetLastErro();
        hold.Acquire();
        info.users--;
        if (sent.postError == 0 && info.waits == wait) {
            info.mustWake = false;
        }
        lastUse = LastUseOf(info);
    } else if (info.units < kMostUnits) {
        info.units++;
    } else {
        sent.postError = EOVERFLOW;
    }
    if (!urgent && sent.postError == 0 && ReadUnits(info, &sent.semCount) != 0) {
        sent.valueError = VarnekPGL_SysGetLastErro();
    }
    hold.Release();
    Dispose(info, lastUse);
    // cppcheck-suppress memleak  // the list owns the block, by the node in it
    return sent;
}

// Takes the first message out of the queue. Returns null when there is none; the caller frees the
// block.
inline Queued *TakeFirst(THREAD_MGR_INFO &info, int32_t *left) VARNEK_REQUIRES(info.queueLock) {
    list_node_t *const node = info.MsgQ.head;
    if (node == nullptr) {
        return nullptr;
    }
    Unlink(&info.MsgQ, node);
    *left = info.MsgQ.count;
    return reinterpret_cast<Queued *>(node);  // its first member
}

// Hands a message out and frees its block.
inline void HandOut(Queued *queued, THREAD_MSG *message) {
    memcpy(static_cast<void *>(message), &queued->message, sizeof queued->message);
    free(queued);
}

// What the owner finds at its queue.
struct Receipt {
    bool found;      // whether the record still exists
    bool counted;    // whether there was a unit; it has been taken
    Queued *queued;  // the message, null for none
    int32_t left;    // messages behind it
    int valueError;  // the result of sem_getvalue
    int semCount;    // the units before one was taken, -1 on failure
};

// Takes a unit and a message, without waiting.
inline __attribute__((always_inline)) Receipt TakeCounted(Threads::Slot *self, int32_t hThread) {
    THREAD_MGR_INFO &info = self->info;
    Receipt receipt = {};
    const Hold hold(info.queueLock);
    receipt.found = self->Has(hThread, std::memory_order_relaxed);
    if (!receipt.found) {
        return receipt;
    }
    receipt.valueError = ReadUnits(info, &receipt.semCount);
    receipt.counted = TakeUnit(info);
    if (receipt.counted) {
        receipt.queued = TakeFirst(info, &receipt.left);
    }
    return receipt;
}

// Waits for one unit of the semaphore. Returns 0, or -1 with errno set.
int WaitForMessage(sem_t *msgQSem, uint32_t timeout) {
    if (timeout == WAIT_FOREVER) {
        return sem_wait(msgQSem);
    }
    timespec now = {};
    if (clock_gettime(CLOCK_REALTIME, &now) != 0) {
        return -1;
    }
    const timespec deadline = DeadlineAfter(now, timeout);
    return sem_timedwait(msgQSem, &deadline);
}

// Takes a unit and a message; waits for a unit if there is none. Returns the number of the error
// that ended the wait, 0 for none. No trace comes between setting `mustWake` and the wait, because
// the log function might receive messages itself.
int WaitAndTake(Threads::Slot *self, int32_t hThread, uint32_t timeout, Receipt *receipt) {
    THREAD_MGR_INFO &info = self->info;
    int error = 0;
    const char *lastUse = nullptr;
    Hold hold(info.queueLock);
    receipt->found = self->Has(hThread, std::memory_order_relaxed);
    if (receipt->found && !TakeUnit(info)) {
        info.mustWake = true;
        info.waits++;
        info.users++;
        hold.Release();
        error = WaitForMessage(&info.msgQSem, timeout) == 0 ? 0 : VarnekPGL_SysGetLastErro();
        hold.Acquire();
        info.mustWake = false;
        info.users--;
        receipt->found = self->Has(hThread, std::memory_order_relaxed);
        lastUse = LastUseOf(info);
    }
    if (receipt->found && error == 0) {
        receipt->queued = TakeFirst(info, &receipt->left);
    }
    hold.Release();
    Dispose(info, lastUse);
    return error;
}

}  // namespace

BOOL VarnekPGL_SendMessage(int32_t hThread, const THREAD_MSG *message) {
    TRACE_LOW_QUICK("***** START : VarnekPGL_SendMessage. hThread = %d", hThread);
    if (message == nullptr) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_SendMessage: message is NULL");
    }
    Threads::Slot *const slot = gThreadInfoArr.Find(hThread);
    if (slot == nullptr) {
        return VARNEK_FAIL(
            FALSE, "***** VarnekPGL_SendMessage. Can't find thread info. thread = [%d]", hThread);
    }
    TRACE_LOW_QUICK("***** VarnekPGL_SendMessage: ThreadMgr arrIdx = %d",
                    gThreadInfoArr.NumberOf(slot));
    Queued *const queued = CopyOf(message);
    if (queued == nullptr) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_SendMessage: memalloc failed");
    }
    const Sent sent = Enqueue(slot, hThread, queued, false);
    if (!sent.found) {
        free(queued);
        return VARNEK_FAIL(
            FALSE, "***** VarnekPGL_SendMessage. Can't find thread info. thread = [%d]", hThread);
    }
    if (sent.postError != 0) {
        return VARNEK_FAIL(FALSE,
                           "***** VarnekPGL_SendMessage: Semaphore Post FAIL. errCode = [%d]",
                           sent.postError);
    }
    if (sent.valueError != 0) {
        TRACE_ERROR("***** VarnekPGL_SendMessage: Semaphore Get Value FAIL. errCode = [%d]",
                    sent.valueError);
    }
    TRACE_LOW_QUICK("***** VarnekPGL_SendMessage: semCount = %d", sent.semCount);
    return TRUE;
}

BOOL VarnekPGL_SendUrgentMessage(int32_t hThread, const THREAD_MSG *message) {
    if (message == nullptr) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_SendUrgentMessage: message is NULL");
    }
    Threads::Slot *const slot = gThreadInfoArr.Find(hThread);
    if (slot == nullptr) {
        return VARNEK_FAIL(
            FALSE, "***** VarnekPGL_SendUrgentMessage. Can't find thread info. thread = [%d]",
            hThread);
    }
    Queued *const queued = CopyOf(message);
    if (queued == nullptr) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_SendUrgentMessage: memalloc failed");
    }
    const Sent sent = Enqueue(slot, hThread, queued, true);
    if (!sent.found) {
        free(queued);
        return VARNEK_FAIL(
            FALSE, "***** VarnekPGL_SendUrgentMessage. Can't find thread info. thread = [%d]",
            hThread);
    }
    if (sent.postError != 0) {
        return VARNEK_FAIL(FALSE,
                           "***** VarnekPGL_SendUrgentMessage: Semaphore Post FAIL. errCode = [%d]",
                           sent.postError);
    }
    return TRUE;
}

BOOL VarnekPGL_ReceiveMessage(uint32_t timeout, THREAD_MSG *message, int32_t *count) {
    const auto [curThread, slot] = FindSelf();
    TRACE_LOW_QUICK("***** START : VarnekPGL_ReceiveMessage. current thread = %d", curThread);
    if (message == nullptr || count == nullptr) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_ReceiveMessage: message or count is NULL");
    }
    if (curThread == kInvalidHandle) {
        return VARNEK_FAIL(FALSE,
                           "***** VarnekPGL_ReceiveMessage. Can't find current thread handle");
    }
    Receipt receipt = TakeCounted(slot, curThread);
    TRACE_LOW_QUICK("VarnekPGL_ReceiveMessage: arrIdx = %d",
                    receipt.found ? gThreadInfoArr.NumberOf(slot) : -1);
    if (!receipt.found) {
        return VARNEK_FAIL(
            FALSE, "VarnekPGL_ReceiveMessage: Can't find current thread Info. curThread = [%d]",
            curThread);
    }
    if (receipt.valueError != 0) {
        TRACE_ERROR("***** VarnekPGL_ReceiveMessage: Semaphore Get Value FAIL. errCode = [%d]",
                    receipt.valueError);
    }
    TRACE_LOW_QUICK("VarnekPGL_ReceiveMessage: semCount = %d", receipt.semCount);
    if (!receipt.counted) {
        const int error = WaitAndTake(slot, curThread, timeout, &receipt);
        if (error != 0) {
            return VARNEK_FAIL(
                FALSE, "***** VarnekPGL_ReceiveMessage: Semaphore wait FAIL. errCode = [%d]",
                error);
        }
        if (!receipt.found) {
            // The record was removed while its thread waited.
            return VARNEK_FAIL(
                FALSE, "VarnekPGL_ReceiveMessage: Can't find current thread Info. curThread = [%d]",
                curThread);
        }
    }
    if (receipt.queued == nullptr) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_ReceiveMessage: Msg is NULL");
    }
    HandOut(receipt.queued, message);
    *count = receipt.left;
    return TRUE;
}

BOOL VarnekPGL_PeekMessage(THREAD_MSG *message, int32_t *count) {
    const auto [curThread, slot] = FindSelf();
    TRACE_LOW("***** START : VarnekPGL_PeekMessage. current thread = %d", curThread);
    if (message == nullptr || count == nullptr) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_PeekMessage: message or count is NULL");
    }
    if (curThread == kInvalidHandle) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_PeekMessage. Can't find current thread handle");
    }
    Hold hold(slot->info.queueLock);
    int32_t left = 0;
    const bool found = slot->Has(curThread, std::memory_order_relaxed);
    Queued *const queued = found ? TakeFirst(slot->info, &left) : nullptr;
    hold.Release();
    TRACE_LOW("VarnekPGL_PeekMessage: arrIdx = %d", found ? gThreadInfoArr.NumberOf(slot) : -1);
    if (!found) {
        return VARNEK_FAIL(
            FALSE, "VarnekPGL_PeekMessage: Can't find current thread Info. curThread = [%d]",
            curThread);
    }
    if (queued == nullptr) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_PeekMessage: Msg is NULL");
    }
    HandOut(queued, message);
    *count = left;
    TRACE_LOW("***** END : VarnekPGL_PeekMessage.");
    return TRUE;
}
