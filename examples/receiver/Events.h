// The events of a stream's programme, in bounded memory.
#ifndef RECEIVER_EVENTS_H
#define RECEIVER_EVENTS_H

#include <cstddef>
#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include "BroadcastTime.h"
#include "Code.h"

namespace receiver {

struct Rating {
    Code country;  // its rules define the value
    uint8_t value;
};

struct Event {
    uint16_t id = 0;
    std::optional<DateTime> start;
    std::optional<int> duration;  // seconds
    Code language;                // of the name and the text
    std::string name;
    std::string text;
    std::string extended_text;
    std::vector<Rating> ratings;
    std::vector<uint8_t> genres;  // both levels, four bits each
    std::vector<Code> audio_languages;
};

struct EventSection {  // the place of a section among all EIT sections
    uint8_t table_id;
    uint32_t stream;  // the identifiers of its network and transport stream
    uint16_t service_id;
    uint8_t number;
    bool operator<(const EventSection &other) const {
        return std::tie(table_id, stream, service_id, number) <
               std::tie(other.table_id, other.stream, other.service_id, other.number);
    }
};

// Keeps the latest content of each section. An event that its section no longer has is gone.
class EventTable {
  public:
    // Far more than a week of every service needs, and a bound on what a hostile stream takes.
    static constexpr size_t kMostEvents = 65536;
    static constexpr size_t kMostBytes = 16 << 20;  // of the events' texts and lists

    // Replaces the content of a section, and removes the sections that its table no longer has.
    //   segment_last, last  the last section of its segment of eight, and of its table
    void Replace(const EventSection &section, uint8_t segment_last, uint8_t last,
                 std::vector<Event> events);

    // Returns how often there was no room for an event.
    uint64_t LeftOut() const { return left_out_; }

    using Key = std::pair<uint16_t, uint16_t>;  // service_id, event_id

    // Joins what the sections say about each event. Present and following win over a schedule,
    // and otherwise the section that came last. The others supply what the winner leaves out,
    // because tables describe an event in different detail.
    std::map<Key, Event> Joined() const;

  private:
    struct Content {
        uint64_t arrival;
        std::vector<Event> events;
    };
    using Sections = std::map<EventSection, Content>;

    void Erase(Sections::iterator begin, Sections::iterator end);

    Sections sections_;  // without empty ones, so their number is limited too
    size_t events_ = 0;
    size_t bytes_ = 0;
    uint64_t arrivals_ = 0;
    uint64_t left_out_ = 0;
};

}  // namespace receiver

#endif
