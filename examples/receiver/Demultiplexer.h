// Follows the packets of every PID and extracts the sections of the tables, which are on fixed
// PIDs, on the PMT PIDs that the PAT names at that point of the stream, and on the AIT PIDs that
// the PMTs name. Until there is a PAT, PMTs are found on any PID.
#ifndef RECEIVER_DEMULTIPLEXER_H
#define RECEIVER_DEMULTIPLEXER_H

#include <array>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <map>
#include <vector>

#include "Model.h"
#include "PcrMeter.h"
#include "SectionAssembler.h"
#include "TransportStream.h"

namespace receiver {

struct PidCounters {
    uint64_t packets = 0;  // without those with a transport error, whose PID is uncertain
    uint64_t continuity_errors = 0;
};

struct DemultiplexerCounters {
    uint64_t continuity_errors = 0;
    uint64_t transport_errors = 0;       // packets that the demodulator marked; ignored
    uint64_t scrambled = 0;              // packets
    uint64_t good = 0;                   // complete sections with a correct CRC, or without one
    uint64_t bad_crc = 0;                // complete sections with a wrong CRC
    uint64_t incomplete = 0;             // sections that were abandoned
    std::array<uint64_t, 256> tables{};  // good sections of each table_id
    std::vector<PidCounters> pids;       // one for each PID
    PcrSpan clock;
};

class Demultiplexer {
  public:
    // Called with a good section, which is valid during the call.
    using Handler = std::function<void(uint16_t pid, const unsigned char *section, size_t size)>;

    explicit Demultiplexer(Handler handler);

    // Processes the 188 bytes of the stream's next packet.
    void Push(const unsigned char *packet);

    // Whether this PID carries tables at this point of the stream.
    bool CarriesTables(uint16_t pid) const {
        return pids_[pid].table_uses != 0 || (!pat_complete_ && pids_[pid].has_pmt);
    }

    DemultiplexerCounters Counters() const;

  private:
    struct Header;
    struct PidState {
        PidCounters counters;
        int last = -1;            // counter of the PID's latest packet, -1 before the first
        bool repeatable = false;  // that packet had a payload and may be repeated once
        unsigned table_uses = 0;  // one if the PID is fixed, and one for each entry that names it
        bool has_pmt = false;     // a PMT seems to be on it, though no PAT has named it
        SectionAssembler assembler;
    };
    enum class Order { kNext, kRepeated, kBroken, kRestarted };

    static Header ParseHeader(const unsigned char *packet);
    static Order CheckContinuity(const Header &header, PidState &state);
    bool MayBePmt(const Header &header, const unsigned char *packet, PidState &state) const;
    void OnSection(uint16_t pid, bool claimed, const unsigned char *section, size_t size);
    void FollowNames(const unsigned char *section, size_t size);
    void RemoveUse(uint16_t pid);
    void Forget(uint32_t key);

    Handler handler_;
    DemultiplexerCounters counters_;  // without those of the PIDs and the clock
    uint64_t position_ = 0;           // packets so far
    PcrMeter pcr_meter_;
    std::vector<PidState> pids_;
    // The sections that name PIDs: those of the PAT by section_number, and PMTs by service_id plus
    // kPmtKey. A repeated section, which has the same CRC, is not parsed again.
    struct Naming {
        uint32_t crc;
        // The programs of a PAT; or the AITs of a PMT, each with the PMT's service_id and its PID.
        std::vector<Program> programs;
    };
    static constexpr uint32_t kPmtKey = 0x10000;
    std::map<uint32_t, Naming> namings_;
    bool pat_complete_ = false;
};

}  // namespace receiver

#endif
