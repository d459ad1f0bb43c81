// Eight threads use the library at random, as the modules of a running stack do, for as many seconds as the first
// argument says. They compare each result with what they know of each other, and in the end no message, no trace and
// no place in a table may be missing.
#include <sys/resource.h>

#include <atomic>
#include <chrono>
#include <cstdio>
#include <cstring>
#include <mutex>
#include <random>
#include <string>
#include <thread>

#include "Varnek_CRingBuffer.h"
#include "Varnek_Tasking.h"
#include "support/Check.h"
#include "support/Families.h"
#include "support/Platform.h"

namespace {

using namespace std::chrono_literals;
using Clock = std::chrono::system_clock;

constexpr int kThreads = 8;
constexpr int kUnits = 3;  // of the shared semaphore
constexpr int kPacket = 188;

std::atomic<bool> gStop{false}, gStorm{false};
std::atomic<int> gReady{0}, gSenders{kThreads}, gRunning{kThreads}, gUnitsTaken{0};
std::atomic<int64_t> gTraces{0}, gLines{0};
int32_t gMutex, gSemaphore;
int64_t gGuarded = 0;

// What a message carries. `number` counts the messages from one thread to another.
struct Message {
    int64_t number;
    int32_t from;
    int32_t urgent;  // or the record that receives it
    char filled[24];
};
static_assert(sizeof(Message) == sizeof(THREAD_MSG));

// What one thread did and saw. Other threads use only the atomics and the ring.
struct Worker {
    int index;
    int32_t handle;
    std::mt19937 random;
    int64_t sent[kThreads], received[kThreads], urgentSent, urgentReceived;
    int64_t locks, starts, shortLived, written, read, operations, passed;
    int32_t latest[kThreads];  // the last record of each other worker that it sent to
    std::atomic<int64_t> fired, ended, taken;
    std::mutex timerLock;
    int64_t timers;           // its timers so far, changed under timerLock
    VarnekCRingBuffer *ring;  // between an even worker, which writes, and the next one

