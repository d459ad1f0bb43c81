// Finds the packets in a stream of bytes: packets of 188 bytes, of 192 (a four-byte time stamp in
// front) and of 204 (16 parity bytes behind), recognised by the distance of their sync bytes.
#ifndef RECEIVER_PACKETSOURCE_H
#define RECEIVER_PACKETSOURCE_H

#include <cstddef>
#include <cstdint>
#include <functional>
#include <vector>

namespace receiver {

struct PacketCounters {
    uint64_t bytes = 0;        // all that was fed
    uint64_t packets = 0;      // whole ones; a packet that the end of the stream cuts is none
    uint64_t sync_losses = 0;  // garbage in front of the first packet is one
    unsigned packet_size = 0;  // distance of the sync bytes, 0 until packets were found
};

// Bytes go in, in blocks of any size; whole packets come out, in order. Holds back at most about a
// thousand bytes. After a loss it takes up the stream at the first sync byte that several others
// follow at the packet distance, and no byte belongs to two packets.
class PacketSource {
  public:
    // Called with packets of 188 bytes, one right behind the other, valid during the call.
    using Handler = std::function<void(const unsigned char *packets, size_t count)>;

    explicit PacketSource(Handler handler) : handler_(std::move(handler)) {}

    void Feed(const unsigned char *bytes, size_t count);
    // Judges the bytes that were held back, because no more will come.
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
