// The four date and time conversions, called as a caller calls them.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>

#include "monthnames.h"
#include "qoraio32.h"

namespace {

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kInf = std::numeric_limits<double>::infinity();

double DateOf(int day, int month, int year) {
    double date = -1.0;
    EXPECT_EQ(qoraConvertDate(day, month, year, &date), QORA_STATUS_OK)
        << day << "." << month << "." << year;
    return date;
}

struct Ymd {
    int day = -7, month = -7, year = -7;
};

int Split(double date, Ymd* out) {
    return qoraConvertQORADate(&out->day, &out->month, &out->year, date);
}

TEST(ConvertDate, KnownDates) {
    EXPECT_EQ(DateOf(14, 10, 1582), 0.0);
    EXPECT_EQ(DateOf(15, 10, 1582), 86400.0);
    EXPECT_EQ(DateOf(1, 1, 1970), 12219379200.0);
    EXPECT_EQ(DateOf(29, 2, 2000), 13171161600.0);
    EXPECT_EQ(DateOf(29, 2, 1600), DateOf(28, 2, 1600) + 86400.0);
    EXPECT_EQ(DateOf(1, 3, 2000), DateOf(29, 2, 2000) + 86400.0);
    EXPECT_EQ(DateOf(31, 12, 9999), 265621593600.0);
}

TEST(ConvertDate, RefusesInvalidDatesAndLeavesZero) {
    const int bad[][3] = {{13, 10, 1582}, {1, 1, 1582},  {29, 2, 1900}, {29, 2, 2100},
                          {30, 2, 2000},  {31, 4, 2000}, {31, 6, 2000}, {31, 9, 2000},
                          {31, 11, 2000}, {1, 1, 10000}, {1, 1, 1581},  {0, 1, 2000},
                          {32, 1, 2000},  {1, 0, 2000},  {1, 13, 2000}, {-1, -1, -1}};
    for (const auto& d : bad) {
        double date = 123.0;
        EXPECT_EQ(qoraConvertDate(d[0], d[1], d[2], &date), QORA_STATUS_BAD_DATE)
            << d[0] << "." << d[1] << "." << d[2];
        EXPECT_EQ(date, 0.0);
    }
    EXPECT_EQ(qoraConvertDate(1, 1, 2000, nullptr), QORA_STATUS_BAD_DATE);
}

TEST(ConvertQORADate, KnownValues) {
    Ymd d;
    ASSERT_EQ(Split(0.0, &d), QORA_STATUS_OK);
    EXPECT_EQ(d.day, 14);
    EXPECT_EQ(d.month, 10);
    EXPECT_EQ(d.year, 1582);
    ASSERT_EQ(Split(86399.0, &d), QORA_STATUS_OK);
    EXPECT_EQ(d.day, 14);
    EXPECT_EQ(d.month, 10);
    EXPECT_EQ(d.year, 1582);
    ASSERT_EQ(Split(86400.0, &d), QORA_STATUS_OK);
    EXPECT_EQ(d.day, 15);
    EXPECT_EQ(d.month, 10);
    EXPECT_EQ(d.year, 1582);
    ASSERT_EQ(Split(12219379200.0, &d), QORA_STATUS_OK);
    EXPECT_EQ(d.day, 1);
    EXPECT_EQ(d.month, 1);
    EXPECT_EQ(d.year, 1970);
    ASSERT_EQ(Split(-0.0, &d), QORA_STATUS_OK);
    EXPECT_EQ(d.year, 1582);
}

TEST(ConvertQORADate, RoundTripsEveryFewDaysUpToTheLastDate) {
    const double last = 265621593600.0;
    for (double date = 0.0; date <= last; date += 86400.0 * 37) {
        Ymd d;
        ASSERT_EQ(Split(date + 43200.5, &d), QORA_STATUS_OK) << date;
        ASSERT_EQ(DateOf(d.day, d.month, d.year), date) << d.day << "." << d.month << "." << d.year;
    }
}

TEST(ConvertQORADate, SplitsDatesBeyondTheLastYearWithoutOverflow) {
    Ymd d;
    ASSERT_EQ(Split(265621593600.0 + 86400.0, &d), QORA_STATUS_OK);
    EXPECT_EQ(d.day, 1);
    EXPECT_EQ(d.month, 1);
    EXPECT_EQ(d.year, 10000);
    // Day counts where 32-bit arithmetic would overflow still give a calendar date.
    ASSERT_EQ(Split(600000000.0 * 86400.0, &d), QORA_STATUS_OK);
    EXPECT_GT(d.year, 1000000);
    EXPECT_GE(d.month, 1);
    EXPECT_LE(d.month, 12);
    EXPECT_GE(d.day, 1);
    EXPECT_LE(d.day, 31);
}

TEST(ConvertQORADate, RefusesAndLeavesOutputsUntouched) {
    for (double date : {-1.0, -86400.0, kNaN, -kInf, kInf, 1e300, 9.3e18, 1e17}) {
        Ymd d;
        EXPECT_EQ(Split(date, &d), QORA_STATUS_BAD_DATE) << date;
        EXPECT_EQ(d.day, -7);
        EXPECT_EQ(d.month, -7);
        EXPECT_EQ(d.year, -7);
    }
    int day, month;
    EXPECT_EQ(qoraConvertQORADate(&day, &month, nullptr, 0.0), QORA_STATUS_BAD_DATE);
}

TEST(ConvertTime, ComputesSecondsAndRefusesBadFields) {
    double time = -1.0;
    ASSERT_EQ(qoraConvertTime(1, 2, 3, 4.5, &time), QORA_STATUS_OK);
    EXPECT_EQ(time, 93784.5);
    ASSERT_EQ(qoraConvertTime(0, 23, 59, 59.999, &time), QORA_STATUS_OK);
    EXPECT_DOUBLE_EQ(time, 86399.999);
    ASSERT_EQ(qoraConvertTime(2147483647, 23, 59, 0.0, &time), QORA_STATUS_OK);
    EXPECT_EQ(time, (2147483647.0 * 24 + 23) * 3600 + 59 * 60);

    const struct {
        int day, hour, minute;
        double second;
    } bad[] = {{0, 0, 0, 60.0}, {0, 0, 0, -0.5}, {0, 0, 0, kNaN}, {0, 0, 0, kInf}, {-1, 0, 0, 0.0},
               {0, 24, 0, 0.0}, {0, -1, 0, 0.0}, {0, 0, 60, 0.0}, {0, 0, -1, 0.0}};
    for (const auto& b : bad) {
        time = 7.0;
        EXPECT_EQ(qoraConvertTime(b.day, b.hour, b.minute, b.second, &time), QORA_STATUS_BAD_TIME)
            << b.day << " " << b.hour << " " << b.minute << " " << b.second;
        EXPECT_EQ(time, 7.0);
    }
    EXPECT_EQ(qoraConvertTime(0, 0, 0, 0.0, nullptr), QORA_STATUS_BAD_TIME);
}

TEST(ConvertQORATime, SplitsSecondsKeepingFractions) {
    int day = -1, hour = -1, minute = -1;
    double second = -1.0;
    ASSERT_EQ(qoraConvertQORATime(&day, &hour, &minute, &second, 93784.5), QORA_STATUS_OK);
    EXPECT_EQ(day, 1);
    EXPECT_EQ(hour, 2);
    EXPECT_EQ(minute, 3);
    EXPECT_EQ(second, 4.5);
    ASSERT_EQ(qoraConvertQORATime(&day, &hour, &minute, &second, 86399.25), QORA_STATUS_OK);
    EXPECT_EQ(day, 0);
    EXPECT_EQ(hour, 23);
    EXPECT_EQ(minute, 59);
    EXPECT_EQ(second, 59.25);
    ASSERT_EQ(qoraConvertQORATime(&day, &hour, &minute, &second, 0.0), QORA_STATUS_OK);
    EXPECT_EQ(day, 0);
    EXPECT_EQ(hour, 0);
    EXPECT_EQ(minute, 0);
    EXPECT_EQ(second, 0.0);
    const double lastDay = 2147483647.0 * 86400;
    ASSERT_EQ(qoraConvertQORATime(&day, &hour, &minute, &second, lastDay + 3661.0), QORA_STATUS_OK);
    EXPECT_EQ(day, 2147483647);
    EXPECT_EQ(hour, 1);
    EXPECT_EQ(minute, 1);
    EXPECT_EQ(second, 1.0);
}

TEST(ConvertQORATime, RefusesAndLeavesOutputsUntouched) {
    for (double time : {-1.0, -1e-300, kNaN, kInf, 1e300, 2147483648.0 * 86400}) {
        int day = -7, hour = -7, minute = -7;
        double second = -7.0;
        EXPECT_EQ(qoraConvertQORATime(&day, &hour, &minute, &second, time), QORA_STATUS_BAD_TIME)
            << time;
        EXPECT_EQ(day, -7);
        EXPECT_EQ(hour, -7);
        EXPECT_EQ(minute, -7);
        EXPECT_EQ(second, -7.0);
    }
    int day, hour;
    double second;
    EXPECT_EQ(qoraConvertQORATime(&day, &hour, nullptr, &second, 1.0), QORA_STATUS_BAD_TIME);
}

TEST(MonthNames, CoverTheTwelveMonthsOnly) {
    EXPECT_STREQ(MonthAbbreviation(1), "Jan");
    EXPECT_STREQ(MonthAbbreviation(5), "May");
    EXPECT_STREQ(MonthAbbreviation(12), "Dec");
    EXPECT_EQ(MonthAbbreviation(0), nullptr);
    EXPECT_EQ(MonthAbbreviation(13), nullptr);
}

}  // namespace
