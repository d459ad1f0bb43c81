/// @file
/// Wall-clock time, and the calendar from 1970 to 2030.
///
/// Seconds count from 1970-01-01 00:00:00. Calendar records have no time zone; the conversions take
/// them for UTC. Thread-safe.
/// @see [Guide: time](docs/guide/time.md)
#ifndef VARNEK_TIME_H
#define VARNEK_TIME_H

#include "Varnek_Common.h"

typedef struct VarnekCDateTime VarnekCDateTime;  ///< in C too

/// A date with a time of day, or a span of time.
///
///     iYear            the record is
///     1970 and more    a point in time
///     0 to 99          a span: years, months and days that passed, then hours, minutes, seconds
///     anything else    invalid; counts as 0 seconds
///
/// A point after 2030, which arithmetic can produce, counts as 0 seconds too, without a trace, and
/// so does a span that would end after 2030. Arithmetic gives points: 90 seconds become 1970-01-01
/// 00:01:30, which counts as 90 seconds again.
#ifdef __cplusplus
struct VARNEK_API VarnekCDateTime
#else
struct VarnekCDateTime
#endif
{
    int32_t iYear;    ///< in full, such as 2015
    int32_t iMonth;   ///< 1 to 12
    int32_t iDay;     ///< 1 to 31
    int32_t iHour;    ///< 0 to 23
    int32_t iMinute;  ///< 0 to 59
    int32_t iSecond;  ///< 0 to 59

#ifdef __cplusplus
    /// Returns the seconds of this point or span, tracing an invalid year. In a span, days that
    /// fill month number `iMonth` count as one more month, and 12 months or more as one more year;
    /// the rest is dropped.
    uint32_t GetElapsedSeconds() const;

    /// Adds the seconds of the other record, modulo 2^32. Subtracting too much is traced and
    /// changes nothing.
    VarnekCDateTime &operator+=(const VarnekCDateTime &other);
    VarnekCDateTime &operator-=(const VarnekCDateTime &other);      ///< subtracts
    VarnekCDateTime operator+(const VarnekCDateTime &other) const;  ///< adds

    /// Compares the fields, from the year down.
    BOOL operator==(const VarnekCDateTime &other) const;
    BOOL operator>(const VarnekCDateTime &other) const;   ///< compares
    BOOL operator>=(const VarnekCDateTime &other) const;  ///< compares
    BOOL operator<(const VarnekCDateTime &other) const;   ///< compares
    BOOL operator<=(const VarnekCDateTime &other) const;  ///< compares
#endif
};

/// A point in time, to the millisecond.
typedef struct PglMilliTime {
    int32_t sec;   ///< seconds since 1970
    int32_t msec;  ///< milliseconds, 0 to 999
} PglMilliTime;

#ifdef __cplusplus
extern "C" {
#endif

/// Returns the current time in seconds.
VARNEK_API int32_t VarnekPGL_GetTime(void);

/// Reads the clock to the millisecond. From 2031 on it gives the time of day on the last day of
/// 2030, with 0 milliseconds.
/// @return TRUE; FALSE if the clock cannot be read, and for null after a panic report
VARNEK_API BOOL VarnekPGL_GetMilliseconds(PglMilliTime *out);

/// Fills the record with the current time in UTC.
/// @return TRUE; FALSE for null after a panic report
VARNEK_API BOOL VarnekPGL_GetSystemTime(VarnekCDateTime *dt);

/// Returns local time minus UTC in seconds; 0, after a trace, if local time is not known; from 2031
/// on, the negative of the current time.
VARNEK_API int32_t VarnekPGL_GetTimezoneOffset(void);

/// Counts the seconds from 1970 to a record, simply adding a day, hour, minute or second that is
/// out of range; 0 for null, a year outside 1970 to 2030 and a month outside 1 to 12.
VARNEK_API uint32_t VarnekPGL_DateTimeToSeconds(const VarnekCDateTime *dt);

/// Fills the record with the point this many seconds after the start of 1970.
/// @return TRUE; FALSE for null after a panic report
VARNEK_API BOOL VarnekPGL_SecondsToDataTime(uint32_t seconds, VarnekCDateTime *dt);

/// Says whether a date has day 1 to 31, month 1 to 12 and a year from 1970 on; FALSE for null.
VARNEK_API BOOL __VarnekPGL_ValidateDate(const VarnekCDateTime *dt);

/// Adds two records as seconds. An invalid date becomes 1970-01-01 in the caller's record, so that
/// only its time of day is added. `result` may be one of the two.
/// @return TRUE; FALSE for a null pointer after a panic report
VARNEK_API BOOL VarnekPGL_AddDateTime(VarnekCDateTime *a, VarnekCDateTime *b,
                                      VarnekCDateTime *result);

#ifdef __cplusplus
}
#endif

#endif
