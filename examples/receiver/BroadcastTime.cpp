// The calendar rule is that of EN 300 468, annex C, with factors of 100 and 10000 instead of the
// decimal fractions of its constants.
#include "BroadcastTime.h"

#include "Names.h"

namespace receiver {
namespace {

constexpr int kDaySeconds = 24 * 3600;
constexpr int kFirstDay = 15079;  // 1900-03-01

// Decodes two decimal digits; -1 if one is above 9.
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
    if (!time || *time >= kDaySeconds || mjd < kFirstDay) {
        return std::nullopt;
    }
    return DateTime{mjd} * kDaySeconds + *time;
}

std::string ToText(const std::optional<DateTime> &time) {
    if (!time || *time < DateTime{kFirstDay} * kDaySeconds) {
        return {};
    }
    const int day = static_cast<int>(*time / kDaySeconds);
    const int year = (day * 100 - 1507820) / 36525;
    const int year_days = year * 36525 / 100;
    const int month = (day * 10 - 149561 - year_days * 10) * 1000 / 306001;
    const int month_days = month * 306001 / 10000;
    const int wrap = month >= 14 ? 1 : 0;
    return Format("%04d-%02d-%02d ", 1900 + year + wrap, month - 1 - wrap * 12,
                  day - 14956 - year_days - month_days) +
           ToText(std::optional(static_cast<int>(*time % kDaySeconds)));
}

std::string ToText(const std::optional<int> &seconds) {
    return seconds ? Format("%02d:%02d:%02d", *seconds / 3600, *seconds / 60 % 60, *seconds % 60)
                   : std::string();
}

}  // namespace receiver
