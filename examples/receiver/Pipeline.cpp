// Three threads form a chain, and a fourth one collects their results:
//
//   reader ==packets==> demultiplexer --sections--> parser
//      \ counters           \ counters                 \ model, end
//       +--------------------+--------------------------+---------> control <-- timer's ticks
//
// Packets go through a ring, and a message says how many bytes were written to it. All other data
// is passed in messages. An end message follows the data down the chain, so a thread that receives
// it has received all data, and control has each thread's result before it receives the end.
#include "Pipeline.h"

#include <algorithm>
#include <cstring>
#include <memory>
#include <new>
#include <type_traits>
#include <utility>
#include <vector>

#include "Demultiplexer.h"
#include "PacketSource.h"
#include "Progress.h"
#include "Tables.h"
#include "TransportStream.h"
#include "Varnek_CRingBuffer.h"
#include "Varnek_Semaphore.h"
#include "Varnek_Thread.h"
#include "Varnek_Timer.h"

namespace receiver {
namespace {

constexpr size_t kBlockSize = 65536;
// The size of a message's data. It is large, so that the cost of waking the other thread is small.
constexpr size_t kBatchSize = 1024 * kPacketSize;
constexpr uint32_t kBatchesWaiting = 8;
constexpr uint32_t kTickTime = 250;  // milliseconds

// In the order of their creation. A thread is created after the one that it sends to.
enum ThreadIndex { kControl, kParser, kDemultiplexer, kReader, kThreadCount };

// The threads share this. A handle is -1 until its object exists. A thread uses only objects that
// were created before it.
struct Pipeline {
    StreamFile &file;  // used only by the reader while it runs
    uint64_t size;     // of the file in bytes, 0 when it is not known
    const PipelineOptions &options;

    // The ring has room for all batches that may wait. A write to it does not wait and is never
    // partial, so semaphores ensure that there is room. The ring is created before the mutex: if
    // there is no mutex left for the ring, there is none for us either, and the pipeline does not
    // start.
    VarnekCRingBuffer ring{static_cast<int>(kBatchSize * kBatchesWaiting)};

    int32_t packet_room = -1;   // semaphore: batches that may still be sent to the demultiplexer
    int32_t section_room = -1;  // semaphore: the same for sections to the parser
    int32_t ended = -1;         // semaphore: threads that have finished
    int32_t mutex = -1;
    int32_t timer = -1;
    int32_t threads[kThreadCount] = {-1, -1, -1, -1};

