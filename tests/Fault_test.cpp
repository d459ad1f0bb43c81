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

class Fault : public VarnekTest {
  public:
    void UseOwnQueue();

  protected:
    std::promise<void> done_;
};

void *Nothing(void *) { return nullptr; }

// Notes a call of the library that is made while the next call of a function fails. Every operation runs again
// afterwards, and then succeeds.
#define FAULT(function, error, ...)                                                                  \
    (TakeLog(), FailCall(function, 1, error), Note(function " fails: " #__VA_ARGS__, (__VA_ARGS__)), \
     FailCall(function, 0, 0))

TEST_F(Fault, MutexesAndSemaphores) {
    const int32_t mutex = VarnekPGL_CreateMutex("mutex");
    const int32_t sem = VarnekPGL_CreateSemaphore("sem", 2);
    FAULT("pthread_mutex_init", ENOMEM, VarnekPGL_CreateMutex("new"));
    FAULT("pthread_mutex_lock", EINVAL, VarnekPGL_AcquireMutex(mutex));
    FAULT("pthread_mutex_unlock", EPERM, VarnekPGL_AcquireMutex(mutex) && VarnekPGL_ReleaseMutex(mutex));
    FAULT("pthread_mutex_destroy", EBUSY, VarnekPGL_ReleaseMutex(mutex) && VarnekPGL_DeleteMutex(mutex));
    FAULT("sem_init", ENOSPC, VarnekPGL_CreateSemaphore("new", 0));
    FAULT("sem_wait", EINTR, VarnekPGL_WaitSemaphore(sem, WAIT_FOREVER));
    FAULT("sem_timedwait", ETIMEDOUT, VarnekPGL_WaitSemaphore(sem, 5));
    FAULT("clock_gettime", EFAULT, VarnekPGL_WaitSemaphore(sem, 5));
    FAULT("sem_post", EINVAL, VarnekPGL_SignalSemaphore(sem));
    FailCall("sem_timedwait", 1, EINTR);
    EXPECT_FALSE(VarnekPGL_WaitSemaphore(sem, 5));
    EXPECT_EQ(TakeErrors().size(), 3u) << "an interrupted wait ends with three lines";
    EXPECT_EQ(VarnekPGL_CreateMutex("new"), mutex + 1) << "a failure takes no handle";
    EXPECT_TRUE(VarnekPGL_AcquireMutex(mutex) && VarnekPGL_ReleaseMutex(mutex));
    EXPECT_TRUE(VarnekPGL_DeleteMutex(mutex));
    EXPECT_TRUE(VarnekPGL_WaitSemaphore(sem, 0) && VarnekPGL_WaitSemaphore(sem, 0));
    FAULT("sem_destroy", EINVAL, VarnekPGL_DeleteSemaphore(sem));
    EXPECT_EQ(VarnekPGL_CreateSemaphore("new", 0), sem + 1);
}

TEST_F(Fault, Threads) {
    const auto create = [] { return VarnekPGL_CreateThread("new", 1, 0, Nothing, nullptr); };
    FAULT("pthread_mutex_init", ENOMEM, create());
    FAULT("sem_init", ENOSPC, create());
    FAULT("pthread_create", EAGAIN, create());
    EXPECT_EQ(VarnekPGL_GetThreadByName("new"), -1);
    EXPECT_EQ(create(), 1) << "a failure gives its handle back";
    FAULT("sem_destroy", EINVAL, VarnekPGL_DeleteThread(1));
    EXPECT_EQ(create(), 2);
}

// Runs in a registered thread of handle 1: what goes wrong with its own queue.
void Fault::UseOwnQueue() {
    const THREAD_MSG message = {};
    THREAD_MSG received;
    int32_t count = -1;
    const auto send = [&] { return VarnekPGL_SendMessage(1, &message); };
    const auto urgent = [&] { return VarnekPGL_SendUrgentMessage(1, &message); };
    const auto receive = [&](uint32_t timeout) { return VarnekPGL_ReceiveMessage(timeout, &received, &count); };
    FAULT("malloc", ENOMEM, send());
    FAULT("malloc", ENOMEM, urgent());
    FAULT("sem_getvalue", EINVAL, send());
    FAULT("sem_getvalue", EINVAL, receive(0));
    NOTE(receive(0));  // a failed send leaves neither a message nor a signal
    FAULT("sem_wait", EINTR, receive(WAIT_FOREVER));
    FAULT("clock_gettime", EFAULT, receive(7));
    done_.set_value();
}

TEST_F(Fault, APostThatFailsLeavesTheMessageAndTheNextWakesTheOwner) {
    const auto run = [](void *left) -> void * {
        THREAD_MSG message = {};
        int32_t count = -1;
        while (message.data[0] == 0) {
            VarnekPGL_ReceiveMessage(WAIT_FOREVER, &message, &count);
        }
        static_cast<std::promise<int32_t> *>(left)->set_value(count);
        return nullptr;
    };
    std::promise<int32_t> left;
    ASSERT_EQ(VarnekPGL_CreateThread("owner", 1, 0, run, &left), 1);
    const THREAD_MSG message = {}, urgent = {{1}};
    // Until the owner waits.
    do {
        VarnekPGL_MSleep(1);
        FailCall("sem_post", 1, EOVERFLOW);
    } while (VarnekPGL_SendMessage(1, &message));
    EXPECT_EQ(TakeErrors(),
              std::vector<std::string>{"***** VarnekPGL_SendMessage: Semaphore Post FAIL. errCode = [75]"});
    FAULT("sem_post", EOVERFLOW, VarnekPGL_SendUrgentMessage(1, &urgent));
    EXPECT_TRUE(VarnekPGL_SendMessage(1, &message));
    EXPECT_EQ(left.get_future().get(), 2) << "behind the urgent message";
    EXPECT_TRUE(VarnekPGL_DeleteThread(1));
}

TEST_F(Fault, Messages) {
    const auto run = [](void *self) { return static_cast<Fault *>(self)->UseOwnQueue(), self; };
    ASSERT_EQ(VarnekPGL_CreateThread("self", 1, 0, run, this), 1);
    done_.get_future().wait();
    NOTE(VarnekPGL_DeleteThread(1));
}

TEST_F(Fault, Timers) {
    const TimerCallbackFunc callback = [](uint32_t, void *) {};
    ASSERT_EQ(VarnekPGL_CreateTimer("timer"), 0);
    const auto start = [=] { return VarnekPGL_StartTimer(0, 60000, callback, nullptr); };
    FAULT("timer_create", EAGAIN, start());
    FAULT("timer_settime", EINVAL, start());
    EXPECT_FALSE(VarnekPGL_CancelTimer(0)) << "a failed start leaves the timer as created";
    EXPECT_TRUE(start());
    FAULT("timer_gettime", EINVAL, start());
    FAULT("timer_gettime", EINVAL, VarnekPGL_CancelTimer(0));
    FAULT("timer_gettime", EINVAL, VarnekPGL_IsTimerActive(0));
    FAULT("timer_settime", EINVAL, VarnekPGL_CancelTimer(0));
    EXPECT_TRUE(VarnekPGL_IsTimerActive(0));
    EXPECT_TRUE(VarnekPGL_CancelTimer(0));
    FAULT("timer_settime", EINVAL, start());
    EXPECT_TRUE(start()) << "a timer whose arming failed is made anew";
    FAULT("timer_delete", EINVAL, VarnekPGL_DeleteTimer(0));
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
        FAULT("malloc", ENOMEM, startSecond());
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

class FaultAlone : public Fault {
  protected:
    // Runs an operation that leaves nothing behind again and again, while the first, second, ... call of each function
    // fails, until there is none left to fail. The result is that of success or one of `failures`.
    void Force(const char *name, int64_t success, std::vector<int64_t> failures, bool quiet,
               const std::function<int64_t()> &run) {
        failures.push_back(success);
        ASSERT_EQ(run(), success) << name;
        for (const char *call : FailingCalls()) {
            // The library does not look at what cannot fail: the locks of its own tables.
            for (int nth = 1; strncmp(call, "pthread_mutex_", 14) != 0 || strstr(call, "init") != nullptr; ++nth) {
                SCOPED_TRACE(name + std::string(", ") + call + " " + std::to_string(nth));
                TakeLog();
                FailCall(call, nth, EIO);
                const int64_t result = run();
                const bool over = IsStillToFail(call);
                FailCall(call, 0, 0);
                EXPECT_THAT(failures, ::testing::Contains(result));
                if (over) {
                    ASSERT_EQ(result, success);
                    break;
                }
                ++forced_;
                const std::vector<LogLine> log = TakeLog();
                EXPECT_TRUE(quiet || std::any_of(log.begin(), log.end(),
                                                 [](const LogLine &line) { return line.priority >= 4; }));
                ASSERT_EQ(run(), success) << "something stayed behind";
            }
        }
    }
    int forced_ = 0;
};

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
    FAULT("ftell", EOVERFLOW, VarnekPGL_GetFileSize(file.c_str()));
    FAULT("ftell", EOVERFLOW, VarnekPGL_GetFileSizeByHandle(handle));
    FailCall("ftell", 1, EOVERFLOW);
    FAULT("fflush", EBADF, VarnekPGL_GetFileSizeByHandle(handle));
    FailCall("ftell", 0, 0);
    VarnekPGL_CloseFile(handle);
}

TEST_F(FaultAlone, EveryOperationSurvivesTheFailureOfEachOfItsCalls) {
    const std::string file = Path("file"), copy = Path("copy"), directory = Path("directory");
    const int32_t sink = VarnekPGL_CreateThread("sink", 1, 0, Nothing, nullptr);
    const int32_t semaphore = VarnekPGL_CreateSemaphore("semaphore", 0);
    const VarnekConfigInfo initial = *VarnekCfg_GetConfigInfo();
    char bytes[8] = {};
    unsigned char raw[8] = {};
    const auto content = [&] { WriteAll(file, "12345678"); };
    using Run = std::function<int64_t()>;
    const auto loud = [&](const char *name, int64_t success, const std::vector<int64_t> &failures, const Run &run) {
        Force(name, success, failures, false, run);
    };
    // These say nothing of some failures.
    const auto quiet = [&](const char *name, int64_t success, const std::vector<int64_t> &failures, const Run &run) {
        Force(name, success, failures, true, run);
    };
    loud("mutex", TRUE, {FALSE}, [] { return VarnekPGL_DeleteMutex(VarnekPGL_CreateMutex("new")); });
    loud("semaphore", TRUE, {FALSE}, [] { return VarnekPGL_DeleteSemaphore(VarnekPGL_CreateSemaphore("new", 0)); });
    quiet("wait", FALSE, {}, [&] { return VarnekPGL_WaitSemaphore(semaphore, 1); });
    quiet("thread", TRUE, {FALSE},
          [] { return VarnekPGL_DeleteThread(VarnekPGL_CreateThread("new", 1, 0, Nothing, nullptr)); });
    loud("send", 2, {1}, [&] {
        const THREAD_MSG message = {};
        return VarnekPGL_SendMessage(sink, &message) + VarnekPGL_SendUrgentMessage(sink, &message);
    });
    loud("timer", 4, {1, 2, 3}, [] {
        const uint32_t timer = static_cast<uint32_t>(VarnekPGL_CreateTimer("new"));
        const auto nothing = [](uint32_t, void *) {};
        const BOOL started = VarnekPGL_StartTimer(timer, 60000, nothing, nullptr);
        return started + VarnekPGL_IsTimerActive(timer) + VarnekPGL_CancelTimer(timer) + VarnekPGL_DeleteTimer(timer);
    });
    quiet("list", 3, {2}, [&] {
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
    });
    loud("bit stream", 0, {-22}, [&] {
        const VarnekCBitInputStream stream(raw, 8, 1);
        VarnekCBitInputStream other(stream);
        return other.GetByteArray(raw, 8);
    });
    loud("ring", 0, {-8, -16}, [&] {
        VarnekCRingBuffer ring(8);
        return VarnekCRingBuffer(ring).Write(raw, 8) + ring.Write(raw, 8) + ring.Reset(9);
    });
    loud("string", 1, {0}, [] { return VarnekCString("text") + "more" == VarnekCString("textmore"); });
    loud("Latin-15", TRUE, {FALSE}, [] {
        char *text = strdup("kept");
        const BOOL done = VarnekPGL_ConvertLatin15toUTF8(&text, "text", 4);
        EXPECT_STREQ(text, done ? "text" : "kept");
        free(text);
        return done;
    });
    loud("check of a CRC", FALSE, {}, [&] {
        WriteAll(file, std::string("1234\0\0\0\0", 8));
        return VarnekUtil_CheckFileCRC32(file.c_str());
    });
    loud("append of a CRC", TRUE, {FALSE}, [&] { return content(), VarnekUtil_AppendCRC32ToFile(file.c_str()); });
    quiet("read", 8, {-18, -1, 0}, [&] { return content(), VarnekPGL_ReadFile(file.c_str(), bytes, 8); });
    quiet("write", 8, {-18, -1, 0}, [&] { return VarnekPGL_WriteFile(file.c_str(), bytes, 8); });
    loud("append", 0, {-18, -1}, [&] { return content(), VarnekPGL_AppendFile(file.c_str(), bytes, 8); });
    quiet("size", 8, {0, -1}, [&] { return content(), VarnekPGL_GetFileSize(file.c_str()); });
    loud("flush", 0, {-1}, [&] {
        const PglFileHandle handle = VarnekPGL_OpenFile(file.c_str(), PGL_FILE_MODE_CREATE_RW);
        return handle == -1 ? -1 : VarnekPGL_FlushFile(handle) + VarnekPGL_CloseFile(handle);
    });
    quiet("large file", 808, {-101, -501, -500, -492, 0, 799, 800}, [&] {
        const int32_t handle = VarnekPGL_OpenFile64Bits(file.c_str(), PGL_FILE_MODE_CREATE_RW);
        const int32_t written = VarnekPGL_WriteFileByHandle64Bits(handle, bytes, 8);
        VarnekPGL_SeekFile64Bits(handle, 0, SEEK_SET);
        const int32_t read = VarnekPGL_ReadFileByHandle64Bits(handle, bytes, 8);
        VarnekPGL_CloseFile64Bits(handle);
        return written * 100 + read;
    });
    quiet("copy", 0, {-1}, [&] { return content(), VarnekPGL_CopyFile(file.c_str(), copy.c_str()); });
    quiet("move", 0, {-1}, [&] { return content(), VarnekPGL_MoveFile(file.c_str(), copy.c_str()); });
    loud("permissions", 0, {-1}, [&] { return content(), VarnekPGL_Chmod(file.c_str(), 666); });
    loud("removal", 0, {-1}, [&] { return content(), VarnekPGL_DeleteFile(file.c_str()); });
    quiet("position", 0, {-1, -2, -3}, [&] {
        const PglFileHandle handle = VarnekPGL_OpenFile(file.c_str(), PGL_FILE_MODE_CREATE_RW);
        const int32_t end = VarnekPGL_SeekFile(handle, 0, SEEK_END) + VarnekPGL_TellFile(handle);
        return end + VarnekPGL_GetFileSizeByHandle(handle) + VarnekPGL_CloseFile(handle);
    });
    quiet("large size", 8, {0, -1}, [&] { return content(), VarnekPGL_GetFileSize64Bits(file.c_str()); });
    loud("listing", 2, {0, 1}, [&] {
        VarnekPGL_MakeDir(directory.c_str());
        int entries = 0;
        PglDirEntryInfo entry;
        void *const listed = VarnekPGL_OpenDir(directory.c_str());
        for (; VarnekPGL_ReadDir(listed, &entry); ++entries) {
        }
        VarnekPGL_CloseDir(listed);
        std::filesystem::remove_all(directory);
        return entries;
    });
    loud("attributes", TRUE, {FALSE}, [&] {
        PglFmFileAttributes attributes;
        return content(), VarnekPGL_FmGetFileAttributes(file.c_str(), &attributes);
    });
    quiet("clock", TRUE, {FALSE}, [] {
        PglMilliTime now;
        return VarnekPGL_GetMilliseconds(&now);
    });
    quiet("directory", 0, {-1, -2, -3}, [&] {
        const int32_t made = VarnekPGL_MakeDir(directory.c_str());
        WriteAll(directory + "/file", "text");
        const int32_t cleared = VarnekPGL_ClearDir(directory.c_str());
        const int32_t deleted = VarnekPGL_DeleteDirEx(directory.c_str());
        std::filesystem::remove_all(directory);
        return made + cleared + deleted;
    });
    loud("settings", 68, {0}, [&] {
        *VarnekCfg_GetConfigInfo() = initial;
        VarnekCfg_SetStandard(VarnekCfg_GetConfigInfo()->standardType + 1);
        VarnekCfg_LoadConfigFile();
        return VarnekCfg_GetConfigInfo()->cprmPlayerDelay;
    });
    quiet("debug configuration", 0, {}, [] { return VarnekPGL_InitializeDebug(), 0; });
    RecordProperty("forced", forced_);
    EXPECT_GT(forced_, 130);
    EXPECT_TRUE(VarnekPGL_DeleteThread(sink));
}

}  // namespace
