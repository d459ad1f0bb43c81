// The clock, the calendar and the arithmetic on records. In the supported range every fourth year
// is a leap year, so the calendar repeats every 1461 days. All additions of seconds are modulo
// 2^32.
#include "Varnek_Time.h"

#include <errno.h>
#include <stddef.h>
#include <sys/time.h>
#include <time.h>

#include <tuple>

#include "Varnek_Trace.h"

// Callers and library agree on these records.
static_assert(sizeof(VarnekCDateTime) == 24 && offsetof(VarnekCDateTime, iSecond) == 20);
static_assert(sizeof(PglMilliTime) == 8);

namespace {

constexpr int32_t kFirstYear = 1970;
constexpr int32_t kLastYear = 2030;
constexpr int32_t kLastSpanYear = 99;

constexpr uint32_t kDay = 86400;
constexpr uint32_t kYear = 365 * kDay;
constexpr uint32_t kLeapYear = 366 * kDay;
constexpr uint32_t kCycle = 3 * kYear + kLeapYear;

constexpr int64_t kEndOfRange = 1924992000;  // 2031-01-01
constexpr int64_t kLastDay = kEndOfRange - kDay;

// The number of days before each month, minus one, because the days of a month count from 1.
constexpr int32_t kCommonMonths[] = {-1, 30, 58, 89, 119, 150, 180, 211, 242, 272, 303, 333, 364};
constexpr int32_t kLeapMonths[] = {-1, 30, 59, 90, 120, 151, 181, 212, 243, 273, 304, 334, 365};

// The fields in the order in which they are compared.
auto Fields(const VarnekCDateTime &dt) {
    return std::tie(dt.iYear, dt.iMonth, dt.iDay, dt.iHour, dt.iMinute, dt.iSecond);
}

// Whether `days` whole days fill the month with this number; a month outside 1 to 12 is never full.
bool FillsMonth(int32_t month, int32_t days) {
    return month >= 1 && month <= 12 && days >= kCommonMonths[month] - kCommonMonths[month - 1];
}

// Replaces an invalid date with 1970-01-01.
void RepairDate(VarnekCDateTime *dt) {
    if (__VarnekPGL_ValidateDate(dt) == TRUE) {
        return;
    }
    dt->iYear = kFirstYear;
    dt->iMonth = 1;
    dt->iDay = 1;
}

}  // namespace

int32_t VarnekPGL_GetTime() {
    return static_cast<int32_t>(time(nullptr));
}

BOOL VarnekPGL_GetMilliseconds(PglMilliTime *out) {
    if (out == nullptr) {
        VARNEK_PANIC();
        return FALSE;
    }
    timeval now = {};
    if (gettimeofday(&now, nullptr) != 0) {
        return FALSE;
    }
    const int64_t sec = now.tv_sec;
    const bool isBeyond = sec >= kEndOfRange;
    out->sec = static_cast<int32_t>(isBeyond ? kLastDay + (sec - kEndOfRange) % kDay : sec);
    out->msec = isBeyond ? 0 : static_cast<int32_t>(now.tv_usec / 1000);
    return TRUE;
}

BOOL VarnekPGL_GetSystemTime(VarnekCDateTime *dt) {
    return VarnekPGL_SecondsToDataTime(static_cast<uint32_t>(time(nullptr)), dt);
}

int32_t VarnekPGL_GetTimezoneOffset() {
    const time_t now = time(nullptr);
    tm local = {};
    if (localtime_r(&now, &local) == nullptr) {
        return VARNEK_FAIL(0,
                           "***** VarnekPGL_GetTimezoneOffset : Get Local Time FAIL, errno = [%d]",
                           VarnekPGL_SysGetLastErro());
    }
    const VarnekCDateTime dt = {local.tm_year + 1900, local.tm_mon + 1, local.tm_mday,
                                local.tm_hour,        local.tm_min,     local.tm_sec};
    return static_cast<int32_t>(VarnekPGL_DateTimeToSeconds(&dt) - static_cast<uint32_t>(now));
}

uint32_t VarnekPGL_DateTimeToSeconds(const VarnekCDateTime *dt) {
    if (dt == nullptr) {
        return 0;
    }
    const uint32_t year = static_cast<uint32_t>(dt->iYear) - kFirstYear;
    const uint32_t month = static_cast<uint32_t>(dt->iMonth) - 1;
    if (year > kLastYear - kFirstYear || month > 11) {
        return 0;
    }
    // The third year has the first leap day; from March on it has passed.
    const uint32_t leapDays = (year + (month >= 2 ? 2 : 1)) / 4;
    const uint32_t days = year * 365 + leapDays + static_cast<uint32_t>(kCommonMonths[month]) +
                          static_cast<uint32_t>(dt->iDay);
    const uint32_t minutes =
        (days * 24 + static_cast<uint32_t>(dt->iHour)) * 60 + static_cast<uint32_t>(dt->iMinute);
    return minutes * 60 + static_cast<uint32_t>(dt->iSecond);
}

