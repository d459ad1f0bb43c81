// The thread registry and the message queues.
//
// The registry's guard is held while a record is made or removed. A queue's list has a lock of its
// own. What keeps a record's queue and semaphore alive while a sender or a receiver is inside is
// the record's count of users: a removal makes the record invisible at once, and whoever is the
// last one out takes it apart. So no lock is ever held across a wait, and none while another is
// taken.
#include "Varnek_Thread.h"

#include <pthread.h>
#include <sched.h>
#include <semaphore.h>
#include <stdlib.h>

#include "Varnek_List.h"
#include "Varnek_Lock.h"
#include "Varnek_Semaphore.h"
#include "Varnek_SlotTable.h"
#include "Varnek_Support.h"
#include "Varnek_Timer.h"
#include "Varnek_Trace.h"

static_assert(sizeof(THREAD_MSG) == 40, "every module of the stack counts on this size");

namespace {

constexpr int MAX_THREAD_MGR_INFO_ARR_SIZE = 20;

struct THREAD_MGR_INFO {
    std::atomic<bool> bUsed;             // from its creation until it is taken apart
    std::atomic<pthread_t> linuxThread;  // as the handle: complete before that is published
    std::atomic<uint32_t> users;         // who is inside, and kRemoved
    sem_t msgQSem;                       // counts the queue's messages
    Lock queueLock;
    list_t MsgQ VARNEK_GUARDED_BY(queueLock);
    const char *removedBy;  // the operation that removed the record, and the level at which it
    uint32_t unreadMask;    // reports unread messages: for the last one out
};

constexpr uint32_t kRemoved = 0x80000000u;
constexpr int kLeaveTries = 1000;  // of a millisecond

SlotTable<THREAD_MGR_INFO, MAX_THREAD_MGR_INFO_ARR_SIZE> gThreadInfoArr;
std::atomic<int32_t> gThreadInfoArrSize{0};
int32_t gNextThreadHandle = 1;  // guarded by the registry's guard

// Set while a thread exists, or is about to, whose record is not visible yet. Written by the holder
// of the guard. Who reads it clear sees the record of every thread that was running by then.
std::atomic<bool> gThreadStarting{false};

// The handle of the guard "VarnekThreadMutex"; kNoGuard until the first creation makes it.
constexpr int32_t kNoGuard = -1;
constexpr int32_t kGuardInTheMaking = -2;
std::atomic<int32_t> gThreadMutex{kNoGuard};

int32_t Guard() {
    const int32_t guard = gThreadMutex.load(std::memory_order_acquire);
    return guard != kGuardInTheMaking ? guard : kNoGuard;
}

// Ends a removal that found no record. A guard that does not exist yet is released all the same, so
// that both of its lines are in the log; one that the system refused is not ours to release.
void ReleaseGuard(int32_t guard, bool held) {
    if (held || guard == kNoGuard) {
        VarnekPGL_ReleaseMutex(guard);
    }
}

// Makes the guard on first use. Of several threads one makes it and the others wait that moment,
// since a second mutex of its name would destroy the first.
bool EnsureGuard() {
    for (;;) {
        int32_t guard = gThreadMutex.load(std::memory_order_acquire);
        if (guard != kNoGuard && guard != kGuardInTheMaking) {
            return true;
        }
        if (guard == kNoGuard && gThreadMutex.compare_exchange_strong(guard, kGuardInTheMaking)) {
            guard = VarnekPGL_CreateMutex("VarnekThreadMutex");
            gThreadMutex.store(guard, std::memory_order_release);
            return guard != kNoGuard;
        }
        sched_yield();
    }
}

// Holds the guard, but only while a thread is starting: a lookup finds the record of every thread
// that was running when it began, the calling one included.
class StartedThreads {
  public:
    StartedThreads()
        : held_(gThreadStarting.load(std::memory_order_acquire) &&
                VarnekPGL_AcquireMutex(Guard()) != FALSE) {}
    ~StartedThreads() {
        if (held_) {
            VarnekPGL_ReleaseMutex(Guard());
        }
    }
    StartedThreads(const StartedThreads &) = delete;
    StartedThreads &operator=(const StartedThreads &) = delete;

