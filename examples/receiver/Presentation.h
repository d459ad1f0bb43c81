// Shows what was read: a summary for people, and the same as a JSON object.
#ifndef RECEIVER_PRESENTATION_H
#define RECEIVER_PRESENTATION_H

#include <string>

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

// UTF-8, about a screen, with a final line feed.
std::string ToSummary(const Report &report);

// One JSON object (RFC 8259) with a final line feed. Numbers that the stream does not tell are
// null, texts and times that it does not tell are empty.
std::string ToJson(const Report &report);

}  // namespace receiver

#endif
