// Measures a stream's duration and bit rate with its program clock references.
#ifndef RECEIVER_PCRMETER_H
#define RECEIVER_PCRMETER_H

#include <cstdint>
#include <map>
#include <optional>

namespace receiver {

// The time and the packets between the clock references of one PID, without intervals in which the
// clock jumps.
struct PcrSpan {
    uint64_t ticks = 0;    // of 27 MHz
    uint64_t packets = 0;  // of the whole stream
};

// Measures each PID by itself, because the programs of a stream may have different clocks. A
// reference counts once the next one confirms it, so a damaged one is dropped while the interval
// around it still counts.
class PcrMeter {
  public:
    // Adds a clock reference.
    //   position  number of packets of the stream before this one
    void Push(uint16_t pid, uint64_t pcr, uint64_t position);

    // Returns the span of the PID with the longest measured time.
    PcrSpan Longest() const;

  private:
    struct Reference {
        uint64_t pcr;
        uint64_t position;
    };
    struct Clock {
        std::optional<Reference> last;    // confirmed
        std::optional<Reference> newest;  // not yet
        PcrSpan span;                     // up to the last one
    };

    static bool Follows(const std::optional<Reference> &earlier, const Reference &later);
    static PcrSpan Extended(const Clock &clock);

    std::map<uint16_t, Clock> clocks_;  // by PID
};

}  // namespace receiver

#endif
