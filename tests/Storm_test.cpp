// Storms: for a second and a half each, threads do to one table at once whatever races could break,
// and each result is held against what must be true at any moment.
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <atomic>
#include <chrono>
#include <cstring>
#include <ctime>
#include <memory>
#include <random>
#include <thread>

#include "Varnek_Config.h"
#include "Varnek_Semaphore.h"
#include "Varnek_Thread.h"
#include "Varnek_Timer.h"
#include "support/VarnekTest.h"

namespace {

constexpr char kConfigPath[] = VARNEK_DATA_DIR "debug_ltn.ini";
constexpr int kHandles = 16000000;  // more than a fast machine gives out in the time

int64_t WallClock() {
    timespec now = {};
    clock_gettime(CLOCK_REALTIME, &now);
    return now.tv_sec * int64_t{1000000000} + now.tv_nsec;
}

// Runs `work(index, random)` in each of `count` threads, again and again for that time.
template <typename Work>
void Storm(int count, Work work) {
    const auto end = std::chrono::steady_clock::now() + std::chrono::milliseconds(1500);
    std::vector<std::thread> threads;
    for (int i = 0; i < count; i++) {
        threads.emplace_back([i, end, &work] {
            std::mt19937 random(static_cast<unsigned>(i));
            while (std::chrono::steady_clock::now() < end && !::testing::Test::HasFailure()) {
                work(i, random);
            }
        });
    }
    for (std::thread &thread : threads) {
        thread.join();
    }
}

class StormAlone : public VarnekTest {
  protected:
    void SetUp() override {
        VarnekTest::SetUp();
        WriteAll(kConfigPath, "# off");
        VarnekPGL_InitializeDebug();
    }
};

// Every character of a name tells whose it is, so that half a name is none.
std::string NameOf(int id) { return std::string(31, static_cast<char>('a' + id)); }

// Creation, deletion and lookups of the three families, at once.
struct Family {
    const char *what;
    int32_t (*create)(const char *name);
    BOOL (*remove)(int32_t handle);
    int32_t (*find)(const char *name);
    BOOL (*use)(int32_t handle);
};

void *Nothing(void *) { return nullptr; }

const Family kFamilies[] = {
    {"mutex", VarnekPGL_CreateMutex, VarnekPGL_DeleteMutex, VarnekPGL_GetMutexByName,
     [](int32_t h) { return VarnekPGL_AcquireMutex(h) && VarnekPGL_ReleaseMutex(h) ? TRUE : FALSE; }},
    {"semaphore", [](const char *name) { return VarnekPGL_CreateSemaphore(name, 0); }, VarnekPGL_DeleteSemaphore,
     VarnekPGL_SemaphoreByName,
     [](int32_t h) { return VarnekPGL_SignalSemaphore(h) && VarnekPGL_WaitSemaphore(h, 1000) ? TRUE : FALSE; }},
    {"thread", [](const char *name) { return VarnekPGL_CreateThread(name, 1, 16384, Nothing, nullptr); },
     VarnekPGL_DeleteThread, VarnekPGL_GetThreadByName,
     [](int32_t h) {
         const THREAD_MSG message = {};
         return VarnekPGL_SendMessage(h, &message);
     }},
};

TEST_F(StormAlone, LookupsDuringCreationsAndDeletions) {
    constexpr int kNames = 4;
    for (const Family &family : kFamilies) {
        // Whose handle it is, 0 while its creation has not returned.
        const auto owners = std::make_unique<std::atomic<int8_t>[]>(kHandles);
        std::atomic<int> found{0};
        Storm(2 * kNames, [&](int thread, std::mt19937 &random) {
            if (thread < kNames) {
                const int32_t handle = family.create(NameOf(thread).c_str());
                ASSERT_GT(handle, 0);
                ASSERT_LT(handle, kHandles);
                ASSERT_EQ(owners[static_cast<size_t>(handle)].exchange(static_cast<int8_t>(thread + 1)), 0)
                    << family.what << ": a handle came back";
                ASSERT_EQ(family.find(NameOf(thread).c_str()), handle) << family.what;
                ASSERT_TRUE(family.use(handle)) << family.what;
                ASSERT_TRUE(family.remove(handle)) << family.what;
                ASSERT_FALSE(family.use(handle)) << family.what;
                return;
            }
            const int name = static_cast<int>(random() % kNames);
            const int32_t handle = family.find(NameOf(name).c_str());
            if (handle != -1) {
                found++;
                const int8_t owner = owners[static_cast<size_t>(handle)];
                ASSERT_TRUE(owner == 0 || owner == name + 1) << family.what << ": the handle of another name";
            }
        });
        EXPECT_GT(found, 0) << family.what;
    }
}

TEST_F(StormAlone, SavesThatAreKilled) {
    const std::string path = VARNEK_DATA_DIR "Varnek_Config.cfg";
    VarnekConfigInfo &info = *VarnekCfg_GetConfigInfo();
    const auto save = [&info](char letter) {
        memset(info.currentAreaName, letter, sizeof info.currentAreaName - 1);
        VarnekCfg_SaveConfigFile();
    };
    // Either text, whole.
    save('a');
    VarnekCfg_GetSupportNation();
    save('a');
    const size_t size = ReadAll(path).size();
    const auto check = [&path, size] {
        const std::string text = ReadAll(path);
        const size_t start = strlen("CONFIG_CURRENTAREANAME=");
        ASSERT_EQ(text.size(), size) << text;
        ASSERT_EQ(text.substr(start, 99), std::string(99, text[start]));
    };
    std::mt19937 random(1);
    const auto end = std::chrono::steady_clock::now() + std::chrono::milliseconds(1500);
    while (std::chrono::steady_clock::now() < end && !HasFatalFailure()) {
        const pid_t child = fork();  // of this process's only thread
        if (child == 0) {
            while (true) {
                save('a');
                save('b');
            }
        }
        for (auto i = random() % 20; i > 0; i--) {
            check();
        }
        kill(child, SIGKILL);
        waitpid(child, nullptr, 0);
        check();
    }
}

// What a worker of the message storm is told, and what it is meant for.
struct Content {
    int32_t destination;
    int32_t sender;
    int32_t number;
    int32_t last;
};

THREAD_MSG Pack(const Content &content) {
    THREAD_MSG message = {};
    memcpy(message.data, &content, sizeof content);
    return message;
}

constexpr int kSenders = 3;

struct Totals {
    std::atomic<int> alive{0};
    std::atomic<int> received{0};
};

// Receives until its record is gone or the last message is here. What it gets was sent to it, and
// is in order.
void *Receiver(void *argument) {
    Totals &totals = *static_cast<Totals *>(argument);
    const int32_t self = VarnekPGL_GetCurrentThread();
    int32_t next[kSenders] = {};
    THREAD_MSG message;
    int32_t count = 0;
    // A removal before the first look is no error: a removed thread has no handle.
    while (self != -1 && VarnekPGL_ReceiveMessage(WAIT_FOREVER, &message, &count)) {
        Content content;
        memcpy(&content, message.data, sizeof content);
        EXPECT_EQ(content.destination, self) << "a message for another record";
        EXPECT_EQ(content.number, next[content.sender]++) << "a message lost, doubled or out of order";
        totals.received++;
        if (content.last != 0) {
            break;
        }
    }
    totals.alive--;
    return nullptr;
}

TEST_F(StormAlone, MessagesToRecordsThatComeAndGo) {
    Totals totals;
    std::atomic<int> sent{0};
    int32_t latest[kSenders] = {};
    // Nothing but the registry tells a sender of a record.
    const auto find = [] { return VarnekPGL_GetThreadByName("receiver"); };
    Storm(kSenders + 1, [&](int thread, std::mt19937 &random) {
        if (thread < kSenders) {
            const int32_t handle = find();
            if (handle == -1 || handle == latest[thread]) {
                std::this_thread::yield();
                return;
            }
            latest[thread] = handle;
            THREAD_MSG message;
            int32_t number = 0;
            do {
                message = Pack({handle, thread, number++, 0});
            } while (VarnekPGL_SendMessage(handle, &message) && number < 2000);
            sent += number;
            return;
        }
        totals.alive++;
        const int32_t handle = VarnekPGL_CreateThread("receiver", 1, 65536, Receiver, &totals);
        ASSERT_NE(handle, -1);
        if (random() % 2 != 0) {
            std::this_thread::sleep_for(std::chrono::microseconds(random() % 300));
        }
        ASSERT_TRUE(VarnekPGL_DeleteThread(handle));
    });
    EXPECT_TRUE(Eventually([&] { return totals.alive == 0; })) << "a waiter was not woken";
    EXPECT_GT(totals.received, 0);
    EXPECT_GT(sent, totals.received) << "no record went with messages unread";
}

// One start of a timer: when it is due.
struct Start {
    std::atomic<int64_t> due{0};
};

constexpr int kTimers = 4;
Start gStarts[kTimers][1024];  // outlives late callbacks
std::atomic<int> gExpiries{0};

// A callback never comes before its start is due.
void ExpectDue(uint32_t, void *userData) {
    const int64_t now = WallClock();
    const Start &start = *static_cast<Start *>(userData);
    EXPECT_GE(now, start.due) << "a callback came early";
    gExpiries++;
}

// Does to its own timer what a callback may do.
void UseOwnTimer(uint32_t timer, void *userData) {
    switch (++gExpiries % 4) {
        case 0:
            VarnekPGL_StartTimer(timer, 1, UseOwnTimer, userData);
            break;
        case 1:
            VarnekPGL_CancelTimer(timer);
            break;
        case 2:
            VarnekPGL_DeleteTimer(timer);
            break;
        default:
            break;
    }
}

TEST_F(StormAlone, ExpiriesThatMeetCancelsAndStarts) {
    Storm(kTimers, [](int thread, std::mt19937 &random) {
        thread_local int next = 0;
        const std::string name = NameOf(thread);
        int32_t timer = VarnekPGL_GetTimerByName(name.c_str());
        if (timer == -1) {
            timer = VarnekPGL_CreateTimer(name.c_str());
        }
        ASSERT_GE(timer, 0);
        const auto handle = static_cast<uint32_t>(timer);
        // A short start that may be expiring while it is cancelled, then a long one.
        for (uint32_t timeout : {1u, 20u}) {
            Start &start = gStarts[thread][next++ % 1024];
            start.due = WallClock() + timeout * int64_t{1000000};
            VarnekPGL_StartTimer(handle, timeout, thread % 2 != 0 ? ExpectDue : UseOwnTimer, &start);
            std::this_thread::sleep_for(std::chrono::microseconds(900 + random() % 200));
            VarnekPGL_CancelTimer(handle);
        }
    });
    EXPECT_GT(gExpiries, 0);
    for (uint32_t timer = 0; timer < 32; timer++) {
        VarnekPGL_DeleteTimer(timer);
    }
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
}

}  // namespace
