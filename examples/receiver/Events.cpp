// The table also counts the bytes of texts and lists, so that long ones cannot exhaust the memory.
#include "Events.h"

#include <algorithm>

#include "TransportStream.h"

namespace receiver {
namespace {

size_t BytesOf(const Event &event) {
    return event.name.size() + event.text.size() + event.extended_text.size() +
           event.ratings.size() * sizeof(Rating) + event.genres.size() +
           event.audio_languages.size() * sizeof(Code);
}

template <typename Content>
void FillIn(Content &content, const Content &other) {
    if (content.empty()) {
        content = other;
    }
}

}  // namespace

void EventTable::Replace(const EventSection &section, uint8_t segment_last, uint8_t last,
                         std::vector<Event> events) {
    const auto upper = [&](unsigned number) {
        EventSection end = section;
        end.number = static_cast<uint8_t>(number);
        return sections_.upper_bound(end);
    };
    Erase(sections_.lower_bound(section), upper(section.number));
    Erase(upper(std::max(last, section.number)), upper(0xFF));
    // A segment_last below this section's own number is an error and says nothing about others.
    if (segment_last >= section.number) {
        const unsigned segment_end = section.number | 7u;
        Erase(upper(std::min<unsigned>(segment_last, segment_end)), upper(segment_end));
    }
    Content content{arrivals_++, {}};
    for (Event &event : events) {
        const size_t bytes = BytesOf(event);
        if (events_ == kMostEvents || bytes_ + bytes > kMostBytes) {
            ++left_out_;
            continue;
        }
        ++events_;
        bytes_ += bytes;
        content.events.push_back(std::move(event));
    }
    if (!content.events.empty()) {
        content.events.shrink_to_fit();
        sections_.emplace(section, std::move(content));
    }
}

void EventTable::Erase(Sections::iterator begin, Sections::iterator end) {
    for (auto it = begin; it != end; ++it) {
        events_ -= it->second.events.size();
        for (const Event &event : it->second.events) {
            bytes_ -= BytesOf(event);
        }
    }
    sections_.erase(begin, end);
}

std::map<EventTable::Key, Event> EventTable::Joined() const {
    std::vector<const Sections::value_type *> nearest;
    for (const auto &section : sections_) {
        nearest.push_back(&section);
    }
    std::sort(nearest.begin(), nearest.end(), [](const auto *left, const auto *right) {
        const bool left_schedule = left->first.table_id >= kTableEitActualSchedule;
        const bool right_schedule = right->first.table_id >= kTableEitActualSchedule;
        return left_schedule != right_schedule ? right_schedule
                                               : left->second.arrival > right->second.arrival;
    });
    std::map<Key, Event> joined;
    for (const auto *section : nearest) {
        for (const Event &event : section->second.events) {
            const auto [found, first] =
                joined.try_emplace({section->first.service_id, event.id}, event);
            Event &kept = found->second;
            if (kept.name.empty()) {
                kept.name = event.name;
                kept.text = event.text;
                kept.language = event.language;
            }
            FillIn(kept.extended_text, event.extended_text);
            FillIn(kept.ratings, event.ratings);
            FillIn(kept.genres, event.genres);
            FillIn(kept.audio_languages, event.audio_languages);
        }
    }
    return joined;
}

}  // namespace receiver
