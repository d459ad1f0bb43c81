// Makes calls of the C library fail: each failure has its result and its lines, and leaves nothing behind.
#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <future>
#include <initializer_list>
#include <memory>

#include "Varnek_CBitInputStream.h"
#include "Varnek_CRingBuffer.h"
#include "Varnek_CString.h"
#include "Varnek_Config.h"
#include "Varnek_File.h"
#include "Varnek_List.h"
#include "Varnek_LngPack.h"
#include "Varnek_Tasking.h"
#include "Varnek_Time.h"
#include "Varnek_Util.h"
#include "support/FailingCalls.h"
#include "support/Families.h"
#include "support/VarnekTest.h"

namespace {

using ::testing::ElementsAre, ::testing::IsEmpty;

constexpr uint32_t kStack = 256 * 1024;

class Fault : public VarnekTest {
  protected:
    // Joins the results of several calls.
    std::string Results(std::initializer_list<int64_t> results) const {
        std::string text;
        for (const int64_t result : results) {
            text += (text.empty() ? "" : " ") + Named(result);
        }
        return text;
    }

    // While the first, second, ... call of each function fails, runs an operation that leaves nothing behind, until no
    // call is left to fail. Notes what the operation returns and traces, and then, for each other outcome, the calls
    // whose failures lead to it and the errors it adds, unless these depend on the order of a directory's entries.
    void Force(const std::string &name, const std::function<std::string()> &run, bool ordered = true) {
        TakeLog();
        const std::string success = run();
        const std::vector<std::string> usual = Errors();
        std::map<std::string, std::string> outcomes;  // with the calls
        for (const char *call : FailingCalls()) {
            const std::string shown = strncmp(call, "_Zna", 4) == 0 ? "operator new[]" : call;
            // The library does not check the locks of its own tables, which cannot fail.
            for (int nth = 1; strncmp(call, "pthread_mutex_", 14) != 0 || strstr(call, "init") != nullptr; ++nth) {
                SCOPED_TRACE(name + ", " + shown + " " + std::to_string(nth));
                TakeLog();
                FailCall(call, nth, EIO);
                const std::string result = run();
                const bool over = IsStillToFail(call);
                FailCall(call, 0, 0);
                if (over) {
                    ASSERT_EQ(result, success);
                    break;
                }
                std::string &calls = outcomes[result + Added(Errors(), usual)];
                const size_t comma = calls.rfind(", ");
                const size_t last = comma != std::string::npos ? comma + 2 : 0;
                const bool isSame = calls.compare(last, shown.size(), shown) == 0;
                calls += (isSame ? " " : calls.empty() ? shown + " " : ", " + shown + " ") + std::to_string(nth);
                ASSERT_EQ(run(), success) << "the failure left something behind";
            }
        }
        Note(name + ": " + success + (ordered ? Added(usual, {}) : "") + "\n");
        for (const auto &[outcome, calls] : outcomes) {
            if (ordered) {
                Note("  " + calls + (outcome == success ? " change nothing" : ": " + outcome) + "\n");
            }
        }
    }

