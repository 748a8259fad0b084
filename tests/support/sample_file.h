// The sample file shipped in examples/: a small dictionary of mixed types
// with every kind of dictionary record, and a dozen cases, compressed in the
// machine's order. Its bytes are fixed, so a test can compare them with the
// committed copy and tools can be shown on a known file; in its other forms it
// seeds the fuzzer.
#pragma once

#include "sysfile_builder.h"

namespace fixture {

Bytes SampleFile(Endian endian = Endian::Native, bool compressed = true);

}  // namespace fixture
