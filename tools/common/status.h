// Library statuses as a user reads them, and the one way the tools stop on a
// failed call.
#pragma once

#include <string>

// A failed call: the status, and what was being done.
struct Failure {
    int status;
    std::string doing;
};

// Returns a success or warning status; throws Failure on an error.
int Check(int status, const std::string& doing);

// "QORA_STATUS_BAD_FILE (6) while opening the file. The file is ...".
std::string FailureText(const Failure& failure);

// Input a tool refuses: where it is and a plain sentence, as one text.
struct BadInput {
    std::string text;
};
