// Shows a report to programs.
#ifndef RECEIVER_JSONREPORT_H
#define RECEIVER_JSONREPORT_H

#include <cstdio>

#include "Report.h"

namespace receiver {

// Writes one JSON object (RFC 8259) with a final line feed, piece by piece, so that its size takes
// no memory. Numbers that the stream does not tell are null, texts and times that it does not tell
// are empty.
void WriteJson(const Report &report, std::FILE *out);

}  // namespace receiver

#endif
