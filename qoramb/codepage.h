// Encoding names, code page numbers, and the library's current code-page
// converter and collator. Names may be Windows code page numbers, ICU
// converter names, IANA names or the code page part of a runtime locale name.
#pragma once

#include <unicode/ucnv.h>
#include <unicode/ucol.h>

#include <memory>
#include <string>

struct ConverterCloser {
    void operator()(UConverter* cnv) const { ucnv_close(cnv); }
};
using ConverterPtr = std::unique_ptr<UConverter, ConverterCloser>;

// The warnings the library's substitution callbacks leave in the error code
// after replacing a character by "?".
constexpr UErrorCode kSubstitutedUnassigned = static_cast<UErrorCode>(-100);
constexpr UErrorCode kSubstitutedIllegal = static_cast<UErrorCode>(-101);

// The IANA name (or ICU's own) for a Windows code page number; false and an
// empty name when ICU knows no converter for it.
bool CodePageToEncodingName(long codePage, std::string& name);
// The Windows code page number of an encoding name, or 0 when it has none.
long EncodingNameToCodePage(const char* name);
// Opens a converter with the library's substitution behaviour, for a name, a
// code page number given as decimal text, or (name null) the current
// converter's encoding. Null on failure; the caller closes the converter.
UConverter* OpenConverter(const char* name);
// The name under which the library reports the converter's encoding (the
// current converter when cnv is null).
std::string EncodingDisplayName(UConverter* cnv);
// Makes the converter for name the current one when its encoding differs.
bool SetCodePageConverter(const char* name);
// Makes the collator for locale the current one when its locale differs.
bool SetCollatorLocale(const char* locale);
// Writes "<collator locale>.<encoding>" with its terminator into buffer and
// returns its length, or returns 0 and leaves buffer alone when it does not fit.
int GetLocaleString(char* buffer, int size);
// The collator locale and encoding name of the runtime's current locale;
// false and both empty when any part cannot be resolved.
bool GetSystemLocaleInfo(std::string& locale, std::string& encoding);
// True when ICU knows both names and they denote the same converter.
bool IsSameEncoding(const char* a, const char* b);
// The name of the encoding of text at the interface: "UTF-8" in UTF-8 mode,
// else the display name of the current converter.
std::string InterfaceEncodingName();
// The ISO 639 language and ISO 3166 country codes of the runtime's current
// character-type locale; "en" and "" when it matches no known locale.
void LocaleToIsoCodes(std::string& language, std::string& country);
// The same for a locale name of the form language_country.codepage, where
// language and country are English names ("German_Germany.1252") or ISO codes
// ("de_DE.UTF-8"); a POSIX modifier ("@euro") is ignored.
void LocaleNameToIsoCodes(const char* name, std::string& language, std::string& country);

// The current code-page converter, created on first use. Never close it:
// convert through a clone.
UConverter* CurrentConverter();
// A private clone of cnv, or of the current converter when cnv is null.
ConverterPtr CloneConverter(UConverter* cnv);
// Makes cnv the current converter without taking it over and returns the
// one it replaces (null when none was made yet); counts as a change. For a
// while only: the caller puts the previous one back.
UConverter* ExchangeCurrentConverter(UConverter* cnv);
// Goes up by one each time the current converter is replaced.
unsigned CodePageConverterChanges();
// The current collator, created on first use for ICU's default locale.
UCollator* CurrentCollator();