  private:
    const bool held_;
};

int32_t HandleOfName(const char *szThreadName) {
    const StartedThreads started;
    return gThreadInfoArr.FindByName(szThreadName);
}

// Users of a record ------------------------------------------------------------------------------

// Takes a removed record apart. Runs in the last thread that had to do with it, which is why the
// queue needs no lock here.
void Dispose(int slot) VARNEK_THREAD_SAFETY(no_thread_safety_analysis) {
    THREAD_MGR_INFO &info = gThreadInfoArr[slot];
    if (sem_destroy(&info.msgQSem) != 0) {
        TRACE_ERROR("***** %s : semaphore destroy FAIL!! errCode = [%d]", info.removedBy,
                    VarnekPGL_SysGetLastErro());
    }
    if (info.MsgQ.count > 0) {
        VARNEK_TRACE(info.unreadMask, "***** %s : MsgQ is not empty!!size = [%d]", info.removedBy,
                     info.MsgQ.count);
        while (void *message = list_removeHead(&info.MsgQ)) {
            free(message);
        }
    }
    info.users.fetch_and(~kRemoved, std::memory_order_relaxed);
    info.bUsed.store(false, std::memory_order_release);
}

void Leave(int slot) {
    if (gThreadInfoArr[slot].users.fetch_sub(1, std::memory_order_acq_rel) == kRemoved + 1) {
        Dispose(slot);
    }
}

// Keeps the record of this handle in one piece until Leave. False when it is gone.
bool Enter(int slot, int32_t hThread) {
    std::atomic<uint32_t> &users = gThreadInfoArr[slot].users;
    uint32_t count = users.load(std::memory_order_relaxed);
    do {
        if ((count & kRemoved) != 0) {
            return false;
        }
    } while (!users.compare_exchange_weak(count, count + 1, std::memory_order_acquire,
                                          std::memory_order_relaxed));
    // The slot may have changed hands since it was looked up.
    if (!gThreadInfoArr.IsLive(slot, hThread)) {
        Leave(slot);
        return false;
    }
    return true;
}

// One stay inside a record.
class RecordUse {
  public:
    explicit RecordUse(int32_t hThread)
        : hThread_(hThread), slot_(gThreadInfoArr.FindByHandle(hThread)) {
        if (slot_ != -1 && !Enter(slot_, hThread)) {
            slot_ = -1;
        }
    }
    ~RecordUse() {
        if (slot_ != -1) {
            Leave(slot_);
        }
    }
    RecordUse(const RecordUse &) = delete;
    RecordUse &operator=(const RecordUse &) = delete;

    int Slot() const { return slot_; }  // -1 for none
    THREAD_MGR_INFO &Info() const { return gThreadInfoArr[slot_]; }
    // Whether the record has not been removed meanwhile.
    bool IsLive() const { return gThreadInfoArr.IsLive(slot_, hThread_); }

