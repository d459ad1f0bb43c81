#include "Varnek_Semaphore.h"

#include <semaphore.h>

#include <chrono>
#include <thread>

#include "support/VarnekTest.h"

namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::MatchesRegex;

const std::string k31 = "a name of thirty-one characters";
const std::string k32 = k31 + "!";

class Mutex : public VarnekTest {};
class Semaphore : public VarnekTest {};

TEST_F(Mutex, HandlesRiseAndNeverComeBack) {
    EXPECT_EQ(VarnekPGL_CreateMutex("one"), 1);
    EXPECT_EQ(VarnekPGL_CreateMutex(k31.c_str()), 2);
    EXPECT_EQ(VarnekPGL_CreateMutex(k32.c_str()), -1) << "a failure takes no handle";
    EXPECT_EQ(VarnekPGL_GetMutexByName(k31.c_str()), 2);
    EXPECT_EQ(VarnekPGL_GetMutexByName("One"), -1);
    EXPECT_TRUE(VarnekPGL_DeleteMutex(1));
    EXPECT_EQ(VarnekPGL_GetMutexByName("one"), -1);
    EXPECT_EQ(VarnekPGL_CreateMutex("one"), 3);
    TakeLog();
    EXPECT_EQ(VarnekPGL_CreateMutex("one"), 4);
    EXPECT_THAT(TakeBodies(),
                ElementsAre("szMutexName=[one]. Duplicated Mutex. Old one will be destroyed!\n",
                            "***** START : VarnekPGL_DeleteMutex. hMutex=[3]", "***** END : VarnekPGL_DeleteMutex",
                            "***** START : __Varnek_create_mutex. szMutexName=[one]",
                            MatchesRegex("\\*\\*\\*\\*\\* END : __Varnek_create_mutex mutex handle = 4, "
                                         "linuxMutex=\\[.*\\]\n")));
    // Handles that share a place among the lookup's hints.
    for (int handle = 5; handle < 300; handle++) {
        EXPECT_EQ(VarnekPGL_CreateMutex("again"), handle);
    }
    EXPECT_TRUE(VarnekPGL_AcquireMutex(2) && VarnekPGL_ReleaseMutex(2));
    EXPECT_TRUE(VarnekPGL_AcquireMutex(299) && VarnekPGL_ReleaseMutex(299));
}

TEST_F(Mutex, NamesThatResembleEachOther) {
    // The first two have one digest; a slot keeps the rest of a longer name that it had before.
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

TEST_F(Semaphore, ALogFunctionMayUseTheFamilyOnceTheLockIsFree) {
    static int32_t inner = 0;
    gLogHook = [](const LogLine &line) {
        if (line.text.find("arrIdx == -1") != std::string::npos) {
            inner = VarnekPGL_CreateSemaphore("inner", 0);
        }
    };
    EXPECT_FALSE(VarnekPGL_DeleteSemaphore(77));
    gLogHook = nullptr;
    EXPECT_EQ(inner, 1);
}

TEST_F(Mutex, FailuresHaveTheirLineAndResult) {
    const int32_t held = VarnekPGL_CreateMutex("held");
    VarnekPGL_AcquireMutex(held);
    TakeLog();
    ExpectRows({
        {VarnekPGL_CreateMutex(nullptr), -1, {"***** __Varnek_create_mutex : Mutex name is null!!"}},
        {VarnekPGL_CreateMutex(""),
         -1,
         {"***** __Varnek_create_mutex : Invalid Mutex Name. szMutexName = [], Len = [0]"}},
        {VarnekPGL_CreateMutex(k32.c_str()),
         -1,
         {"***** __Varnek_create_mutex : Invalid Mutex Name. szMutexName = [" + k32 + "], Len = [32]"}},
        {VarnekPGL_CreateMutex("held"),
         -1,
         {"***** VarnekPGL_DeleteMutex : Mutex Destroy FAIL! errCode = [16]",
          "***** __Varnek_create_mutex : Duplicated Mutex. mutex name = [held]"}},
        {VarnekPGL_DeleteMutex(-1),
         FALSE,
         {"***** VarnekPGL_DeleteMutex : Can't find mutex info. mutex handle = [-1]"}},
        {VarnekPGL_AcquireMutex(0),
         FALSE,
         {"***** VarnekPGL_AcquireMutex : Can't find mutex info. mutex handle = [0]"}},
        {VarnekPGL_ReleaseMutex(2147483647),
         FALSE,
         {"***** VarnekPGL_ReleaseMutex : Can't find mutex info. mutex handle = [2147483647]"}},
        {VarnekPGL_GetMutexByName(nullptr), -1, {}},
        {VarnekPGL_GetMutexByName(""), -1, {}},
    });
    EXPECT_EQ(VarnekPGL_GetMutexByName("held"), held) << "a held mutex survives";
    EXPECT_TRUE(VarnekPGL_ReleaseMutex(held));
    EXPECT_TRUE(VarnekPGL_DeleteMutex(held));
}

TEST_F(Mutex, FortyFitAndExclude) {
    int32_t handles[40];
    for (int i = 0; i < 40; i++) {
        handles[i] = VarnekPGL_CreateMutex(("m" + std::to_string(i)).c_str());
        EXPECT_EQ(handles[i], i + 1);
    }
    TakeLog();
    EXPECT_EQ(VarnekPGL_CreateMutex("one more"), -1);
    EXPECT_THAT(TakeErrors(), ElementsAre("***** __Varnek_create_mutex : Mutex pool is full. "
                                          "gMutexArrSize = [40]"));
    int count = 0;
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; i++) {
        threads.emplace_back([&count, handle = handles[39]] {
            for (int n = 0; n < 20000; n++) {
                VarnekPGL_AcquireMutex(handle);
                count++;
                VarnekPGL_ReleaseMutex(handle);
            }
        });
    }
    for (std::thread &thread : threads) {
        thread.join();
    }
    EXPECT_EQ(count, 80000);
    EXPECT_THAT(TakeLog(), IsEmpty()) << "acquire and release trace nothing";
    EXPECT_TRUE(VarnekPGL_DeleteMutex(handles[7]));
    EXPECT_EQ(VarnekPGL_CreateMutex("m7"), 41);
}

