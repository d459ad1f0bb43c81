// Shows a report to programs.
#ifndef RECEIVER_JSONREPORT_H
#define RECEIVER_JSONREPORT_H

#include <string>

#include "Report.h"

namespace receiver {

// One JSON object (RFC 8259) with a final line feed. Numbers that the stream does not tell are
// null, texts and times that it does not tell are empty.
std::string ToJson(const Report &report);

}  // namespace receiver

#endif
