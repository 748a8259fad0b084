// Long variable names. A variable record has room for 8 bytes of name, so a
// written file gives every variable a unique short name and pairs it with
// the variable's own name in the long names record; a reader renames the
// variables back.
#pragma once

#include <cstddef>
#include <string>

class QORA_DataSource;
struct HeaderSettings;

// Gives every variable of the source a unique short name of at most 8
// bytes: settings.fNameList becomes one (name, short name) pair per
// variable, in dictionary order. Raises internal error 1504, naming the
// variable, when none can be made.
void GenerateShortNames(const QORA_DataSource& source, HeaderSettings& settings);
