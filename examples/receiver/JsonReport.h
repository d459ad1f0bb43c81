// Writes a report for other programs.
#ifndef RECEIVER_JSONREPORT_H
#define RECEIVER_JSONREPORT_H

#include <cstdio>

#include "Report.h"

namespace receiver {

// Writes one JSON object (RFC 8259) with a final line feed. It writes piece by piece, so that a
// large object needs no more memory. Numbers that the stream does not contain are null; texts and
// times that it does not contain are empty.
void WriteJson(const Report &report, std::FILE *out);

}  // namespace receiver

#endif
