// Dates are seconds since 14 October 1582 00:00 in the proleptic Gregorian
// calendar; times of day and durations are plain seconds.
#include <cmath>
#include <cstdint>
#include <limits>

#include "calendar.h"
#include "qoraio32.h"

namespace {

constexpr double kSecondsPerDay = 86400.0;
// 2^63: from here on a date has no 64-bit second count.
constexpr double kDateLimit = 9223372036854775808.0;

bool IsLeapYear(int year) { return year % 4 == 0 && (year % 100 != 0 || year % 400 == 0); }

int DaysInMonth(int month, int year) {
    static const int kDays[12] = {31, 29, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
    return month == 2 && !IsLeapYear(year) ? 28 : kDays[month - 1];
}

}  // namespace

int QORA_API qoraConvertDate(int day, int month, int year, double* date) {
    if (date == nullptr) return QORA_STATUS_BAD_DATE;
    *date = 0.0;
    if (month < 1 || month > 12 || year < 1582 || year > 9999 || day < 1 ||
        day > DaysInMonth(month, year))
        return QORA_STATUS_BAD_DATE;
    const int64_t days = GregorianDays(year, month, day);
    if (days < 0) return QORA_STATUS_BAD_DATE;
    *date = static_cast<double>(days) * kSecondsPerDay;
    return QORA_STATUS_OK;
}

// The day count is taken in 64 bits, so that dates far beyond year 9999 still
// split correctly; a date whose year would not fit its output is refused.
int QORA_API qoraConvertQORADate(int* day, int* month, int* year, double date) {
    if (day == nullptr || month == nullptr || year == nullptr || !(date >= 0.0) ||
        !(date < kDateLimit))
        return QORA_STATUS_BAD_DATE;
    int64_t fullYear;
    int fullMonth, fullDay;
    GregorianDate(static_cast<int64_t>(date) / 86400, &fullYear, &fullMonth, &fullDay);
    if (fullYear > std::numeric_limits<int>::max()) return QORA_STATUS_BAD_DATE;
    *day = fullDay;
    *month = fullMonth;
    *year = static_cast<int>(fullYear);
    return QORA_STATUS_OK;
}

int QORA_API qoraConvertTime(int day, int hour, int minute, double second, double* time) {
    if (time == nullptr || day < 0 || hour < 0 || hour > 23 || minute < 0 || minute > 59 ||
        !(second >= 0.0 && second < 60.0))
        return QORA_STATUS_BAD_TIME;
    *time = ((static_cast<double>(day) * 24 + hour) * 60 + minute) * 60 + second;
    return QORA_STATUS_OK;
}

// A time whose day count does not fit the day output is refused.
int QORA_API qoraConvertQORATime(int* day, int* hour, int* minute, double* second, double time) {
    if (day == nullptr || hour == nullptr || minute == nullptr || second == nullptr ||
        !(time >= 0.0) || !(time / kSecondsPerDay < 2147483648.0))
        return QORA_STATUS_BAD_TIME;
    *day = static_cast<int>(time / kSecondsPerDay);
    *second = std::fmod(time, 60.0);
    const int minutes = static_cast<int>(std::fmod(time, kSecondsPerDay) / 60.0);
    *hour = minutes / 60;
    *minute = minutes % 60;
    return QORA_STATUS_OK;
}
