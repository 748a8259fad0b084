#include "HeaderSettings.h"

#include <algorithm>
#include <cstring>

#include "datasrc.h"
#include "qoramb.h"
#include "specialvalues.h"

HeaderSettings::HeaderSettings()
    : fSysmis(SysmisValue()),
      fHighest(HighestValue()),
      fLowest(LowestValue()),
      fProduct("@(#) QORA DATA FILE MS Windows Release 16.0.0") {}

void HeaderSettings::BuildSwapMask(const QORA_DataSource& source) {
    fSwapMask.assign(source.ValueCount(), 0);
    for (int i = 0; i < source.ColumnCount(); ++i)
        if (!source.GetVariable(i).IsString()) fSwapMask[source.ValueOffset(i)] = 1;
}

void SwapBytes(void* bytes, size_t size) {
    auto* p = static_cast<unsigned char*>(bytes);
    std::reverse(p, p + size);
}

int32_t SwapInt32(int32_t value) {
    SwapBytes(&value, sizeof value);
    return value;
}

double SwapDouble(double value) {
    SwapBytes(&value, sizeof value);
    return value;
}

namespace {

const char* const kMonthNames[12] = {"jan", "feb", "mar", "apr", "may", "jun",
                                     "jul", "aug", "sep", "oct", "nov", "dec"};

// Digits are taken at face value: a character that is no digit simply makes
// a number out of range.
int TwoDigits(const char* p) { return 10 * (p[0] - '0') + (p[1] - '0'); }

int MonthOf(const char* name) {
    for (int m = 0; m < 12; ++m)
        if (mbEqualNoCase(name, 3, kMonthNames[m], 3, nullptr)) return m + 1;
    return 13;
}

// Days since 14 October 1582 in the proleptic Gregorian calendar.
int64_t DaysSinceGregorianStart(int year, int month, int day) {
    const int64_t m = month >= 3 ? month - 3 : month + 9;
    const int64_t y = month >= 3 ? year : year - 1;
    return (146097 * (y / 100)) / 4 + (1461 * (y % 100)) / 4 + (153 * m + 2) / 5 + day - 578041;
}

}  // namespace

bool ParseCreationStamp(const char* date, const char* time, double* stamp) {
    const int day = TwoDigits(date);
    const int month = MonthOf(date + 3);
    int year = 1900 + TwoDigits(date + 7);
    if (year < 1970) year += 100;
    const int hour = TwoDigits(time), minute = TwoDigits(time + 3), second = TwoDigits(time + 6);
    if (year < 1582 || year > 9999 || month < 1 || month > 12 || day < 1 || day > 31 || hour < 0 ||
        hour > 23 || minute < 0 || minute > 59 || second < 0 || second >= 60)
        return false;
    const int64_t days = DaysSinceGregorianStart(year, month, day);
    if (days < 0) return false;
    *stamp = double(days * 86400 + hour * 3600 + minute * 60 + second);
    return true;
}
