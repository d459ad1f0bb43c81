// Compares the calendar with the C library's, spans and comparisons with their definitions, and reads a clock that the
// tests set.
#include "Varnek_Time.h"

#include <sys/time.h>

#include <array>
#include <cstring>
#include <ctime>

#include "support/VarnekTest.h"

namespace {

using ::testing::ElementsAre, ::testing::IsEmpty, ::testing::SizeIs;

time_t gNow = -1;  // the clock's time if a test set it, or else -1

class Time : public VarnekTest {};

std::array<int32_t, 6> Fields(const VarnekCDateTime &dt) {
    std::array<int32_t, 6> fields;
    memcpy(fields.data(), &dt, sizeof fields);
    return fields;
}

TEST_F(Time, TheCalendarIsTheCLibrarys) {
    for (time_t day = 0; day < 1924992000; day += 86400) {
        for (const int second : {0, 1, 59, 60, 3599, 3600, 43200, 86399}) {
            const time_t seconds = day + second;
            tm c = {};
            gmtime_r(&seconds, &c);
            VarnekCDateTime dt;
            ASSERT_EQ(VarnekPGL_SecondsToDataTime(static_cast<uint32_t>(seconds), &dt), TRUE);
            ASSERT_THAT(Fields(dt),
                        ElementsAre(c.tm_year + 1900, c.tm_mon + 1, c.tm_mday, c.tm_hour, c.tm_min, c.tm_sec));
            ASSERT_EQ(VarnekPGL_DateTimeToSeconds(&dt), static_cast<uint32_t>(seconds));
        }
    }
    std::mt19937 random(1582);
    const auto pick = [&random](int low, int high) { return std::uniform_int_distribution<int>(low, high)(random); };
    for (int i = 0; i < 20000; ++i) {
        const VarnekCDateTime dt = {pick(1969, 2031), pick(0, 13),       pick(-800, 800),
                                    pick(-50, 50),    pick(-3000, 3000), pick(-90000, 90000)};
        tm c = {};
        c.tm_year = dt.iYear - 1900;
        c.tm_mon = dt.iMonth - 1;
        c.tm_mday = dt.iDay;
        c.tm_hour = dt.iHour;
        c.tm_min = dt.iMinute;
        c.tm_sec = dt.iSecond;
        const bool counts = dt.iYear >= 1970 && dt.iYear <= 2030 && c.tm_mon >= 0 && c.tm_mon <= 11;
        ASSERT_EQ(VarnekPGL_DateTimeToSeconds(&dt), counts ? static_cast<uint32_t>(timegm(&c)) : 0u);
    }
}

TEST_F(Time, SpansCountFromZero) {
    const struct {
        int span[3], end[3];  // years, months and days, and the date that much later than 1970-01-01
    } rows[] = {
        {{0, 0, 0}, {1970, 1, 1}},   {{0, 1, 30}, {1970, 2, 31}},   {{0, 0, 40}, {1970, 1, 41}},
        {{0, 1, 31}, {1970, 3, 1}},  {{0, 2, 27}, {1970, 3, 28}},   {{2, 2, 28}, {1972, 4, 1}},
        {{0, 4, 29}, {1970, 5, 30}}, {{0, 11, 29}, {1970, 12, 30}}, {{0, 11, 30}, {1971, 1, 1}},
        {{0, 12, 0}, {1971, 1, 1}},  {{0, 12, 31}, {1971, 1, 1}},   {{0, 30, 31}, {1971, 1, 32}},
        {{60, 12, 0}, {2031, 1, 1}}, {{0, -1, 0}, {1970, 0, 1}},
    };
    for (const auto &[span, end] : rows) {
        const VarnekCDateTime elapsed = {span[0], span[1], span[2], 1, 30, 5},
                              point = {end[0], end[1], end[2], 1, 30, 5};
        EXPECT_EQ(elapsed.GetElapsedSeconds(), VarnekPGL_DateTimeToSeconds(&point))
            << span[0] << " years, " << span[1] << " months, " << span[2];
    }
    EXPECT_THAT(TakeLog(), IsEmpty());
    for (const int32_t year : {INT32_MIN, -1, 100, 1969}) {
        EXPECT_EQ((VarnekCDateTime{year, 3, 3, 3, 3, 3}.GetElapsedSeconds()), 0u);
        EXPECT_EQ(TakeErrors().back(), "Invalid Year!! iYear=[" + std::to_string(year) + "]\n");
    }
}

TEST_F(Time, ArithmeticCountsSeconds) {
    const VarnekCDateTime early = {2015, 6, 1, 10, 30, 0}, noon = {2015, 6, 1, 12, 0, 0};
    VarnekCDateTime dt = early, span = {0, 0, 0, 1, 30, 0};
    EXPECT_EQ(early + span, noon);
    EXPECT_EQ(dt += span, noon);
    EXPECT_EQ(dt -= early, (VarnekCDateTime{1970, 1, 1, 1, 30, 0}));
    EXPECT_EQ(dt += dt, (VarnekCDateTime{1970, 1, 1, 3, 0, 0}));
    EXPECT_THAT(TakeLog(), IsEmpty());
    EXPECT_EQ((dt = early) -= noon, early);
    EXPECT_THAT(TakeErrors(), ElementsAre("Time Information Invalid! This Time=[1433154600], Arg "
                                          "Time=[1433160000]\n"));
    EXPECT_EQ(VarnekPGL_AddDateTime(&dt, &span, &dt), TRUE);
    EXPECT_EQ(dt, noon);
    EXPECT_EQ(span, (VarnekCDateTime{1970, 1, 1, 1, 30, 0}));
    const int dates[][3] = {{2015, 6, 0}, {2015, 6, 32}, {2015, 0, 1}, {2015, 13, 1}, {1969, 6, 1}};
    for (const auto &date : dates) {
        dt = {date[0], date[1], date[2], 0, 0, 0};
        EXPECT_EQ(VarnekPGL_AddDateTime(&span, &dt, &span), TRUE);
        EXPECT_EQ(dt, (VarnekCDateTime{1970, 1, 1, 0, 0, 0}));
    }
    EXPECT_EQ(span, (VarnekCDateTime{1970, 1, 1, 1, 30, 0}));
}

TEST_F(Time, ComparisonsTakeTheFirstFieldThatDiffers) {
    std::mt19937 random(365);
    const auto pick = [&random] { return static_cast<int32_t>(random() % 3) - 1; };
    for (int i = 0; i < 20000; ++i) {
        const VarnekCDateTime a = {1970, pick(), 0, pick(), pick(), pick()},
                              b = {1970, pick(), 0, pick(), pick(), pick()};
        const auto x = Fields(a), y = Fields(b);
        ASSERT_THAT((std::array<BOOL, 5>{a == b, a<b, a <= b, a> b, a >= b}),
                    ElementsAre(x == y, x<y, x <= y, x> y, x >= y));
    }
}

TEST_F(Time, TheClockIsReadInUtcAndInItsZone) {
    VarnekCDateTime dt;
    const struct {
        const char *zone;
        time_t now;
        int32_t seconds, milliseconds, offset;
    } rows[] = {
        {"BRT3", 1433154605, 1433154605, 500, -10800},
        {"NPT-5:45", 1924971299, 1924971299, 500, 20700},
        // The calendar ends with 2030: no local time is known any more, and the last day repeats itself.
        {"PHT-8", 1924991999, 1924991999, 500, -1924991999},
        {"UTC0", 1924992000 + 86400 * 3 + 7, 1924905607, 0, -1925251207},
    };
    for (const auto &[zone, now, seconds, milliseconds, offset] : rows) {
        setenv("TZ", zone, 1);
        tzset();
        gNow = now;
        PglMilliTime time = {};
        EXPECT_EQ(VarnekPGL_GetMilliseconds(&time), TRUE);
        EXPECT_TRUE(time.sec == seconds && time.msec == milliseconds) << zone;
        EXPECT_EQ(VarnekPGL_GetTime(), now);
        EXPECT_EQ(VarnekPGL_GetTimezoneOffset(), offset);
        EXPECT_EQ(VarnekPGL_GetSystemTime(&dt), TRUE);
        EXPECT_EQ(dt.iSecond, now % 60);
    }
    // Not every C library knows summer time by the rule alone.
    setenv("TZ", "BRT3BRST,M10.3.0/0,M2.3.0/0", 1);
    tzset();
    gNow = 1420113600;
    tm local = {};
    ASSERT_NE(localtime_r(&gNow, &local), nullptr);
    EXPECT_EQ(VarnekPGL_GetTimezoneOffset(), local.tm_gmtoff);
    EXPECT_THAT(TakeLog(), IsEmpty());
    if (sizeof(time_t) > 4) {
        gNow = static_cast<time_t>(INT64_MAX / 2);
        EXPECT_EQ(VarnekPGL_GetTimezoneOffset(), 0);
        EXPECT_EQ(TakeErrors().back(), "***** VarnekPGL_GetTimezoneOffset : Get Local Time FAIL, errno = [" +
                                           std::to_string(EOVERFLOW) + "]");
    }
    gNow = -2;
    PglMilliTime untouched = {7, 8};
    EXPECT_EQ(VarnekPGL_GetMilliseconds(&untouched), FALSE);
    EXPECT_TRUE(untouched.sec == 7 && untouched.msec == 8);
}

TEST_F(Time, NullRecordsAreReported) {
    VarnekCDateTime dt = {2015, 6, 1, 0, 0, 0};
    EXPECT_EQ(VarnekPGL_GetMilliseconds(nullptr), FALSE);
    EXPECT_EQ(VarnekPGL_GetSystemTime(nullptr), FALSE);
    EXPECT_EQ(VarnekPGL_SecondsToDataTime(0, nullptr), FALSE);
    EXPECT_EQ(VarnekPGL_AddDateTime(&dt, nullptr, &dt), FALSE);
    EXPECT_THAT(TakeBodies("Varnek"), SizeIs(4));
    EXPECT_EQ(VarnekPGL_DateTimeToSeconds(nullptr), 0u);
}

}  // namespace

// The C library's declarations.
#ifdef __GLIBC__
using ZonePointer = void *;
#define CLOCK_NOEXCEPT noexcept
#else
using ZonePointer = struct timezone *;
#define CLOCK_NOEXCEPT
#endif

// The clock of the whole process, including the library. It cannot be read when gNow is -2.
extern "C" int gettimeofday(timeval *out, ZonePointer) CLOCK_NOEXCEPT {
    timespec now = {};
    clock_gettime(CLOCK_REALTIME, &now);
    out->tv_sec = gNow != -1 ? gNow : now.tv_sec;
    out->tv_usec = gNow != -1 ? 500999 : static_cast<suseconds_t>(now.tv_nsec / 1000);
    return gNow == -2 ? -1 : 0;
}

extern "C" time_t time(time_t *out) CLOCK_NOEXCEPT {
    timeval now = {};
    gettimeofday(&now, nullptr);
    return out != nullptr ? *out = now.tv_sec : now.tv_sec;
}
