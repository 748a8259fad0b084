#include "calendar.h"

namespace {

// Julian day numbers: the origin of the arithmetic below, and day 0.
constexpr int64_t kJulianOrigin = 1721119;
constexpr int64_t kJulianDayZero = 2299160;

// Built into the library image, so ready before any code runs.
const char* const kMonthAbbreviations[12] = {"Jan", "Feb", "Mar", "Apr", "May", "Jun",
                                             "Jul", "Aug", "Sep", "Oct", "Nov", "Dec"};

}  // namespace

// The year is counted from March, so that the leap day ends it; 146097 days
// make 400 years, 1461 days 4 years, 153 days a group of 5 months.
int64_t GregorianDays(int64_t year, int month, int day) {
    const int64_t m = month >= 3 ? month - 3 : month + 9;
    const int64_t y = month >= 3 ? year : year - 1;
    const int64_t julian =
        (146097 * (y / 100)) / 4 + (1461 * (y % 100)) / 4 + (153 * m + 2) / 5 + day + kJulianOrigin;
    return julian - kJulianDayZero;
}

void GregorianDate(int64_t days, int64_t* year, int* month, int* day) {
    const int64_t j = (days + (kJulianDayZero - kJulianOrigin)) * 4 - 1;
    const int64_t c = j / 146097;
    const int64_t d = (j % 146097) / 4 * 4 + 3;
    const int64_t y = d / 1461;
    const int64_t e = ((d % 1461) + 4) / 4 * 5 - 3;
    const int64_t m = e / 153;
    *year = 100 * c + y + (m >= 10 ? 1 : 0);
    *month = static_cast<int>(m >= 10 ? m - 9 : m + 3);
    *day = static_cast<int>(((e % 153) + 5) / 5);
}

const char* MonthAbbreviation(int month) {
    return month >= 1 && month <= 12 ? kMonthAbbreviations[month - 1] : nullptr;
}
