#include "Varnek_Tasking.h"

#include <pthread.h>
#include <signal.h>

#include <memory>

#include "support/Families.h"
#include "support/VarnekTest.h"

bool StartInOtherLibrary(varnek::Timer &timer, std::atomic<int> &called);

namespace {

using namespace std::chrono_literals;
using varnek::Existing;
using varnek::Limit;
using varnek::Outcome;

constexpr uint32_t kStack = 256 * 1024;

struct Content {
    int64_t number;
    int32_t from;
};

class Tasking : public VarnekTest {};

TEST_F(Tasking, LimitsAreRoundedUpAndNeverEndless) {
    using std::chrono::duration;
    constexpr uint32_t kLongest = WAIT_FOREVER - 1;
    const std::pair<Limit, uint32_t> rows[] = {
        {0ms, 0},
        {-1h, 0},
        {1ns, 1},
        {1ms, 1},
        {1000001ns, 2},
        {2s, 2000},
        {4294967294ms, kLongest},
        {4294967295ms, kLongest},
        {4294967293999999ns, kLongest},
        {4294967293000000ns, kLongest - 1},
        {std::chrono::hours::max(), kLongest},
        {std::chrono::hours::min(), 0},
        {std::chrono::nanoseconds::max(), kLongest},
        {duration<double>(1e300), kLongest},
        {duration<float>(0.0001f), 1},
        {duration<float, std::ratio<1, 30>>(128849016.f), kLongest - 94},
        {duration<int64_t, std::ratio<1, 2893202001>>(12'000'000'000'000'000), 4147653706},
        {duration<int8_t, std::ratio<60>>(1), 60000},
        {duration<int64_t, std::ratio<1, 90000>>(91), 2},
        {Limit::None(), WAIT_FOREVER}};
    for (const auto &[limit, expected] : rows) {
        EXPECT_EQ(limit.Milliseconds(), expected);
    }
}

TEST_F(Tasking, NamesAreCopiedOrRefused) {
    const std::string text = "a name of thirty-one characters, and more";
    const varnek::Mutex mutex(std::string_view(text).substr(0, 31), Existing::kReplace);
    EXPECT_EQ(mutex.Handle(), VarnekPGL_GetMutexByName("a name of thirty-one characters"));
    for (const std::string_view name :
         {std::string_view("a\0b", 3), std::string_view(text), std::string_view("a\0", 2)}) {
        EXPECT_FALSE(varnek::Mutex(name, Existing::kUse));
        EXPECT_FALSE(varnek::Semaphore(name, Existing::kReplace, 0));
        EXPECT_FALSE(varnek::Timer(name));
        EXPECT_FALSE(varnek::Thread(name, kStack, [] {}));
    }
}

TEST_F(Tasking, TheCallerChoosesWhatBecomesOfTheOldObject) {
    varnek::Semaphore used("unit", Existing::kUse, 1);
    {
        varnek::Semaphore again("unit", Existing::kUse, 5);
        EXPECT_EQ(again.Handle(), used.Handle());
        EXPECT_EQ(again.Wait(0ms), Outcome::kSuccess);
        EXPECT_EQ(again.Wait(0ms), Outcome::kTimeout);
    }
    EXPECT_TRUE(used.Signal()) << "a borrowed semaphore was deleted";
    {
        const varnek::Semaphore owned("unit", Existing::kReplace, 0);
        EXPECT_EQ(used.Wait(), Outcome::kGone);
    }
    EXPECT_EQ(VarnekPGL_SemaphoreByName("unit"), -1);
    std::atomic<int> handles{0};
    AtOnce(8, [&handles](int) { handles += varnek::Mutex("shared", Existing::kUse).Handle(); });
    EXPECT_EQ(handles, 8) << "two threads made the mutex";
}

TEST_F(Tasking, NoSectionRunsUnprotected) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    varnek::Mutex mutex("held", Existing::kReplace);
    std::unique_lock<varnek::Mutex> hold(mutex);
    const varnek::Mutex refused("held", Existing::kReplace);
    EXPECT_FALSE(refused) << "a held mutex was replaced";
    hold.unlock();
    EXPECT_TRUE(VarnekPGL_DeleteMutex(mutex.Handle()));
    EXPECT_DEATH(mutex.lock(), "");
}

TEST_F(Tasking, AReceiveTellsItsOutcomesApart) {
    struct sigaction act = {};
    act.sa_handler = [](int) {};
    sigaction(SIGUSR1, &act, nullptr);
    std::atomic<bool> ready{false}, interrupted{false};
    std::atomic<pthread_t> self{};
    varnek::Thread thread("receiver", kStack, [&] {
        Content content = {-1, 0};
        EXPECT_EQ(varnek::Receive(content, 1ms), Outcome::kTimeout);
        EXPECT_EQ(varnek::Receive(content, -1h), Outcome::kTimeout);
        THREAD_MSG peeked;
        int32_t left = 0;
        EXPECT_TRUE(varnek::Send(VarnekPGL_GetCurrentThread(), Content{1, 0}));
        EXPECT_TRUE(VarnekPGL_PeekMessage(&peeked, &left));
        EXPECT_EQ(varnek::Receive(content, 1ms), Outcome::kTimeout) << "a peek is no outcome";
        EXPECT_EQ(content.number, -1);
        for (int64_t number : {1, 2}) {
            EXPECT_TRUE(varnek::SendUrgent(VarnekPGL_GetCurrentThread(), Content{number, 7}));
        }
        EXPECT_EQ(varnek::Receive(content), Outcome::kSuccess);
        EXPECT_EQ(content.number * 10 + content.from, 27);
        EXPECT_EQ(varnek::Receive(content, 1h), Outcome::kSuccess);
        self = pthread_self();
        ready = true;
        EXPECT_EQ(varnek::Receive(content, 1h), Outcome::kInterrupted);
        interrupted = true;
        EXPECT_EQ(varnek::Receive(content), Outcome::kGone) << "it goes on after a signal";
        EXPECT_EQ(varnek::Receive(content, 1h), Outcome::kGone);
    });
    ASSERT_TRUE(Eventually([&] { return ready.load(); }));
    EXPECT_TRUE(Eventually([&] { return pthread_kill(self, SIGUSR1) == 0 && interrupted; }));
    std::this_thread::sleep_for(5ms);
    pthread_kill(self, SIGUSR1);
    EXPECT_FALSE(thread.Join(5ms));
    EXPECT_TRUE(VarnekPGL_DeleteThread(thread.Handle()));
    EXPECT_TRUE(thread.Join(1h));
    Content content = {};
    EXPECT_EQ(varnek::Receive(content), Outcome::kGone) << "this thread has no record";
}

// What a callable captures, and how many copies of it there are.
struct Module {
    std::atomic<int> sum{0};
    std::shared_ptr<int> life = std::make_shared<int>();
    void Add(int a, const std::shared_ptr<int> &) { sum += a; }
};

TEST_F(Tasking, AThreadAndItsOwnerEndInAnyOrder) {
    Module module;
    varnek::Thread member("member", kStack, &Module::Add, &module, 3, module.life);
    EXPECT_FALSE(varnek::Thread("member", kStack, [] {})) << "a thread has the name";
    AtOnce(2, [&member](int) { EXPECT_TRUE(member.Join()); });
    EXPECT_EQ(module.sum, 3);
    EXPECT_EQ(module.life.use_count(), 1) << "Join came before the callable's end";
    EXPECT_FALSE(varnek::Send(member.Handle(), 1));
    TakeLog();
    {  // The owner ends first: the record is removed, and the destructor waits.
        varnek::Thread waits("waits", kStack, [&module, life = module.life] {
            int number = 0;
            while (varnek::Receive(number) == Outcome::kSuccess) {
                module.sum += number;
            }
            std::this_thread::sleep_for(10ms);
            module.sum = -1;
        });
        EXPECT_TRUE(varnek::Send(waits.Handle(), 4));
    }
    EXPECT_EQ(module.sum, -1);
    // The callable itself destroys its owner.
    std::optional<varnek::Thread> own;
    std::atomic<bool> made{false}, ended{false};
    own.emplace("own", kStack, [&, life = module.life] {
        Eventually([&] { return made.load(); });
        own.reset();
        ended = life.use_count() > 0;
    });
    made = true;
    EXPECT_TRUE(Eventually([&] { return ended && module.life.use_count() == 1; }));
}

TEST_F(Tasking, ATimersCallablesFindNothingThatIsGone) {
    Module module;
    varnek::Timer timer("timer");
    EXPECT_FALSE(varnek::Timer("timer")) << "the name is in use";
    const auto start = std::chrono::steady_clock::now();
    EXPECT_TRUE(timer.Start(19999us, &Module::Add, &module, 1, module.life));
    EXPECT_TRUE(Eventually([&] { return module.life.use_count() == 1; }));
    EXPECT_GE(std::chrono::steady_clock::now() - start, 19ms);
    EXPECT_FALSE(timer.Cancel()) << "no start is left";
    EXPECT_TRUE(timer.Start(1h, &Module::Add, &module, 2, module.life));
    EXPECT_TRUE(timer.IsActive());
    EXPECT_FALSE(timer.Start(1ms, &Module::Add, &module, 2, module.life)) << "it is armed";
    EXPECT_TRUE(timer.Cancel());
    EXPECT_EQ(module.life.use_count(), 1);
    EXPECT_TRUE(timer.Start(-1s, [&] { EXPECT_TRUE(timer.Start(1ms, &Module::Add, &module, 4, module.life)); }));
    EXPECT_TRUE(Eventually([&] { return module.sum == 5; }));
    {  // The destructor waits for a callable that runs.
        varnek::Timer slow("slow");
        std::atomic<bool> begun{false};
        EXPECT_TRUE(slow.Start(1ms, [&, life = module.life] {
            begun = true;
            std::this_thread::sleep_for(10ms);
            module.sum = slow.Start(1ms, [] {}) ? -2 : -1;
        }));
        EXPECT_TRUE(Eventually([&] { return begun.load(); }));
    }
    EXPECT_LT(module.sum, 0);
    EXPECT_EQ(module.life.use_count(), 1);
    std::atomic<int> called{0};
    EXPECT_TRUE(StartInOtherLibrary(timer, called));
    EXPECT_TRUE(Eventually([&] { return called == 1; })) << "it was started by another shared library";
    auto own = std::make_shared<std::optional<varnek::Timer>>();
    own->emplace("own");
    EXPECT_TRUE((*own)->Start(1ms, [own] { own->reset(); }));
    EXPECT_TRUE(Eventually([&] { return own.use_count() == 1; }));
    // Where pointers have 32 bits, the numbers of calls wrap around, perhaps to that of a call that still runs.
    int number = 0;
    const varnek::Thread waits("waits", kStack, [&number] { (void)varnek::Receive(number); });
    --varnek::detail::Shared::Get().number;
    EXPECT_TRUE(timer.Start(1ms, [&called] { ++called; }));
    EXPECT_TRUE(Eventually([&] { return called == 2; }));
}

// Timers that are destroyed while they expire, and threads whose owners end before or after them.
TEST_F(Tasking, AStormLeavesNothingBehind) {
    std::atomic<int> expired{0};
    AtOnce(4, [&expired](int index) {
        const std::string number = std::to_string(index);
        const auto life = std::make_shared<int>();
        for (int round = 0; round < 300; ++round) {
            {
                varnek::Timer timer("timer" + number);
                EXPECT_TRUE(timer.Start(1ms, [&expired, life] { ++expired; }));
                std::this_thread::sleep_for(std::chrono::microseconds(900 + round));
                const varnek::Thread brief("brief" + number, kStack, [life] {});
                if (round % 3 == 0) {
                    timer.Cancel();
                }
            }
            EXPECT_EQ(life.use_count(), 1);
        }
    });
    EXPECT_GT(expired, 0);
    for (const Family &family : kFamilies) {
        EXPECT_GE(family.Room(), 20u) << family.name;
    }
}

}  // namespace
