// exchange: two threads that send each other messages, paced by a timer.
//
//   timer      sends Tick to the counter, from a thread of the system
//   counter    counts ticks, sends Show to the display, waits for Shown, and starts the timer again
//   display    prints, and answers with Shown; a Quit ends it
//
// The threads find each other by name. All waits have a time-out, so the program ends whatever goes
// wrong.
#include <cstdio>
#include <cstring>

#include "Varnek_Semaphore.h"
#include "Varnek_Thread.h"
#include "Varnek_Timer.h"

namespace {

enum Kind : int32_t { kTick, kShow, kShown, kQuit };

// The content of a message between these threads.
struct Content {
    Kind kind;
    int32_t round;
};
static_assert(sizeof(Content) <= sizeof(THREAD_MSG::data), "it has to fit");

constexpr char kCounter[] = "counter";
constexpr char kDisplay[] = "display";
constexpr int32_t kRounds = 5;
constexpr uint32_t kPace = 20;        // milliseconds
constexpr uint32_t kPatience = 5000;  // milliseconds
constexpr int32_t kPriority = 50;
constexpr uint32_t kStackSize = 256 * 1024;

int32_t hEnded = -1;  // one unit from each thread that ends
bool gAllShown = false;

bool Send(const char *szThreadName, Kind kind, int32_t round) {
    const Content content = {kind, round};
    THREAD_MSG message = {};
    std::memcpy(message.data, &content, sizeof content);
    return VarnekPGL_SendMessage(VarnekPGL_GetThreadByName(szThreadName), &message) != FALSE;
}

bool Receive(Content *content) {
    THREAD_MSG message;
    int32_t left = 0;
    if (!VarnekPGL_ReceiveMessage(kPatience, &message, &left)) {
        return false;
    }
    std::memcpy(content, message.data, sizeof *content);
    return true;
}

// The callback only sends a message. It must not keep the timer service waiting, and a message
// needs no lock.
void OnTimer(uint32_t, void *) {
    Send(kCounter, kTick, 0);
}

void *Count(void *argument) {
    const uint32_t hTimer = *static_cast<const uint32_t *>(argument);
    int32_t round = 0;
    Content content = {kShown, 0};
    do {
        const bool going = content.kind == kTick
                               ? Send(kDisplay, kShow, ++round)
                               : VarnekPGL_StartTimer(hTimer, kPace, OnTimer, nullptr) != FALSE;
        if (!going || !Receive(&content)) {
            break;
        }
    } while (content.kind != kShown || round < kRounds);
    gAllShown = content.kind == kShown && round == kRounds;
    Send(kDisplay, kQuit, round);
    VarnekPGL_SignalSemaphore(hEnded);
    return nullptr;
}

void *Display(void *) {
    Content content = {};
    while (Receive(&content) && content.kind == kShow) {
        std::printf("round %d\n", static_cast<int>(content.round));
        Send(kCounter, kShown, content.round);
    }
    VarnekPGL_SignalSemaphore(hEnded);
    return nullptr;
}

}  // namespace

int main() {
    hEnded = VarnekPGL_CreateSemaphore("ended", 0);
    const int32_t created = VarnekPGL_CreateTimer("pace");
    static uint32_t hTimer;  // outlives the thread that reads it, however main ends
    hTimer = static_cast<uint32_t>(created);
    if (hEnded == -1 || created == -1) {
        std::fputs("exchange: no semaphore or timer\n", stderr);
        return 1;
    }
    const int32_t hDisplay =
        VarnekPGL_CreateThread(kDisplay, kPriority, kStackSize, Display, nullptr);
    const int32_t hCounter =
        VarnekPGL_CreateThread(kCounter, kPriority, kStackSize, Count, &hTimer);
    if (hDisplay == -1 || hCounter == -1) {
        std::fputs("exchange: no thread\n", stderr);
        return 1;
    }
    bool ended = true;
    for (int thread = 0; thread < 2; ++thread) {
        ended = VarnekPGL_WaitSemaphore(hEnded, 2 * kPatience) != FALSE && ended;
    }
    if (!ended || !gAllShown) {
        std::fputs("exchange: a message went missing\n", stderr);
        return 1;
    }
    // The semaphore is not deleted, because a thread that has signalled may still be inside that
    // call.
    VarnekPGL_DeleteThread(hCounter);
    VarnekPGL_DeleteThread(hDisplay);
    VarnekPGL_DeleteTimer(hTimer);
    std::printf("%d rounds\n", static_cast<int>(kRounds));
    return 0;
}
