// The calendar rule is that of EN 300 468, annex C, in integers. Factors of 100 and 10000 replace
// the decimal fractions of its constants.
#include "BroadcastTime.h"

#include <cstdio>
#include <cstdlib>
#include <tuple>

#include "Varnek_Time.h"

namespace receiver {
namespace {

constexpr int kFirstDay = 15079;  // 1900-03-01

// Decodes two decimal digits; -1 when one is above 9.
int DecodeBcdByte(uint32_t byte) {
    const int tens = static_cast<int>((byte >> 4) & 0x0F);
    const int units = static_cast<int>(byte & 0x0F);
    return tens > 9 || units > 9 ? -1 : tens * 10 + units;
}

}  // namespace

std::optional<int> DecodeBcdTime(uint32_t bcd) {
    const int hours = DecodeBcdByte(bcd >> 16);
    const int minutes = DecodeBcdByte(bcd >> 8);
    const int seconds = DecodeBcdByte(bcd);
    if (hours < 0 || minutes < 0 || minutes > 59 || seconds < 0 || seconds > 59) {
        return std::nullopt;
    }
    return (hours * 60 + minutes) * 60 + seconds;
}

std::optional<DateTime> DecodeDateTime(uint16_t mjd, uint32_t bcd) {
    const std::optional<int> time = DecodeBcdTime(bcd);
    const int day = mjd;
    if (!time || *time >= 24 * 3600 || day < kFirstDay) {
        return std::nullopt;
    }
    const int year = (day * 100 - 1507820) / 36525;
    const int year_days = year * 36525 / 100;
    const int month = (day * 10 - 149561 - year_days * 10) * 1000 / 306001;
    const int month_days = month * 306001 / 10000;
    const int wrap = month >= 14 ? 1 : 0;
    return DateTime{1900 + year + wrap, month - 1 - wrap * 12, day - 14956 - year_days - month_days,
                    *time / 3600,       *time / 60 % 60,       *time % 60};
}

std::optional<DateTime> Shifted(const DateTime &time, int seconds) {
    VarnekCDateTime point = {time.year, time.month, time.day, time.hour, time.minute, time.second};
    const VarnekCDateTime span = {0, 0, 0, 0, 0, std::abs(seconds)};
    const uint32_t elapsed = VarnekPGL_DateTimeToSeconds(&point);
    // The library returns 0 seconds for a point outside its calendar.
    if (elapsed == 0 || (seconds < 0 && elapsed < span.GetElapsedSeconds())) {
        return std::nullopt;
    }
    if (seconds < 0) {
        point -= span;
    } else {
        point += span;
    }
    if (VarnekPGL_DateTimeToSeconds(&point) == 0) {
        return std::nullopt;
    }
    return DateTime{point.iYear, point.iMonth,  point.iDay,
                    point.iHour, point.iMinute, point.iSecond};
}

std::string ToText(const std::optional<DateTime> &time) {
    if (!time) {
        return {};
    }
    char text[80];
    std::snprintf(text, sizeof text, "%04d-%02d-%02d %02d:%02d:%02d", time->year, time->month,
                  time->day, time->hour, time->minute, time->second);
    return text;
}

std::string ToText(const std::optional<int> &seconds) {
    if (!seconds) {
        return {};
    }
    char text[40];
    std::snprintf(text, sizeof text, "%02d:%02d:%02d", *seconds / 3600, *seconds / 60 % 60,
                  *seconds % 60);
    return text;
}

bool operator<(const DateTime &left, const DateTime &right) {
    return std::tie(left.year, left.month, left.day, left.hour, left.minute, left.second) <
           std::tie(right.year, right.month, right.day, right.hour, right.minute, right.second);
}

}  // namespace receiver