  private:
    const int32_t hThread_;
    int slot_;
};

// Removes the record at `slot` for `operation`; the guard is held. Returns the new count.
int32_t Remove(int slot, const char *operation, uint32_t unreadMask) {
    THREAD_MGR_INFO &info = gThreadInfoArr[slot];
    gThreadInfoArr.Withdraw(slot);
    const int32_t count = gThreadInfoArrSize.fetch_sub(1, std::memory_order_relaxed) - 1;
    info.removedBy = operation;
    info.unreadMask = unreadMask;
    // The owner may be waiting for a message: this wakes it, and it finds its record gone. Without
    // a waiter the post goes with the semaphore.
    sem_post(&info.msgQSem);
    if (info.users.fetch_or(kRemoved, std::memory_order_acq_rel) == 0) {
        Dispose(slot);
    }
    return count;
}

// Threads ----------------------------------------------------------------------------------------

void __Varnek_delete_thread_info(int32_t hThread) {
    TRACE_LOW("***** START : %s. thread handle=[%d]", __func__, hThread);
    const int32_t guard = Guard();
    const bool held = VarnekPGL_AcquireMutex(guard) != FALSE;
    const int slot = held ? gThreadInfoArr.FindByHandle(hThread) : -1;
    if (slot == -1) {
        TRACE_ERROR("***** %s : Can't find thread info. thread handle = [%d]", __func__, hThread);
        ReleaseGuard(guard, held);
        return;
    }
    const int32_t count = Remove(slot, __func__, VARNEK_LEVEL_LOW | VARNEK_MODULE_COMMON);
    VarnekPGL_ReleaseMutex(guard);
    TRACE_LOW("***** END : %s, %d", __func__, count);
}

// Starts the OS thread of a prepared record. Returns pthread_create's result.
int StartThread(pthread_t *linuxThread, int32_t priority, uint32_t stackSize,
                void *(*function)(void *), void *argument) {
    pthread_attr_t attributes;
    const int result = pthread_attr_init(&attributes);
    if (result != 0) {
        return result;
    }
    // What the system refuses of these (a stack below its minimum, a priority that the policy does
    // not know) stays at its default.
    sched_param parameter = {};
    parameter.sched_priority = priority;
    pthread_attr_setstacksize(&attributes, stackSize);
    pthread_attr_setdetachstate(&attributes, PTHREAD_CREATE_DETACHED);
    pthread_attr_setschedparam(&attributes, &parameter);
    pthread_attr_setschedpolicy(&attributes, SCHED_OTHER);
    const int created = pthread_create(linuxThread, &attributes, function, argument);
    pthread_attr_destroy(&attributes);
    return created;
}

int FirstUnused() {
    for (int slot = 0; slot < MAX_THREAD_MGR_INFO_ARR_SIZE; slot++) {
        if (!gThreadInfoArr[slot].bUsed.load(std::memory_order_acquire)) {
            return slot;
        }
    }
    return -1;
}

// Fills the record at `slot` and starts its thread; the guard is held. The record becomes visible
// once the thread exists: a handle that is given back was never seen, and a new thread that looks
// for itself earlier waits for the guard.
int32_t StartRecord(int slot, const char *szThreadName, int32_t priority, uint32_t stackSize,
                    void *(*function)(void *), void *argument) {
    THREAD_MGR_INFO &info = gThreadInfoArr[slot];
    if (sem_init(&info.msgQSem, 0, 0) != 0) {
        return VARNEK_FAIL(-1,
                           "***** __Varnek_create_thread : MsgQ Sem creation FAIL!! errCode = [%d]",
                           VarnekPGL_SysGetLastErro());
    }
    list_initialize(&info.MsgQ);
    gThreadStarting.store(true, std::memory_order_release);
    pthread_t linuxThread = {};
    const int result = StartThread(&linuxThread, priority, stackSize, function, argument);
    if (result != 0) {
        gThreadStarting.store(false, std::memory_order_release);
        TRACE_ERROR("***** __Varnek_create_thread : pthread creation FAIL!! errCode = [%d]",
                    result);
        sem_destroy(&info.msgQSem);
        return -1;
    }
    const int32_t hHandle = gNextThreadHandle++;
    info.bUsed.store(true, std::memory_order_relaxed);
    info.linuxThread.store(linuxThread, std::memory_order_release);
    gThreadInfoArrSize.fetch_add(1, std::memory_order_relaxed);
    gThreadInfoArr.Publish(slot, szThreadName, hHandle);
    gThreadStarting.store(false, std::memory_order_release);
    return hHandle;
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
    const int32_t count = gThreadInfoArrSize.load(std::memory_order_relaxed);
    if (count >= MAX_THREAD_MGR_INFO_ARR_SIZE) {
        return VARNEK_FAIL(
            -1, "***** __Varnek_create_thread : Thread pool is full. gThreadInfoArrSize = [%d]",
            count);
    }
    if (HandleOfName(szThreadName) != kInvalidHandle) {
        return VARNEK_FAIL(-1,
                           "***** __Varnek_create_thread : Duplicated thread. thread name = [%s]",
                           szThreadName);
    }

    const int32_t guard = Guard();
    if (VarnekPGL_AcquireMutex(guard) == FALSE) {
        return -1;
    }
    int slot = FirstUnused();
    // A removed record is free once its last visitor has left, which takes a moment.
    for (int i = 0;
         i < kLeaveTries && slot == -1 &&
         gThreadInfoArrSize.load(std::memory_order_relaxed) < MAX_THREAD_MGR_INFO_ARR_SIZE;
         i++) {
        VarnekPGL_ReleaseMutex(guard);
        VarnekPGL_MSleep(1);
        if (VarnekPGL_AcquireMutex(guard) == FALSE) {
            return -1;
        }
        slot = FirstUnused();
    }
    if (slot == -1) {
        TRACE_ERROR("***** __Varnek_create_thread : Can't find empty index!!!!");
        VarnekPGL_ReleaseMutex(guard);
        return -1;
    }
    const int32_t hHandle =
        StartRecord(slot, szThreadName, priority, stackSize, function, argument);
    const int linuxThread =
        static_cast<int>(gThreadInfoArr[slot].linuxThread.load(std::memory_order_relaxed));
    VarnekPGL_ReleaseMutex(guard);
    if (hHandle == -1) {
        return VARNEK_FAIL(-1, "***** END : __Varnek_create_thread, thread creation failed");
    }
    TRACE_LOW("***** END : __Varnek_create_thread thread handle = %d, linuxThread=[%d]\n", hHandle,
              linuxThread);
    return hHandle;
}

// The handle of the newest record with this thread id, since the system reuses the ids of threads
// that ended; -1 for none. The handle is read before and after, as in a lookup by name.
int32_t HandleOfThread(pthread_t linuxThread) {
    const StartedThreads started;
    int32_t newest = kInvalidHandle;
    for (int slot = 0; slot < MAX_THREAD_MGR_INFO_ARR_SIZE; slot++) {
        const int32_t hHandle = gThreadInfoArr.HandleOf(slot);
        if (hHandle > 0 && hHandle > newest &&
            pthread_equal(gThreadInfoArr[slot].linuxThread.load(std::memory_order_acquire),
                          linuxThread) &&
            gThreadInfoArr.IsLive(slot, hHandle)) {
            newest = hHandle;
        }
    }
    return newest;
}

}  // namespace

