#include "namerules.h"

#include "qoramb.h"

namespace {

const char* const kReservedWords[] = {"ALL", "AND", "BY",  "EQ", "GE", "GT",  "LE",
                                      "LT",  "NE",  "NOT", "OR", "TO", "WITH"};

bool IsReservedWord(const char* name, size_t length) {
    if (length >= 5) return false;
    for (const char* word : kReservedWords) {
        if (mbEqualNoCase(name, static_cast<int>(length), word, -1, nullptr)) return true;
    }
    return false;
}

}  // namespace

bool IsAsciiNameChar(unsigned char c) {
    return (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z') || (c >= '0' && c <= '9') || c == '@' ||
           c == '#' || c == '$' || c == '_' || c == '.';
}

int QORA_CheckVariableName(const char* name, size_t length) {
    while (length > 0 && name[length - 1] == ' ') --length;
    if (length == 0 || length > kMaxNameBytes) return kNameBadLength;
    for (size_t pos = 0; pos < length;) {
        int n = mbCharLength(name + pos, length - pos);
        if (n <= 0 || static_cast<size_t>(n) > length - pos) return kNameBadChar;
        unsigned char c = static_cast<unsigned char>(name[pos]);
        if (n == 1 && c < 0x80 && !IsAsciiNameChar(c)) return kNameBadChar;
        pos += n;
    }
    char first = name[0];
    if ((first >= '0' && first <= '9') || first == '_' || first == '.') return kNameBadFirst;
    if (IsReservedWord(name, length)) return kNameReserved;
    if (first == '#') return kNameScratch;
    if (first == '$') return kNameSystem;
    return kNameValid;
}