  private:
    static std::vector<std::string> Errors() {
        std::vector<std::string> errors = TakeErrors();
        for (std::string &error : errors) {
            error = WithoutHandles(error.substr(0, error.find('\n')));
        }
        return errors;
    }
    static std::string Added(std::vector<std::string> errors, const std::vector<std::string> &usual) {
        for (const std::string &error : usual) {
            const auto found = std::find(errors.begin(), errors.end(), error);
            errors.erase(found, found == errors.end() ? found : found + 1);
        }
        std::string lines;
        for (const std::string &error : errors) {
            lines += (errors.size() == 1 ? " | " : "\n    ") + error;
        }
        return lines;
    }
};

TEST_F(Fault, AMutexSurvivesEachFailingCall) {
    notesLow_ = false;
    FailCall("pthread_mutex_init", 1, ENOMEM);
    NOTE(VarnekPGL_CreateThread)("new", 1, 0, Nothing, nullptr);  // the first thread makes the guard of all
    const int32_t mutex = VarnekPGL_CreateMutex("mutex");
    const struct {
        const char *call;
        BOOL (*operation)(int32_t);
        const char *error;
    } rows[] = {
        {"pthread_mutex_lock", VarnekPGL_AcquireMutex, "VarnekPGL_AcquireMutex : Mutex Lock"},
        {"pthread_mutex_unlock", VarnekPGL_ReleaseMutex, "VarnekPGL_ReleaseMutex : Mutex Unlock"},
        {"pthread_mutex_destroy", VarnekPGL_DeleteMutex, "VarnekPGL_DeleteMutex : Mutex Destroy"},
    };
    for (const auto &[call, operation, error] : rows) {
        TakeLog();
        FailCall(call, 1, EINVAL);
        EXPECT_FALSE(operation(mutex));
        EXPECT_THAT(TakeErrors(), ElementsAre("***** " + std::string(error) + " FAIL! errCode = [22]"));
        EXPECT_TRUE(operation(mutex)) << call;
    }
}

TEST_F(Fault, APostThatFailsLetsTheNextWakeTheOwner) {
    std::promise<int32_t> left;
    varnek::Thread owner("owner", kStack, [&left] {
        THREAD_MSG message = {};
        int32_t count = -1;
        while (message.data[0] == 0) {
            VarnekPGL_ReceiveMessage(WAIT_FOREVER, &message, &count);
        }
        left.set_value(count);
    });
    // Nothing is posted, so nothing fails, until the owner waits.
    do {
        VarnekPGL_MSleep(1);
        FailCall("sem_post", 1, EOVERFLOW);
    } while (varnek::Send(owner.Handle(), 0));
    FailCall("sem_post", 1, EOVERFLOW);
    EXPECT_FALSE(varnek::SendUrgent(owner.Handle(), 1));
    EXPECT_THAT(TakeErrors(), ElementsAre("***** VarnekPGL_SendMessage: Semaphore Post FAIL. errCode = [75]",
                                          "***** VarnekPGL_SendUrgentMessage: Semaphore Post FAIL. errCode = [75]"));
    EXPECT_TRUE(varnek::Send(owner.Handle(), 0));
    auto woken = left.get_future();
    EXPECT_EQ(woken.wait_for(std::chrono::seconds(20)), std::future_status::ready);
    EXPECT_EQ(woken.get(), 2) << "behind the urgent message";
}

TEST_F(Fault, AReceiveReportsWhyItsWaitEnded) {
    varnek::Thread("worker", kStack, [] {
        THREAD_MSG message = {};
        int32_t count = -1;
        for (const auto send : {VarnekPGL_SendMessage, VarnekPGL_SendUrgentMessage}) {
            FailCall("malloc", 1, ENOMEM);
            EXPECT_FALSE(send(1, &message)) << "and it leaves neither a message nor a signal";
        }
        for (const auto &[call, error, timeout] : {std::tuple("sem_timedwait", EINTR, 9u),
                                                   {"sem_wait", EINTR, WAIT_FOREVER},
                                                   {"clock_gettime", EFAULT, 9u}}) {
            TakeLog();
            FailCall(call, 1, error);
            EXPECT_FALSE(VarnekPGL_ReceiveMessage(timeout, &message, &count));
            EXPECT_THAT(TakeErrors(), ElementsAre("***** VarnekPGL_ReceiveMessage: Semaphore wait FAIL. errCode = [" +
                                                  std::to_string(error) + "]"));
        }
    }).Join();
    EXPECT_THAT(TakeErrors(), IsEmpty()) << "the queue was not empty";
}

TEST_F(Fault, AMessageThatComesAsTheWaitTimesOutIsReceived) {
    FailCall("sem_timedwait", 1, ETIMEDOUT);
    varnek::Thread worker("worker", kStack, [] {
        THREAD_MSG received;
        int32_t count = -1;
        EXPECT_TRUE(VarnekPGL_ReceiveMessage(60000, &received, &count));
        EXPECT_EQ(count, 0);
        const auto start = std::chrono::steady_clock::now();
        EXPECT_FALSE(VarnekPGL_ReceiveMessage(20, &received, &count));
        EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(19));
        EXPECT_EQ(TakeErrors().size(), 1u) << "a time-out is reported once";
    });
    EXPECT_TRUE(Eventually([] { return !IsStillToFail("sem_timedwait"); }));
    EXPECT_TRUE(varnek::Send(worker.Handle(), 0));
    worker.Join();
}