int32_t VarnekPGL_CreateThread(const char *szThreadName, int32_t priority, uint32_t stackSize,
                               void *(*function)(void *), void *argument) {
    TRACE_LOW("***** START : __Varnek_get_thread_by_name, szThreadName=[%s]", Shown(szThreadName));
    const int32_t hOld = HandleOfName(szThreadName);
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
    const int32_t guard = Guard();
    const bool held = VarnekPGL_AcquireMutex(guard) != FALSE;
    const int slot = held ? gThreadInfoArr.FindByHandle(hThread) : -1;
    if (slot == -1) {
        TRACE_ERROR("***** VarnekPGL_DeleteThread : Can't find thread info. thread handle = [%d]",
                    hThread);
        ReleaseGuard(guard, held);
        return FALSE;
    }
    const int32_t count = Remove(slot, __func__, VARNEK_LEVEL_ERROR | VARNEK_MODULE_COMMON);
    VarnekPGL_ReleaseMutex(guard);
    TRACE_LOW("***** END : VarnekPGL_DeleteThread, %d", count);
    return TRUE;
}

int32_t VarnekPGL_GetThreadByName(const char *szThreadName) {
    TRACE_LOW("***** START : VarnekPGL_GetThreadByName, szThreadName=[%s]", Shown(szThreadName));
    const int32_t hThread = HandleOfName(szThreadName);
    if (hThread != kInvalidHandle) {
        TRACE_LOW("***** END : VarnekPGL_GetThreadByName. thread handle = [%d]", hThread);
    }
    return hThread;
}

