// The thread registry, guarded by the named mutex "VarnekThreadMutex", and the message operations.
// A thread knows itself by the block that its creator handed to it, which it keeps under a
// thread-specific key, because the system reuses the ids of threads that have ended.
#include "Varnek_Thread.h"

#include <pthread.h>
#include <sched.h>
#include <semaphore.h>
#include <stdlib.h>

#include "Varnek_HoldMutex.h"
#include "Varnek_Lock.h"
#include "Varnek_MessageQueue.h"
#include "Varnek_Semaphore.h"
#include "Varnek_SlotTable.h"
#include "Varnek_Support.h"
#include "Varnek_Trace.h"

static_assert(sizeof(THREAD_MSG) == 40 && alignof(THREAD_MSG) == 8,
              "every module of the stack counts on this size and alignment");

namespace {

constexpr int MAX_THREAD_MGR_INFO_ARR_SIZE = 20;
constexpr size_t kSystemNameSize = 16;  // of a thread's name in the system, with the terminator

// What a running thread has to itself, whatever becomes of its record. When it ends, the block is
// kept for another thread and never freed, so a sender may post its semaphore however late: the
// block's next thread just looks at its queue once more.
struct RunningThread {
    sem_t wake;
    int32_t hHandle;  // 0 after the thread's end
    void *(*function)(void *);
    void *argument;
    char systemName[kSystemNameSize];
    bool isEnding;        // one round of thread-specific destructors has run
    RunningThread *next;  // among the idle ones
};

struct THREAD_MGR_INFO {
    MessageQueue queue;
    pthread_t linuxThread;
    const RunningThread *running;  // for a debugger: has another handle once the thread has ended
};

using Threads = SlotTable<THREAD_MGR_INFO, MAX_THREAD_MGR_INFO_ARR_SIZE>;
Threads gThreadInfoArr;

// A leaf lock, like those of the queues.
Lock gIdleLock;
RunningThread *gIdle VARNEK_GUARDED_BY(gIdleLock) = nullptr;

// Creating the first thread makes the key and then the guard, whose handle publishes both. Threads
// that the registry did not start need the acquire as well: one may still hold a value of a deleted
// key that had the same number, which the C library recognises as stale only if the thread also
// sees that this key has been created.
constexpr int32_t kNoGuard = HoldMutex::kNoMutex;
OneAtATime gFirstCreation;
pthread_key_t gSelfKey;
std::atomic<int32_t> gThreadMutex{kNoGuard};

int32_t Guard() {
    return gThreadMutex.load(std::memory_order_acquire);
}

// Blocks of running threads ----------------------------------------------------------------------

// Returns an idle block, or a new one. Null, with errno set, if that cannot be made.
RunningThread *TakeBlock() {
    Hold hold(gIdleLock);
    RunningThread *block = gIdle;
    if (block != nullptr) {
        gIdle = block->next;
        return block;
    }
    hold.Release();
    block = static_cast<RunningThread *>(malloc(sizeof(RunningThread)));
    if (block != nullptr && sem_init(&block->wake, 0, 0) != 0) {
        free(block);  // no thread has seen it
        block = nullptr;
    }
    return block;
}

void RecycleBlock(RunningThread *block) {
    const Hold hold(gIdleLock);
    block->hHandle = 0;
    block->next = gIdle;
    gIdle = block;
}

// Runs when a thread ends. The system has cleared the value by then, but the destructors of other
// keys may still ask for the thread's handle or receive messages. So the value is stored again for
// one more round of destructors.
void EndSelf(void *self) {
    auto *const block = static_cast<RunningThread *>(self);
    if (!block->isEnding) {
        block->isEnding = true;
        if (pthread_setspecific(gSelfKey, block) == 0) {
            return;
        }
    }
    RecycleBlock(block);
}

// Creates the key and the guard unless they exist. Returns false if they cannot be created, and in
// a call that the log function makes while its own thread is creating them.
bool EnsureGuard() {
    if (Guard() == kNoGuard) {
        gFirstCreation.Do([] {
            if (Guard() != kNoGuard || pthread_key_create(&gSelfKey, EndSelf) != 0) {
                return;
            }
            const int32_t guard = VarnekPGL_CreateMutex("VarnekThreadMutex");
            if (guard == kNoGuard) {
                pthread_key_delete(gSelfKey);
            }
            gThreadMutex.store(guard, std::memory_order_release);
        });
    }
    return Guard() != kNoGuard;
}

// Threads ----------------------------------------------------------------------------------------

// Removes the record of a handle. The log lines show the name `operation`; the line about unread
// messages has the mask `unreadMask`. For an unknown handle it writes a line and returns FALSE.
BOOL RemoveRecord(int32_t hThread, const char *operation, uint32_t unreadMask) {
    HoldMutex hold(Guard(), HoldMutex::kFailure);
    Threads::Slot *const slot = hold.IsHeld() ? gThreadInfoArr.Find(hThread) : nullptr;
    if (slot == nullptr) {
        TRACE_ERROR("***** %s : Can't find thread info. thread handle = [%d]", operation, hThread);
        return FALSE;
    }
    const MessageQueue::Closed closed = slot->info.queue.Close();
    const int32_t count = gThreadInfoArr.Withdraw(slot);
    hold.Release();
    // From here on the slot is free for another thread: its queue is empty and nobody's, and
    // nothing below touches either.
    if (closed.waiter != nullptr) {
        sem_post(closed.waiter);
    }
    if (closed.unread.count > 0) {
        VARNEK_TRACE(unreadMask, "***** %s : MsgQ is not empty!!size = [%d]", operation,
                     closed.unread.count);
    }
    for (list_node_t *node = closed.unread.head; node != nullptr;) {
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
    auto *const self = static_cast<RunningThread *>(begin);
    if (gThreadInfoArr.Find(self->hHandle) == nullptr) {
        const HoldMutex created(Guard());
    }
    pthread_setname_np(pthread_self(), self->systemName);
    const auto function = self->function;
    void *const argument = self->argument;
    if (SetErrno(pthread_setspecific(gSelfKey, self)) != 0) {
        TRACE_ERROR("***** %s : thread handle cannot be kept!! errCode = [%d]", __func__,
                    VarnekPGL_SysGetLastErro());
        RecycleBlock(self);
    }
    return function(argument);
}

// Starts a detached OS thread. Returns pthread_create's result; if that is 0, the thread owns its
// block.
int StartThread(pthread_t *linuxThread, int32_t priority, uint32_t stackSize,
                RunningThread *block) {
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
    const int created = pthread_create(linuxThread, &attributes, ThreadEntry, block);
    pthread_attr_destroy(&attributes);
    return created;
}

// Fills the record at `slot` and starts its thread; the guard is held. The record becomes visible
// only when its thread exists, so a handle that could not be used goes to the next thread created.
int32_t StartRecord(Threads::Slot *slot, const char *szThreadName, int32_t priority,
                    uint32_t stackSize, void *(*function)(void *), void *argument) {
    RunningThread *const block = TakeBlock();
    if (block == nullptr) {
        return VARNEK_FAIL(-1,
                           "***** __Varnek_create_thread : MsgQ Sem creation FAIL!! errCode = [%d]",
                           VarnekPGL_SysGetLastErro());
    }
    const int32_t hHandle = gThreadInfoArr.NextHandle();
    block->hHandle = hHandle;
    block->function = function;
    block->argument = argument;
    memset(block->systemName, 0, sizeof block->systemName);
    memcpy(block->systemName, szThreadName, strnlen(szThreadName, kSystemNameSize - 1));
    block->isEnding = false;
    const int result = StartThread(&slot->info.linuxThread, priority, stackSize, block);
    if (result != 0) {
        TRACE_ERROR("***** __Varnek_create_thread : pthread creation FAIL!! errCode = [%d]",
                    result);
        RecycleBlock(block);
        return -1;
    }
    slot->info.running = block;
    slot->info.queue.Open(hHandle);
    return gThreadInfoArr.Publish(slot, szThreadName);
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
    Threads::Slot *const slot = guard.IsHeld() ? gThreadInfoArr.FirstFree() : nullptr;
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

// The calling thread's handle, slot and block.
struct Self {
    int32_t hThread;
    Threads::Slot *slot;
    RunningThread *block;
};

// Returns kInvalidHandle in a thread whose record has been removed, and in one that the registry
// has not started, which has no value under the key. Inlined, since receiving begins with it.
inline __attribute__((always_inline)) Self FindSelf() {
    TRACE_LOW_QUICK("***** VarnekPGL_GetCurrentThread : curPthreadId = [%d]",
                    static_cast<int>(pthread_self()));
    auto *const block =
        Guard() != kNoGuard ? static_cast<RunningThread *>(pthread_getspecific(gSelfKey)) : nullptr;
    const int32_t hThread = block != nullptr ? block->hHandle : kInvalidHandle;
    Threads::Slot *const slot = gThreadInfoArr.Find(hThread, std::memory_order_relaxed);
    if (slot == nullptr) {
        TRACE_ERROR("***** VarnekPGL_GetCurrentThread : Can't find thread Info. pthreadID = [%d]",
                    static_cast<int>(pthread_self()));
        return {kInvalidHandle, nullptr, nullptr};
    }
    TRACE_LOW_QUICK("***** END : VarnekPGL_GetCurrentThread. thread handle = [%d]", hThread);
    return {hThread, slot, block};
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

// Sends a message; the log lines show the name `operation`. Inlined, because the modules send
// messages all the time.
inline __attribute__((always_inline)) BOOL Send(int32_t hThread, const THREAD_MSG *message,
                                                bool isUrgent, const char *operation) {
    if (message == nullptr) {
        return VARNEK_FAIL(FALSE, "***** %s: message is NULL", operation);
    }
    // Relaxed, because the queue has a lock: its owner was stored under it before the handle was
    // published, so whoever has read the handle finds that owner or a later one.
    Threads::Slot *const slot = gThreadInfoArr.Find(hThread, std::memory_order_relaxed);
    if (slot == nullptr) {
        return VARNEK_FAIL(FALSE, "***** %s. Can't find thread info. thread = [%d]", operation,
                           hThread);
    }
    if (!isUrgent) {
        TRACE_LOW_QUICK("***** VarnekPGL_SendMessage: ThreadMgr arrIdx = %d",
                        gThreadInfoArr.NumberOf(slot));
    }
    auto *const queued = static_cast<MessageQueue::Queued *>(malloc(sizeof(MessageQueue::Queued)));
    if (queued == nullptr) {
        return VARNEK_FAIL(FALSE, "***** %s: memalloc failed", operation);
    }
    // Copied as bytes, because a caller's message may have any alignment.
    memcpy(&queued->message, static_cast<const void *>(message), sizeof queued->message);
    const MessageQueue::Pushed pushed = slot->info.queue.Push(hThread, queued, isUrgent);
    if (!pushed.isOpen) {
        free(queued);
        return VARNEK_FAIL(FALSE, "***** %s. Can't find thread info. thread = [%d]", operation,
                           hThread);
    }
    // cppcheck-suppress memleak  // the queue owns the block, by the node in it
    if (pushed.error != 0) {
        return VARNEK_FAIL(FALSE, "***** %s: Semaphore Post FAIL. errCode = [%d]", operation,
                           pushed.error);
    }
    if (!isUrgent) {
        TRACE_LOW_QUICK("***** VarnekPGL_SendMessage: semCount = %d", pushed.permits);
    }
    return TRUE;
}

// Hands a message out and frees its block.
inline void HandOut(const MessageQueue::Taken &taken, THREAD_MSG *message, int32_t *count) {
    memcpy(static_cast<void *>(message), &taken.queued->message, sizeof taken.queued->message);
    *count = taken.left;
    free(taken.queued);
}

}  // namespace

BOOL VarnekPGL_SendMessage(int32_t hThread, const THREAD_MSG *message) {
    TRACE_LOW_QUICK("***** START : VarnekPGL_SendMessage. hThread = %d", hThread);
    return Send(hThread, message, false, __func__);
}

BOOL VarnekPGL_SendUrgentMessage(int32_t hThread, const THREAD_MSG *message) {
    return Send(hThread, message, true, __func__);
}

BOOL VarnekPGL_ReceiveMessage(uint32_t timeout, THREAD_MSG *message, int32_t *count) {
    const auto [curThread, slot, block] = FindSelf();
    TRACE_LOW_QUICK("***** START : VarnekPGL_ReceiveMessage. current thread = %d", curThread);
    if (message == nullptr || count == nullptr) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_ReceiveMessage: message or count is NULL");
    }
    if (curThread == kInvalidHandle) {
        return VARNEK_FAIL(FALSE,
                           "***** VarnekPGL_ReceiveMessage. Can't find current thread handle");
    }
    MessageQueue::Taken taken = slot->info.queue.Take(curThread);
    TRACE_LOW_QUICK("VarnekPGL_ReceiveMessage: arrIdx = %d",
                    taken.isOpen ? gThreadInfoArr.NumberOf(slot) : -1);
    if (taken.isOpen) {
        TRACE_LOW_QUICK("VarnekPGL_ReceiveMessage: semCount = %d", taken.permits);
        if (!taken.isPermitted) {
            taken = slot->info.queue.WaitAndTake(curThread, timeout, &block->wake);
        }
    }
    if (!taken.isOpen) {
        return VARNEK_FAIL(
            FALSE, "VarnekPGL_ReceiveMessage: Can't find current thread Info. curThread = [%d]",
            curThread);
    }
    if (SetErrno(taken.error) != 0) {
        return VARNEK_FAIL(FALSE,
                           "***** VarnekPGL_ReceiveMessage: Semaphore wait FAIL. errCode = [%d]",
                           taken.error);
    }
    if (taken.queued == nullptr) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_ReceiveMessage: Msg is NULL");
    }
    HandOut(taken, message, count);
    return TRUE;
}

BOOL VarnekPGL_PeekMessage(THREAD_MSG *message, int32_t *count) {
    const auto [curThread, slot, block] = FindSelf();
    TRACE_LOW("***** START : VarnekPGL_PeekMessage. current thread = %d", curThread);
    if (message == nullptr || count == nullptr) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_PeekMessage: message or count is NULL");
    }
    if (curThread == kInvalidHandle) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_PeekMessage. Can't find current thread handle");
    }
    const MessageQueue::Taken taken = slot->info.queue.TakeUncounted(curThread);
    TRACE_LOW("VarnekPGL_PeekMessage: arrIdx = %d",
              taken.isOpen ? gThreadInfoArr.NumberOf(slot) : -1);
    if (!taken.isOpen) {
        return VARNEK_FAIL(
            FALSE, "VarnekPGL_PeekMessage: Can't find current thread Info. curThread = [%d]",
            curThread);
    }
    if (taken.queued == nullptr) {
        return VARNEK_FAIL(FALSE, "***** VarnekPGL_PeekMessage: Msg is NULL");
    }
    HandOut(taken, message, count);
    TRACE_LOW("***** END : VarnekPGL_PeekMessage.");
    return TRUE;
}