TEST_F(Fault, ADroppedExpiryIsDeliveredWhateverTheNextStartAsksFor) {
    const TimerCallbackFunc count = [](uint32_t, void *calls) { ++*static_cast<std::atomic<int> *>(calls); };
    ASSERT_EQ(VarnekPGL_CreateTimer("timer"), 0);
    std::atomic<int> first{0}, second{0};
    const auto drop = [&](std::atomic<int> *calls) {
        FailCall("delivery", 1, 0);
        ASSERT_TRUE(VarnekPGL_StartTimer(0, 1, count, calls));
        ASSERT_TRUE(Eventually([] { return !IsStillToFail("delivery"); }));
    };
    const auto startLong = [&] { return VarnekPGL_StartTimer(0, 10000, count, &second); };
    drop(&first);
    for (const char *call : {"timer_create", "timer_settime"}) {
        FailCall(call, 1, EAGAIN);
        EXPECT_FALSE(startLong());
    }
    FailCall("malloc", 1, ENOMEM);
    EXPECT_FALSE(startLong());
    EXPECT_EQ(TakeErrors().back(), "VarnekPGL_StartTimer. memalloc failed");
    const auto start = std::chrono::steady_clock::now();
    EXPECT_TRUE(startLong());
    EXPECT_TRUE(Eventually([&] { return first == 1; }));
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(8));
    EXPECT_TRUE(VarnekPGL_IsTimerActive(0)) << "the second start had expired";
    EXPECT_TRUE(VarnekPGL_CancelTimer(0));
    // Neither cancelling nor a start that fails drops a call that is owed.
    drop(&first);
    EXPECT_TRUE(startLong() && VarnekPGL_CancelTimer(0));
    EXPECT_TRUE(Eventually([&] { return first == 2; }));
    drop(&first);
    FailCall("timer_settime", 2, EINVAL);
    EXPECT_FALSE(startLong());
    EXPECT_TRUE(Eventually([&] { return first == 3; }));
    EXPECT_EQ(second, 0);
}

class FaultAlone : public Fault {};

TEST_F(FaultAlone, OnlyAMissingDebugConfigurationIsSeeded) {
    const std::string own = ReadAll(kDebugFile);
    WriteAll(kShippedDebugFile, "LogToUSB=1\n");
    FailCall("fopen", 1, EMFILE);
    VarnekPGL_InitializeDebug();
    std::filesystem::remove(kShippedDebugFile);
    EXPECT_EQ(ReadAll(kDebugFile), own);
}

TEST_F(FaultAlone, ASaveReplacesAFileThatAnotherHasJustReplacedAndFollowsNoPlantedLink) {
    const std::string draft = VARNEK_DATA_DIR "Varnek_Config.new." + std::to_string(getpid()) + ".";
    WriteAll(kSettingsFile, "old");
    std::filesystem::create_hard_link(kSettingsFile, Path("second name"));
    FailCall("lstat64", 1, 0);  // a link count of 0 ...
    VarnekCfg_SaveConfigFile();
    EXPECT_NE(ReadAll(kSettingsFile), "old") << "two names are written in place";
    std::filesystem::remove(Path("second name"));
    std::filesystem::create_hard_link(kSettingsFile, Path("open"));
    std::filesystem::remove(kSettingsFile);
    WriteAll(kSettingsFile, "old");
    const int reader = open(kSettingsFile, O_RDONLY);
    FailCall("lstat64", 1, 0);  // ... is no second name
    VarnekCfg_SaveConfigFile();
    char text[3] = {};
    EXPECT_EQ(read(reader, text, sizeof text), 3);
    close(reader);
    EXPECT_EQ(std::string(text, 3), "old") << "a reader met the save in place";

    const std::string victim = std::filesystem::absolute(Path("victim"));
    for (int number = 0; number < 4; ++number) {
        WriteAll(victim, "kept");
        std::filesystem::create_symlink(victim, draft + std::to_string(number));
    }
    FailCall("unlinkat", 1, EPERM);
    VarnekCfg_SaveConfigFile();
    EXPECT_EQ(ReadAll(victim), "kept");
}

