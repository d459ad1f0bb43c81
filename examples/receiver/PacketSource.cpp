// When locked, the source expects a sync byte at the end of each packet; when searching, it goes
// byte by byte, with a limited look-ahead. Both only move forward, so any input takes linear time.
#include "PacketSource.h"

#include <algorithm>

#include "TransportStream.h"

namespace receiver {
namespace {

constexpr size_t kTimestampedSize = 192;
constexpr size_t kTimestampSize = 4;
constexpr size_t kDistances[] = {kPacketSize, kTimestampedSize, 204};
constexpr size_t kLargestDistance = 204;

// The number of consecutive sync bytes that is taken for a start of packets. Few are enough at the
// first byte of a stream, and at the packet distance already in use, so that short runs of packets
// between losses count. Elsewhere it takes more, and valid packet headers, because many other files
// have this byte at regular distances. More than seven would miss datagrams of seven packets.
constexpr size_t kSyncsToFind = 5;
constexpr size_t kSyncsToResume = 3;
constexpr size_t kLookAhead = (kSyncsToFind - 1) * kLargestDistance + 4;

// The number of bytes before the first sync byte, if the stream begins with a complete packet.
constexpr size_t Lead(size_t distance) {
    return distance == kTimestampedSize ? kTimestampSize : 0;
}

}  // namespace

// Once it has found packets, it passes them on in place, except those that span two blocks.
void PacketSource::Feed(const unsigned char *bytes, size_t count) {
    counters_.bytes += count;
    if (locked_ && !pending_.empty()) {
        const size_t missing = std::min(count, next_ + kPacketSize - pending_.size());
        pending_.insert(pending_.end(), bytes, bytes + missing);
        Run(false);
        bytes += missing;
        count -= missing;
    }
    if (locked_ && pending_.empty()) {
        const size_t distance = counters_.packet_size;
        const auto is_packet = [&](size_t start) {
            return start + kPacketSize <= count && bytes[start] == kSyncByte;
        };
        size_t at = next_;
        while (is_packet(at)) {
            size_t together = 1;
            while (distance == kPacketSize && is_packet(at + together * kPacketSize)) {
                ++together;
            }
            counters_.packets += together;
            handler_(bytes + at, together);
            at += together * distance;
        }
        const size_t used = std::min(at, count);
        pending_offset_ += used;
        next_ = at - used;
        bytes += used;
        count -= used;
    }
    pending_.insert(pending_.end(), bytes, bytes + count);
    Run(false);
}

void PacketSource::Finish() {
    Run(true);
}

void PacketSource::Run(bool at_end) {
    while (locked_ || Search(at_end)) {
        if (next_ >= pending_.size()) {
            break;
        }
        if (pending_[next_] != kSyncByte) {
            ++counters_.sync_losses;
            locked_ = false;
            continue;
        }
        if (pending_.size() - next_ < kPacketSize) {
            break;
        }
        ++counters_.packets;
        handler_(&pending_[next_], 1);
        next_ += counters_.packet_size;
    }
    const size_t used = std::min(next_, pending_.size());
    pending_.erase(pending_.begin(), pending_.begin() + static_cast<std::ptrdiff_t>(used));
    pending_offset_ += used;
    next_ -= used;
}

// Moves next_ to a byte where packets start, as far as the available bytes show.
bool PacketSource::Search(bool at_end) {
    for (; next_ < pending_.size(); ++next_) {
        if (!at_end && pending_.size() - next_ < kLookAhead) {
            return false;
        }
        if (pending_[next_] != kSyncByte) {
            continue;
        }
        for (const size_t distance : kDistances) {
            if (!StartsPackets(next_, distance)) {
                continue;
            }
            if (counters_.packet_size == 0 && pending_offset_ + next_ > Lead(distance)) {
                ++counters_.sync_losses;
            }
            counters_.packet_size = static_cast<unsigned>(distance);
            locked_ = true;
            return true;
        }
    }
    return false;
}

// The look-ahead contains all sync bytes that are required, but near the end of the stream
// those that remain suffice, though it takes at least three if nothing else points to packets.
bool PacketSource::StartsPackets(size_t at, size_t distance) const {
    const uint64_t offset = pending_offset_ + at;
    const size_t room = pending_.size() - at;
    const bool known = distance == counters_.packet_size;
    const bool expected = known || offset == Lead(distance);
    if (offset < Lead(distance) || room + Lead(distance) < (known ? kPacketSize : distance)) {
        return false;
    }
    const size_t wanted = expected ? kSyncsToResume : kSyncsToFind;
    size_t found = 0;
    bool headers = false;  // one at least, as a file of nothing but sync bytes has none
    while (found < wanted && found * distance < room) {
        const size_t start = at + found * distance;
        if (pending_[start] != kSyncByte || (!expected && !MayBeHeader(start))) {
            return false;
        }
        headers = headers || start + 3 >= pending_.size() || (pending_[start + 3] & 0x30) != 0;
        ++found;
    }
    return headers && (expected || found >= kSyncsToResume);
}

// Whether the available part of the header has no transport error and a valid
// adaptation_field_control.
bool PacketSource::MayBeHeader(size_t at) const {
    return at + 3 >= pending_.size() ||
           ((pending_[at + 1] & 0x80) == 0 && (pending_[at + 3] & 0x30) != 0);
}

}  // namespace receiver
