// The two directions of qoraconv. Each throws BadInput for input it refuses
// and Failure for a library call that fails; either way no output is left.
#pragma once

#include <string>

struct Options {
    bool compress = false;
    std::string dict;  // the JSON dictionary side file, or empty
    std::string input;
    std::string output;
};

// CSV (and a side file to read) to a system file.
void CsvToFile(const Options& options);
// A system file to CSV (and a side file to write).
void FileToCsv(const Options& options);
