// Failing calls of the C library: result, line, and that everything is as before.
#include <algorithm>
#include <atomic>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <functional>
#include <future>

#include "Varnek_CBitInputStream.h"
#include "Varnek_CRingBuffer.h"
#include "Varnek_CString.h"
#include "Varnek_Config.h"
#include "Varnek_Debug.h"
#include "Varnek_File.h"
#include "Varnek_List.h"
#include "Varnek_LngPack.h"
#include "Varnek_Semaphore.h"
#include "Varnek_Thread.h"
#include "Varnek_Time.h"
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

TEST_F(Fault, AStartWhoseDeliveryIsDroppedIsPaidByTheNext) {
    const TimerCallbackFunc count = [](uint32_t, void *calls) { ++*static_cast<std::atomic<int> *>(calls); };
    ASSERT_EQ(VarnekPGL_CreateTimer("timer"), 0);
    for (const bool cancelled : {false, true}) {
        std::atomic<int> first{0}, second{0};
        const auto startSecond = [&] { return VarnekPGL_StartTimer(0, cancelled ? 60000 : 1, count, &second); };
        DropDelivery();
        ASSERT_TRUE(VarnekPGL_StartTimer(0, 1, count, &first));
        ASSERT_TRUE(Eventually(IsDeliveryDropped));
        ExpectFaults({{"malloc", ENOMEM, startSecond, FALSE, {"VarnekPGL_StartTimer. memalloc failed"}}});
        EXPECT_TRUE(startSecond());
        EXPECT_TRUE(!cancelled || VarnekPGL_CancelTimer(0));
        EXPECT_TRUE(Eventually([&] { return first == 1 && second == (cancelled ? 0 : 1); }));
    }
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
        [&] { EXPECT_EQ(text.String(), nullptr); },
        [&] { target = text; },
        [&] { target = "text"; },
        [&] { EXPECT_EQ(VarnekCString(text) == text, 0); },
        [&] { kept += text; },
        [&] { kept += "text"; },
        [&] { EXPECT_EQ((text + text).String(), nullptr); },
        [&] { EXPECT_EQ((text + "text").String(), nullptr); },
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
    WriteAll(path, "CONFIG_STANDARDTYPE=5");
    for (const auto &[call, reason] : {std::pair("malloc", "Out of memory!"), {"fread", "Cannot Read Config File!"}}) {
        FailCall(call, 1, EIO);
        VarnekCfg_LoadConfigFile();
        EXPECT_EQ(TakeBodies().back(), std::string("  VarnekCfg_LoadConfigFile : ") + reason);
        EXPECT_EQ(VarnekCfg_GetConfigInfo()->cprmPlayerDelay, 68);
    }
    VarnekCfg_LoadConfigFile();
    EXPECT_EQ(VarnekCfg_GetStandard(), 5);
}

TEST_F(FaultAlone, OnlyAMissingDebugConfigurationIsSeeded) {
    const std::string working = VARNEK_DATA_DIR "debug_ltn.ini", shipped = VARNEK_SYSTEM_DIR "debug_ltn.ini";
    const std::string own = ReadAll(working);
    WriteAll(shipped, "LogToUSB=1\n");
    FailCall("fopen", 1, EMFILE);
    VarnekPGL_InitializeDebug();
    std::filesystem::remove(shipped);
    EXPECT_EQ(ReadAll(working), own);
}

TEST_F(Fault, ASizeIsTheFilesWhateverTheStreamsPosition) {
    const std::string file = Path("file");
    WriteAll(file, "12345678");
    const PglFileHandle handle = VarnekPGL_OpenFile(file.c_str(), PGL_FILE_MODE_READ);
    ExpectFaults({
        {"ftell", EOVERFLOW, [&] { return VarnekPGL_GetFileSize(file.c_str()); }, 8, {}},
        {"ftell", EOVERFLOW, [&] { return VarnekPGL_GetFileSizeByHandle(handle); }, 8, {}},
        {"fflush",
         EBADF,
         [&] { return FailCall("ftell", 1, EOVERFLOW), VarnekPGL_GetFileSizeByHandle(handle); },
         8,
         {}},
    });
    FailCall("ftell", 0, 0);
    VarnekPGL_CloseFile(handle);
}

// An operation that leaves nothing behind, made again and again, while the first, second, ... call of
// each function fails, until there is none left to fail.
struct Operation {
    const char *name;
    std::function<int64_t()> run;
    int64_t success;
    std::vector<int64_t> failures;  // as one of them, or as success where a call's failure does no harm
    bool quiet = false;             // says nothing of some failures
};

