// Named mutexes and named semaphores. They share the kind of table but no operation, because their
// messages, trace points and deletion rules differ.
#include "Varnek_Semaphore.h"

#include <pthread.h>
#include <semaphore.h>

#include "Varnek_Clock.h"
#include "Varnek_Lock.h"
#include "Varnek_MutexTable.h"
#include "Varnek_SlotTable.h"
#include "Varnek_Support.h"
#include "Varnek_Trace.h"

Mutexes gMutexArr;

namespace {

constexpr int MAX_SEM_MGR_INFO_ARR_SIZE = 40;

struct SEM_MGR_INFO {
    sem_t linuxSem;
};

// Returns the first 32-bit word of an OS object. Log lines show it, because it contains the state.
template <typename OsObject>
int FirstWord(const OsObject &object) {
    int32_t word = 0;
    static_assert(sizeof object >= sizeof word, "an OS object has at least one word");
    memcpy(&word, &object, sizeof word);
    return word;
}

// Each table has a lock that guards every change. Lookups read the table without it.
Lock gMutexArrLock;
Lock gSemArrLock;
using Semaphores = SlotTable<SEM_MGR_INFO, MAX_SEM_MGR_INFO_ARR_SIZE>;
Semaphores gSemArr;

// Mutexes ----------------------------------------------------------------------------------------

int32_t __Varnek_create_mutex(const char *szMutexName) {
    TRACE_LOW("***** START : __Varnek_create_mutex. szMutexName=[%s]", Shown(szMutexName));
    if (szMutexName == nullptr) {
        return VARNEK_FAIL(-1, "***** __Varnek_create_mutex : Mutex name is null!!");
    }
    const int len = static_cast<int>(strlen(szMutexName));
    if (len == 0 || len >= static_cast<int>(kNameSize)) {
        return VARNEK_FAIL(
            -1, "***** __Varnek_create_mutex : Invalid Mutex Name. szMutexName = [%s], Len = [%d]",
            szMutexName, len);
    }
    const int32_t count = gMutexArr.Count();
    if (count >= MAX_MUTEX_MGR_INFO_ARR_SIZE) {
        return VARNEK_FAIL(
            -1, "***** __Varnek_create_mutex : Mutex pool is full. gMutexArrSize = [%d]", count);
    }
    if (gMutexArr.FindByName(szMutexName) != kInvalidHandle) {
        return VARNEK_FAIL(-1, "***** __Varnek_create_mutex : Duplicated Mutex. mutex name = [%s]",
                           szMutexName);
    }

    Hold hold(gMutexArrLock);
    auto *const slot = gMutexArr.FirstFree();
    if (slot == nullptr) {
        return VARNEK_FAIL(-1, "***** __Varnek_create_mutex : Can't find empty index!!!!");
    }
    pthread_mutex_t &linuxMutex = slot->info.linuxMutex;
    if (SetErrno(pthread_mutex_init(&linuxMutex, nullptr)) != 0) {
        return VARNEK_FAIL(-1, "***** __Varnek_create_mutex : Mutex creation FAIL!! errCode = [%d]",
                           VarnekPGL_SysGetLastErro());
    }
    const int word = FirstWord(linuxMutex);  // before others can lock it
    const int32_t hHandle = gMutexArr.Publish(slot, szMutexName);
    hold.Release();

    TRACE_LOW("***** END : __Varnek_create_mutex mutex handle = %d, linuxMutex=[%d]\n", hHandle,
              word);
    return hHandle;
}

// Destroys a mutex unless a thread holds it. Some systems would destroy a held mutex and some would
// refuse; with the trylock the result is the same everywhere.
bool DestroyMutex(pthread_mutex_t *mutex) {
    if (SetErrno(pthread_mutex_trylock(mutex)) != 0) {
        return false;
    }
    pthread_mutex_unlock(mutex);
    return SetErrno(pthread_mutex_destroy(mutex)) == 0;
}

}  // namespace

int32_t VarnekPGL_CreateMutex(const char *szMutexName) {
    const int32_t hOld = gMutexArr.FindByName(szMutexName);
    if (hOld != kInvalidHandle) {
        TRACE_HIGH("szMutexName=[%s]. Duplicated Mutex. Old one will be destroyed!\n", szMutexName);
        VarnekPGL_DeleteMutex(hOld);
    }
    return __Varnek_create_mutex(szMutexName);
}

BOOL VarnekPGL_DeleteMutex(int32_t hMutex) {
    TRACE_LOW("***** START : VarnekPGL_DeleteMutex. hMutex=[%d]", hMutex);
    Hold hold(gMutexArrLock);
    auto *const slot = gMutexArr.Find(hMutex);
    if (slot == nullptr) {
        return VARNEK_FAIL(
            FALSE, "***** VarnekPGL_DeleteMutex : Can't find mutex info. mutex handle = [%d]",
            hMutex);
    }
    if (!DestroyMutex(&slot->info.linuxMutex)) {
        return VARNEK_FAIL(FALSE,
                           "***** VarnekPGL_DeleteMutex : Mutex Destroy FAIL! errCode = [%d]",
                           VarnekPGL_SysGetLastErro());
    }
    gMutexArr.Withdraw(slot);
    hold.Release();
    TRACE_LOW("***** END : VarnekPGL_DeleteMutex");
    return TRUE;
}

