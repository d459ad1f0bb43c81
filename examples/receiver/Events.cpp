// The table also counts the bytes of texts and lists, so that long ones cannot exhaust the memory.
#include "Events.h"

#include <utility>

namespace receiver {
namespace {

size_t BytesOf(const Event &event) {
    return event.name.size() + event.text.size() + event.extended_text.size() +
           event.ratings.size() * sizeof(Rating) + event.genres.size() +
           event.audio_languages.size() * sizeof(Code);
}

template <typename Content>
void FillIn(Content &content, Content &earlier) {
    if (content.empty()) {
        content = std::move(earlier);
    }
}

}  // namespace

void EventTable::Keep(const EventKey &key, Event event) {
    const auto found = events_.find(key);
    if (found == events_.end()) {
        const size_t bytes = BytesOf(event);
        if (events_.size() == kMostEvents || bytes_ + bytes > kMostBytes) {
            ++left_out_;
            return;
        }
        bytes_ += bytes;
        events_.emplace(key, std::move(event));
        return;
    }
    Event &kept = found->second;
    // The old and the new data must fit together, because parts of the old data may stay.
    if (bytes_ + BytesOf(event) > kMostBytes) {
        ++left_out_;
        return;
    }
    bytes_ -= BytesOf(kept);
    if (event.name.empty()) {
        event.name = std::move(kept.name);
        event.text = std::move(kept.text);
        event.language = kept.language;
    }
    FillIn(event.extended_text, kept.extended_text);
    FillIn(event.ratings, kept.ratings);
    FillIn(event.genres, kept.genres);
    FillIn(event.audio_languages, kept.audio_languages);
    bytes_ += BytesOf(event);
    kept = std::move(event);
}

}  // namespace receiver