BOOL VarnekPGL_SecondsToDataTime(uint32_t seconds, VarnekCDateTime *dt) {
    if (dt == nullptr) {
        VARNEK_PANIC();
        return FALSE;
    }
    const uint32_t cycle = seconds / kCycle;
    uint32_t rest = seconds % kCycle;
    // The third year of a cycle is its leap year.
    uint32_t year = 0;
    const int32_t *months = kCommonMonths;
    if (rest >= 2 * kYear + kLeapYear) {
        year = 3;
        rest -= 2 * kYear + kLeapYear;
    } else if (rest >= 2 * kYear) {
        year = 2;
        rest -= 2 * kYear;
        months = kLeapMonths;
    } else if (rest >= kYear) {
        year = 1;
        rest -= kYear;
    }
    const int32_t day = static_cast<int32_t>(rest / kDay);
    // No month is longer than 31 days, so this is the right month or an earlier one.
    int32_t month = day / 32 + 1;
    while (months[month] < day) {
        ++month;
    }
    const int32_t second = static_cast<int32_t>(rest % kDay);
    dt->iYear = kFirstYear + static_cast<int32_t>(4 * cycle + year);
    dt->iMonth = month;
    dt->iDay = day - months[month - 1];
    dt->iHour = second / 3600;
    dt->iMinute = second % 3600 / 60;
    dt->iSecond = second % 60;
    return TRUE;
}

BOOL __VarnekPGL_ValidateDate(const VarnekCDateTime *dt) {
    return dt != nullptr && dt->iDay >= 1 && dt->iDay <= 31 && dt->iMonth >= 1 &&
                   dt->iMonth <= 12 && dt->iYear >= kFirstYear
               ? TRUE
               : FALSE;
}

BOOL VarnekPGL_AddDateTime(VarnekCDateTime *a, VarnekCDateTime *b, VarnekCDateTime *result) {
    if (a == nullptr || b == nullptr || result == nullptr) {
        VARNEK_PANIC();
        return FALSE;
    }
    RepairDate(a);
    RepairDate(b);
    return VarnekPGL_SecondsToDataTime(
        VarnekPGL_DateTimeToSeconds(a) + VarnekPGL_DateTimeToSeconds(b), result);
}

uint32_t VarnekCDateTime::GetElapsedSeconds() const {
    if (iYear >= kFirstYear) {
        return VarnekPGL_DateTimeToSeconds(this);
    }
    if (iYear < 0 || iYear > kLastSpanYear) {
        return VARNEK_FAIL(0u, "Invalid Year!! iYear=[%d]\n", iYear);
    }
    // The point that far after 1970-01-01. A point counts days and months from 1, so it has one
    // more of each than have passed.
    const bool isFull = FillsMonth(iMonth, iDay);
    const int32_t passed = iMonth + (isFull ? 1 : 0);
    VarnekCDateTime point = *this;
    point.iYear = iYear + kFirstYear + (passed >= 12 ? 1 : 0);
    point.iMonth = passed >= 12 ? 1 : passed + 1;
    point.iDay = isFull ? 1 : static_cast<int32_t>(static_cast<uint32_t>(iDay) + 1);
    return VarnekPGL_DateTimeToSeconds(&point);
}

VarnekCDateTime &VarnekCDateTime::operator+=(const VarnekCDateTime &other) {
    VarnekPGL_SecondsToDataTime(GetElapsedSeconds() + other.GetElapsedSeconds(), this);
    return *this;
}

VarnekCDateTime &VarnekCDateTime::operator-=(const VarnekCDateTime &other) {
    const uint32_t a = GetElapsedSeconds();
    const uint32_t b = other.GetElapsedSeconds();
    if (a < b) {
        TRACE_ERROR("Time Information Invalid! This Time=[%u], Arg Time=[%u]\n", a, b);
        return *this;
    }
    VarnekPGL_SecondsToDataTime(a - b, this);
    return *this;
}

VarnekCDateTime VarnekCDateTime::operator+(const VarnekCDateTime &other) const {
    VarnekCDateTime sum;
    VarnekPGL_SecondsToDataTime(GetElapsedSeconds() + other.GetElapsedSeconds(), &sum);
    return sum;
}

BOOL VarnekCDateTime::operator==(const VarnekCDateTime &other) const {
    return Fields(*this) == Fields(other) ? TRUE : FALSE;
}

BOOL VarnekCDateTime::operator>(const VarnekCDateTime &other) const {
    return Fields(*this) > Fields(other) ? TRUE : FALSE;
}

BOOL VarnekCDateTime::operator>=(const VarnekCDateTime &other) const {
    return Fields(*this) >= Fields(other) ? TRUE : FALSE;
}

BOOL VarnekCDateTime::operator<(const VarnekCDateTime &other) const {
    return Fields(*this) < Fields(other) ? TRUE : FALSE;
}

BOOL VarnekCDateTime::operator<=(const VarnekCDateTime &other) const {
    return Fields(*this) <= Fields(other) ? TRUE : FALSE;
}
