// Writes a report for people.
#ifndef RECEIVER_SUMMARY_H
#define RECEIVER_SUMMARY_H

#include <cstddef>
#include <cstdio>

#include "Report.h"

namespace receiver {

// Writes UTF-8, about a screen or two, in lines of at most `width` columns.
void WriteSummary(const Report &report, size_t width, std::FILE *out);

}  // namespace receiver

#endif
