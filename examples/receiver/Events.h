// The events of a stream's programme, in bounded memory.
#ifndef RECEIVER_EVENTS_H
#define RECEIVER_EVENTS_H

#include <cstddef>
#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <tuple>
#include <vector>

#include "BroadcastTime.h"
#include "Code.h"

namespace receiver {

struct EventKey {
    uint16_t service_id;
    uint16_t event_id;
    bool operator<(const EventKey &other) const {
        return std::tie(service_id, event_id) < std::tie(other.service_id, other.event_id);
    }
};

struct Rating {
    Code country;  // its rules define the value
    uint8_t value;
};

struct Event {
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

class EventTable {
  public:
    // Far more than a week of every service needs. The limit bounds the memory for hostile streams.
    static constexpr size_t kMostEvents = 65536;
    static constexpr size_t kMostBytes = 16 << 20;  // of the events' texts and lists

    // Stores the latest data about an event. Tables describe an event in different detail, so
    // earlier fields stay if the new ones are empty.
    void Keep(const EventKey &key, Event event);

    // Returns how often there was no room for an event, or for new data about one.
    uint64_t LeftOut() const { return left_out_; }

    bool Has(const EventKey &key) const { return events_.count(key) != 0; }
    auto begin() const { return events_.begin(); }
    auto end() const { return events_.end(); }

  private:
    std::map<EventKey, Event> events_;
    size_t bytes_ = 0;
    uint64_t left_out_ = 0;
};

}  // namespace receiver

#endif
