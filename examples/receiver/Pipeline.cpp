// Three threads form a chain, and the caller waits for them:
//
//   reader ==blocks==> demultiplexer ==sections==> parser
//
// A message says which block or batch is ready. A semaphore counts those that may still be sent, so
// a thread waits when the next one is slower. An empty block or batch is the end. The packets stay
// in the block that they were read into until the demultiplexer has finished with it.
#include "Pipeline.h"

#include <cstring>
#include <memory>
#include <vector>

#include "Demultiplexer.h"
#include "PacketSource.h"
#include "Progress.h"
#include "Tables.h"
#include "Varnek_Semaphore.h"
#include "Varnek_Thread.h"
#include "Varnek_Timer.h"

namespace receiver {
namespace {

// Large, so that the cost of waking the other thread is small, and small enough for the caches.
constexpr size_t kBlockSize = 1024 * kPacketSize;
constexpr uint32_t kBlocks = 8;
constexpr uint32_t kTickTime = 250;  // milliseconds

using Bytes = std::vector<unsigned char>;

// The threads share this. A handle is -1 until its object exists. A thread is created after the one
// that it sends to.
struct Pipeline {
    enum Index { kParser, kDemultiplexer, kReader, kThreadCount };

    StreamFile &file;
    const PipelineOptions &options;
    Report &report;  // the model is the parser's, the counters are the demultiplexer's
    std::vector<Bytes> blocks{kBlocks, Bytes(kBlockSize)};
    std::atomic<uint64_t> bytes_read{0};

    int32_t block_room = -1;    // semaphore: blocks that the reader may fill
    int32_t section_room = -1;  // semaphore: batches that may still be sent to the parser
    int32_t ended = -1;         // semaphore: threads that have finished
    int32_t mutex = -1;
    int32_t threads[kThreadCount] = {-1, -1, -1};
};

// Messages ---------------------------------------------------------------------------------------

// The bytes belong to the receiver of the message: a block until it signals that there is room, and
// a batch for good.
struct Message {
    Bytes *bytes;
    uint32_t size;  // 0 is the end
};

// Sends to a thread that exists. So a failure means that there is no memory for the message now.
void Send(int32_t thread, const Message &message) {
    THREAD_MSG record{};
    std::memcpy(record.data, &message, sizeof message);
    while (VarnekPGL_SendMessage(thread, &record) == FALSE) {
        VarnekPGL_MSleep(10);
    }
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
    size_t count = 1;
    for (size_t i = 0; count != 0; i = (i + 1) % kBlocks) {
        Wait(pipeline.block_room);
        Bytes &block = pipeline.blocks[i];
        count = pipeline.file.Read(block.data(), block.size(), pipeline.options.stop);
        pipeline.bytes_read.fetch_add(count, std::memory_order_relaxed);
        Send(pipeline.threads[Pipeline::kDemultiplexer], {&block, static_cast<uint32_t>(count)});
    }
}

// A batch has sections one after the other, each behind its PID. Their own lengths separate them.
void RunDemultiplexer(Pipeline &pipeline) {
    auto batch = std::make_unique<Bytes>();
    Demultiplexer demultiplexer([&](uint16_t pid, const unsigned char *section, size_t size) {
        batch->push_back(static_cast<unsigned char>(pid >> 8));
        batch->push_back(static_cast<unsigned char>(pid));
        batch->insert(batch->end(), section, section + size);
    });
    Capture *const capture = pipeline.options.capture;
    PacketSource source([&](const unsigned char *packet, size_t count) {
        for (; count > 0; --count, packet += kPacketSize) {
            demultiplexer.Push(packet);
            if (capture != nullptr && demultiplexer.CarriesTables(PidOf(packet))) {
                capture->Push(packet);
            }
        }
    });
    const auto send_batch = [&] {
        Wait(pipeline.section_room);
        const auto size = static_cast<uint32_t>(batch->size());
        Send(pipeline.threads[Pipeline::kParser], {batch.release(), size});
        batch = std::make_unique<Bytes>();
    };
    for (Message message = Receive(); message.size != 0; message = Receive()) {
        source.Feed(message.bytes->data(), message.size);
        VarnekPGL_SignalSemaphore(pipeline.block_room);
        if (!batch->empty()) {
            send_batch();
        }
    }
    source.Finish();
    if (capture != nullptr) {
        capture->Finish();
    }
    pipeline.report.packets = source.Counters();
    pipeline.report.sections = demultiplexer.Counters();
    if (!batch->empty()) {
        send_batch();
    }
    Send(pipeline.threads[Pipeline::kParser], {});
}

void RunParser(Pipeline &pipeline) {
    TableParser parser(pipeline.report.model, pipeline.options.language);
    for (Message message = Receive(); message.size != 0; message = Receive()) {
        const std::unique_ptr<const Bytes> batch(message.bytes);
        VarnekPGL_SignalSemaphore(pipeline.section_room);
        for (const unsigned char *at = batch->data(); at < batch->data() + batch->size();) {
            const size_t size = 3u + ((at[3] & 0x0Fu) << 8 | at[4]);
            parser.Push(static_cast<uint16_t>(at[0] << 8 | at[1]), at + 2, size);
            at += 2 + size;
        }
    }
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
} kThreads[Pipeline::kThreadCount] = {
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
        {"ReceiverBlockRoom", kBlocks, pipeline.block_room},
        {"ReceiverSectionRoom", kBlocks, pipeline.section_room},
        {"ReceiverEnded", 0, pipeline.ended},
    };
    for (const auto &semaphore : semaphores) {
        semaphore.handle = VarnekPGL_CreateSemaphore(semaphore.name, semaphore.count);
        if (semaphore.handle == -1) {
            return std::string("semaphore ") + semaphore.name;
        }
    }
    pipeline.mutex = VarnekPGL_CreateMutex("ReceiverMutex");
    return pipeline.mutex == -1 ? "mutex ReceiverMutex" : "";
}

void DeleteObjects(const Pipeline &pipeline) {
    for (const int32_t semaphore : {pipeline.block_room, pipeline.section_room, pipeline.ended}) {
        if (semaphore != -1) {
            VarnekPGL_DeleteSemaphore(semaphore);
        }
    }
    if (pipeline.mutex != -1) {
        VarnekPGL_DeleteMutex(pipeline.mutex);
    }
}

}  // namespace

