// Measures a stream's duration and bit rate with its program clock references.
#ifndef RECEIVER_PCRMETER_H
#define RECEIVER_PCRMETER_H

#include <cstdint>
#include <map>

namespace receiver {

// The time and the packets between the clock references of one PID. Intervals in which the clock
// jumps do not count.
struct PcrSpan {
    uint64_t ticks = 0;    // of 27 MHz
    uint64_t packets = 0;  // of the whole stream
};

class PcrMeter {
  public:
    // Adds a clock reference.
    //   position  number of packets of the stream before this one
    //   restart   whether the packet announces that the clock jumps
    void Push(uint16_t pid, uint64_t pcr, uint64_t position, bool restart);

    // Returns the span of the PID with the longest measured time.
    PcrSpan Longest() const;

  private:
    struct Clock {
        uint64_t pcr = 0;
        uint64_t position = 0;
        PcrSpan span;
    };
    std::map<uint16_t, Clock> clocks_;  // by PID
};

}  // namespace receiver

#endif
