// The sample file shipped in examples/: a small dictionary of mixed types
// and a dozen cases, compressed. Its bytes are fixed, so a test can compare
// them with the committed copy and tools can be shown on a known file.
#pragma once

#include "sysfile_builder.h"

namespace fixture {

Bytes SampleFile();

// Seconds since 14 October 1582 at midnight of the given day.
double DateValue(int year, int month, int day);

}  // namespace fixture