TEST_F(Fault, ObjectsSurviveEachFailingCall) {
    // No thread ends, so each new one needs a semaphore of its own.
    const auto stay = [](void *) -> void * { return VarnekPGL_MSleep(600000), nullptr; };
    const int32_t sink = VarnekPGL_CreateThread("sink", 1, 65536, stay, nullptr);
    Force("mutex", [this, last = VarnekPGL_CreateMutex("last")]() mutable {
        const int32_t mutex = VarnekPGL_CreateMutex("new");
        EXPECT_TRUE(mutex == -1 || mutex == ++last) << "a failure took a handle";
        return mutex == -1 ? "not created" : Results({VarnekPGL_DeleteMutex(mutex)});
    });
    Force("semaphore", [this, last = VarnekPGL_CreateSemaphore("last", 0)]() mutable {
        const int32_t semaphore = VarnekPGL_CreateSemaphore("new", 0);
        EXPECT_TRUE(semaphore == -1 || semaphore == ++last) << "a failure took a handle";
        const auto pass = [=](uint32_t timeout) {
            return VarnekPGL_SignalSemaphore(semaphore) != FALSE ? VarnekPGL_WaitSemaphore(semaphore, timeout) : FALSE;
        };
        return semaphore == -1 ? "not created"
                               : Results({pass(WAIT_FOREVER), pass(1), VarnekPGL_DeleteSemaphore(semaphore)});
    });
    Force("thread", [this, stay, last = sink]() mutable {
        const int32_t thread = VarnekPGL_CreateThread("new", 1, 65536, stay, nullptr);
        EXPECT_TRUE(thread == -1 || thread == ++last) << "a failure took a handle";
        return thread == -1 ? "not created" : Results({VarnekPGL_DeleteThread(thread)});
    });
    Force("send", [this, sink] { return Results({varnek::Send(sink, 0), varnek::SendUrgent(sink, 0)}); });
    Force("timer", [] {
        const uint32_t timer = static_cast<uint32_t>(VarnekPGL_CreateTimer("new"));
        std::string results;
        const auto note = [&results](const char *call, BOOL result) {
            results += call + std::to_string(result);
            return result;
        };
        const auto start = [=] {
            return VarnekPGL_StartTimer(
                timer, 60000, [](uint32_t, void *) {}, nullptr);
        };
        note("start ", start());
        note(", active ", VarnekPGL_IsTimerActive(timer));
        note(", start ", start());
        const BOOL cancelled = note(", cancel ", VarnekPGL_CancelTimer(timer));
        if (note(", start ", start()) == FALSE && cancelled != FALSE) {
            note(", start ", start());
        }
        note(", delete ", VarnekPGL_DeleteTimer(timer));
        return results;
    });
    EXPECT_TRUE(VarnekPGL_DeleteThread(sink));
}

