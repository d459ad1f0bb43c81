// What the tables of a stream say: the parser fills it, the report shows it. Only what
// applies now and to this stream is kept, except for events, where other streams' fill in.
#ifndef RECEIVER_MODEL_H
#define RECEIVER_MODEL_H

#include <cstddef>
#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include "BroadcastTime.h"
#include "Name.h"

namespace receiver {

struct Program {  // a PAT entry
    uint16_t service_id;
    uint16_t pmt_pid;
};

struct Component {  // a PMT entry
    uint16_t pid;
    uint8_t stream_type;
    uint8_t descriptor;  // tag of the one that tells what private data is, 0 for none
};

struct ProgramMap {    // a PMT
    uint16_t pmt_pid;  // where it came
    uint16_t pcr_pid;
    std::vector<Component> components;
};

struct ServiceInfo {  // an SDT entry
    uint16_t service_id;
    std::optional<uint8_t> type;
    Name provider;
    Name name;
};

struct EventKey {
    uint16_t service_id;
    uint16_t event_id;
    bool operator<(const EventKey &other) const {
        return std::tie(service_id, event_id) < std::tie(other.service_id, other.event_id);
    }
};

struct Event {
    bool other_stream;
    std::optional<DateTime> start;
    std::optional<int> duration;  // seconds
    std::string name;
    std::string text;
};

struct LocalOffset {
    std::string country;
    uint8_t region;
    int minutes;  // to be added to UTC
    std::optional<DateTime> change;
    int next_minutes;  // from then on
};

// A table that comes in numbered sections. A section takes the place of the earlier one of its
// number: repeats change nothing, and a new version takes over as it comes in.
template <typename Content>
class Sections {
  public:
    void Replace(uint8_t number, uint8_t last, Content content) {
        sections_.erase(sections_.upper_bound(last), sections_.end());
        if (number <= last) {
            sections_[number] = std::move(content);
        }
    }
    auto begin() const { return sections_.begin(); }
    auto end() const { return sections_.end(); }

  private:
    std::map<uint8_t, Content> sections_;
};

struct Model {
    // Far more events than a week of every service takes; keeps memory bounded on hostile streams.
    static constexpr size_t kMostEvents = 65536;

    std::optional<uint16_t> transport_stream_id;
    std::optional<uint16_t> network_id;
    Name network_name;
    std::optional<DateTime> utc_time;  // the latest
    std::vector<LocalOffset> local_offsets;
    Sections<std::vector<Program>> pat;
    Sections<std::vector<ServiceInfo>> sdt;
    std::map<uint16_t, ProgramMap> pmts;  // by service_id
    std::map<EventKey, Event> events;
    uint64_t events_left_out = 0;  // for lack of room
};

}  // namespace receiver

#endif
