// What was read, and how its parts belong together: services joined from their tables, events in
// order, local times. The summary and the JSON object both show this.
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

// What the receiver is set up for, from the library's configuration.
struct Settings {
    int standard_type = 2;
    std::string nation = "BRA";
    bool bml = false;  // whether that nation has BML data broadcasting
};

struct Report {
    Settings settings;
    PacketCounters packets;
    DemultiplexerCounters sections;
    Model model;
};

struct Service {
    std::optional<uint16_t> pmt_pid;
    const ServiceInfo *info = nullptr;  // null without an SDT entry
    const ProgramMap *map = nullptr;    // null without a PMT
};

// Services that the PAT or the SDT names, by service_id. They point into the model. A PMT counts
// only when it came where the PAT says.
std::map<uint16_t, Service> JoinServices(const Model &model);

using EventEntry = const std::pair<const EventKey, Event> *;

// By start; those whose start is not known come last.
std::vector<EventEntry> SortEvents(const Model &model);

// The offset that local times are shown with: the one for the receiver's nation, or else the first.
const LocalOffset *OffsetFor(const Report &report);

// Local time at a moment in UTC, with the offset that applies then; nothing when either is not
// known.
std::optional<DateTime> ToLocal(const std::optional<DateTime> &time, const LocalOffset *offset);

// "-03:00"
std::string ToOffsetText(int minutes);

// printf for short texts of bounded size.
std::string Format(const char *format, ...) __attribute__((format(printf, 1, 2)));

}  // namespace receiver

#endif
