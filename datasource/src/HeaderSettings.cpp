#include "HeaderSettings.h"

#include <algorithm>
#include <cstring>

#include "calendar.h"
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

namespace {

// Digits are taken at face value: a character that is no digit simply makes
// a number out of range.
int TwoDigits(const char* p) { return 10 * (p[0] - '0') + (p[1] - '0'); }

int MonthOf(const char* name) {
    for (int m = 0; m < 12; ++m)
        if (mbEqualNoCase(name, 3, MonthAbbreviation(m + 1), 3, nullptr)) return m + 1;
    return 13;
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
    const int64_t days = GregorianDays(year, month, day);
    if (days < 0) return false;
    *stamp = double(days * 86400 + hour * 3600 + minute * 60 + second);
    return true;
}