int32_t VarnekPGL_GetCurrentThread() {
    const pthread_t self = pthread_self();
    TRACE_LOW_QUICK("***** VarnekPGL_GetCurrentThread : curPthreadId = [%d]",
                    static_cast<int>(self));
    const int32_t hThread = HandleOfThread(self);
    if (hThread == kInvalidHandle) {
        return VARNEK_FAIL(
            -1, "***** VarnekPGL_GetCurrentThread : Can't find thread Info. pthreadID = [%d]",
            static_cast<int>(self));
    }
    TRACE_LOW_QUICK("***** END : VarnekPGL_GetCurrentThread. thread handle = [%d]", hThread);
    return hThread;
}

// Messages ---------------------------------------------------------------------------------------

namespace {

// Copies a message into a block of its own and puts it into the queue. False when memory is short;
// nothing is left behind then.
bool Enqueue(THREAD_MGR_INFO &info, const THREAD_MSG &message, void (*insert)(list_t *, void *)) {
    void *block = malloc(sizeof message);
    if (block == nullptr) {
        return false;
    }
    memcpy(block, &message, sizeof message);
    Hold hold(info.queueLock);
    const int32_t before = info.MsgQ.count;
    insert(&info.MsgQ, block);
    const bool inserted = info.MsgQ.count != before;
    hold.Release();
    if (!inserted) {
        free(block);
    }
    return inserted;
}

// Moves the first message out of the queue. False when there is none.
bool Dequeue(THREAD_MGR_INFO &info, THREAD_MSG *message, int32_t *count) {
    Hold hold(info.queueLock);
    void *block = list_removeHead(&info.MsgQ);
    const int32_t left = info.MsgQ.count;
    hold.Release();
    if (block == nullptr) {
        return false;
    }
    memcpy(message, block, sizeof *message);
    free(block);
    *count = left;
    return true;
}

// Waits for one unit, with errno telling why not. 0 or -1.
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

}  // namespace

BOOL VarnekPGL_SendMessage(int32_t hThread, const THREAD_MSG *message) {
    TRACE_LOW_QUICK("***** START : VarnekPGL_SendMessage. hThread = %d", hThread);
    if (message == nullptr) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_SendMessage: message is NULL");
    }
    const RecordUse use(hThread);
    if (use.Slot() == -1) {
        return VARNEK_FAIL(
            FALSE, "***** VarnekPGL_SendMessage. Can't find thread info. thread = [%d]", hThread);
    }
    TRACE_LOW_QUICK("***** VarnekPGL_SendMessage: ThreadMgr arrIdx = %d", use.Slot());
    if (!Enqueue(use.Info(), *message, list_insert)) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_SendMessage: memalloc failed");
    }
    sem_t *msgQSem = &use.Info().msgQSem;
    if (sem_post(msgQSem) != 0) {
        return VARNEK_FAIL(FALSE,
                           "***** VarnekPGL_SendMessage: Semaphore Post FAIL. errCode = [%d]",
                           VarnekPGL_SysGetLastErro());
    }
    int semCount = -1;
    if (sem_getvalue(msgQSem, &semCount) != 0) {
        TRACE_ERROR("***** VarnekPGL_SendMessage: Semaphore Get Value FAIL. errCode = [%d]",
                    VarnekPGL_SysGetLastErro());
        semCount = -1;
    }
    TRACE_LOW_QUICK("***** VarnekPGL_SendMessage: semCount = %d", semCount);
    return TRUE;
}

