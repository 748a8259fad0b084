#include "HeaderSettings.h"

#include <gtest/gtest.h>

#include <tuple>

namespace {

// The stamp of a date and time field pair, or -1 when they are rejected.
double Stamp(const char* date, const char* time) {
    double stamp = -1.0;
    return ParseCreationStamp(date, time, &stamp) ? stamp : -1.0;
}

}  // namespace

TEST(CreationStamp, CountsSecondsFromTheGregorianStart) {
    const std::tuple<const char*, const char*, double> rows[] = {
        {"04 Dec 26", "17:16:43", 14015783803.0},
        {"04 DEC 69", "17:16:43", 15372782203.0},  // 00-69: 2000s
        {"04 dec 70", "17:16:43", 12248558203.0},  // 70-99: 1900s
        {"29 Feb 00", "00:00:00", 13171161600.0},
        {" 4 Dec 26", "17:16:43", -1.0},  // a blank is no digit
        {"04 Xyz 26", "17:16:43", -1.0},
        {"00 Dec 26", "17:16:43", -1.0},
        {"32 Dec 26", "17:16:43", -1.0},
        {"04 Dec 26", "24:00:00", -1.0},
        {"04 Dec 26", "23:60:00", -1.0},
        {"04 Dec 26", "23:59:60", -1.0},
        {"\0\0\0\0\0\0\0\0\0", "\0\0\0\0\0\0\0\0", -1.0},
    };
    for (const auto& [date, time, stamp] : rows) EXPECT_EQ(Stamp(date, time), stamp) << date;
    // A day beyond its month's length is taken as it stands.
    EXPECT_GT(Stamp("31 Feb 26", "00:00:00"), 0.0);
}
