// The file's character encoding, as the integer information record states it.
#pragma once

struct HeaderSettings;

// Called when a dictionary is committed for writing: the character code
// becomes the code page number of the settings' encoding name, when the name
// has one; otherwise it keeps its value.
void SetCharacterCodeFromEncoding(HeaderSettings& settings);
