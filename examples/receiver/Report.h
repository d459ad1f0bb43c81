// What a stream contained: services joined from their tables, events in order, times in UTC and
// local time. The summary and the JSON object show it.
#ifndef RECEIVER_REPORT_H
#define RECEIVER_REPORT_H

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "Demultiplexer.h"
#include "Model.h"
#include "PacketSource.h"

namespace receiver {

// The library's configuration and the user's choices.
struct Settings {
    int standard_type = 2;
    std::string nation = "BRA";
    bool bml = false;  // whether that nation has BML data broadcasting
    std::optional<uint8_t> region;
    bool all = false;  // the summary lists every event and every PID
};

struct Report {
    Settings settings;
    PacketCounters packets;
    DemultiplexerCounters sections;
    Model model;
};

// Return milliseconds and bits per second, by the clock references.
std::optional<int64_t> DurationOf(const Report &report);
std::optional<int64_t> BitRateOf(const Report &report);

struct Service {
    std::optional<uint16_t> pmt_pid;
    ServiceInfo info{};               // empty without an SDT entry
    const ProgramMap *map = nullptr;  // of the model; null without a PMT
    bool one_seg = false;
};

// Joins the services that the PAT or the SDT names, by service_id. A PMT counts only on the PID
// that the PAT names; without a PAT, as in one-seg reception, every PMT names its service.
std::map<uint16_t, Service> JoinServices(const Model &model);

// Finds this stream's entry in the NIT, or without a PAT the only entry; null for none.
const NetworkStream *FindOwnStream(const Model &model);

// Whether the NIT or the PMT of a service signals an emergency warning.
bool IsEmergency(const Model &model, const std::map<uint16_t, Service> &services);

struct ListedEvent {
    uint16_t service_id;
    Event event;
    bool other_stream;
};

// Lists the events by start, those whose start is not known last. With `others`, these include the
// events of other streams that this stream does not describe itself.
std::vector<ListedEvent> ListEvents(const Model &model, bool others);

// Converts the stream's times. It takes them for UTC except in Brazil, where they and the local
// offsets are relative to the official time of Brasilia.
class StreamClock {
  public:
    explicit StreamClock(const Report &report);

    // The nation whose rules the stream follows: the receiver's if the TOT names it or none,
    // otherwise the first in the TOT; empty for a DVB stream whose TOT names none.
    const Code &Nation() const { return nation_; }

    // The offset for local times: the first of the receiver's nation, in the region that the user
    // names, if any. If the user names none and the TOT does not name the nation, it is the first
    // in the TOT. Null for none.
    const LocalOffset *Offset() const { return offset_; }

    // Convert a time of the stream to UTC and to local time, the latter by the offset that applies
    // at that time.
    std::optional<DateTime> Utc(const std::optional<DateTime> &time) const;
    std::optional<DateTime> Local(const std::optional<DateTime> &time) const;

    // Formats the offset from UTC, such as "-03:00"; `minutes` is the value in the stream.
    std::string OffsetText(int minutes) const;

  private:
    Code nation_;
    const LocalOffset *offset_ = nullptr;
};

// Writes a report for people, in lines of at most `width` columns.
void WriteSummary(const Report &report, size_t width, std::FILE *out);

// Writes a report for programs: one JSON object (RFC 8259) and a line feed, as README.md describes.
// It writes piece by piece, so a large object needs no more memory.
void WriteJson(const Report &report, std::FILE *out);

}  // namespace receiver

#endif