    int Below(int limit) { return static_cast<int>(random() % static_cast<unsigned int>(limit)); }
    // Every character but the first shows the owner, so that half a name is no one's name.
    std::string Name(char kind) const { return kind + std::string(30, static_cast<char>('a' + index)); }
};
Worker gWorkers[kThreads];

// Who made each handle: the handle times 8 plus the worker, at the place that the handle's low bits give.
std::atomic<int64_t> gMakers[3][4096];

void SetMaker(int family, int32_t handle, const Worker &maker) {
    CHECK(handle > 0 && gMakers[family][handle % 4096].exchange(int64_t{handle} * 8 + maker.index) / 8 != handle);
}

// Returns the handle that another thread's name has at the moment, or -1, but never the handle of another name.
int32_t LookUp(int family, int32_t (*find)(const char *), const Worker &maker, char kind) {
    const int32_t handle = find(maker.Name(kind).c_str());
    if (handle != -1) {
        const int64_t known = gMakers[family][handle % 4096];
        CHECK(known / 8 != handle || known % 8 == maker.index);
    }
    return handle;
}

void Send(Worker &me) {
    const int to = me.Below(kThreads);
    const BOOL urgent = me.Below(8) == 0 ? TRUE : FALSE;
    Message message{urgent ? ++me.urgentSent : ++me.sent[to], me.index, urgent, {}};
    memset(message.filled, static_cast<char>(message.number), sizeof message.filled);
    CHECK(varnek::Send(gWorkers[to].handle, message, urgent ? VarnekPGL_SendUrgentMessage : VarnekPGL_SendMessage));
}

// Takes a message if there is one. Receiving skips the permits that peeking has left behind.
bool Receive(Worker &me, bool peek) {
    Message message;
    int32_t left = 0;
    const bool found = peek ? VarnekPGL_PeekMessage(reinterpret_cast<THREAD_MSG *>(&message), &left) == TRUE
                            : varnek::Receive(message, 0ms) == varnek::Outcome::kSuccess;
    if (!found) {
        return false;
    }
    char expected[sizeof message.filled];
    memset(expected, static_cast<char>(message.number), sizeof expected);
    CHECK(left >= 0 && memcmp(message.filled, expected, sizeof expected) == 0);
    if (message.urgent) {
        ++me.urgentReceived;
    } else {
        CHECK(message.number == ++me.received[message.from]);
    }
    return true;
}

void UseSharedObjects(Worker &me) {
    CHECK(VarnekPGL_AcquireMutex(gMutex) == TRUE);
    const int64_t before = gGuarded;
    std::this_thread::yield();
    gGuarded = before + 1;
    CHECK(VarnekPGL_ReleaseMutex(gMutex) == TRUE);
    ++me.locks;
    if (VarnekPGL_WaitSemaphore(gSemaphore, static_cast<uint32_t>(me.Below(2))) == TRUE) {
        CHECK(++gUnitsTaken <= kUnits);
        std::this_thread::yield();
        --gUnitsTaken;
        CHECK(VarnekPGL_SignalSemaphore(gSemaphore) == TRUE);
    }
}

void UseOwnObjects(Worker &me) {
    const std::string name = me.Name('o');
    const int32_t mutex = VarnekPGL_CreateMutex(name.c_str());
    const int32_t semaphore = VarnekPGL_CreateSemaphore(name.c_str(), 1);
    CHECK(mutex > 0 && VarnekPGL_GetMutexByName(name.c_str()) == mutex);
    CHECK(semaphore > 0 && VarnekPGL_SemaphoreByName(name.c_str()) == semaphore);
    SetMaker(0, mutex, me);
    SetMaker(1, semaphore, me);
    CHECK(VarnekPGL_AcquireMutex(mutex) == TRUE && VarnekPGL_ReleaseMutex(mutex) == TRUE);
    CHECK(VarnekPGL_WaitSemaphore(semaphore, WAIT_FOREVER) == TRUE && VarnekPGL_WaitSemaphore(semaphore, 0) == FALSE);
    CHECK(VarnekPGL_DeleteMutex(mutex) == TRUE && VarnekPGL_DeleteSemaphore(semaphore) == TRUE);
    CHECK(VarnekPGL_GetMutexByName(name.c_str()) == -1 && VarnekPGL_AcquireMutex(mutex) == FALSE);
}

// One start of a timer, kept for callbacks that come late.
struct Start {
    std::atomic<Clock::time_point> due;
    std::atomic<int64_t> timer;  // as the worker counts its timers
    Worker *worker;
};
Start gStarts[kThreads][1024];

// Must not be called before its start is due. Half of the callbacks use their own timer, unless it has been deleted,
// because its handle may belong to another worker's timer by then.
void OnTimer(uint32_t timer, void *userData) {
    const Start &start = *static_cast<Start *>(userData);
    CHECK(Clock::now() >= start.due.load());
    Worker &worker = *start.worker;
    const int64_t nth = ++worker.fired;
    const std::lock_guard<std::mutex> guard(worker.timerLock);
    if (worker.index % 2 == 0 && start.timer == worker.timers) {
        nth % 2 == 0 ? VarnekPGL_CancelTimer(timer) : VarnekPGL_StartTimer(timer, 20, OnTimer, userData);
    }
}

void UseTimer(Worker &me) {
    const std::string name = me.Name('t');
    const int32_t timer = VarnekPGL_CreateTimer(name.c_str());
    CHECK(timer >= 0 && VarnekPGL_GetTimerByName(name.c_str()) == timer);
    const uint32_t handle = static_cast<uint32_t>(timer);
    const bool mine = me.index % 2 != 0;
    // The short ones may be expiring while they are cancelled.
    for (uint32_t timeout : {1u, 20u, 1u + static_cast<uint32_t>(me.Below(3))}) {
        Start &start = gStarts[me.index][me.starts++ % 1024];
        start.worker = &me;
        start.timer = me.timers;
        start.due = Clock::now() + std::chrono::milliseconds(timeout);
        CHECK(VarnekPGL_StartTimer(handle, timeout, OnTimer, &start) == TRUE || !mine);
        std::this_thread::sleep_for(std::chrono::microseconds(900 + me.Below(200)));
        VarnekPGL_CancelTimer(handle);
        CHECK(VarnekPGL_IsTimerActive(handle) == FALSE || !mine);
    }
    {
        const std::lock_guard<std::mutex> guard(me.timerLock);
        ++me.timers;
    }
    CHECK(VarnekPGL_DeleteTimer(handle) == TRUE);
    CHECK(me.fired <= me.starts || !mine);
}

void UseRing(Worker &me) {
    unsigned char packet[kPacket];
    Worker &writer = gWorkers[me.index & ~1];
    if (me.index == writer.index) {
        memset(packet, static_cast<char>(me.written), sizeof packet);
        if (me.ring->GetSpaceWriting() >= kPacket) {
            CHECK(me.ring->Write(packet, kPacket) == 0);
            ++me.written;
        }
    } else if (writer.ring->GetSpaceReading() >= kPacket) {
        unsigned char expected[kPacket];
        memset(expected, static_cast<char>(me.read), sizeof expected);
        CHECK(writer.ring->Read(packet, kPacket) == 0 && memcmp(packet, expected, sizeof packet) == 0);
        ++me.read;
    }
    const int distance = writer.ring->GetDistance();
    CHECK(distance >= 0 && distance <= 100);
    const VarnekCRingBuffer own(kPacket);
    CHECK(own.GetDistance() == 0);
}

// Receives until its record is gone. Every message must have been sent to this record, and come in order.
void *ReceiveAll(void *argument) {
    Worker &parent = *static_cast<Worker *>(argument);
    const int32_t self = VarnekPGL_GetCurrentThread();
    int64_t next[kThreads] = {};
    Message message;
    // The thread has no handle if its record was removed before it could ask.
    while (self != -1 && varnek::Receive(message) == varnek::Outcome::kSuccess) {
        CHECK(message.urgent == self && message.number == next[message.from]++);
        ++parent.taken;
    }
    ++parent.ended;
    return nullptr;
}

void UseThread(Worker &me) {
    const int32_t thread = VarnekPGL_CreateThread(me.Name('s').c_str(), 1, 65536, ReceiveAll, &me);
    CHECK(VarnekPGL_GetThreadByName(me.Name('s').c_str()) == thread);
    SetMaker(2, thread, me);
    if (me.Below(2) != 0) {
        std::this_thread::sleep_for(std::chrono::microseconds(me.Below(1000)));
    }
    CHECK(VarnekPGL_DeleteThread(thread) == TRUE);
    // Removing the record wakes the waiter.
    for (++me.shortLived; me.ended < me.shortLived;) {
        std::this_thread::yield();
    }
}

// Looks for the objects that another thread makes and deletes meanwhile, and sends messages to its thread until the
// thread is gone.
void UseOthers(Worker &me) {
    const Worker &other = gWorkers[me.Below(kThreads)];
    LookUp(0, VarnekPGL_GetMutexByName, other, 'o');
    LookUp(1, VarnekPGL_SemaphoreByName, other, 'o');
    const int32_t thread = LookUp(2, VarnekPGL_GetThreadByName, other, 's');
    if (thread == -1 || thread == me.latest[other.index]) {
        return;
    }
    me.latest[other.index] = thread;
    Message message{0, me.index, thread, {}};
    while (varnek::Send(thread, message) && ++message.number < 2000) {
    }
    me.passed += message.number;
}

void ReceiveOrPeek(Worker &me) { Receive(me, me.Below(33) == 0); }

void Trace(Worker &me) {
    ++gTraces;
    VARNEK_TRACE(VARNEK_LEVEL_HIGH | VARNEK_MODULE_GINGA, "soak %d%*c", me.index, 900, '.');
}

// Half of the time, all threads act as modules do. The rest is a storm, in which half of the threads only create and
// delete, while the others look for those objects.
void *Work(void *argument) {
    Worker &me = *static_cast<Worker *>(argument);
    while (gReady == 0) {
        std::this_thread::yield();
    }
    CHECK(VarnekPGL_GetCurrentThread() == me.handle);
    for (; !gStop; ++me.operations) {
        const int kind = me.Below(100);
        const auto act = gStorm      ? (me.index % 2 != 0 ? UseOthers
                                        : kind < 50       ? UseOwnObjects
                                                          : UseThread)
                         : kind < 27 ? Send
                         : kind < 60 ? ReceiveOrPeek
                         : kind < 66 ? UseOthers
                         : kind < 76 ? UseSharedObjects
                         : kind < 82 ? UseOwnObjects
                         : kind < 83 ? UseTimer
                         : kind < 93 ? UseRing
                         : kind < 94 ? UseThread
                                     : Trace;
        act(me);
    }
    --gSenders;
    while (gSenders > 0) {
        std::this_thread::yield();
    }
    while (Receive(me, false)) {
    }
    --gRunning;
    return nullptr;
}

// Says how many more objects each registry has room for.
std::string RoomInTables() {
    std::string room;
    for (const Family &family : kFamilies) {
        room += std::to_string(family.Room()) + " " + family.name + ", ";
    }
    return room;
}

template <typename Count>
long long Sum(Count Worker::*count) {
    long long sum = 0;
    for (const Worker &worker : gWorkers) {
        sum += worker.*count;
    }
    return sum;
}

void OnLog(int, const char *tag, const char *text) {
    if (strcmp(tag, "SBTVD_GINGA") == 0) {
        const char *body = BodyOf(tag, text);
        CHECK(text[1] == 'H' && strncmp(body, "soak ", 5) == 0 && strlen(body) == 906 && body[905] == '.');
        ++gLines;
    }
}

}  // namespace

