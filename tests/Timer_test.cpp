#include "Varnek_Timer.h"

#include <sys/syscall.h>
#include <unistd.h>

#include "support/VarnekTest.h"

namespace {

using ::testing::IsEmpty;
using Clock = std::chrono::steady_clock;

// What a callback has seen.
struct Expiries {
    std::atomic<int> count{0};
    std::atomic<uint32_t> timer{99};
    std::atomic<pid_t> thread{0};
};

void CountExpiry(uint32_t timer, void *userData) {
    auto *expiries = static_cast<Expiries *>(userData);
    expiries->timer = timer;
    expiries->thread = static_cast<pid_t>(syscall(SYS_gettid));
    expiries->count++;
}

class Timer : public VarnekTest {};

TEST_F(Timer, HandlesAreSlotsAndNamesAreUnique) {
    const std::string k40(40, 'n');
    EXPECT_EQ(VarnekPGL_GetTimerByName(""), -1) << "a free slot has a name";
    EXPECT_EQ(VarnekPGL_CreateTimer(k40.c_str()), 0);
    EXPECT_EQ(VarnekPGL_CreateTimer(""), 1);
    EXPECT_EQ(VarnekPGL_GetTimerByName(""), 1);
    Expiries expiries;
    EXPECT_TRUE(VarnekPGL_StartTimer(0, 60000, CountExpiry, &expiries));
    EXPECT_EQ(VarnekPGL_GetTimerByName(k40.c_str()), 0);
    NOTE(VarnekPGL_CreateTimer)(k40);
    NOTE(VarnekPGL_CreateTimer)(k40 + "n");
    NOTE(VarnekPGL_CreateTimer)(nullptr);
    NOTE(VarnekPGL_GetTimerByName)(nullptr);
    EXPECT_TRUE(VarnekPGL_IsTimerActive(0)) << "the duplicate changed the timer";
    EXPECT_TRUE(VarnekPGL_DeleteTimer(0));
    EXPECT_EQ(VarnekPGL_CreateTimer("again"), 0);
    VarnekPGL_DestoryTimerSystem();
    EXPECT_EQ(VarnekPGL_GetTimerByName("again"), 0);
}

TEST_F(Timer, BadHandlesAndArgumentsHaveTheirLine) {
    VarnekPGL_CreateTimer("never started");
    NOTE(VarnekPGL_StartTimer)(5, 1, CountExpiry, nullptr);
    NOTE(VarnekPGL_CancelTimer)(5);
    NOTE(VarnekPGL_DeleteTimer)(5);
    NOTE(VarnekPGL_IsTimerActive)(5);
    for (uint32_t handle : {32u, UINT32_MAX}) {
        EXPECT_FALSE(VarnekPGL_StartTimer(handle, 1, CountExpiry, nullptr) || VarnekPGL_CancelTimer(handle) ||
                     VarnekPGL_DeleteTimer(handle) || VarnekPGL_IsTimerActive(handle));
    }
    NOTE(VarnekPGL_StartTimer)(0, 0, CountExpiry, nullptr);
    NOTE(VarnekPGL_StartTimer)(0, 1, nullptr, nullptr);
    NOTE(VarnekPGL_CancelTimer)(0);
    EXPECT_FALSE(VarnekPGL_IsTimerActive(0));
}

TEST_F(Timer, ExpiresOnceOnAnotherThreadAndStartsAgain) {
    VarnekPGL_CreateTimer("other");
    const auto timer = static_cast<uint32_t>(VarnekPGL_CreateTimer("timer"));
    Expiries expiries;
    for (int round = 1; round <= 2; round++) {
        const auto start = Clock::now();
        EXPECT_TRUE(VarnekPGL_StartTimer(timer, 60, CountExpiry, &expiries));
        EXPECT_TRUE(VarnekPGL_IsTimerActive(timer));
        EXPECT_FALSE(VarnekPGL_StartTimer(timer, 1, CountExpiry, &expiries)) << "it is armed";
        EXPECT_TRUE(Eventually([&] { return expiries.count == round; }));
        EXPECT_GE(Clock::now() - start, std::chrono::milliseconds(55));
        EXPECT_FALSE(VarnekPGL_IsTimerActive(timer));
    }
    EXPECT_EQ(expiries.timer, timer);
    EXPECT_NE(expiries.thread, static_cast<pid_t>(syscall(SYS_gettid)));
    NOTE(VarnekPGL_CancelTimer)(timer);  // an expired timer is already disarmed
    EXPECT_TRUE(VarnekPGL_DeleteTimer(timer));
    std::this_thread::sleep_for(std::chrono::milliseconds(100));
    EXPECT_EQ(expiries.count, 2);
}

TEST_F(Timer, ACancelledStartNeverCallsBack) {
    const auto timer = static_cast<uint32_t>(VarnekPGL_CreateTimer("timer"));
    Expiries first, second;
    EXPECT_TRUE(VarnekPGL_StartTimer(timer, 30, CountExpiry, &first));
    gLogHook = [](const LogLine &line) {  // by its last line, the family's lock is free
        if (line.text.find("END: VarnekPGL_CancelTimer") != std::string::npos) {
            EXPECT_FALSE(VarnekPGL_IsTimerActive(0));
        }
    };
    EXPECT_TRUE(VarnekPGL_CancelTimer(timer));
    gLogHook = nullptr;
    EXPECT_TRUE(VarnekPGL_StartTimer(timer, 60, CountExpiry, &second));
    EXPECT_TRUE(Eventually([&] { return second.count == 1; }));
    EXPECT_EQ(first.count, 0);
    EXPECT_THAT(TakeErrors(), IsEmpty());
}

TEST_F(Timer, EachStartCallsBackOnceHoweverLateItsDelivery) {
    VarnekPGL_CreateTimer("timer");
    for (const bool cancelled : {false, true}) {
        // The first delivery is held up until the second start has been made.
        static std::atomic<int> deliveries;
        static std::atomic<bool> held;
        deliveries = 0;
        held = true;
        gLogHook = [](const LogLine &line) {
            if (line.text.find("Timer Callback: Timer") != std::string::npos && deliveries++ == 0) {
                Eventually([] { return !held; });
            }
        };
        Expiries first, second;
        EXPECT_TRUE(VarnekPGL_StartTimer(0, 1, CountExpiry, &first));
        EXPECT_TRUE(Eventually([] { return deliveries == 1; }));
        EXPECT_TRUE(VarnekPGL_StartTimer(0, cancelled ? 60000 : 1, CountExpiry, &second));
        if (cancelled) {
            EXPECT_TRUE(VarnekPGL_CancelTimer(0));
            EXPECT_FALSE(VarnekPGL_IsTimerActive(0));
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
        held = false;
        EXPECT_TRUE(Eventually([&] { return first.count == 1 && second.count == (cancelled ? 0 : 1); }));
        std::this_thread::sleep_for(std::chrono::milliseconds(100));
        EXPECT_EQ(first.count + second.count, cancelled ? 1 : 2);
        gLogHook = nullptr;
    }
}

TEST_F(Timer, AnOwnerThatPollsGetsACallForEachStart) {
    VarnekPGL_CreateTimer("timer");
    std::vector<Expiries> starts(1000);
    for (Expiries &start : starts) {
        ASSERT_TRUE(VarnekPGL_StartTimer(0, 1, CountExpiry, &start));
        ASSERT_TRUE(Eventually([] { return !VarnekPGL_IsTimerActive(0); }));
    }
    for (const Expiries &start : starts) {
        EXPECT_TRUE(Eventually([&] { return start.count == 1; }));
    }
}

TEST_F(Timer, ACallbackMayUseItsOwnTimer) {
    static std::atomic<int> rounds{0};
    VarnekPGL_CreateTimer("timer");
    const TimerCallbackFunc again = [](uint32_t timer, void *userData) {
        if (++rounds < 3) {
            EXPECT_TRUE(VarnekPGL_StartTimer(timer, 1, reinterpret_cast<TimerCallbackFunc>(userData), userData));
            return;
        }
        EXPECT_TRUE(VarnekPGL_CancelTimer(timer));
        EXPECT_TRUE(VarnekPGL_DeleteTimer(timer));
        rounds++;
    };
    EXPECT_TRUE(VarnekPGL_StartTimer(0, 1, again, reinterpret_cast<void *>(again)));
    EXPECT_TRUE(Eventually([] { return rounds == 4; }));
    EXPECT_EQ(VarnekPGL_GetTimerByName("timer"), -1);
}

TEST_F(Timer, SleepsLast) {
    const std::pair<std::function<void()>, int> rows[] = {
        {[] { VarnekPGL_MSleep(30); }, 30},
        {[] { VarnekPGL_MSleep(0); }, 0},
        {[] { VarnekPGL_MSleep(-100000); }, 0},
        {[] { VarnekPGL_USleep(1); }, 1000},
    };
    for (const auto &[sleep, least] : rows) {
        const auto start = Clock::now();
        sleep();
        EXPECT_GE(Clock::now() - start, std::chrono::milliseconds(least));
        EXPECT_LT(Clock::now() - start, std::chrono::milliseconds(10000));
    }
}

}  // namespace