TEST_F(Fault, ValuesSurviveEachFailingCall) {
    resultNames_ = {NAMED(VARNEK_BITS_END), NAMED(VARNEK_RING_INVALID)};
    unsigned char raw[8] = {};
    Force("list", [&] {
        list_t list;
        list_initialize(&list);
        list_insertHead(&list, raw);
        list_insertTail(&list, raw);
        list_insertAt(&list, 1, raw);
        const int32_t count = list.count;
        for (int32_t i = 0; i < count; ++i) {
            EXPECT_EQ(list_removeTail(&list), raw);
        }
        EXPECT_EQ(list.head, nullptr);
        return Results({count});
    });
    Force("bit stream", [&] {
        const VarnekCBitInputStream stream(raw, 8, 1);
        VarnekCBitInputStream copy(stream), assigned(raw, 8, 0);
        assigned = stream;
        const auto use = [&](VarnekCBitInputStream &each) {
            unsigned char flag = 1;
            each.ReadByte(8, flag);
            each.RwindToFirst();
            return Results({flag, each.GetByteArray(raw, 8)});
        };
        const std::string copied = use(copy);
        return "copied " + copied + ", assigned " + use(assigned);
    });
    Force("ring", [&] {
        VarnekCRingBuffer ring(8), copy(ring);
        std::string results = Results({ring.Reset(9)});
        const auto use = [&](VarnekCRingBuffer &each) {
            return Results({each.Write(raw, 8), each.GetSpaceReading(), each.GetSpaceWriting(), each.GetDistance(),
                            each.Reset(4), each.Write(raw, 1)});
        };
        results += ", then " + use(ring);
        return results + ", the copy " + use(copy);
    });
    Force("string", [] {
        const VarnekCString text("text");
        VarnekCString assigned("a"), literal("a"), sum("kept");
        assigned = text;
        literal = "text";
        sum += text;
        std::string all;
        const auto show = [&all](const VarnekCString &string) {
            const std::unique_ptr<char[]> copy(string.String());
            all += (all.empty() ? "" : " ") + std::string(copy != nullptr ? copy.get() : "(null)");
        };
        show(assigned);
        show(literal);
        show(sum);
        show(text + text);
        show(text + "text");
        return all;
    });
    Force("Latin-15", [this] {
        char *text = strdup("kept");
        const BOOL done = VarnekPGL_ConvertLatin15toUTF8(&text, "text", 4);
        const std::string result = Results({done}) + " " + text;
        free(text);
        return result;
    });
}

TEST_F(Fault, FilesSurviveEachFailingCall) {
    resultNames_ = {NAMED(VARNEK_FILE_NOT_OPENED), NAMED(VARNEK_FILE_DEVICE_FAILURE)};
    const std::string file = Path("file"), target = Path("target");
    char bytes[8] = {};
    const auto content = [&file] { WriteAll(file, "12345678"); };
    const int next = dup(STDERR_FILENO);
    close(next);
    Show("Hndl : " + std::to_string(next), "Hndl : NEXT");
    const auto force = [&](const char *name, const std::function<int64_t()> &run) {
        Force(name, [&] { return content(), Results({run()}); });
    };
    force("append of a CRC", [&] { return VarnekUtil_AppendCRC32ToFile(file.c_str()); });
    force("read", [&] { return VarnekPGL_ReadFile(file.c_str(), bytes, 8); });
    force("write", [&] { return VarnekPGL_WriteFile(file.c_str(), bytes, 8); });
    force("append", [&] { return VarnekPGL_AppendFile(file.c_str(), bytes, 8); });
    force("copy", [&] { return VarnekPGL_CopyFile(file.c_str(), target.c_str()); });
    force("move", [&] { return VarnekPGL_MoveFile(file.c_str(), target.c_str()); });
    force("permissions", [&] { return VarnekPGL_Chmod(file.c_str(), 666); });
    force("large size", [&] { return VarnekPGL_GetFileSize64Bits(file.c_str()); });
    Force("handle", [&] {
        const PglFileHandle handle = VarnekPGL_OpenFile(file.c_str(), PGL_FILE_MODE_CREATE_RW);
        return handle == -1 ? "not opened"
                            : Results({VarnekPGL_SeekFile(handle, 0, SEEK_END), VarnekPGL_TellFile(handle),
                                       VarnekPGL_GetFileSizeByHandle(handle), VarnekPGL_FlushFile(handle),
                                       VarnekPGL_CloseFile(handle)});
    });
    Force("large file", [&]() -> std::string {
        const int32_t handle = VarnekPGL_OpenFile64Bits(file.c_str(), PGL_FILE_MODE_CREATE_RW);
        if (handle == -1) {
            return "not opened";
        }
        const int32_t written = VarnekPGL_WriteFileByHandle64Bits(handle, bytes, 8);
        VarnekPGL_SeekFile64Bits(handle, 0, SEEK_SET);
        const int32_t read = VarnekPGL_ReadFileByHandle64Bits(handle, bytes, 8);
        VarnekPGL_CloseFile64Bits(handle);
        return Results({written, read});
    });
    content();
    const PglFileHandle handle = VarnekPGL_OpenFile(file.c_str(), PGL_FILE_MODE_READ);
    FailCall("ftell", 1, EOVERFLOW);
    FailCall("fseek", 1, EBADF);
    EXPECT_EQ(VarnekPGL_GetFileSizeByHandle(handle), 8);
    VarnekPGL_CloseFile(handle);
}