TEST_F(Semaphore, HandlesCountApartAndUnitsAreKept) {
    VarnekPGL_CreateMutex("a mutex");
    const int32_t sem = VarnekPGL_CreateSemaphore(k31.c_str(), 3);
    EXPECT_EQ(sem, 1);
    for (BOOL taken : {TRUE, TRUE, TRUE, FALSE}) {
        EXPECT_EQ(VarnekPGL_WaitSemaphore(sem, 0), taken);
    }
    EXPECT_THAT(TakeErrors(), IsEmpty()) << "a time-out traces no Error";
    EXPECT_TRUE(VarnekPGL_SignalSemaphore(sem));
    EXPECT_TRUE(VarnekPGL_WaitSemaphore(sem, WAIT_FOREVER));
    TakeLog();
    EXPECT_EQ(VarnekPGL_CreateSemaphore(k31.c_str(), 0), 2);
    EXPECT_THAT(TakeBodies(), ElementsAre("szSemName=[" + k31 +
                                              "]. Duplicated Semaphore. Old one will be "
                                              "destroyed!\n",
                                          "Varnek_delete_semaphore: OK 0",
                                          "***** START : __Varnek_create_semaphore. szSemName=[" + k31 + "], count=[0]",
                                          MatchesRegex("__Varnek_create_semaphore: ret \\[2\\]. linux "
                                                       "Semaphore=\\[.*\\],  size = \\[1\\]\n")));
    EXPECT_EQ(VarnekPGL_SemaphoreByName(k31.c_str()), 2);
    EXPECT_TRUE(VarnekPGL_SignalSemaphore(2));
    EXPECT_THAT(TakeBodies(), ElementsAre("VarnekPGL_SignalSemaphore: hSem[2], arrIdx[0]\n",
                                          "VarnekPGL_SignalSemaphore: hSem[2], arrIdx[0]\n"));
    EXPECT_TRUE(VarnekPGL_WaitSemaphore(2, WAIT_FOREVER));
    EXPECT_THAT(TakeBodies(), ElementsAre("VarnekPGL_WaitSemaphore: hSem[2], arrIdx[0]",
                                          "VarnekPGL_WaitSemaphore: hSem[2], arrIdx[0]\n"));
}

TEST_F(Semaphore, FailuresHaveTheirLineAndResult) {
    const std::string lookup = "VarnekPGL_WaitSemaphore: arrIdx == -1, ";
    ExpectRows({
        {VarnekPGL_CreateSemaphore(nullptr, 0), -1, {"__Varnek_create_semaphore: szSemName == NULL"}},
        {VarnekPGL_CreateSemaphore("", 0), -1, {"__Varnek_create_semaphore: 0 (strLenTmp == 0 || strLenTmp >= 32)"}},
        {VarnekPGL_CreateSemaphore(k32.c_str(), 0),
         -1,
         {"__Varnek_create_semaphore: 32 (strLenTmp == 0 || strLenTmp >= 32)"}},
        {VarnekPGL_CreateSemaphore("much", 0xFFFFFFFF), -1, {"__Varnek_create_semaphore: retSem != 0. errCode = [22]"}},
        {VarnekPGL_DeleteSemaphore(1), FALSE, {"Varnek_delete_semaphore: arrIdx == -1, 1"}},
        {VarnekPGL_WaitSemaphore(-1, 0), FALSE, {lookup + "-1"}},
        {VarnekPGL_WaitSemaphore(0, WAIT_FOREVER), FALSE, {lookup + "0"}},
        {VarnekPGL_SignalSemaphore(9), FALSE, {"VarnekPGL_SignalSemaphore: arrIdx == -1, 9"}},
        {VarnekPGL_SemaphoreByName(nullptr), -1, {}},
        {VarnekPGL_CreateSemaphore("brimful", SEM_VALUE_MAX), 1, {}},
        {VarnekPGL_SignalSemaphore(1), FALSE, {"VarnekPGL_SignalSemaphore: retSem != 0, errCode = [75]"}},
        {VarnekPGL_DeleteSemaphore(1), TRUE, {}},
    });
    for (int i = 0; i < 40; i++) {
        EXPECT_EQ(VarnekPGL_CreateSemaphore(std::to_string(i).c_str(), 0), i + 2);
    }
    EXPECT_EQ(VarnekPGL_CreateSemaphore("one more", 0), -1);
    EXPECT_THAT(TakeErrors(), ElementsAre("__Varnek_create_semaphore: gSemArrSize(40) >= "
                                          "MAX_SEM_MGR_INFO_ARR_SIZE(40)"));
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
