// The file's character encoding, as the integer information record states it.
#pragma once

#include <string>

struct HeaderSettings;

// The encoding of the file's text: the name its encoding record gave; without
// one, the name of the code page its character code gives; failing that, the
// current locale's.
std::string FileEncodingName(const HeaderSettings& settings);

// Called when a dictionary is committed for writing: the character code
// becomes the code page number of the settings' encoding name, when the name
// has one; otherwise it keeps its value.
void SetCharacterCodeFromEncoding(HeaderSettings& settings);
