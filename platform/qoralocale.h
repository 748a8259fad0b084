// The system's locale catalogue: the installed locales with their English
// language and country names and their ISO codes, as the library's locale
// lookup enumerates them.
#pragma once

#include <cstddef>

struct SystemLocale {
    const char* englishLanguage;  // "German"
    const char* englishCountry;   // "Germany"
    const char* isoLanguage;      // ISO 639: "de"
    const char* isoCountry;       // ISO 3166: "DE"
};

// The known locales, in enumeration order; count receives their number.
const SystemLocale* SystemLocales(size_t& count);