namespace {

// Failures of acquiring and releasing. Out of line, so that a success pays nothing for them.
__attribute__((noinline, cold)) BOOL NoSuchMutex(const char *operation, int32_t hMutex) {
    return VARNEK_FAIL(FALSE, "***** %s : Can't find mutex info. mutex handle = [%d]", operation,
                       hMutex);
}

__attribute__((noinline, cold)) BOOL MutexFails(const char *operation, const char *step,
                                                int error) {
    SetErrno(error);
    return VARNEK_FAIL(FALSE, "***** %s : Mutex %s FAIL! errCode = [%d]", operation, step,
                       VarnekPGL_SysGetLastErro());
}

}  // namespace

BOOL VarnekPGL_AcquireMutex(int32_t hMutex) {
    auto *const slot = gMutexArr.Find(hMutex);
    if (slot == nullptr) {
        return NoSuchMutex(__func__, hMutex);
    }
    const int error = pthread_mutex_lock(&slot->info.linuxMutex);
    return error == 0 ? TRUE : MutexFails(__func__, "Lock", error);
}

BOOL VarnekPGL_ReleaseMutex(int32_t hMutex) {
    auto *const slot = gMutexArr.Find(hMutex);
    if (slot == nullptr) {
        return NoSuchMutex(__func__, hMutex);
    }
    const int error = pthread_mutex_unlock(&slot->info.linuxMutex);
    return error == 0 ? TRUE : MutexFails(__func__, "Unlock", error);
}

int32_t VarnekPGL_GetMutexByName(const char *szMutexName) {
    return gMutexArr.FindByName(szMutexName);
}

// Semaphores -------------------------------------------------------------------------------------

namespace {

int32_t __Varnek_create_semaphore(const char *szSemName, uint32_t count) {
    TRACE_LOW("***** START : __Varnek_create_semaphore. szSemName=[%s], count=[%d]",
              Shown(szSemName), static_cast<int>(count));
    if (szSemName == nullptr) {
        return VARNEK_FAIL(-1, "__Varnek_create_semaphore: szSemName == NULL");
    }
    const int strLenTmp = static_cast<int>(strlen(szSemName));
    if (strLenTmp == 0 || strLenTmp >= static_cast<int>(kNameSize)) {
        return VARNEK_FAIL(-1, "__Varnek_create_semaphore: %d (strLenTmp == 0 || strLenTmp >= %d)",
                           strLenTmp, static_cast<int>(kNameSize));
    }
    const int32_t size = gSemArr.Count();
    if (size >= MAX_SEM_MGR_INFO_ARR_SIZE) {
        return VARNEK_FAIL(
            -1, "__Varnek_create_semaphore: gSemArrSize(%d) >= MAX_SEM_MGR_INFO_ARR_SIZE(%d)", size,
            MAX_SEM_MGR_INFO_ARR_SIZE);
    }
    if (gSemArr.FindByName(szSemName) != kInvalidHandle) {
        return VARNEK_FAIL(-1, "__Varnek_create_semaphore: bDuplicatedSem == TRUE, %s, %d",
                           szSemName, size);
    }

    Hold hold(gSemArrLock);
    auto *const slot = gSemArr.FirstFree();
    if (slot == nullptr) {
        return VARNEK_FAIL(-1, "***** __Varnek_create_semaphore : Can't find empty index!!!!");
    }
    sem_t &linuxSem = slot->info.linuxSem;
    if (sem_init(&linuxSem, 0, count) != 0) {
        const int error = VarnekPGL_SysGetLastErro();
        hold.Release();
        return VARNEK_FAIL(-1, "__Varnek_create_semaphore: retSem != 0. errCode = [%d]", error);
    }
    const int word = FirstWord(linuxSem);  // before others can change it
    const int32_t hHandle = gSemArr.Publish(slot, szSemName);
    const int32_t newSize = gSemArr.Count();
    hold.Release();

    TRACE_LOW("__Varnek_create_semaphore: ret [%d]. linux Semaphore=[%d],  size = [%d]\n", hHandle,
              word, newSize);
    return hHandle;
}

// Waits without limit. A signal ends the wait as a failure.
BOOL WaitForever(int32_t hSem, Semaphores::Slot *slot) {
    const int retSem = sem_wait(&slot->info.linuxSem);
    TRACE_LOW_QUICK("VarnekPGL_WaitSemaphore: hSem[%d], arrIdx[%d]\n", hSem,
                    gSemArr.NumberOf(slot));
    if (retSem != 0) {
        return VARNEK_FAIL(FALSE, "VarnekPGL_WaitSemaphore: retSem != 0, errCode = [%d]",
                           VarnekPGL_SysGetLastErro());
    }
    return TRUE;
}

// Waits with a limit. It looks the handle up again, as late as possible before the wait.
BOOL WaitUntilDeadline(int32_t hSem, uint32_t timeout) {
    timespec curTime = {};
    timespec semTimeOut = {};
    int retSem = clock_gettime(CLOCK_REALTIME, &curTime);
    if (retSem == 0) {
        semTimeOut = DeadlineAfter(curTime, timeout);
        auto *const slot = gSemArr.Find(hSem);
        if (slot == nullptr) {
            return VARNEK_FAIL(FALSE, "VarnekPGL_WaitSemaphore: arrIdx == -1, %d", hSem);
        }
        retSem = sem_timedwait(&slot->info.linuxSem, &semTimeOut);
    }
    if (retSem == 0) {
        return TRUE;
    }
    if (VarnekPGL_SysGetLastErro() == ETIMEDOUT) {
        return FALSE;
    }
    TRACE_ERROR("VarnekPGL_WaitSemaphore: retSem [%d] != 0, timeout [%d] errCode = [%d]", retSem,
                static_cast<int>(timeout), VarnekPGL_SysGetLastErro());
    TRACE_ERROR("VarnekPGL_WaitSemaphore: curTime.tv_sec[%d] curTime.tv_nsec[%d]",
                static_cast<int>(curTime.tv_sec), static_cast<int>(curTime.tv_nsec));
    TRACE_ERROR("VarnekPGL_WaitSemaphore: semTimeOut.tv_sec[%d] semTimeOut.tv_nsec[%d]",
                static_cast<int>(semTimeOut.tv_sec), static_cast<int>(semTimeOut.tv_nsec));
    return FALSE;
}

}  // namespace

