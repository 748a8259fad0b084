// The four date and time conversions, called as a caller calls them. Dates
// count seconds from 14 October 1582; times count seconds from day 0.
#include <gtest/gtest.h>

#include <limits>

#include "qoraio32.h"

namespace {

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kInf = std::numeric_limits<double>::infinity();
constexpr double kLastDate = 265621593600.0;  // 31 December 9999
constexpr double kLastDay = 2147483647.0 * 86400;
constexpr double kU = -7;  // an output left untouched

// kDate: day, month, year -> date (0 on failure). kSplitDate: date -> day,
// month, year. kTime: day, hour, minute, second -> time. kSplitTime: time ->
// day, hour, minute, second. Outputs start at kU; a failure leaves them so,
// but for kDate.
enum Call { kDate, kSplitDate, kTime, kSplitTime };

struct Row {
    Call call;
    double in[4];
    int status;
    double out[4] = {};
};

int Convert(const Row& r, double out[4]) {
    int i[4] = {int(kU), int(kU), int(kU), int(kU)};
    int status = 0;
    switch (r.call) {
        case kDate:
            return qoraConvertDate(int(r.in[0]), int(r.in[1]), int(r.in[2]), &out[0]);
        case kSplitDate:
            status = qoraConvertQORADate(&i[0], &i[1], &i[2], r.in[0]);
            break;
        case kTime:
            return qoraConvertTime(int(r.in[0]), int(r.in[1]), int(r.in[2]), r.in[3], &out[0]);
        case kSplitTime:
            status = qoraConvertQORATime(&i[0], &i[1], &i[2], &out[3], r.in[0]);
            break;
    }
    for (int k = 0; k < 3; ++k) out[k] = i[k];
    return status;
}

TEST(DateTime, ConversionsAndTheirEdges) {
    const int kDateBad = QORA_STATUS_BAD_DATE, kTimeBad = QORA_STATUS_BAD_TIME;
    const Row rows[] = {
        // clang-format off
        {kDate, {14, 10, 1582}, 0, {0}}, {kDate, {15, 10, 1582}, 0, {86400}},
        {kDate, {1, 1, 1970}, 0, {12219379200.0}}, {kDate, {28, 2, 1600}, 0, {548294400}},
        {kDate, {29, 2, 1600}, 0, {548380800}}, {kDate, {29, 2, 2000}, 0, {13171161600.0}},
        {kDate, {1, 3, 2000}, 0, {13171248000.0}}, {kDate, {31, 12, 9999}, 0, {kLastDate}},
        {kDate, {13, 10, 1582}, kDateBad}, {kDate, {1, 1, 1582}, kDateBad},
        {kDate, {1, 1, 1581}, kDateBad}, {kDate, {1, 1, 10000}, kDateBad},
        {kDate, {29, 2, 1900}, kDateBad}, {kDate, {29, 2, 2100}, kDateBad},
        {kDate, {30, 2, 2000}, kDateBad}, {kDate, {31, 4, 2000}, kDateBad},
        {kDate, {31, 6, 2000}, kDateBad}, {kDate, {31, 9, 2000}, kDateBad},
        {kDate, {31, 11, 2000}, kDateBad}, {kDate, {0, 1, 2000}, kDateBad},
        {kDate, {32, 1, 2000}, kDateBad}, {kDate, {1, 0, 2000}, kDateBad},
        {kDate, {1, 13, 2000}, kDateBad}, {kDate, {-1, -1, -1}, kDateBad},
        {kSplitDate, {0}, 0, {14, 10, 1582}}, {kSplitDate, {-0.0}, 0, {14, 10, 1582}},
        {kSplitDate, {86399}, 0, {14, 10, 1582}}, {kSplitDate, {86400}, 0, {15, 10, 1582}},
        {kSplitDate, {12219379200.0}, 0, {1, 1, 1970}},
        {kSplitDate, {kLastDate + 86400}, 0, {1, 1, 10000}},
        // A day count where 32-bit arithmetic would overflow.
        {kSplitDate, {600000000.0 * 86400}, 0, {28, 12, 1644326}},
        {kSplitDate, {-1}, kDateBad}, {kSplitDate, {-86400}, kDateBad},
        {kSplitDate, {kNaN}, kDateBad}, {kSplitDate, {-kInf}, kDateBad},
        {kSplitDate, {kInf}, kDateBad}, {kSplitDate, {1e300}, kDateBad},
        {kSplitDate, {9.3e18}, kDateBad}, {kSplitDate, {1e17}, kDateBad},
        {kTime, {1, 2, 3, 4.5}, 0, {93784.5}},
        {kTime, {0, 23, 59, 59.9990234375}, 0, {86399.9990234375}},
        {kTime, {2147483647, 23, 59, 0}, 0, {185542587187140.0}},
        {kTime, {0, 0, 0, 60}, kTimeBad}, {kTime, {0, 0, 0, -0.5}, kTimeBad},
        {kTime, {0, 0, 0, kNaN}, kTimeBad}, {kTime, {0, 0, 0, kInf}, kTimeBad},
        {kTime, {-1, 0, 0, 0}, kTimeBad}, {kTime, {0, 24, 0, 0}, kTimeBad},
        {kTime, {0, -1, 0, 0}, kTimeBad}, {kTime, {0, 0, 60, 0}, kTimeBad},
        {kTime, {0, 0, -1, 0}, kTimeBad},
        {kSplitTime, {93784.5}, 0, {1, 2, 3, 4.5}}, {kSplitTime, {86399.25}, 0, {0, 23, 59, 59.25}},
        {kSplitTime, {0}, 0, {0, 0, 0, 0}},
        {kSplitTime, {kLastDay + 3661}, 0, {2147483647, 1, 1, 1}},
        {kSplitTime, {-1}, kTimeBad}, {kSplitTime, {-1e-300}, kTimeBad},
        {kSplitTime, {kNaN}, kTimeBad}, {kSplitTime, {kInf}, kTimeBad},
        {kSplitTime, {1e300}, kTimeBad}, {kSplitTime, {kLastDay + 86400}, kTimeBad},
        // clang-format on
    };
    for (const Row& r : rows) {
        SCOPED_TRACE(testing::Message() << "call " << r.call << " (" << r.in[0] << ", " << r.in[1]
                                        << ", " << r.in[2] << ", " << r.in[3] << ")");
        double out[4] = {kU, kU, kU, kU};
        EXPECT_EQ(Convert(r, out), r.status);
        const int outputs = r.call == kDate || r.call == kTime ? 1 : r.call == kSplitDate ? 3 : 4;
        const bool untouched = r.status != 0 && r.call != kDate;
        for (int k = 0; k < outputs; ++k)
            EXPECT_EQ(out[k], untouched ? kU : r.out[k]) << "output " << k;
    }
    int i = 0;
    double d = 0;
    EXPECT_EQ(qoraConvertDate(1, 1, 2000, nullptr), QORA_STATUS_BAD_DATE);
    EXPECT_EQ(qoraConvertQORADate(&i, &i, nullptr, 0.0), QORA_STATUS_BAD_DATE);
    EXPECT_EQ(qoraConvertTime(0, 0, 0, 0.0, nullptr), QORA_STATUS_BAD_TIME);
    EXPECT_EQ(qoraConvertQORATime(&i, &i, nullptr, &d, 1.0), QORA_STATUS_BAD_TIME);
}

TEST(DateTime, DatesRoundTripEveryFewDaysUpToTheLast) {
    for (double date = 0.0; date <= kLastDate; date += 86400.0 * 37) {
        int day = 0, month = 0, year = 0;
        double back = -1;
        ASSERT_EQ(qoraConvertQORADate(&day, &month, &year, date + 43200.5), QORA_STATUS_OK);
        ASSERT_EQ(qoraConvertDate(day, month, year, &back), QORA_STATUS_OK);
        ASSERT_EQ(back, date) << day << "." << month << "." << year;
    }
}

}  // namespace
