// exchange: two threads that send each other messages, paced by a timer.
//
//   timer      sends Tick to the counter, from a thread of the system
//   counter    counts ticks, sends Show to the display, waits for Shown, and starts the timer again
//   display    prints, and answers with Shown; a Quit ends it
//
// The threads find each other by name. Every wait has a limit, so the program always ends.
#include <cstdio>

#include "Varnek_Tasking.h"

namespace {

using namespace std::chrono_literals;
using varnek::Outcome;

// The content of a message between these threads.
struct Content {
    enum { kTick, kShow, kShown, kQuit } kind;
    int32_t round;
};

constexpr char kCounter[] = "counter";
constexpr char kDisplay[] = "display";
constexpr int32_t kRounds = 5;
constexpr auto kPace = 20ms;
constexpr auto kPatience = 5s;
constexpr uint32_t kStackSize = 256 * 1024;

bool SendTo(const char *szThreadName, const Content &content) {
    return varnek::Send(VarnekPGL_GetThreadByName(szThreadName), content);
}

// Sets `isComplete` to whether all rounds took place.
void Count(varnek::Timer *pace, bool *isComplete) {
    // Runs on a thread of the timer service, which must not wait, so it only sends a message.
    const auto tick = [] { SendTo(kCounter, {Content::kTick, 0}); };
    Content content = {Content::kShown, 0};
    int32_t round = 0;
    do {
        const bool isGoing = content.kind == Content::kTick
                                 ? SendTo(kDisplay, {Content::kShow, ++round})
                                 : pace->Start(kPace, tick);
        if (!isGoing || varnek::Receive(content, kPatience) != Outcome::kSuccess) {
            break;
        }
    } while (content.kind != Content::kShown || round < kRounds);
    *isComplete = content.kind == Content::kShown && round == kRounds;
    SendTo(kDisplay, {Content::kQuit, round});
}

void Display() {
    Content content = {};
    while (varnek::Receive(content, kPatience) == Outcome::kSuccess &&
           content.kind == Content::kShow) {
        std::printf("round %d\n", static_cast<int>(content.round));
        SendTo(kCounter, {Content::kShown, content.round});
    }
}

}  // namespace

int main() {
    varnek::Timer pace("pace");
    bool isComplete = false;
    varnek::Thread display(kDisplay, kStackSize, Display);
    varnek::Thread counter(kCounter, kStackSize, Count, &pace, &isComplete);
    if (!pace || !display || !counter) {
        std::fputs("exchange: no timer or thread\n", stderr);
        return 1;
    }
    if (!counter.Join(2 * kPatience) || !display.Join(2 * kPatience) || !isComplete) {
        std::fputs("exchange: a message went missing\n", stderr);
        return 1;
    }
    std::printf("%d rounds\n", static_cast<int>(kRounds));
    return 0;
}