    uint64_t bytes_read = 0;  // under the mutex
    Report report = {};       // used only by control while it runs
};

// Messages ---------------------------------------------------------------------------------------

// A message transfers the ownership of its object: the thread that receives it deletes the object.
// When a thread ends, only messages without an object may remain in its queue.
enum class Kind : uint32_t {
    kPackets,  // no object; the length is the number of bytes that were written to the ring
    kSections,
    kPacketCounters,
    kSectionCounters,
    kModel,
    kTick,
    kEnd
};

struct Section {
    uint16_t pid;
    std::vector<unsigned char> bytes;
};
using SectionBatch = std::vector<Section>;

struct Message {
    Kind kind;
    void *object = nullptr;
    uint32_t length = 0;  // of packets, in bytes
};
static_assert(sizeof(Message) <= sizeof(THREAD_MSG) && std::is_trivially_copyable_v<Message>);

bool TrySend(int32_t thread, const Message &message) {
    THREAD_MSG record{};
    std::memcpy(record.data, &message, sizeof message);
    return VarnekPGL_SendMessage(thread, &record) != FALSE;
}

// Sends to a thread that exists. So a failure means that there is no memory, which ends the program
// as it does elsewhere.
void Send(int32_t thread, const Message &message) {
    if (!TrySend(thread, message)) {
        throw std::bad_alloc();
    }
}

template <typename Object>
void SendObject(int32_t thread, Kind kind, Object object) {
    Send(thread, {kind, new Object(std::move(object))});
}

template <typename Object>
Object Take(const Message &message) {
    const std::unique_ptr<Object> object(static_cast<Object *>(message.object));
    return std::move(*object);
}

// Receives the calling thread's next message. Only a signal can end the wait early.
Message Receive() {
    THREAD_MSG record{};
    int32_t left = 0;
    while (VarnekPGL_ReceiveMessage(WAIT_FOREVER, &record, &left) == FALSE) {
    }
    Message message{};
    std::memcpy(&message, record.data, sizeof message);
    return message;
}

void Wait(int32_t semaphore) {
    while (VarnekPGL_WaitSemaphore(semaphore, WAIT_FOREVER) == FALSE) {
    }
}

// Threads ----------------------------------------------------------------------------------------

void RunReader(Pipeline &pipeline) {
    std::vector<unsigned char> batch;
    batch.reserve(kBatchSize);
    const auto send_batch = [&] {
        Wait(pipeline.packet_room);
        if (pipeline.ring.Write(batch.data(), static_cast<int>(batch.size())) != 0) {
            throw std::bad_alloc();  // a ring without storage
        }
        const auto length = static_cast<uint32_t>(batch.size());
        Send(pipeline.threads[kDemultiplexer], {Kind::kPackets, nullptr, length});
        batch.clear();
    };
    PacketSource source([&](const unsigned char *packets, size_t count) {
        const unsigned char *const end = packets + count * kPacketSize;
        while (packets < end) {
            const size_t room = kBatchSize - batch.size();
            const unsigned char *const part =
                packets + std::min(room, static_cast<size_t>(end - packets));
            batch.insert(batch.end(), packets, part);
            packets = part;
            if (batch.size() == kBatchSize) {
                send_batch();
            }
        }
    });
    std::vector<unsigned char> block(kBlockSize);
    while (const size_t count =
               pipeline.file.Read(block.data(), block.size(), pipeline.options.stop)) {
        source.Feed(block.data(), count);
        VarnekPGL_AcquireMutex(pipeline.mutex);
        pipeline.bytes_read += count;
        VarnekPGL_ReleaseMutex(pipeline.mutex);
    }
    source.Finish();
    if (!batch.empty()) {
        send_batch();
    }
    SendObject(pipeline.threads[kControl], Kind::kPacketCounters, source.Counters());
    Send(pipeline.threads[kDemultiplexer], {Kind::kEnd});
}

void RunDemultiplexer(Pipeline &pipeline) {
    SectionBatch sections;
    Demultiplexer demultiplexer([&](uint16_t pid, const unsigned char *section, size_t size) {
        sections.push_back({pid, {section, section + size}});
    });
    Capture *const capture = pipeline.options.capture;
    std::vector<unsigned char> packets(kBatchSize);
    for (Message message = Receive(); message.kind != Kind::kEnd; message = Receive()) {
        pipeline.ring.Read(packets.data(), static_cast<int>(message.length));
        VarnekPGL_SignalSemaphore(pipeline.packet_room);
        for (size_t at = 0; at < message.length; at += kPacketSize) {
            const unsigned char *packet = packets.data() + at;
            demultiplexer.Push(packet);
            if (capture != nullptr && demultiplexer.CarriesTables(PidOf(packet))) {
                capture->Push(packet);
            }
        }
        if (!sections.empty()) {
            Wait(pipeline.section_room);
            SendObject(pipeline.threads[kParser], Kind::kSections, std::exchange(sections, {}));
        }
    }
    if (capture != nullptr) {
        capture->Finish();
    }
    SendObject(pipeline.threads[kControl], Kind::kSectionCounters, demultiplexer.Counters());
    Send(pipeline.threads[kParser], {Kind::kEnd});
}

void RunParser(Pipeline &pipeline) {
    Model model;
    TableParser parser(model, pipeline.options.language);
    for (Message message = Receive(); message.kind != Kind::kEnd; message = Receive()) {
        const SectionBatch sections = Take<SectionBatch>(message);
        VarnekPGL_SignalSemaphore(pipeline.section_room);
        for (const Section &section : sections) {
            parser.Push(section.pid, section.bytes.data(), section.bytes.size());
        }
    }
    SendObject(pipeline.threads[kControl], Kind::kModel, std::move(model));
    Send(pipeline.threads[kControl], {Kind::kEnd});
}

// Runs on a thread of the timer service, and may run after the pipeline has ended. So its only
// argument is the control thread's handle, which is invalid by then.
void OnTimer(uint32_t, void *control) {
    TrySend(static_cast<int32_t>(reinterpret_cast<intptr_t>(control)), {Kind::kTick});
}

void StartTimer(const Pipeline &pipeline) {
    if (pipeline.timer != -1) {
        void *const control = reinterpret_cast<void *>(intptr_t{VarnekPGL_GetCurrentThread()});
        VarnekPGL_StartTimer(static_cast<uint32_t>(pipeline.timer), kTickTime, OnTimer, control);
    }
}

void RunControl(Pipeline &pipeline) {
    ProgressLine line(pipeline.options.progress, pipeline.size);
    StartTimer(pipeline);
    for (Message message = Receive(); message.kind != Kind::kEnd; message = Receive()) {
        if (message.kind == Kind::kPacketCounters) {
            pipeline.report.packets = Take<PacketCounters>(message);
        } else if (message.kind == Kind::kSectionCounters) {
            pipeline.report.sections = Take<DemultiplexerCounters>(message);
        } else if (message.kind == Kind::kModel) {
            pipeline.report.model = Take<Model>(message);
        } else if (message.kind == Kind::kTick) {
            VarnekPGL_AcquireMutex(pipeline.mutex);
            const uint64_t done = pipeline.bytes_read;
            VarnekPGL_ReleaseMutex(pipeline.mutex);
            line.Show(done);
            StartTimer(pipeline);
        }
    }
    line.Erase();
}

// The last action of a thread, when all its objects are destroyed. It signals while it holds the
// mutex. So a thread that has received every signal, and then acquires the mutex, knows that no
// thread still uses the semaphore.
template <void (*Body)(Pipeline &)>
void *RunThread(void *argument) {
    Pipeline &pipeline = *static_cast<Pipeline *>(argument);
    Body(pipeline);
    VarnekPGL_AcquireMutex(pipeline.mutex);
    VarnekPGL_SignalSemaphore(pipeline.ended);
    VarnekPGL_ReleaseMutex(pipeline.mutex);
    return nullptr;
}

constexpr struct {
    const char *name;
    void *(*function)(void *);
} kThreads[kThreadCount] = {
    {"ReceiverControl", RunThread<RunControl>},
    {"ReceiverParser", RunThread<RunParser>},
    {"ReceiverDemultiplexer", RunThread<RunDemultiplexer>},
    {"ReceiverReader", RunThread<RunReader>},
};
constexpr int32_t kPriority = 50;
constexpr uint32_t kStackSize = 1 << 20;

// Start and end ----------------------------------------------------------------------------------

//   returns  as RunPipeline
std::string CreateObjects(Pipeline &pipeline) {
    const struct {
        const char *name;
        uint32_t count;
        int32_t &handle;
    } semaphores[] = {
        {"ReceiverPacketRoom", kBatchesWaiting, pipeline.packet_room},
        {"ReceiverSectionRoom", kBatchesWaiting, pipeline.section_room},
        {"ReceiverEnded", 0, pipeline.ended},
    };
    for (const auto &semaphore : semaphores) {
        semaphore.handle = VarnekPGL_CreateSemaphore(semaphore.name, semaphore.count);
        if (semaphore.handle == -1) {
            return std::string("semaphore ") + semaphore.name;
        }
    }
    pipeline.mutex = VarnekPGL_CreateMutex("ReceiverMutex");
    if (pipeline.mutex == -1) {
        return "mutex ReceiverMutex";
    }
    if (pipeline.options.progress != nullptr) {
        pipeline.timer = VarnekPGL_CreateTimer("ReceiverTick");
        if (pipeline.timer == -1) {
            return "timer ReceiverTick";
        }
    }
    return {};
}

void DeleteObjects(const Pipeline &pipeline) {
    for (const int32_t semaphore : {pipeline.packet_room, pipeline.section_room, pipeline.ended}) {
        if (semaphore != -1) {
            VarnekPGL_DeleteSemaphore(semaphore);
        }
    }
    if (pipeline.mutex != -1) {
        VarnekPGL_DeleteMutex(pipeline.mutex);
    }
    if (pipeline.timer != -1) {
        VarnekPGL_DeleteTimer(static_cast<uint32_t>(pipeline.timer));
    }
}

}  // namespace

std::string RunPipeline(StreamFile &file, const PipelineOptions &options, Report &report) {
    Pipeline pipeline{file, file.Size(), options};
    std::string missing = CreateObjects(pipeline);
    int started = 0;
    while (missing.empty() && started < kThreadCount) {
        const auto &[name, function] = kThreads[started];
        pipeline.threads[started] =
            VarnekPGL_CreateThread(name, kPriority, kStackSize, function, &pipeline);
        if (pipeline.threads[started] == -1) {
            missing = std::string("thread ") + name;
        } else {
            ++started;
        }
    }
    if (started > 0 && started < kThreadCount) {
        // The reader, which would send the end down the chain, does not exist.
        Send(pipeline.threads[started - 1], {Kind::kEnd});
    }
    for (int i = 0; i < started; ++i) {
        Wait(pipeline.ended);
    }
    if (started > 0) {
        VarnekPGL_AcquireMutex(pipeline.mutex);
        VarnekPGL_ReleaseMutex(pipeline.mutex);
    }
    for (int i = 0; i < started; ++i) {
        VarnekPGL_DeleteThread(pipeline.threads[i]);
    }
    DeleteObjects(pipeline);
    report.packets = pipeline.report.packets;
    report.sections = pipeline.report.sections;
    report.model = std::move(pipeline.report.model);
    return missing;
}

}  // namespace receiver