TEST_F(FaultAlone, EveryOperationSurvivesTheFailureOfEachOfItsCalls) {
    const std::string file = Path("file"), copy = Path("copy"), directory = Path("directory");
    const int32_t sink = VarnekPGL_CreateThread("sink", 1, 0, Nothing, nullptr);
    const int32_t semaphore = VarnekPGL_CreateSemaphore("semaphore", 0);
    const VarnekConfigInfo initial = *VarnekCfg_GetConfigInfo();
    char bytes[8] = {};
    unsigned char raw[8] = {};
    const auto content = [&] { WriteAll(file, "12345678"); };
    const std::vector<Operation> operations = {
        {"mutex", [] { return VarnekPGL_DeleteMutex(VarnekPGL_CreateMutex("new")); }, TRUE, {FALSE}},
        {"semaphore", [] { return VarnekPGL_DeleteSemaphore(VarnekPGL_CreateSemaphore("new", 0)); }, TRUE, {FALSE}},
        {"wait", [&] { return VarnekPGL_WaitSemaphore(semaphore, 1); }, FALSE, {}, true},
        {"thread",
         [] { return VarnekPGL_DeleteThread(VarnekPGL_CreateThread("new", 1, 0, Nothing, nullptr)); },
         TRUE,
         {FALSE},
         true},
        {"send",
         [&] {
             const THREAD_MSG message = {};
             return VarnekPGL_SendMessage(sink, &message) + VarnekPGL_SendUrgentMessage(sink, &message);
         },
         2,
         {1}},
        {"timer",
         [] {
             const uint32_t timer = static_cast<uint32_t>(VarnekPGL_CreateTimer("new"));
             const auto nothing = [](uint32_t, void *) {};
             const BOOL started = VarnekPGL_StartTimer(timer, 60000, nothing, nullptr);
             return started + VarnekPGL_IsTimerActive(timer) + VarnekPGL_CancelTimer(timer) +
                    VarnekPGL_DeleteTimer(timer);
         },
         4,
         {1, 2, 3}},
        {"list",
         [&] {
             list_t list;
             list_initialize(&list);
             list_insertHead(&list, bytes);
             list_insertTail(&list, bytes);
             list_insertAt(&list, 1, bytes);
             const int32_t count = list.count;
             for (int32_t i = 0; i < count; ++i) {
                 EXPECT_EQ(list_removeTail(&list), bytes);
             }
             return count + (list.head == nullptr ? 0 : 100);
         },
         3,
         {2},
         true},
        {"bit stream",
         [&] {
             const VarnekCBitInputStream stream(raw, 8, 1);
             VarnekCBitInputStream other(stream);
             return other.GetByteArray(raw, 8);
         },
         0,
         {-22}},
        {"ring",
         [&] {
             VarnekCRingBuffer ring(8);
             return VarnekCRingBuffer(ring).Write(raw, 8) + ring.Write(raw, 8) + ring.Reset(9);
         },
         0,
         {-8, -16}},
        {"string", [] { return VarnekCString("text") + "more" == VarnekCString("textmore"); }, 1, {0}},
        {"Latin-15",
         [] {
             char *text = strdup("kept");
             const BOOL done = VarnekPGL_ConvertLatin15toUTF8(&text, "text", 4);
             EXPECT_STREQ(text, done ? "text" : "kept");
             free(text);
             return done;
         },
         TRUE,
         {FALSE}},
        {"check of a CRC",
         [&] {
             WriteAll(file, std::string("1234\0\0\0\0", 8));
             return VarnekUtil_CheckFileCRC32(file.c_str());
         },
         FALSE,
         {}},
        {"append of a CRC", [&] { return content(), VarnekUtil_AppendCRC32ToFile(file.c_str()); }, TRUE, {FALSE}},
        {"read", [&] { return content(), VarnekPGL_ReadFile(file.c_str(), bytes, 8); }, 8, {-18, -1, 0}, true},
        {"write", [&] { return VarnekPGL_WriteFile(file.c_str(), bytes, 8); }, 8, {-18, -1, 0}, true},
        {"append", [&] { return content(), VarnekPGL_AppendFile(file.c_str(), bytes, 8); }, 0, {-18, -1}},
        {"size", [&] { return content(), VarnekPGL_GetFileSize(file.c_str()); }, 8, {0, -1}, true},
        {"flush",
         [&] {
             const PglFileHandle handle = VarnekPGL_OpenFile(file.c_str(), PGL_FILE_MODE_CREATE_RW);
             return handle == -1 ? -1 : VarnekPGL_FlushFile(handle) + VarnekPGL_CloseFile(handle);
         },
         0,
         {-1}},
        {"large file",
         [&] {
             const int32_t handle = VarnekPGL_OpenFile64Bits(file.c_str(), PGL_FILE_MODE_CREATE_RW);
             const int32_t written = VarnekPGL_WriteFileByHandle64Bits(handle, bytes, 8);
             VarnekPGL_SeekFile64Bits(handle, 0, SEEK_SET);
             const int32_t read = VarnekPGL_ReadFileByHandle64Bits(handle, bytes, 8);
             VarnekPGL_CloseFile64Bits(handle);
             return written * 100 + read;
         },
         808,
         {-101, -501, -500, -492, 0, 799, 800},
         true},
        {"copy", [&] { return content(), VarnekPGL_CopyFile(file.c_str(), copy.c_str()); }, 0, {-1}, true},
        {"move", [&] { return content(), VarnekPGL_MoveFile(file.c_str(), copy.c_str()); }, 0, {-1}, true},
        {"permissions", [&] { return content(), VarnekPGL_Chmod(file.c_str(), 666); }, 0, {-1}},
        {"removal", [&] { return content(), VarnekPGL_DeleteFile(file.c_str()); }, 0, {-1}},
        {"position",
         [&] {
             const PglFileHandle handle = VarnekPGL_OpenFile(file.c_str(), PGL_FILE_MODE_CREATE_RW);
             const int32_t end = VarnekPGL_SeekFile(handle, 0, SEEK_END) + VarnekPGL_TellFile(handle);
             return end + VarnekPGL_GetFileSizeByHandle(handle) + VarnekPGL_CloseFile(handle);
         },
         0,
         {-1, -2, -3},
         true},
        {"large size", [&] { return content(), VarnekPGL_GetFileSize64Bits(file.c_str()); }, 8, {0, -1}, true},
        {"listing",
         [&] {
             VarnekPGL_MakeDir(directory.c_str());
             int entries = 0;
             PglDirEntryInfo entry;
             void *const listed = VarnekPGL_OpenDir(directory.c_str());
             for (; VarnekPGL_ReadDir(listed, &entry); ++entries) {
             }
             VarnekPGL_CloseDir(listed);
             std::filesystem::remove_all(directory);
             return entries;
         },
         2,
         {0, 1}},
        {"attributes",
         [&] {
             PglFmFileAttributes attributes;
             return content(), VarnekPGL_FmGetFileAttributes(file.c_str(), &attributes);
         },
         TRUE,
         {FALSE}},
        {"clock",
         [] {
             PglMilliTime now;
             return VarnekPGL_GetMilliseconds(&now);
         },
         TRUE,
         {FALSE},
         true},
        {"directory",
         [&] {
             const int32_t made = VarnekPGL_MakeDir(directory.c_str());
             WriteAll(directory + "/file", "text");
             const int32_t cleared = VarnekPGL_ClearDir(directory.c_str());
             const int32_t deleted = VarnekPGL_DeleteDirEx(directory.c_str());
             std::filesystem::remove_all(directory);
             return made + cleared + deleted;
         },
         0,
         {-1, -2, -3},
         true},
        {"settings",
         [&] {
             *VarnekCfg_GetConfigInfo() = initial;
             VarnekCfg_SetStandard(VarnekCfg_GetConfigInfo()->standardType + 1);
             VarnekCfg_LoadConfigFile();
             return VarnekCfg_GetConfigInfo()->cprmPlayerDelay;
         },
         68,
         {0}},
        {"debug configuration", [] { return VarnekPGL_InitializeDebug(), 0; }, 0, {}, true},
    };
    int forced = 0;
    for (const Operation &operation : operations) {
        ASSERT_EQ(operation.run(), operation.success) << operation.name;
        for (const char *call : FailingCalls()) {
            // The library does not look at what cannot fail: the locks of its own tables.
            for (int nth = 1; strncmp(call, "pthread_mutex_", 14) != 0 || strstr(call, "init") != nullptr; ++nth) {
                SCOPED_TRACE(operation.name + std::string(", ") + call + " " + std::to_string(nth));
                TakeLog();
                FailCall(call, nth, EIO);
                const int64_t result = operation.run();
                const bool over = IsStillToFail(call);
                FailCall(call, 0, 0);
                if (over) {
                    ASSERT_EQ(result, operation.success);
                    break;
                }
                ++forced;
                std::vector<int64_t> possible = operation.failures;
                possible.push_back(operation.success);
                EXPECT_THAT(possible, ::testing::Contains(result));
                const std::vector<LogLine> log = TakeLog();
                EXPECT_TRUE(operation.quiet || std::any_of(log.begin(), log.end(),
                                                           [](const LogLine &line) { return line.priority >= 4; }));
                ASSERT_EQ(operation.run(), operation.success) << "something stayed behind";
            }
        }
    }
    RecordProperty("forced", forced);
    EXPECT_GT(forced, 130);
    EXPECT_TRUE(VarnekPGL_DeleteThread(sink));
}

}  // namespace