int32_t VarnekPGL_CreateSemaphore(const char *szSemName, uint32_t count) {
    const int32_t hOld = gSemArr.FindByName(szSemName);
    if (hOld != kInvalidHandle) {
        TRACE_HIGH("szSemName=[%s]. Duplicated Semaphore. Old one will be destroyed!\n", szSemName);
        VarnekPGL_DeleteSemaphore(hOld);
    }
    return __Varnek_create_semaphore(szSemName, count);
}

BOOL VarnekPGL_DeleteSemaphore(int32_t hSem) {
    Hold hold(gSemArrLock);
    auto *const slot = gSemArr.Find(hSem);
    if (slot == nullptr) {
        hold.Release();
        return VARNEK_FAIL(FALSE, "Varnek_delete_semaphore: arrIdx == -1, %d", hSem);
    }
    const int32_t size = gSemArr.Withdraw(slot);
    if (sem_destroy(&slot->info.linuxSem) != 0) {
        TRACE_ERROR("Varnek_delete_semaphore: retSem != 0, errCode = [%d]",
                    VarnekPGL_SysGetLastErro());
    }
    hold.Release();
    TRACE_LOW("Varnek_delete_semaphore: OK %d", size);
    return TRUE;
}

BOOL VarnekPGL_WaitSemaphore(int32_t hSem, uint32_t timeout) {
    auto *const slot = gSemArr.Find(hSem);
    TRACE_LOW_QUICK("VarnekPGL_WaitSemaphore: hSem[%d], arrIdx[%d]", hSem, gSemArr.NumberOf(slot));
    if (slot == nullptr) {
        return VARNEK_FAIL(FALSE, "VarnekPGL_WaitSemaphore: arrIdx == -1, %d", hSem);
    }
    return timeout == WAIT_FOREVER ? WaitForever(hSem, slot) : WaitUntilDeadline(hSem, timeout);
}

BOOL VarnekPGL_SignalSemaphore(int32_t hSem) {
    auto *const slot = gSemArr.Find(hSem);
    TRACE_LOW_QUICK("VarnekPGL_SignalSemaphore: hSem[%d], arrIdx[%d]\n", hSem,
                    gSemArr.NumberOf(slot));
    if (slot == nullptr) {
        return VARNEK_FAIL(FALSE, "VarnekPGL_SignalSemaphore: arrIdx == -1, %d", hSem);
    }
    const int retSem = sem_post(&slot->info.linuxSem);
    TRACE_LOW_QUICK("VarnekPGL_SignalSemaphore: hSem[%d], arrIdx[%d]\n", hSem,
                    gSemArr.NumberOf(slot));
    if (retSem != 0) {
        return VARNEK_FAIL(FALSE, "VarnekPGL_SignalSemaphore: retSem != 0, errCode = [%d]",
                           VarnekPGL_SysGetLastErro());
    }
    return TRUE;
}

int32_t VarnekPGL_SemaphoreByName(const char *szSemName) {
    return gSemArr.FindByName(szSemName);
}
