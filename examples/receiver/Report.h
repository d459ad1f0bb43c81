// What was read, and how its parts belong together: services joined from their tables, events in
// order, times in UTC and local. The summary and the JSON object both show this.
#ifndef RECEIVER_REPORT_H
#define RECEIVER_REPORT_H

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "Demultiplexer.h"
#include "Model.h"
#include "PacketSource.h"

namespace receiver {

// What the receiver is set up for: the library's configuration, and the region that the user names.
struct Settings {
    int standard_type = 2;
    std::string nation = "BRA";
    bool bml = false;  // whether that nation has BML data broadcasting
    std::optional<uint8_t> region;
};

struct Report {
    Settings settings;
    PacketCounters packets;
    DemultiplexerCounters sections;
    Model model;
};

// Tells whether the bytes hold so little of a stream that they are something else.
bool IsHardlyStream(const Report &report);

// The clock references give the duration in milliseconds and the bit rate in bits per second.
std::optional<int64_t> DurationOf(const Report &report);
std::optional<int64_t> BitRateOf(const Report &report);

struct Service {
    std::optional<uint16_t> pmt_pid;
    const ServiceInfo *info = nullptr;  // null without an SDT entry
    const ProgramMap *map = nullptr;    // null without a PMT
    bool one_seg = false;
};

// Joins the services that the PAT or the SDT names, by service_id. They point into the model. A PMT
// counts only when it came where the PAT says.
std::map<uint16_t, Service> JoinServices(const Model &model);

// Finds the NIT's entry on this stream; null without one.
const NetworkStream *FindOwnStream(const Model &model);

// Tells whether the NIT or the PMT of a service signals a warning to the population.
bool IsEmergency(const Model &model, const std::map<uint16_t, Service> &services);

struct ListedEvent {
    EventKey key;
    const Event *event;
    bool other_stream;
};

// Lists all events by start, those whose start is not known last. Another stream's account of an
// event that this stream tells of is left out.
std::vector<ListedEvent> ListEvents(const Model &model);

// Converts the stream's times. In Brazil they are the official time of Brasilia, and local offsets
// are relative to that; elsewhere they are UTC.
class StreamClock {
  public:
    explicit StreamClock(const Report &report);

    // The nation whose rules the stream follows: the receiver's when the TOT has it or says
    // nothing, else the TOT's first; empty for a DVB stream that says nothing.
    const Code &Nation() const { return nation_; }

    // The offset that local times are shown with: the one for the receiver's nation and region, or
    // else, where the user names no region, the first. Null for none.
    const LocalOffset *Offset() const { return offset_; }

    // These convert a time as the stream carries it; nothing comes out when it is not known. The
    // local time takes the offset that applies then.
    std::optional<DateTime> Utc(const std::optional<DateTime> &time) const;
    std::optional<DateTime> Local(const std::optional<DateTime> &time) const;

    // Shows the offset from UTC as "-03:00"; `minutes` are as the stream carries them.
    std::string OffsetText(int minutes) const;

  private:
    Code nation_;
    const LocalOffset *offset_ = nullptr;
};

}  // namespace receiver

#endif
