#include "PcrMeter.h"

namespace receiver {
namespace {

constexpr uint64_t kCycle = (uint64_t{1} << 33) * 300;  // the clock wraps here
// Streams have at least ten references a second, so a longer step is a jump or damage.
constexpr uint64_t kLongestStep = 27000000;

uint64_t Step(uint64_t from, uint64_t to) {
    return (to + kCycle - from) % kCycle;
}

}  // namespace

bool PcrMeter::Follows(const std::optional<Reference> &earlier, const Reference &later) {
    return earlier && Step(earlier->pcr, later.pcr) <= kLongestStep;
}

// Returns the span up to the newest reference.
PcrSpan PcrMeter::Extended(const Clock &clock) {
    if (!clock.newest || !Follows(clock.last, *clock.newest)) {
        return clock.span;
    }
    return {clock.span.ticks + Step(clock.last->pcr, clock.newest->pcr),
            clock.span.packets + clock.newest->position - clock.last->position};
}

void PcrMeter::Push(uint16_t pid, uint64_t pcr, uint64_t position) {
    Clock &clock = clocks_[pid];
    const Reference next{pcr, position};
    const bool between =
        clock.newest && Follows(clock.last, *clock.newest) && Follows(clock.newest, next);
    // If this reference follows the last one, the newest was damaged, unless it lies between them.
    if (between || !Follows(clock.last, next)) {
        clock.span = Extended(clock);
        clock.last = clock.newest;
    }
    clock.newest = next;
}

PcrSpan PcrMeter::Longest() const {
    PcrSpan longest;
    for (const auto &entry : clocks_) {
        const PcrSpan span = Extended(entry.second);
        longest = span.ticks > longest.ticks ? span : longest;
    }
    return longest;
}

}  // namespace receiver
