// Each PID with a clock is measured separately, because the programs of a stream may have different
// clocks.
#include "PcrMeter.h"

namespace receiver {
namespace {

constexpr uint64_t kCycle = (uint64_t{1} << 33) * 300;  // the clock wraps here
// Streams have at least ten references a second, so a longer step is a jump or damage.
constexpr uint64_t kLongestStep = 27000000;

}  // namespace

void PcrMeter::Push(uint16_t pid, uint64_t pcr, uint64_t position, bool restart) {
    const auto [found, first] = clocks_.try_emplace(pid);
    Clock &clock = found->second;
    const uint64_t step = (pcr + kCycle - clock.pcr) % kCycle;
    if (!first && !restart && step <= kLongestStep) {
        clock.span.ticks += step;
        clock.span.packets += position - clock.position;
    }
    clock.pcr = pcr;
    clock.position = position;
}

PcrSpan PcrMeter::Longest() const {
    PcrSpan longest;
    for (const auto &entry : clocks_) {
        if (entry.second.span.ticks > longest.ticks) {
            longest = entry.second.span;
        }
    }
    return longest;
}

}  // namespace receiver
