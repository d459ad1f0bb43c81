#include <pthread.h>
#include <sched.h>
#include <sys/prctl.h>

#include <future>

#include "Varnek_Tasking.h"
#include "support/Families.h"
#include "support/VarnekTest.h"

namespace {

using ::testing::ElementsAre, ::testing::IsEmpty;

THREAD_MSG Message(char text) {
    THREAD_MSG message;
    memset(message.data, text, sizeof message.data);
    return message;
}

constexpr uint32_t kStack = 256 * 1024;

class Thread : public VarnekTest {};
class MessageQueue : public VarnekTest {};

TEST_F(Thread, HandlesNamesAndTheThreadsOwnView) {
    std::atomic<int32_t> seen{0};
    const std::string k31 = "a name of thirty-one characters";
    const varnek::Thread first(k31, kStack, [&seen] { seen = VarnekPGL_GetCurrentThread(); });
    EXPECT_EQ(first.Handle(), 1);
    EXPECT_TRUE(Eventually([&seen] { return seen == 1; }));
    EXPECT_EQ(VarnekPGL_CreateThread("second", 1, 0, Nothing, nullptr), 2);
    NOTE(VarnekPGL_GetThreadByName)(k31);
    for (const char *name : {"First", static_cast<const char *>(nullptr)}) {
        EXPECT_EQ(VarnekPGL_GetThreadByName(name), -1);
    }
    EXPECT_TRUE(VarnekPGL_DeleteThread(1));
    EXPECT_FALSE(VarnekPGL_DeleteThread(1));
    NOTE(VarnekPGL_CreateThread)("third", 99, 65536, Nothing, nullptr);
    NOTE(VarnekPGL_GetCurrentThread)();
}

TEST_F(Thread, FailuresHaveTheirLineAndResult) {
    notesLow_ = false;
    NOTE(VarnekPGL_DeleteThread)(1);  // there is no guard before the first thread
    const std::string k32(32, 'n');
    for (const char *name : {static_cast<const char *>(nullptr), "", k32.c_str()}) {
        NOTE(VarnekPGL_CreateThread)(name, 50, 0, Nothing, nullptr);
    }
    NOTE(VarnekPGL_CreateThread)("x", 50, 0, nullptr, nullptr);
    for (int32_t priority : {0, 100}) {
        EXPECT_EQ(VarnekPGL_CreateThread("x", priority, 0, Nothing, nullptr), -1) << priority;
    }
    EXPECT_EQ(VarnekPGL_CreateThread("x", 50, 0, Nothing, nullptr), 1) << "a failure took a handle";
}

TEST_F(Thread, ADuplicateTakesTheRecord) {
    const int32_t old = VarnekPGL_CreateThread("same", 1, 0, Nothing, nullptr);
    EXPECT_TRUE(varnek::Send(old, 'm') && varnek::Send(old, 'm'));
    NOTE(VarnekPGL_CreateThread)("same", 1, 0, Nothing, nullptr);
    EXPECT_FALSE(varnek::Send(old, 'm'));
    EXPECT_TRUE(varnek::Send(old + 1, 'm'));
    NOTE(VarnekPGL_DeleteThread)(old + 1);
}

TEST_F(Thread, AThreadFindsItselfFirstOfAll) {
    std::atomic<int> missed{0};
    for (int i = 0; i < 2000; i++) {
        varnek::Thread("worker", kStack, [&missed, i] {
            const int32_t byName = VarnekPGL_GetThreadByName("worker");
            missed += byName == -1 || byName != VarnekPGL_GetCurrentThread() || !varnek::Send(i + 1, 'm');
        }).Join();
    }
    EXPECT_EQ(missed, 0);
}

TEST_F(Thread, AThreadWithAnEndedThreadsSystemIdIsUnknown) {
    pthread_t ended{};
    std::promise<void> known;
    const varnek::Thread worker("worker", kStack, [&] { ended = pthread_self(), known.set_value(); });
    known.get_future().wait();
    bool same = false;
    for (int i = 0; i < 100 && !same; i++) {
        std::thread([&same, ended] {
            same = pthread_equal(ended, pthread_self()) != 0;
            EXPECT_EQ(VarnekPGL_GetCurrentThread(), -1);
        }).join();
    }
}

// A thread keeps its block for one round of thread-specific destructors after the library's own. So the destructor
// of an older key, which runs before the library's, finds the block in the second round too.
TEST_F(Thread, AThreadKnowsItselfInTheFirstDestructorsOfOtherKeys) {
    struct Key {
        pthread_key_t key;
        std::vector<int32_t> handles;  // what its destructors find in each round
        std::promise<void> ended;
        static void Destroy(void *self) {
            auto &[key, handles, ended] = *static_cast<Key *>(self);
            int32_t number = 7;
            handles.push_back(VarnekPGL_GetCurrentThread());
            const bool isKnown = handles.back() != -1;
            EXPECT_EQ(varnek::Send(handles.back(), number), isKnown);
            EXPECT_EQ(varnek::Receive(number), isKnown ? varnek::Outcome::kSuccess : varnek::Outcome::kGone);
            handles.size() < 3 ? void(pthread_setspecific(key, self)) : ended.set_value();
        }
    };
    static Key older, newer;
    pthread_key_create(&older.key, Key::Destroy);
    VarnekPGL_CreateThread("makes the library's key", 1, 0, Nothing, nullptr);
    pthread_key_create(&newer.key, Key::Destroy);
    const varnek::Thread worker("worker", kStack, [] {
        pthread_setspecific(older.key, &older);
        pthread_setspecific(newer.key, &newer);
    });
    newer.ended.get_future().wait();
    EXPECT_THAT(older.handles, ElementsAre(worker.Handle(), worker.Handle(), -1));
    EXPECT_THAT(newer.handles, ElementsAre(worker.Handle(), -1, -1));
}

TEST_F(Thread, TheSystemKnowsTheNamesBeginning) {
    char name[16] = "";
    varnek::Thread("a name of more than 15", kStack, [&name] { prctl(PR_GET_NAME, name); }).Join();
    EXPECT_STREQ(name, "a name of more ");
}

TEST_F(Thread, ALogFunctionGetsNoThreadWhileItsOwnCallMakesTheGuard) {
    gLogHook = [](const LogLine &line) {
        if (line.text.find("START : __Varnek_create_mutex") != std::string::npos) {
            EXPECT_EQ(VarnekPGL_CreateThread("inner", 1, 0, Nothing, nullptr), -1);
        }
    };
    EXPECT_EQ(VarnekPGL_CreateThread("outer", 1, 0, Nothing, nullptr), 1);
    gLogHook = nullptr;
    EXPECT_THAT(TakeErrors(), ElementsAre("***** __Varnek_create_thread : Thread Mutex Creation Fail!!",
                                          "Thread Creation Fail! szThreadName=[inner]\n"));
}

TEST_F(Thread, FirstCreationsAtOnceMakeOneGuard) {
    // The pause lets every thread find that there is no guard yet.
    gLogHook = [](const LogLine &line) {
        if (line.text.find("START : __Varnek_create_mutex") != std::string::npos) {
            std::this_thread::sleep_for(std::chrono::milliseconds(20));
        }
    };
    const auto name = [](int i) { return "t" + std::to_string(i); };
    AtOnce(8, [&name](int i) { VarnekPGL_CreateThread(name(i).c_str(), 1, 0, Nothing, nullptr); });
    gLogHook = nullptr;
    EXPECT_THAT(TakeErrors(), IsEmpty());
    EXPECT_EQ(VarnekPGL_GetMutexByName("VarnekThreadMutex"), 1);
    for (int i = 0; i < 8; i++) {
        EXPECT_NE(VarnekPGL_GetThreadByName(name(i).c_str()), -1);
    }
}

#if defined(__OPTIMIZE__) && !defined(VARNEK_SANITIZED)

// Returns how many bytes of stack `work` uses, including those of this program's log function.
size_t StackOf(void (*work)()) {
    constexpr size_t kSize = 262144;
    static char stack[kSize] __attribute__((aligned(4096)));
    memset(stack, 0xA5, kSize);
    pthread_attr_t attributes;
    pthread_attr_init(&attributes);
    pthread_attr_setstack(&attributes, stack, kSize);
    pthread_t thread;
    const auto run = [](void *what) -> void * {
        reinterpret_cast<void (*)()>(what)();
        return nullptr;
    };
    EXPECT_EQ(pthread_create(&thread, &attributes, run, reinterpret_cast<void *>(work)), 0);
    pthread_join(thread, nullptr);
    const char *deepest = std::find_if(stack, stack + kSize, [](char c) { return c != '\xA5'; });
    return static_cast<size_t>(stack + kSize - deepest);
}

TEST_F(Thread, CallsFitASmallStack) {
    const std::pair<const char *, void (*)()> rows[] = {
        {"load", VarnekPGL_InitializeDebug},
        {"trace", [] { VARNEK_TRACE(0x80000001, "%s %d %5.2f", "text", 1, 1.5); }},
        {"mutex", [] { VarnekPGL_AcquireMutex(VarnekPGL_CreateMutex("mutex")); }},
        {"semaphore", [] { VarnekPGL_WaitSemaphore(VarnekPGL_CreateSemaphore("semaphore", 0), 1); }},
        {"thread", [] { VarnekPGL_DeleteThread(VarnekPGL_CreateThread("thread", 1, 0, Nothing, nullptr)); }},
        {"timer",
         [] {
             const auto timer = static_cast<uint32_t>(VarnekPGL_CreateTimer("timer"));
             const TimerCallbackFunc ignore = [](uint32_t, void *) {};
             VarnekPGL_StartTimer(timer, 60000, ignore, nullptr);
             VarnekPGL_DeleteTimer(timer);
         }},
        {"message",
         [] {
             THREAD_MSG message = {};
             int32_t count = 0;
             VarnekPGL_SendMessage(VarnekPGL_GetThreadByName("sink"), &message);
             VarnekPGL_ReceiveMessage(0, &message, &count);
         }},
    };
    VarnekPGL_CreateThread("sink", 1, 0, Nothing, nullptr);
    const size_t start = StackOf([] {});
    for (const auto &[what, work] : rows) {
        StackOf(work);  // in the first call, the loader may bind functions
        const size_t used = StackOf(work) - start;
        EXPECT_LT(used, sizeof(void *) == 4 ? 4608u : 6144u) << what;
        RecordProperty(what, static_cast<int>(used));
    }
}

#endif

TEST_F(MessageQueue, UrgentMessagesOvertake) {
    std::string received;
    std::promise<void> sent;
    varnek::Thread worker("worker", kStack, [&] {
        sent.get_future().wait();
        THREAD_MSG message;
        int32_t count = -1;
        for (int32_t left : {3, 2, 1, 0}) {
            EXPECT_TRUE(VarnekPGL_ReceiveMessage(WAIT_FOREVER, &message, &count));
            EXPECT_EQ(count, left);
            received.append(reinterpret_cast<char *>(message.data), sizeof message.data);
        }
        EXPECT_FALSE(VarnekPGL_ReceiveMessage(0, &message, &count));
    });
    for (const char text : {'a', 'b', '1', '2'}) {
        THREAD_MSG message = Message(text);
        if (text < 'a') {
            NOTE(VarnekPGL_SendUrgentMessage)(worker.Handle(), &message);
        } else {
            NOTE(VarnekPGL_SendMessage)(worker.Handle(), &message);
        }
        message = Message('x');
    }
    TakeLog();
    sent.set_value();
    worker.Join();
    EXPECT_EQ(received, std::string(40, '2') + std::string(40, '1') + std::string(40, 'a') + std::string(40, 'b'));
    EXPECT_THAT(TakeErrors(), ElementsAre("***** VarnekPGL_ReceiveMessage: Semaphore wait FAIL. errCode = [110]"));
}

TEST_F(MessageQueue, APeekLeavesASignalBehind) {
    varnek::Thread("worker", kStack, [] {
        THREAD_MSG message;
        int32_t count = -1;
        EXPECT_FALSE(VarnekPGL_PeekMessage(&message, &count));
        EXPECT_FALSE(VarnekPGL_PeekMessage(&message, nullptr));
        EXPECT_FALSE(VarnekPGL_ReceiveMessage(0, nullptr, &count));
        EXPECT_THAT(TakeErrors(), ElementsAre("***** VarnekPGL_PeekMessage: Msg is NULL",
                                              "***** VarnekPGL_PeekMessage: message or count is NULL",
                                              "***** VarnekPGL_ReceiveMessage: message or count is NULL"));
        EXPECT_TRUE(varnek::Send(VarnekPGL_GetCurrentThread(), Message('m')));
        EXPECT_TRUE(VarnekPGL_PeekMessage(&message, &count));
        EXPECT_EQ(message.data[39], 'm');
        EXPECT_EQ(count, 0);
        TakeLog();
        EXPECT_FALSE(VarnekPGL_ReceiveMessage(WAIT_FOREVER, &message, &count));
        EXPECT_THAT(TakeErrors(), ElementsAre("***** VarnekPGL_ReceiveMessage: Msg is NULL"));
        EXPECT_FALSE(VarnekPGL_ReceiveMessage(20, &message, &count));
    }).Join();
}

TEST_F(MessageQueue, FailuresHaveTheirLineAndResult) {
    THREAD_MSG message = Message('m');
    int32_t count = 77;
    NOTE(VarnekPGL_SendMessage)(-1, &message);
    NOTE(VarnekPGL_SendMessage)(1, nullptr);
    NOTE(VarnekPGL_SendUrgentMessage)(0, &message);
    NOTE(VarnekPGL_SendUrgentMessage)(1, nullptr);
    NOTE(VarnekPGL_ReceiveMessage)(0, &message, &count);
    NOTE(VarnekPGL_PeekMessage)(&message, &count);
    EXPECT_EQ(count, 77);
}

TEST_F(MessageQueue, ARemovalWakesTheWaiterAndNothingIsDestroyedUnderIt) {
    for (uint32_t timeout : {WAIT_FOREVER, 20000u}) {
        std::promise<void> waiting;
        varnek::Thread worker("worker", kStack, [&] {
            THREAD_MSG message;
            int32_t count = 77;
            waiting.set_value();
            EXPECT_FALSE(VarnekPGL_ReceiveMessage(timeout, &message, &count));
            EXPECT_EQ(count, 77);
        });
        const int32_t handle = worker.Handle();
        waiting.get_future().wait();
        EXPECT_TRUE(VarnekPGL_DeleteThread(handle));
        const int32_t next = VarnekPGL_CreateThread("next", 1, 0, Nothing, nullptr);
        EXPECT_EQ(next, handle + 1);
        EXPECT_TRUE(varnek::Send(next, 'n')) << "the next record gets no message";
        worker.Join();
        TakeLog();
        VarnekPGL_DeleteThread(next);
        EXPECT_THAT(TakeErrors(), ElementsAre("***** VarnekPGL_DeleteThread : MsgQ is not empty!!size = [1]"));
    }
}

TEST_F(MessageQueue, ALogFunctionMaySendAndReceiveBeforeTheWait) {
    gLogHook = [](const LogLine &line) {
        thread_local bool inside = false;
        if (inside || line.text.find("VarnekPGL_ReceiveMessage: semCount = 0") == std::string::npos) {
            return;
        }
        inside = true;
        int number = 0;
        for (const int each : {1, 2}) {
            EXPECT_TRUE(varnek::Send(VarnekPGL_GetCurrentThread(), each));
        }
        EXPECT_EQ(varnek::Receive(number), varnek::Outcome::kSuccess);
        inside = false;
    };
    varnek::Thread("worker", kStack, [] {
        int number = 0;
        EXPECT_EQ(varnek::Receive(number), varnek::Outcome::kSuccess);
        EXPECT_EQ(number, 2);
    }).Join();
    gLogHook = nullptr;
}

}  // namespace
