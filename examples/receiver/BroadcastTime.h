// The formats of service information: dates as Modified Julian Day, times as binary-coded decimal.
#ifndef RECEIVER_BROADCASTTIME_H
#define RECEIVER_BROADCASTTIME_H

#include <cstdint>
#include <optional>
#include <string>

namespace receiver {

// Seconds since the start of Modified Julian Day 0, in the zone that the stream uses. Unlike the
// library's calendar, which ends with 2030, it covers every later date that a stream can express.
using DateTime = int64_t;

// Decodes a time of day or a duration: six decimal digits hhmmss.
//   returns  seconds; nothing if it is not a time, such as all ones, which mean "not known"
std::optional<int> DecodeBcdTime(uint32_t bcd);

// Decodes a day and a time of day.
//   returns  nothing if it is not a time of day or is before 1900-03-01, where the calendar rule of
//            broadcasting begins
std::optional<DateTime> DecodeDateTime(uint16_t mjd, uint32_t bcd);

// Return "YYYY-MM-DD hh:mm:ss" and "hh:mm:ss"; empty for nothing.
std::string ToText(const std::optional<DateTime> &time);
std::string ToText(const std::optional<int> &seconds);

}  // namespace receiver

#endif
