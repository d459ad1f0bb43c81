// Finds the packets in a stream of bytes. A packet has 188 bytes, 192 with a four-byte time stamp
// in front, or 204 with 16 parity bytes at the end; the distance of the sync bytes tells which.
#ifndef RECEIVER_PACKETSOURCE_H
#define RECEIVER_PACKETSOURCE_H

#include <cstddef>
#include <cstdint>
#include <functional>
#include <vector>

namespace receiver {

struct PacketCounters {
    uint64_t bytes = 0;        // all bytes that were fed
    uint64_t packets = 0;      // complete packets, without one that the end of the stream cuts off
    uint64_t sync_losses = 0;  // bytes before the first packet count as one loss
    unsigned packet_size = 0;  // distance of the sync bytes, 0 until packets are found
};

// Turns blocks of bytes of any size into complete packets in order, and keeps about a thousand
// bytes at most from one block to the next. After a loss it continues at the first sync byte that
// is followed by several others at the packet distance. No byte belongs to two packets.
class PacketSource {
  public:
    // Called with consecutive packets of 188 bytes, which are valid during the call.
    using Handler = std::function<void(const unsigned char *packets, size_t count)>;

    explicit PacketSource(Handler handler) : handler_(std::move(handler)) {}

    void Feed(const unsigned char *bytes, size_t count);
    // Processes what is still buffered at the end of the stream.
    void Finish();

    const PacketCounters &Counters() const { return counters_; }

  private:
    void Run(bool at_end);
    bool Search(bool at_end);
    bool StartsPackets(size_t at, size_t distance) const;
    bool MayBeHeader(size_t at) const;

    Handler handler_;
    PacketCounters counters_;
    std::vector<unsigned char> pending_;  // bytes that are still needed
    uint64_t pending_offset_ = 0;         // position of pending_[0] in the stream
    size_t next_ = 0;                     // index of the next sync byte, or of the search
    bool locked_ = false;
};

}  // namespace receiver

#endif
