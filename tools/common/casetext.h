// The text of case values, both ways: how a value of a variable is written
// as a CSV field (system-missing empty, strings without their trailing
// blanks, dates as yyyy-mm-dd), and how such a field reads back.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "dictionary.h"

// Print format codes of numbers that hold a date, or a date and a time.
bool IsDateFormat(int code);
bool IsDateTimeFormat(int code);

// The shortest text that reads back as the same double.
std::string NumberText(double value);
std::string TrimBlanks(std::string text);
std::string CsvField(const std::string& text);

// The CSV field of variable `index` in the current case; `buffer` holds the
// widest string value and its terminator.
std::string ValueText(int handle, int index, const Variable& var, std::vector<char>& buffer);

// A whole field as a finite number.
bool ParseNumber(std::string_view text, double& value);
// A whole field as yyyy-mm-dd, or as yyyy-mm-dd hh:mm:ss when `withTime`.
bool ParseDate(std::string_view text, bool withTime, double& value);