TEST_F(Fault, DirectoriesSurviveEachFailingCall) {
    const std::string directory = Path("directory");
    Force("listing", [&] {
        std::filesystem::create_directory(directory);
        int entries = 0;
        PglDirEntryInfo entry;
        void *const listed = VarnekPGL_OpenDir(directory.c_str());
        for (; VarnekPGL_ReadDir(listed, &entry); ++entries) {
        }
        VarnekPGL_CloseDir(listed);
        std::filesystem::remove_all(directory);
        return Results({entries});
    });
    const auto remove = [&] {
        const int32_t cleared = VarnekPGL_ClearDir(directory.c_str());
        const std::string results =
            cleared != 0 ? Results({cleared}) : Results({cleared, VarnekPGL_DeleteDirEx(directory.c_str())});
        std::filesystem::remove_all(directory);
        return results;
    };
    Force("empty directory", [&] {
        const int32_t made = VarnekPGL_MakeDir(directory.c_str());
        return Results({made}) + (made != 0 ? "" : " " + remove());
    });
    const auto removeWithFile = [&] {
        std::filesystem::create_directory(directory);
        WriteAll(directory + "/file", "text");
        return remove();
    };
    Force("directory", removeWithFile, false);
}

TEST_F(FaultAlone, ConfigurationsSurviveEachFailingCall) {
    VarnekConfigInfo initial = *VarnekCfg_GetConfigInfo();
    strcpy(initial.supportNation, "BRA");
    const std::string draft = VARNEK_DATA_DIR "Varnek_Config.new.";
    const auto saveAndLoad = [&] {
        WriteAll(draft + "999999999.0", "of no process");
        *VarnekCfg_GetConfigInfo() = initial;
        VarnekCfg_SetStandard(VarnekCfg_GetConfigInfo()->standardType + 1);
        VarnekCfg_GetConfigInfo()->cprmPlayerDelay = 7;  // kept when the load fails
        VarnekCfg_LoadConfigFile();
        for (const auto &entry : std::filesystem::directory_iterator(VARNEK_DATA_DIR)) {
            EXPECT_NE(entry.path().string().rfind(draft + std::to_string(getpid()), 0), 0u) << "a draft is left";
        }
        return Results({VarnekCfg_GetConfigInfo()->cprmPlayerDelay});
    };
    Force("settings", saveAndLoad);
    std::filesystem::create_hard_link(kSettingsFile, Path("second name"));
    Force("settings in place", [&] {
        const std::string old(400, '\n');
        WriteAll(kSettingsFile, old);
        VarnekCfg_SaveConfigFile();
        const std::string text = ReadAll(kSettingsFile);
        return text == old ? "the old text" : std::to_string(text.size()) + " bytes";
    });
    Force("debug configuration", [] { return VarnekPGL_InitializeDebug(), std::string("loaded"); });
    FailCall("malloc", 1, ENOMEM);
    NOTE(VarnekCfg_LoadConfigFile)();
}

}  // namespace
