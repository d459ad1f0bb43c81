// Failing calls of the C library: result, line, and that everything is as before.
#include <cerrno>
#include <filesystem>
#include <functional>
#include <future>

#include "Varnek_CBitInputStream.h"
#include "Varnek_CRingBuffer.h"
#include "Varnek_CString.h"
#include "Varnek_Config.h"
#include "Varnek_List.h"
#include "Varnek_LngPack.h"
#include "Varnek_Semaphore.h"
#include "Varnek_Thread.h"
#include "Varnek_Timer.h"
#include "Varnek_Util.h"
#include "support/FailingCalls.h"
#include "support/VarnekTest.h"

namespace {

using ::testing::ElementsAreArray;

class Fault : public VarnekTest {};

void *Nothing(void *) { return nullptr; }

// A call of the library, made once while a call of the C library fails. Every operation runs again
// afterwards, and then succeeds.
struct FaultRow {
    const char *call;
    int error;
    std::function<int64_t()> operation;
    int64_t expected;
    std::vector<std::string> lines;
};

void ExpectFaults(const std::vector<FaultRow> &rows) {
    for (const FaultRow &row : rows) {
        TakeLog();
        FailCall(row.call, 1, row.error);
        EXPECT_EQ(row.operation(), row.expected) << row.call;
        FailCall(row.call, 0, 0);
        EXPECT_THAT(TakeErrors(), ElementsAreArray(row.lines)) << row.call;
    }
}

TEST_F(Fault, MutexesAndSemaphores) {
    const int32_t mutex = VarnekPGL_CreateMutex("mutex");
    const int32_t sem = VarnekPGL_CreateSemaphore("sem", 2);
    ExpectFaults({
        {"pthread_mutex_init",
         ENOMEM,
         [] { return VarnekPGL_CreateMutex("new"); },
         -1,
         {"***** __Varnek_create_mutex : Mutex creation FAIL!! errCode = [12]"}},
        {"pthread_mutex_lock",
         EINVAL,
         [=] { return VarnekPGL_AcquireMutex(mutex); },
         FALSE,
         {"***** VarnekPGL_AcquireMutex : Mutex Lock FAIL! errCode = [22]"}},
        {"pthread_mutex_unlock",
         EPERM,
         [=] { return VarnekPGL_AcquireMutex(mutex) && VarnekPGL_ReleaseMutex(mutex); },
         FALSE,
         {"***** VarnekPGL_ReleaseMutex : Mutex Unlock FAIL! errCode = [1]"}},
        {"pthread_mutex_destroy",
         EBUSY,
         [=] { return VarnekPGL_ReleaseMutex(mutex) && VarnekPGL_DeleteMutex(mutex); },
         FALSE,
         {"***** VarnekPGL_DeleteMutex : Mutex Destroy FAIL! errCode = [16]"}},
        {"sem_init",
         ENOSPC,
         [] { return VarnekPGL_CreateSemaphore("new", 0); },
         -1,
         {"__Varnek_create_semaphore: retSem != 0. errCode = [28]"}},
        {"sem_wait",
         EINTR,
         [=] { return VarnekPGL_WaitSemaphore(sem, WAIT_FOREVER); },
         FALSE,
         {"VarnekPGL_WaitSemaphore: retSem != 0, errCode = [4]"}},
        {"sem_timedwait", ETIMEDOUT, [=] { return VarnekPGL_WaitSemaphore(sem, 5); }, FALSE, {}},
        {"clock_gettime",
         EFAULT,
         [=] { return VarnekPGL_WaitSemaphore(sem, 5); },
         FALSE,
         {"VarnekPGL_WaitSemaphore: retSem [-1] != 0, timeout [5] errCode = [14]",
          "VarnekPGL_WaitSemaphore: curTime.tv_sec[0] curTime.tv_nsec[0]",
          "VarnekPGL_WaitSemaphore: semTimeOut.tv_sec[0] semTimeOut.tv_nsec[0]"}},
        {"sem_post",
         EINVAL,
         [=] { return VarnekPGL_SignalSemaphore(sem); },
         FALSE,
         {"VarnekPGL_SignalSemaphore: retSem != 0, errCode = [22]"}},
    });
    FailCall("sem_timedwait", 1, EINTR);
    EXPECT_FALSE(VarnekPGL_WaitSemaphore(sem, 5));
    EXPECT_EQ(TakeErrors().size(), 3u) << "an interrupted wait ends with three lines";
    EXPECT_EQ(VarnekPGL_CreateMutex("new"), mutex + 1) << "a failure takes no handle";
    EXPECT_TRUE(VarnekPGL_AcquireMutex(mutex) && VarnekPGL_ReleaseMutex(mutex));
    EXPECT_TRUE(VarnekPGL_DeleteMutex(mutex));
    EXPECT_TRUE(VarnekPGL_WaitSemaphore(sem, 0) && VarnekPGL_WaitSemaphore(sem, 0));
    ExpectFaults({{"sem_destroy",
                   EINVAL,
                   [=] { return VarnekPGL_DeleteSemaphore(sem); },
                   TRUE,
                   {"Varnek_delete_semaphore: retSem != 0, errCode = [22]"}}});
    EXPECT_EQ(VarnekPGL_CreateSemaphore("new", 0), sem + 1);
}

TEST_F(Fault, Threads) {
    const auto create = [] { return VarnekPGL_CreateThread("new", 1, 0, Nothing, nullptr); };
    const std::string end = "***** END : __Varnek_create_thread, thread creation failed";
    const std::string fail = "Thread Creation Fail! szThreadName=[new]\n";
    ExpectFaults({
        {"pthread_mutex_init",
         ENOMEM,
         create,
         -1,
         {"***** __Varnek_create_mutex : Mutex creation FAIL!! errCode = [12]",
          "***** __Varnek_create_thread : Thread Mutex Creation Fail!!", fail}},
        {"sem_init",
         ENOSPC,
         create,
         -1,
         {"***** __Varnek_create_thread : MsgQ Sem creation FAIL!! errCode = [28]", end, fail}},
        {"pthread_create",
         EAGAIN,
         create,
         -1,
         {"***** __Varnek_create_thread : pthread creation FAIL!! errCode = [11]", end, fail}},
    });
    EXPECT_EQ(VarnekPGL_GetThreadByName("new"), -1);
    EXPECT_EQ(create(), 1) << "a failure gives its handle back";
    ExpectFaults({{"sem_destroy",
                   EINVAL,
                   [] { return VarnekPGL_DeleteThread(1); },
                   TRUE,
                   {"***** VarnekPGL_DeleteThread : semaphore destroy FAIL!! errCode = [22]"}}});
    EXPECT_EQ(create(), 2);
}

struct Done {
    std::promise<void> promise;
};

// Runs in a registered thread of handle 1: what goes wrong with its own queue.
void *UseOwnQueue(void *done) {
    const THREAD_MSG message = {};
    const int32_t self = VarnekPGL_GetCurrentThread();
    const auto send = [&] { return VarnekPGL_SendMessage(self, &message); };
    const auto urgent = [&] { return VarnekPGL_SendUrgentMessage(self, &message); };
    THREAD_MSG received;
    int32_t count = -1;
    const auto receive = [&](uint32_t timeout) { return VarnekPGL_ReceiveMessage(timeout, &received, &count); };
    const std::string sendLine = "***** VarnekPGL_SendMessage: ";
    const std::string urgentLine = "***** VarnekPGL_SendUrgentMessage: ";
    const std::string receiveLine = "***** VarnekPGL_ReceiveMessage: ";
    ExpectFaults({
        {"malloc", ENOMEM, send, FALSE, {sendLine + "memalloc failed"}},
        {"malloc", ENOMEM, urgent, FALSE, {urgentLine + "memalloc failed"}},
        {"sem_getvalue", EINVAL, send, TRUE, {sendLine + "Semaphore Get Value FAIL. errCode = [22]"}},
        {"sem_getvalue",
         EINVAL,
         [&] { return receive(0); },
         TRUE,
         {receiveLine + "Semaphore Get Value FAIL. errCode = [-1]"}},
    });
    // The second allocation of a send is the node's.
    for (const auto &sending : {std::function<BOOL()>(send), std::function<BOOL()>(urgent)}) {
        FailCall("malloc", 2, ENOMEM);
        EXPECT_FALSE(sending());
    }
    TakeLog();
    EXPECT_FALSE(receive(0)) << "a failed send leaves neither a message nor a signal";
    EXPECT_EQ(TakeErrors()[0], receiveLine + "Semaphore wait FAIL. errCode = [110]");
    ExpectFaults({
        {"sem_post", EOVERFLOW, send, FALSE, {sendLine + "Semaphore Post FAIL. errCode = [75]"}},
        {"sem_post", EOVERFLOW, urgent, FALSE, {urgentLine + "Semaphore Post FAIL. errCode = [75]"}},
        {"sem_wait",
         EINTR,
         [&] { return receive(WAIT_FOREVER); },
         FALSE,
         {receiveLine + "Semaphore wait FAIL. errCode = [4]"}},
        {"clock_gettime",
         EFAULT,
         [&] { return receive(7); },
         FALSE,
         {receiveLine + "Semaphore wait FAIL. errCode = [14]"}},
    });
    EXPECT_TRUE(VarnekPGL_PeekMessage(&received, &count)) << "what a failed post queued stays queued";
    EXPECT_EQ(count, 1);
    static_cast<Done *>(done)->promise.set_value();
    return nullptr;
}

TEST_F(Fault, Messages) {
    Done done;
    ASSERT_EQ(VarnekPGL_CreateThread("self", 1, 0, UseOwnQueue, &done), 1);
    done.promise.get_future().wait();
    TakeLog();
    EXPECT_TRUE(VarnekPGL_DeleteThread(1));
    EXPECT_EQ(TakeErrors()[0], "***** VarnekPGL_DeleteThread : MsgQ is not empty!!size = [1]");
}

TEST_F(Fault, Timers) {
    const TimerCallbackFunc callback = [](uint32_t, void *) {};
    ASSERT_EQ(VarnekPGL_CreateTimer("timer"), 0);
    const auto start = [=] { return VarnekPGL_StartTimer(0, 60000, callback, nullptr); };
    const std::vector<FaultRow> creations = {
        {"timer_create", EAGAIN, start, FALSE, {"VarnekPGL_StartTimer. Linux Timer Creation FAIL. errCode = [-1]!"}},
        {"timer_settime", EINVAL, start, FALSE, {"VarnekPGL_StartTimer. Set Timer is FAIL. errCode = [-1]!"}},
    };
    ExpectFaults(creations);
    EXPECT_FALSE(VarnekPGL_CancelTimer(0)) << "a failed start leaves the timer as created";
    EXPECT_TRUE(start());
    ExpectFaults({
        {"timer_gettime", EINVAL, start, FALSE, {"VarnekPGL_StartTimer. Get Timer info is FAIL. errCode = [-1]!"}},
        {"timer_gettime",
         EINVAL,
         [] { return VarnekPGL_CancelTimer(0); },
         FALSE,
         {"VarnekPGL_CancelTimer. Get Timer info FAIL. timer : errCode = [-1]"}},
        {"timer_gettime",
         EINVAL,
         [] { return VarnekPGL_IsTimerActive(0); },
         FALSE,
         {"VarnekPGL_IsTimerActive. Get Timer info FAIL. errCode = [-1]!"}},
        {"timer_settime",
         EINVAL,
         [] { return VarnekPGL_CancelTimer(0); },
         FALSE,
         {"VarnekPGL_CancelTimer. Set Timer FAIL. errCode = [22][Invalid argument]"}},
    });
    EXPECT_TRUE(VarnekPGL_IsTimerActive(0));
    EXPECT_TRUE(VarnekPGL_CancelTimer(0));
    ExpectFaults({{"timer_settime", EINVAL, start, FALSE, creations[1].lines}});
    EXPECT_TRUE(start()) << "a timer whose arming failed is made anew";
    ExpectFaults({{"timer_delete",
                   EINVAL,
                   [] { return VarnekPGL_DeleteTimer(0); },
                   TRUE,
                   {"VarnekPGL_DeleteTimer. Delete Timer is FAIL. errCode = [-1]!"}}});
    EXPECT_EQ(VarnekPGL_CreateTimer("timer"), 0);
}

TEST_F(Fault, AListWithoutMemoryStaysAsItIs) {
    list_t list;
    list_initialize(&list);
    int data = 0;
    list_insert(&list, &data);
    for (int operation = 0; operation < 3; operation++) {
        FailCall("malloc", 1, ENOMEM);
        operation == 0   ? list_insertHead(&list, &data)
        : operation == 1 ? list_insertTail(&list, &data)
                         : list_insertAt(&list, 0, &data);
        EXPECT_EQ(list.count, 1);
        EXPECT_EQ(list.head, list.tail);
    }
    EXPECT_EQ(list_removeHead(&list), &data);
}

TEST_F(Fault, ABitStreamWithoutMemoryIsAtItsEnd) {
    unsigned char byte = 0xFF;
    const VarnekCBitInputStream whole(&byte, 1, 1);
    FailCall("operator new[]", 1, ENOMEM);
    VarnekCBitInputStream failed(&byte, 1, 1);
    FailCall("operator new[]", 1, ENOMEM);
    VarnekCBitInputStream copy(whole);
    VarnekCBitInputStream target(&byte, 1, 0);
    FailCall("operator new[]", 1, ENOMEM);
    target = whole;
    EXPECT_EQ(TakeErrors(), std::vector<std::string>(3, "BIS: Out of memory! length=[1]\n"));
    for (VarnekCBitInputStream *stream : {&failed, &copy, &target}) {
        unsigned char flag = 1;
        EXPECT_EQ(stream->ReadByte(8, flag), 0);
        EXPECT_EQ(flag, 0);
        stream->RwindToFirst();
        EXPECT_EQ(stream->GetByteArray(&byte, 1), -22);
    }
}

TEST_F(Fault, ARingWithoutMemoryHasNoStorage) {
    VarnekCRingBuffer whole(4);
    FailCall("malloc", 1, ENOMEM);
    VarnekCRingBuffer failed(4);
    FailCall("malloc", 1, ENOMEM);
    VarnekCRingBuffer copy(whole);
    FailCall("malloc", 1, ENOMEM);
    EXPECT_EQ(whole.Reset(5), -8);
    const std::string line = "Ring Buffer: Out of memory! size=[";
    EXPECT_THAT(TakeErrors(), ElementsAreArray({line + "4]\n", line + "4]\n", line + "5]\n"}));
    for (VarnekCRingBuffer *ring : {&whole, &failed, &copy}) {
        const unsigned char byte = 1;
        EXPECT_EQ(ring->Write(&byte, 1), -8);
        EXPECT_EQ(ring->GetSpaceReading() + ring->GetSpaceWriting() + ring->GetDistance(), 0);
        EXPECT_EQ(ring->Reset(4) + ring->Write(&byte, 1), 0);
    }
}

TEST_F(Fault, AStringWithoutMemoryIsNullOrUnchanged) {
    const VarnekCString empty(""), text("text");
    VarnekCString target("a"), kept("text");
    const std::function<void()> operations[] = {
        [&] { EXPECT_EQ(text.String(), nullptr); },         [&] { target = text; }, [&] { target = "text"; },
        [&] { EXPECT_EQ(VarnekCString(text) == text, 0); }, [&] { kept += text; },  [&] { kept += "text"; },
    };
    for (const auto &operation : operations) {
        target = "a";
        FailCall("operator new[]", 1, ENOMEM);
        operation();
        EXPECT_EQ(TakeErrors()[0].find("String: Out of memory! length=["), 0u);
    }
    EXPECT_TRUE(kept == text);
    FailCall("operator new[]", 1, ENOMEM);
    target = text;
    EXPECT_EQ(target == empty, 0);
    target += "text";
    EXPECT_TRUE(target == text);
}

class FaultAlone : public Fault {};

TEST_F(FaultAlone, SettingsStayWhenAFileCannotBeRead) {
    const std::string path = VARNEK_DATA_DIR "Varnek_Config.cfg";
    std::error_code ignored;
    std::filesystem::rename(path, path + ".aside", ignored);
    WriteAll(path, "CONFIG_STANDARDTYPE=5");
    FailCall("malloc", 1, ENOMEM);
    VarnekCfg_LoadConfigFile();
    EXPECT_EQ(TakeBodies().back(), "  VarnekCfg_LoadConfigFile : Out of memory!");
    EXPECT_EQ(VarnekCfg_GetConfigInfo()->cprmPlayerDelay, 68);
    VarnekCfg_LoadConfigFile();
    EXPECT_EQ(VarnekCfg_GetStandard(), 5);
    std::filesystem::remove(path);
    std::filesystem::rename(path + ".aside", path, ignored);
}

TEST_F(Fault, BlocksThatCannotBeAllocated) {
    const std::string path = Path("file");
    WriteAll(path, "12345678");
    char *const kept = static_cast<char *>(malloc(1));
    char *output = kept;
    const auto check = [&] { return VarnekUtil_CheckFileCRC32(path.c_str()); };
    const auto append = [&] { return VarnekUtil_AppendCRC32ToFile(path.c_str()); };
    const auto convert = [&] { return VarnekPGL_ConvertLatin15toUTF8(&output, "text", 4); };
    ExpectFaults({
        {"malloc", ENOMEM, check, FALSE, {"File Reading Fail!\n"}},
        {"malloc", ENOMEM, append, FALSE, {"File Reading Fail!\n"}},
    });
    for (int nth = 1; nth <= 3; nth++) {
        FailCall("malloc", nth, ENOMEM);
        EXPECT_FALSE(convert()) << nth;
        EXPECT_EQ(output, kept) << "a failure leaves the caller's block alone";
    }
    EXPECT_TRUE(convert());
    EXPECT_STREQ(output, "text");
    free(output);
    EXPECT_EQ(ReadAll(path), "12345678");
}

}  // namespace
