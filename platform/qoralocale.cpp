#include "qoralocale.h"

// A fixed catalogue: POSIX has no enumeration of locales with English names,
// and the C library's installed set differs between machines. Languages come
// first with their principal country, so a lookup by language alone finds it.
static const SystemLocale kLocales[] = {
    {"English", "United States", "en", "US"}, {"English", "United Kingdom", "en", "GB"},
    {"English", "Canada", "en", "CA"},        {"English", "Australia", "en", "AU"},
    {"English", "Ireland", "en", "IE"},       {"English", "New Zealand", "en", "NZ"},
    {"English", "India", "en", "IN"},         {"German", "Germany", "de", "DE"},
    {"German", "Austria", "de", "AT"},        {"German", "Switzerland", "de", "CH"},
    {"French", "France", "fr", "FR"},         {"French", "Canada", "fr", "CA"},
    {"French", "Belgium", "fr", "BE"},        {"French", "Switzerland", "fr", "CH"},
    {"Italian", "Italy", "it", "IT"},         {"Spanish", "Spain", "es", "ES"},
    {"Spanish", "Mexico", "es", "MX"},        {"Portuguese", "Brazil", "pt", "BR"},
    {"Portuguese", "Portugal", "pt", "PT"},   {"Dutch", "Netherlands", "nl", "NL"},
    {"Dutch", "Belgium", "nl", "BE"},         {"Danish", "Denmark", "da", "DK"},
    {"Swedish", "Sweden", "sv", "SE"},        {"Norwegian", "Norway", "nb", "NO"},
    {"Finnish", "Finland", "fi", "FI"},       {"Polish", "Poland", "pl", "PL"},
    {"Czech", "Czech Republic", "cs", "CZ"},  {"Hungarian", "Hungary", "hu", "HU"},
    {"Greek", "Greece", "el", "GR"},          {"Turkish", "Turkey", "tr", "TR"},
    {"Russian", "Russia", "ru", "RU"},        {"Ukrainian", "Ukraine", "uk", "UA"},
    {"Hebrew", "Israel", "he", "IL"},         {"Arabic", "Saudi Arabia", "ar", "SA"},
    {"Arabic", "Egypt", "ar", "EG"},          {"Thai", "Thailand", "th", "TH"},
    {"Vietnamese", "Vietnam", "vi", "VN"},    {"Japanese", "Japan", "ja", "JP"},
    {"Korean", "Korea", "ko", "KR"},          {"Chinese", "China", "zh", "CN"},
    {"Chinese", "Taiwan", "zh", "TW"},        {"Chinese", "Hong Kong", "zh", "HK"},
    {"Chinese", "Singapore", "zh", "SG"},
};

const SystemLocale* SystemLocales(size_t& count) {
    count = sizeof kLocales / sizeof kLocales[0];
    return kLocales;
}
