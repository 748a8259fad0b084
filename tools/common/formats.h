// Formats, measurement levels and alignments in the words their users write:
// F8.2, A20, DATE11; nominal, ordinal, scale; left, right, center.
#pragma once

#include <string>

struct Format {
    int code;
    int width;
    int decimals;
};

std::string FormatText(const Format& format);
// Reads a format text such as "F8.2" or "date11" (any case).
bool ParseFormat(const std::string& text, Format& format);

// Measurement level codes 0 to 3 and alignment codes 0 to 2.
const char* LevelWord(int level);
bool ParseLevel(const std::string& word, int& level);
const char* AlignmentWord(int alignment);
bool ParseAlignment(const std::string& word, int& alignment);
