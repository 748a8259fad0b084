// The dictionary of an open file as the tools read it: the variables, and
// the properties that take more than one call to read.
#pragma once

#include <string>
#include <utility>
#include <vector>

struct Variable {
    std::string name;
    int type;         // 0 numeric, else the string width
    int printFormat;  // format type code
};

// The variables of an open file in dictionary order.
std::vector<Variable> Variables(int handle);

// A numeric variable's missing values: `count` as the library gives it (a
// negative count is a range, low and high, then -count - 2 more values).
struct NumericMissing {
    int count;
    double values[3];
};
NumericMissing NumericMissingValues(int handle, const Variable& var);

// A string variable's missing values without their trailing blanks; none for
// strings wider than 8 bytes, which the library keeps none for.
std::vector<std::string> StringMissingValues(int handle, const Variable& var);

// Value labels in the library's order; string values without trailing blanks.
std::vector<std::pair<double, std::string>> NumericValueLabels(int handle, const Variable& var);
std::vector<std::pair<std::string, std::string>> StringValueLabels(int handle, const Variable& var);
