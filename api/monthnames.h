// The English month abbreviations of creation dates ("Jan" to "Dec"), for
// writing them and for matching them when a date is read.
#pragma once

// The abbreviation of month 1 to 12; null for any other number.
const char* MonthAbbreviation(int month);
