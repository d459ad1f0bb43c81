// Follows every PID's packets and brings out the sections of the tables: those on the PIDs that are
// fixed, and those on the PMT PIDs that the PAT names at that point of the stream.
#ifndef RECEIVER_DEMULTIPLEXER_H
#define RECEIVER_DEMULTIPLEXER_H

#include <array>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <map>
#include <vector>

#include "PcrMeter.h"
#include "SectionAssembler.h"
#include "TransportStream.h"

namespace receiver {

struct PidCounters {
    uint64_t packets = 0;  // but for those with a transport error, whose PID is uncertain
    uint64_t continuity_errors = 0;
};

struct DemultiplexerCounters {
    uint64_t continuity_errors = 0;
    uint64_t transport_errors = 0;  // packets that the demodulator marked; nothing in them is used
    uint64_t scrambled = 0;         // packets
    uint64_t good = 0;              // sections that are whole, with a right CRC or none to check
    uint64_t bad_crc = 0;           // sections that are whole, but damaged
    uint64_t incomplete = 0;        // sections that were given up
    std::array<uint64_t, 256> tables{};  // good sections of each table_id
    std::vector<PidCounters> pids;       // one for each PID
    PcrSpan clock;
};

class Demultiplexer {
  public:
    // Called with a good section, valid during the call.
    using Handler = std::function<void(uint16_t pid, const unsigned char *section, size_t size)>;

    explicit Demultiplexer(Handler handler);

    // Takes the 188 bytes of the stream's next packet.
    void Push(const unsigned char *packet);

    // Tells whether this PID carries tables at this point of the stream.
    bool CarriesTables(uint16_t pid) const { return pids_[pid].table_uses != 0; }

    DemultiplexerCounters Counters() const;

  private:
    struct Header;
    struct PidState {
        PidCounters counters;
        int last = -1;            // counter of the PID's latest packet, -1 before the first
        bool repeatable = false;  // that packet had a payload and may come once more
        unsigned table_uses = 0;  // one where tables are fixed, and one for each PAT entry
        SectionAssembler assembler;
    };
    enum class Order { kNext, kRepeated, kBroken, kRestarted };

    static Header ParseHeader(const unsigned char *packet);
    static Order CheckContinuity(const Header &header, PidState &state);
    void OnSection(uint16_t pid, const unsigned char *section, size_t size);
    void UpdatePmtPids(const unsigned char *section, size_t size);
    void AddUse(uint16_t pid);
    void RemoveUses(const std::vector<uint16_t> &pids);

    Handler handler_;
    DemultiplexerCounters counters_;  // but for those of the PIDs, and the clock
    uint64_t position_ = 0;           // packets so far
    PcrMeter pcr_meter_;
    std::vector<PidState> pids_;
    std::map<uint8_t, std::vector<uint16_t>> pat_sections_;  // PMT PIDs, by section_number
};

}  // namespace receiver

#endif
