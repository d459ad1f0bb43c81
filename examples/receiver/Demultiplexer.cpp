// Packet header, continuity, section assembly and CRC, in this order. PAT and PMTs are read here as
// well as in the table parser, so that no packet after them is missed.
#include "Demultiplexer.h"

#include <cstring>
#include <iterator>
#include <utility>

#include "Tables.h"
#include "TransportStream.h"
#include "Varnek_Util.h"

namespace receiver {
namespace {

constexpr size_t kSmallestCheckedSection = 7;  // a header and a CRC

// Tables without a CRC: time and date, running status, stuffing and discontinuity information.
bool CarriesCrc(unsigned char table_id) {
    return table_id != kTableTdt && table_id != 0x71 && table_id != 0x72 && table_id != 0x7E;
}

// A PCR has 33 bits in units of 90 kHz, six reserved bits, and nine bits in units of 27 MHz.
uint64_t ReadPcr(const unsigned char *bytes) {
    uint64_t value = 0;
    for (int i = 0; i < 6; ++i) {
        value = value << 8 | bytes[i];
    }
    return (value >> 15) * 300 + (value & 0x1FF);
}

}  // namespace

struct Demultiplexer::Header {
    bool transport_error;
    bool unit_start;
    uint16_t pid;
    bool scrambled;
    bool reserved;  // the adaptation_field_control has a reserved value
    bool has_payload;
    uint8_t counter;
    bool discontinuity;
    const unsigned char *pcr;  // null for none
    size_t payload;            // offset if there is one; kPacketSize when it cannot be found
};

Demultiplexer::Demultiplexer(Handler handler) : handler_(std::move(handler)), pids_(kPidCount) {
    for (const uint16_t pid : kTablePids) {
        ++pids_[pid].table_uses;
    }
}

DemultiplexerCounters Demultiplexer::Counters() const {
    DemultiplexerCounters counters = counters_;
    for (const PidState &state : pids_) {
        counters.pids.push_back(state.counters);
    }
    counters.clock = pcr_meter_.Longest();
    return counters;
}

void Demultiplexer::Push(const unsigned char *packet) {
    const Header header = ParseHeader(packet);
    const uint64_t position = position_++;
    if (header.transport_error) {
        ++counters_.transport_errors;
        return;
    }
    PidState &state = pids_[header.pid];
    ++state.counters.packets;
    if (header.scrambled) {
        ++counters_.scrambled;
    }
    if (header.pid == kPidNull || header.reserved) {
        return;
    }
    if (header.pcr != nullptr) {
        pcr_meter_.Push(header.pid, ReadPcr(header.pcr), position);
    }
    const Order order = CheckContinuity(header, state);
    if (order == Order::kBroken) {
        ++counters_.continuity_errors;
        ++state.counters.continuity_errors;
    }
    const bool claimed = state.table_uses != 0;
    if ((!claimed && !MayBePmt(header, packet, state)) || order == Order::kRepeated) {
        return;
    }
    const bool unusable = header.has_payload && (header.scrambled || header.payload == kPacketSize);
    if (order != Order::kNext || unusable) {
        const int dropped = state.assembler.Drop();
        counters_.incomplete += static_cast<unsigned>(claimed ? dropped : 0);
    }
    if (!header.has_payload || unusable) {
        return;
    }
    const int given_up =
        state.assembler.Push(packet + header.payload, kPacketSize - header.payload,
                             header.unit_start, [&](const unsigned char *section, size_t size) {
                                 OnSection(header.pid, claimed, section, size);
                             });
    counters_.incomplete += static_cast<unsigned>(claimed ? given_up : 0);
}

// Reads the bytes directly instead of field by field, because it processes every packet.
Demultiplexer::Header Demultiplexer::ParseHeader(const unsigned char *packet) {
    constexpr size_t kHeaderSize = 4;
    Header header{};
    header.transport_error = (packet[1] & 0x80) != 0;
    header.unit_start = (packet[1] & 0x40) != 0;
    header.pid = PidOf(packet);
    header.scrambled = (packet[3] & 0xC0) != 0;
    const bool has_adaptation = (packet[3] & 0x20) != 0;
    header.has_payload = (packet[3] & 0x10) != 0;
    header.reserved = !has_adaptation && !header.has_payload;
    header.counter = packet[3] & 0x0F;
    header.payload = kHeaderSize;
    if (has_adaptation) {
        const size_t length = packet[kHeaderSize];
        const bool fits = kHeaderSize + 1 + length <= kPacketSize;
        const unsigned flags = fits && length > 0 ? packet[kHeaderSize + 1] : 0;
        header.discontinuity = (flags & 0x80) != 0;
        header.pcr = (flags & 0x10) != 0 && length > 6 ? packet + kHeaderSize + 2 : nullptr;
        header.payload = fits ? kHeaderSize + 1 + length : kPacketSize;
    }
    return header;
}

// Says how a packet follows the one before it on its PID. The counter rises only at packets with a
// payload. They may be sent twice, and a counter may jump if the packet announces it.
Demultiplexer::Order Demultiplexer::CheckContinuity(const Header &header, PidState &state) {
    const int last = std::exchange(state.last, header.counter);
    const bool repeatable = std::exchange(state.repeatable, header.has_payload);
    const int expected = header.has_payload ? (last + 1) & 0x0F : last;
    if (last < 0 || header.counter == expected) {
        return Order::kNext;
    }
    if (header.discontinuity) {
        return Order::kRestarted;
    }
    if (header.counter != last) {
        return Order::kBroken;
    }
    state.repeatable = false;
    return header.has_payload && repeatable ? Order::kRepeated : Order::kBroken;
}

// Whether a packet may carry a PMT that no PAT has named. A stream may begin with PMTs, and one
// that is reduced to its one-seg service has no PAT at all.
bool Demultiplexer::MayBePmt(const Header &header, const unsigned char *packet,
                             PidState &state) const {
    if (pat_complete_) {
        return false;
    }
    if (header.unit_start && header.payload < kPacketSize) {
        const size_t start = header.payload + 1 + packet[header.payload];
        state.has_pmt = state.has_pmt || (start < kPacketSize && packet[start] == kTablePmt);
    }
    return state.has_pmt;
}

void Demultiplexer::OnSection(uint16_t pid, bool claimed, const unsigned char *section,
                              size_t size) {
    const unsigned char table_id = section[0];
    if (!claimed && table_id != kTablePmt) {
        return;
    }
    if (CarriesCrc(table_id) &&
        (size < kSmallestCheckedSection || VarnekUtil_CheckSectionCRC32(section) == FALSE)) {
        counters_.bad_crc += claimed ? 1 : 0;
        return;
    }
    ++counters_.good;
    ++counters_.tables[table_id];
    if ((pid == kPidPat && table_id == kTablePat) || table_id == kTablePmt) {
        FollowNames(section, size);
    }
    handler_(pid, section, size);
}

// A PID that is no longer named may carry anything, so its unfinished section is dropped. New uses
// are added before old ones are removed, so that a PID that stays named keeps its section.
void Demultiplexer::FollowNames(const unsigned char *section, size_t size) {
    constexpr size_t kHeaderAndCrc = 12;
    if (size < kHeaderAndCrc) {
        return;
    }
    const bool is_pat = section[0] == kTablePat;
    const uint32_t key =
        is_pat ? section[6] : kPmtKey | uint32_t{section[3]} << 8 | uint32_t{section[4]};
    uint32_t crc = 0;
    std::memcpy(&crc, section + size - sizeof crc, sizeof crc);
    const auto known = namings_.find(key);
    if (known != namings_.end() && known->second.crc == crc) {
        return;
    }
    FieldReader fields(section, size);
    SectionHeader header{};
    if (!ReadHeader(fields, header)) {
        return;
    }
    Naming naming{crc, {}};
    if (is_pat) {
        ParsePat(section, size, header, naming.programs);
    } else {
        const ProgramMap map = ParsePmt(fields);
        for (const Component &component : map.components) {
            if (component.IsAit()) {
                naming.programs.push_back({header.extension, component.pid});
            }
        }
    }
    for (const Program &program : naming.programs) {
        ++pids_[program.pmt_pid].table_uses;
    }
    Forget(key);
    namings_[key] = std::move(naming);
    if (!is_pat) {
        return;
    }
    for (auto it = namings_.upper_bound(header.last);
         it != namings_.end() && it->first < kPmtKey;) {
        Forget((it++)->first);
    }
    const bool complete =
        std::distance(namings_.begin(), namings_.lower_bound(kPmtKey)) == header.last + 1;
    if (complete && !pat_complete_) {
        pat_complete_ = true;
        for (PidState &state : pids_) {
            if (state.table_uses == 0) {
                state.assembler.Drop();
            }
        }
    }
}

// Removes what a section has named. Without its PAT entry, a service has no AIT either.
void Demultiplexer::Forget(uint32_t key) {
    const auto found = namings_.find(key);
    if (found == namings_.end()) {
        return;
    }
    const std::vector<Program> programs = std::move(found->second.programs);
    namings_.erase(found);
    for (const Program &program : programs) {
        RemoveUse(program.pmt_pid);
        if (key < kPmtKey) {
            Forget(kPmtKey + program.service_id);
        }
    }
}

void Demultiplexer::RemoveUse(uint16_t pid) {
    if (--pids_[pid].table_uses == 0) {
        pids_[pid].assembler.Drop();
    }
}

}  // namespace receiver