BOOL VarnekPGL_SendUrgentMessage(int32_t hThread, const THREAD_MSG *message) {
    if (message == nullptr) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_SendUrgentMessage: message is NULL");
    }
    const RecordUse use(hThread);
    if (use.Slot() == -1) {
        return VARNEK_FAIL(
            FALSE, "***** VarnekPGL_SendUrgentMessage. Can't find thread info. thread = [%d]",
            hThread);
    }
    if (!Enqueue(use.Info(), *message, list_insertHead)) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_SendUrgentMessage: memalloc failed");
    }
    if (sem_post(&use.Info().msgQSem) != 0) {
        return VARNEK_FAIL(FALSE,
                           "***** VarnekPGL_SendUrgentMessage: Semaphore Post FAIL. errCode = [%d]",
                           VarnekPGL_SysGetLastErro());
    }
    return TRUE;
}

BOOL VarnekPGL_ReceiveMessage(uint32_t timeout, THREAD_MSG *message, int32_t *count) {
    const int32_t curThread = VarnekPGL_GetCurrentThread();
    TRACE_LOW_QUICK("***** START : VarnekPGL_ReceiveMessage. current thread = %d", curThread);
    if (message == nullptr || count == nullptr) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_ReceiveMessage: message or count is NULL");
    }
    if (curThread == kInvalidHandle) {
        return VARNEK_FAIL(FALSE,
                           "***** VarnekPGL_ReceiveMessage. Can't find current thread handle");
    }
    const RecordUse use(curThread);
    TRACE_LOW_QUICK("VarnekPGL_ReceiveMessage: arrIdx = %d", use.Slot());
    if (use.Slot() == -1) {
        return VARNEK_FAIL(
            FALSE, "VarnekPGL_ReceiveMessage: Can't find current thread Info. curThread = [%d]",
            curThread);
    }
    sem_t *msgQSem = &use.Info().msgQSem;
    int semCount = -1;
    const int read = sem_getvalue(msgQSem, &semCount);
    if (read != 0) {
        TRACE_ERROR("***** VarnekPGL_ReceiveMessage: Semaphore Get Value FAIL. errCode = [%d]",
                    read);
        semCount = -1;
    }
    TRACE_LOW_QUICK("VarnekPGL_ReceiveMessage: semCount = %d", semCount);
    if (WaitForMessage(msgQSem, timeout) != 0) {
        return VARNEK_FAIL(FALSE,
                           "***** VarnekPGL_ReceiveMessage: Semaphore wait FAIL. errCode = [%d]",
                           VarnekPGL_SysGetLastErro());
    }
    if (!use.IsLive()) {
        // The record was removed while its thread waited here.
        return VARNEK_FAIL(
            FALSE, "VarnekPGL_ReceiveMessage: Can't find current thread Info. curThread = [%d]",
            curThread);
    }
    if (!Dequeue(use.Info(), message, count)) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_ReceiveMessage: Msg is NULL");
    }
    return TRUE;
}

BOOL VarnekPGL_PeekMessage(THREAD_MSG *message, int32_t *count) {
    const int32_t curThread = VarnekPGL_GetCurrentThread();
    TRACE_LOW("***** START : VarnekPGL_PeekMessage. current thread = %d", curThread);
    if (message == nullptr || count == nullptr) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_PeekMessage: message or count is NULL");
    }
    if (curThread == kInvalidHandle) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_PeekMessage. Can't find current thread handle");
    }
    const RecordUse use(curThread);
    TRACE_LOW("VarnekPGL_PeekMessage: arrIdx = %d", use.Slot());
    if (use.Slot() == -1) {
        return VARNEK_FAIL(
            FALSE, "VarnekPGL_PeekMessage: Can't find current thread Info. curThread = [%d]",
            curThread);
    }
    if (!Dequeue(use.Info(), message, count)) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_PeekMessage: Msg is NULL");
    }
    TRACE_LOW("***** END : VarnekPGL_PeekMessage.");
    return TRUE;
}
