#include <semaphore.h>

#include "../CommonUtility/source/Varnek_Clock.h"
#include "Varnek_Semaphore.h"
#include "support/VarnekTest.h"

namespace {

using ::testing::IsEmpty;

const std::string k31 = "a name of thirty-one characters";
const std::string k32 = k31 + "!";

class Mutex : public VarnekTest {};
class Semaphore : public VarnekTest {};

TEST_F(Mutex, HandlesRiseAndNeverComeBack) {
    EXPECT_EQ(VarnekPGL_CreateMutex("one"), 1);
    EXPECT_EQ(VarnekPGL_CreateMutex(k31.c_str()), 2);
    EXPECT_EQ(VarnekPGL_CreateMutex(k32.c_str()), -1) << "a failure took a handle";
    EXPECT_EQ(VarnekPGL_GetMutexByName(k31.c_str()), 2);
    EXPECT_EQ(VarnekPGL_GetMutexByName("One"), -1);
    EXPECT_TRUE(VarnekPGL_DeleteMutex(1));
    EXPECT_EQ(VarnekPGL_GetMutexByName("one"), -1);
    EXPECT_EQ(VarnekPGL_CreateMutex("one"), 3);
    NOTE(VarnekPGL_CreateMutex)("one");
    // So many that some share a place among the hints for looking them up.
    for (int handle = 5; handle < 300; handle++) {
        EXPECT_EQ(VarnekPGL_CreateMutex("again"), handle);
    }
    TakeLog();
    EXPECT_TRUE(VarnekPGL_AcquireMutex(2) && VarnekPGL_ReleaseMutex(2));
    EXPECT_THAT(TakeLog(), IsEmpty()) << "acquire or release traced";
    EXPECT_TRUE(VarnekPGL_AcquireMutex(299) && VarnekPGL_ReleaseMutex(299));
}

TEST_F(Mutex, NamesThatResembleEachOther) {
    // Some begin alike, four end in the same word, that of the terminator, and a slot keeps the end of a longer name.
    const char *const names[] = {"aaaazaaa", "baaa[aaa", "aaaazaaabbbb", "aaaa", "aaa"};
    EXPECT_TRUE(VarnekPGL_DeleteMutex(VarnekPGL_CreateMutex("baaa[aaabbbbcccc")));
    for (const char *name : names) {
        const int32_t handle = VarnekPGL_CreateMutex(name);
        EXPECT_NE(handle, -1) << name;
        EXPECT_TRUE(VarnekPGL_DeleteMutex(handle));
        EXPECT_EQ(VarnekPGL_GetMutexByName(name), -1);
    }
    for (int32_t i = 0; i < 5; i++) {
        EXPECT_EQ(VarnekPGL_CreateMutex(names[i]), 7 + i);
    }
    for (int32_t i = 0; i < 5; i++) {
        EXPECT_EQ(VarnekPGL_GetMutexByName(names[i]), 7 + i) << names[i];
    }
}

TEST_F(Semaphore, ADeadlineCarriesItsNanoseconds) {
    const auto after = [](uint32_t timeout) {
        const timespec deadline = DeadlineAfter({100, 900000000}, timeout);
        return std::pair<int64_t, int64_t>(deadline.tv_sec, deadline.tv_nsec);
    };
    EXPECT_EQ(after(99), std::pair(int64_t{100}, int64_t{999000000}));
    EXPECT_EQ(after(100), std::pair(int64_t{101}, int64_t{0}));
    EXPECT_EQ(after(1500), std::pair(int64_t{102}, int64_t{400000000}));
}

TEST_F(Semaphore, ALogFunctionMayUseTheFamilyOnceTheLockIsFree) {
    static int32_t inner = 0;
    gLogHook = [](const LogLine &line) {
        if (line.text.find("arrIdx == -1") != std::string::npos || line.text.find(": OK") != std::string::npos) {
            inner = VarnekPGL_CreateSemaphore("inner", 0);
        }
    };
    EXPECT_FALSE(VarnekPGL_DeleteSemaphore(77));
    EXPECT_TRUE(VarnekPGL_DeleteSemaphore(inner));
    gLogHook = nullptr;
    EXPECT_EQ(inner, 2);
}

TEST_F(Mutex, FailuresHaveTheirLineAndResult) {
    notesLow_ = false;
    const int32_t held = VarnekPGL_CreateMutex("held");
    VarnekPGL_AcquireMutex(held);
    TakeLog();
    for (const char *name : {static_cast<const char *>(nullptr), "", k32.c_str(), "held"}) {
        NOTE(VarnekPGL_CreateMutex)(name);
    }
    NOTE(VarnekPGL_DeleteMutex)(-1);
    NOTE(VarnekPGL_AcquireMutex)(0);
    NOTE(VarnekPGL_ReleaseMutex)(INT32_MAX);
    EXPECT_EQ(VarnekPGL_GetMutexByName(nullptr), -1);
    EXPECT_EQ(VarnekPGL_GetMutexByName(""), -1);
    EXPECT_EQ(VarnekPGL_GetMutexByName("held"), held) << "a failure removed the mutex";
    EXPECT_TRUE(VarnekPGL_ReleaseMutex(held));
    EXPECT_TRUE(VarnekPGL_DeleteMutex(held));
}

TEST_F(Semaphore, HandlesCountApartAndUnitsAreKept) {
    VarnekPGL_CreateMutex("a mutex");
    const int32_t sem = VarnekPGL_CreateSemaphore(k31.c_str(), 3);
    EXPECT_EQ(sem, 1);
    for (BOOL taken : {TRUE, TRUE, TRUE, FALSE}) {
        EXPECT_EQ(VarnekPGL_WaitSemaphore(sem, 0), taken);
    }
    EXPECT_THAT(TakeErrors(), IsEmpty()) << "a time-out traced an Error";
    EXPECT_TRUE(VarnekPGL_SignalSemaphore(sem));
    EXPECT_TRUE(VarnekPGL_WaitSemaphore(sem, WAIT_FOREVER));
    NOTE(VarnekPGL_CreateSemaphore)(k31, 0);
    EXPECT_EQ(VarnekPGL_SemaphoreByName(k31.c_str()), 2);
    NOTE(VarnekPGL_SignalSemaphore)(2);
    NOTE(VarnekPGL_WaitSemaphore)(2, WAIT_FOREVER);
}

TEST_F(Semaphore, FailuresHaveTheirLineAndResult) {
    notesLow_ = false;
    for (const char *name : {static_cast<const char *>(nullptr), "", k32.c_str()}) {
        NOTE(VarnekPGL_CreateSemaphore)(name, 0);
    }
    NOTE(VarnekPGL_CreateSemaphore)("much", -1);
    NOTE(VarnekPGL_DeleteSemaphore)(1);
    NOTE(VarnekPGL_WaitSemaphore)(-1, 0);
    NOTE(VarnekPGL_SignalSemaphore)(9);
    EXPECT_EQ(VarnekPGL_SemaphoreByName(nullptr), -1);
    Show("count=[" + std::to_string(SEM_VALUE_MAX), "count=[SEM_VALUE_MAX");
    NOTE(VarnekPGL_CreateSemaphore)("brimful", SEM_VALUE_MAX);
    NOTE(VarnekPGL_SignalSemaphore)(1);
    EXPECT_TRUE(VarnekPGL_DeleteSemaphore(1));
}

TEST_F(Semaphore, ASignalEndsAWaitAndATimeoutLasts) {
    const int32_t sem = VarnekPGL_CreateSemaphore("sem", 0);
    const auto start = std::chrono::steady_clock::now();
    EXPECT_FALSE(VarnekPGL_WaitSemaphore(sem, 50));
    EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(45));
    for (uint32_t timeout : {20000u, 0xFFFFFFFEu, WAIT_FOREVER}) {
        std::thread signaller([sem] { VarnekPGL_SignalSemaphore(sem); });
        EXPECT_TRUE(VarnekPGL_WaitSemaphore(sem, timeout));
        signaller.join();
    }
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(15));
}

}  // namespace