std::string RunPipeline(StreamFile &file, const PipelineOptions &options, Report &report) {
    Pipeline pipeline{file, options, report};
    // The size is asked before the reader exists, because only one thread may use the file.
    ProgressLine line(options.progress, file.Size());
    std::string missing = CreateObjects(pipeline);
    int started = 0;
    while (missing.empty() && started < Pipeline::kThreadCount) {
        const auto &[name, function] = kThreads[started];
        pipeline.threads[started] =
            VarnekPGL_CreateThread(name, kPriority, kStackSize, function, &pipeline);
        if (pipeline.threads[started] == -1) {
            missing = std::string("thread ") + name;
        } else {
            ++started;
        }
    }
    if (started > 0 && started < Pipeline::kThreadCount) {
        // The reader, which would send the end down the chain, does not exist.
        Send(pipeline.threads[started - 1], {});
    }
    for (int ended = 0; ended < started;) {
        if (VarnekPGL_WaitSemaphore(pipeline.ended, kTickTime) != FALSE) {
            ++ended;
        } else if (options.progress != nullptr) {
            line.Show(pipeline.bytes_read.load(std::memory_order_relaxed));
        }
    }
    line.Erase();
    if (started > 0) {
        VarnekPGL_AcquireMutex(pipeline.mutex);
        VarnekPGL_ReleaseMutex(pipeline.mutex);
    }
    for (int i = 0; i < started; ++i) {
        VarnekPGL_DeleteThread(pipeline.threads[i]);
    }
    DeleteObjects(pipeline);
    return missing;
}

}  // namespace receiver
