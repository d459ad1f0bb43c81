// Three threads form a chain, and the caller waits for them:
//
//   reader ==blocks==> demultiplexer ==sections==> parser
//
// The packets stay in the block into which they were read until the demultiplexer is done with it.
#include "Pipeline.h"

#include <vector>

#include "Demultiplexer.h"
#include "PacketSource.h"
#include "Progress.h"
#include "Tables.h"
#include "Varnek_Tasking.h"

namespace receiver {
namespace {

using Bytes = std::vector<unsigned char>;

// Large, so that waking the other thread costs little, and small enough for the caches.
constexpr size_t kBlockSize = 1024 * kPacketSize;
constexpr uint32_t kBuffers = 8;
constexpr auto kTick = std::chrono::milliseconds(250);
constexpr uint32_t kStackSize = 1 << 20;

// Passes buffers from one thread to another. The semaphore counts those that may be filled, so the
// first thread waits when the other is slower.
class Channel {
  public:
    Channel(const char *name, size_t size)
        : room_(name, varnek::Existing::kReplace, kBuffers), buffers_(kBuffers, Bytes(size)) {}
    explicit operator bool() const { return static_cast<bool>(room_); }

    // Waits for room. The buffer still has the content with which it was last sent.
    Bytes &Next() {
        (void)room_.Wait();  // fails only without its semaphore
        return buffers_[next_];
    }

    // Sends the buffer that Next returned; `size` is the used part of it, and 0 the end. As the
    // thread exists, this fails only while there is no memory for the message.
    void Send(int32_t thread, size_t size) {
        const Message message{&buffers_[next_], size};
        next_ = (next_ + 1) % kBuffers;
        while (!varnek::Send(thread, message)) {
            VarnekPGL_MSleep(10);
        }
    }

    // Calls `use(bytes, size)` for each buffer sent to the calling thread. It also returns if the
    // thread is destroyed, which happens when a later part of the pipeline cannot be created.
    template <typename Use>
    void ForEach(Use use) {
        Message message{};
        while (varnek::Receive(message) == varnek::Outcome::kSuccess && message.size != 0) {
            use(message.buffer->data(), message.size);
            room_.Signal();
        }
    }

  private:
    struct Message {
        Bytes *buffer;
        size_t size;
    };

    varnek::Semaphore room_;
    std::vector<Bytes> buffers_;
    size_t next_ = 0;
};

struct Pipeline {
    StreamFile &file;
    const PipelineOptions &options;
    Report &report;  // the model is the parser's, the counters are the demultiplexer's
    Channel blocks{"ReceiverBlockRoom", kBlockSize};
    Channel sections{"ReceiverSectionRoom", 0};
    std::atomic<uint64_t> bytes_read{0};
};

void Read(Pipeline *pipeline, int32_t demultiplexer) {
    size_t count = 1;
    while (count != 0) {
        Bytes &block = pipeline->blocks.Next();
        count = pipeline->file.Read(block.data(), block.size(), pipeline->options.stop);
        pipeline->bytes_read.fetch_add(count, std::memory_order_relaxed);
        pipeline->blocks.Send(demultiplexer, count);
    }
}

// A buffer holds sections back to back: each follows its PID and says its own length.
void Demultiplex(Pipeline *pipeline, int32_t parser) {
    Channel &sections = pipeline->sections;
    Bytes *batch = &sections.Next();
    const auto send_batch = [&] {
        sections.Send(parser, batch->size());
        batch = &sections.Next();
        batch->clear();
    };
    Demultiplexer demultiplexer([&](uint16_t pid, const unsigned char *section, size_t size) {
        batch->push_back(static_cast<unsigned char>(pid >> 8));
        batch->push_back(static_cast<unsigned char>(pid));
        batch->insert(batch->end(), section, section + size);
    });
    Capture *const capture = pipeline->options.capture;
    PacketSource source([&](const unsigned char *packet, size_t count) {
        for (; count > 0; --count, packet += kPacketSize) {
            demultiplexer.Push(packet);
            if (capture != nullptr && demultiplexer.CarriesTables(PidOf(packet))) {
                capture->Push(packet);
            }
        }
    });
    pipeline->blocks.ForEach([&](const unsigned char *block, size_t size) {
        source.Feed(block, size);
        if (!batch->empty()) {
            send_batch();
        }
    });
    source.Finish();
    if (capture != nullptr) {
        capture->Finish();
    }
    pipeline->report.packets = source.Counters();
    pipeline->report.sections = demultiplexer.Counters();
    if (!batch->empty()) {
        send_batch();
    }
    sections.Send(parser, 0);
}

void Parse(Pipeline *pipeline) {
    TableParser parser(pipeline->report.model, pipeline->options.language);
    pipeline->sections.ForEach([&](const unsigned char *at, size_t size) {
        for (const unsigned char *const end = at + size; at < end;) {
            const size_t length = 3u + ((at[3] & 0x0Fu) << 8 | at[4]);
            parser.Push(static_cast<uint16_t>(at[0] << 8 | at[1]), at + 2, length);
            at += 2 + length;
        }
    });
}

}  // namespace

std::string RunPipeline(StreamFile &file, const PipelineOptions &options, Report &report) {
    // The size is asked for before the reader exists, because only one thread may use the file.
    ProgressLine line(options.progress, file.Size());
    Pipeline pipeline{file, options, report};
    if (!pipeline.blocks || !pipeline.sections) {
        return pipeline.blocks ? "semaphore ReceiverSectionRoom" : "semaphore ReceiverBlockRoom";
    }
    // Each thread is created after the one to which it sends, and destroyed before it.
    varnek::Thread parser("ReceiverParser", kStackSize, Parse, &pipeline);
    if (!parser) {
        return "thread ReceiverParser";
    }
    varnek::Thread demultiplexer("ReceiverDemultiplexer", kStackSize, Demultiplex, &pipeline,
                                 parser.Handle());
    if (!demultiplexer) {
        return "thread ReceiverDemultiplexer";
    }
    varnek::Thread reader("ReceiverReader", kStackSize, Read, &pipeline, demultiplexer.Handle());
    if (!reader) {
        return "thread ReceiverReader";
    }
    for (varnek::Thread *thread : {&reader, &demultiplexer, &parser}) {
        while (!thread->Join(kTick)) {
            line.Show(pipeline.bytes_read.load(std::memory_order_relaxed));
        }
    }
    line.Erase();
    return {};
}

}  // namespace receiver