int main(int argc, char **argv) {
    const int seconds = argc > 1 ? atoi(argv[1]) : 1;
    StartClean();
    gOnLog = OnLog;
    for (int i = 0; i < kThreads; ++i) {
        gWorkers[i].index = i;
        gWorkers[i].random.seed(static_cast<unsigned int>(i + 1));
        gWorkers[i].ring = i % 2 == 0 ? new VarnekCRingBuffer(kPacket * 7 + 5) : nullptr;
        gWorkers[i].handle = VarnekPGL_CreateThread(gWorkers[i].Name('w').c_str(), 1, 0, Work, &gWorkers[i]);
        CHECK(gWorkers[i].handle > 0);
    }
    gMutex = VarnekPGL_CreateMutex("all");
    gSemaphore = VarnekPGL_CreateSemaphore("all", kUnits);
    const std::string room = RoomInTables();
    gReady = 1;
    for (int quarter = 0; quarter < 4 * seconds; ++quarter) {
        std::this_thread::sleep_for(std::chrono::milliseconds(250));
        gStorm = quarter % 2 == 0;
    }
    gStop = true;
    while (gRunning > 0) {
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }

    CHECK(gGuarded == Sum(&Worker::locks) && gUnitsTaken == 0 && gTraces == gLines && RoomInTables() == room);
    long long sent = Sum(&Worker::urgentSent);
    long long lost = sent - Sum(&Worker::urgentReceived);
    for (const Worker &from : gWorkers) {
        for (const Worker &to : gWorkers) {
            sent += from.sent[to.index];
            lost += from.sent[to.index] - to.received[from.index];
        }
    }
    for (int i = 0; i < kThreads; i += 2) {
        CHECK(gWorkers[i].ring->GetSpaceReading() == (gWorkers[i].written - gWorkers[i + 1].read) * kPacket);
        delete gWorkers[i].ring;
    }
    const long long passed = Sum(&Worker::passed);
    CHECK(passed >= Sum(&Worker::taken));
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    const std::pair<const char *, long long> counts[] = {
        {"seconds", seconds},
        {"operations", Sum(&Worker::operations)},
        {"messages", sent},
        {"lost messages", lost},
        {"timer starts", Sum(&Worker::starts)},
        {"timer callbacks", Sum(&Worker::fired)},
        {"ring packets", Sum(&Worker::read)},
        {"threads", Sum(&Worker::shortLived)},
        {"messages sent to them", passed},
        {"traces", gTraces},
        {"largest memory in KiB", usage.ru_maxrss},
    };
    for (const auto &[what, count] : counts) {
        printf("%-21s %lld\n", what, count);
    }
    printf("room afterwards: %sas before\n", room.c_str());
    LeaveClean();
    return lost == 0 ? 0 : 1;
}
