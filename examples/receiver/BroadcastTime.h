// Dates as Modified Julian Day and times as binary-coded decimal, as service information carries
// them.
#ifndef RECEIVER_BROADCASTTIME_H
#define RECEIVER_BROADCASTTIME_H

#include <cstdint>
#include <optional>
#include <string>

namespace receiver {

struct DateTime {
    int year, month, day, hour, minute, second;
};

// A time of day or a duration: six decimal digits hhmmss.
//   returns  seconds; nothing for a digit above 9 or 60 and more minutes or seconds, so also for
//            all ones, which stand for a time that is not known
std::optional<int> DecodeBcdTime(uint32_t bcd);

// A day and a time of day.
//   returns  nothing for a time that DecodeBcdTime refuses or of 24 hours and more, and for days
//            before 1900-03-01, where the calendar rule that broadcasting uses begins
std::optional<DateTime> DecodeDateTime(uint16_t mjd, uint32_t bcd);

// The time that is `seconds` later, or earlier when they are negative.
//   returns  nothing when either time lies outside 1970 to 2030
std::optional<DateTime> Shifted(const DateTime &time, int seconds);

// "YYYY-MM-DD hh:mm:ss" and "hh:mm:ss"; empty when not known.
std::string ToText(const std::optional<DateTime> &time);
std::string ToText(const std::optional<int> &seconds);

bool operator<(const DateTime &left, const DateTime &right);

}  // namespace receiver

#endif
