#include "formats.h"

#include <cctype>
#include <iterator>

namespace {

// Names of the format type codes; an empty name is a code no format uses.
const char* const kFormatNames[] = {
    "",     "A",    "AHEX",     "COMMA", "DOLLAR", "F",     "IB",    "PIBHEX", "P",     "PIB",
    "PK",   "RB",   "RBHEX",    "",      "",       "Z",     "N",     "E",      "",      "",
    "DATE", "TIME", "DATETIME", "ADATE", "JDATE",  "DTIME", "WKDAY", "MONTH",  "MOYR",  "QYR",
    "WKYR", "PCT",  "DOT",      "CCA",   "CCB",    "CCC",   "CCD",   "CCE",    "EDATE", "SDATE",
};
const int kFormatCount = int(std::size(kFormatNames));

// Plain number formats show their decimals even when there are none (F8.0).
bool ShowsDecimals(int code) {
    return code == 3 || code == 4 || code == 5 || code == 17 || (code >= 31 && code <= 37);
}

const char* const kLevelWords[] = {"unknown", "nominal", "ordinal", "scale"};
const char* const kAlignmentWords[] = {"left", "right", "center"};

template <size_t N>
bool FindWord(const char* const (&words)[N], const std::string& word, int& code) {
    for (size_t i = 0; i < N; ++i) {
        if (word == words[i]) {
            code = int(i);
            return true;
        }
    }
    return false;
}

// Reads a whole unsigned decimal number from text[pos, end).
bool Number(const std::string& text, size_t pos, size_t end, int& out) {
    if (pos >= end || end - pos > 5) return false;
    out = 0;
    for (size_t i = pos; i < end; ++i) {
        if (!std::isdigit(static_cast<unsigned char>(text[i]))) return false;
        out = out * 10 + (text[i] - '0');
    }
    return true;
}

}  // namespace

std::string FormatText(const Format& format) {
    const bool named = format.code >= 0 && format.code < kFormatCount && *kFormatNames[format.code];
    std::string text =
        named ? kFormatNames[format.code] : "code" + std::to_string(format.code) + "_";
    text += std::to_string(format.width);
    if (format.decimals > 0 || ShowsDecimals(format.code))
        text += "." + std::to_string(format.decimals);
    return text;
}

bool ParseFormat(const std::string& text, Format& format) {
    size_t letters = 0;
    while (letters < text.size() && std::isalpha(static_cast<unsigned char>(text[letters])))
        ++letters;
    std::string name = text.substr(0, letters);
    for (char& c : name) c = char(std::toupper(static_cast<unsigned char>(c)));
    if (name.empty() || !FindWord(kFormatNames, name, format.code)) return false;
    const size_t dot = text.find('.', letters);
    format.decimals = 0;
    if (!Number(text, letters, dot == std::string::npos ? text.size() : dot, format.width))
        return false;
    return dot == std::string::npos || Number(text, dot + 1, text.size(), format.decimals);
}

const char* LevelWord(int level) {
    return level >= 0 && level < 4 ? kLevelWords[level] : "unknown";
}
bool ParseLevel(const std::string& word, int& level) { return FindWord(kLevelWords, word, level); }

const char* AlignmentWord(int alignment) {
    return alignment >= 0 && alignment < 3 ? kAlignmentWords[alignment] : "right";
}
bool ParseAlignment(const std::string& word, int& alignment) {
    return FindWord(kAlignmentWords, word, alignment);
}
