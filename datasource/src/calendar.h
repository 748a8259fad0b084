// The calendar of date values: days counted from 14 October 1582 (day 0) in
// the proleptic Gregorian calendar, and the English month abbreviations that
// creation dates are written with.
#pragma once

#include <cstdint>

// The day number of a calendar date; the fields are not checked, and dates
// before 14 October 1582 give negative numbers.
int64_t GregorianDays(int64_t year, int month, int day);

// The calendar date of a day number of 0 or more.
void GregorianDate(int64_t days, int64_t* year, int* month, int* day);

// "Jan" to "Dec" for months 1 to 12; null for any other number.
const char* MonthAbbreviation(int month);
