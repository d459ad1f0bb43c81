// Shows a report to people.
#ifndef RECEIVER_SUMMARY_H
#define RECEIVER_SUMMARY_H

#include <string>

#include "Report.h"

namespace receiver {

// UTF-8, about a screen, with a final line feed.
std::string ToSummary(const Report &report);

}  // namespace receiver

#endif
