// The rules a variable name must follow; attribute names and set names are
// checked with them too.
#pragma once

#include <cstddef>

// The longest name, in bytes.
enum : size_t { kMaxNameBytes = 64 };

// Results of QORA_CheckVariableName.
enum {
    kNameValid = 0,
    kNameScratch = 1,    // valid as a scratch name only (begins with "#")
    kNameSystem = 2,     // valid as a system name only (begins with "$")
    kNameBadLength = 3,  // empty, or longer than 64 bytes
    kNameBadChar = 4,
    kNameReserved = 5,  // one of the reserved words
    kNameBadFirst = 6,  // begins with a digit, "_" or "."
};

// Checks length bytes of name (trailing blanks not counted) in the interface
// encoding; never reads past length.
int QORA_CheckVariableName(const char* name, size_t length);

// Whether an ASCII byte may stand in a name; bytes of 0x80 and above belong
// to the characters of the encoding and are judged as such.
bool IsAsciiNameChar(unsigned char c);
