#include "codepage.h"

#include <unicode/uchar.h>
#include <unicode/ucnv_cb.h>
#include <unicode/uloc.h>

#include <atomic>
#include <clocale>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <utility>
#include <vector>

#include "qoralocale.h"
#include "qoralock.h"
#include "qoramb.h"

namespace {

struct CodePageName {
    long codePage;
    const char* name;
};

const CodePageName kCodePages[] = {
    {932, "windows-31j"}, {936, "GBK"},          {949, "iso-ir-149"}, {950, "Big5"},
    {1250, "cp1250"},     {1251, "cp1251"},      {1252, "cp1252"},    {1253, "cp1253"},
    {1254, "cp1254"},     {1255, "cp1255"},      {1256, "cp1256"},    {1257, "cp1257"},
    {1258, "cp1258"},     {28591, "ISO-8859-1"}, {65001, "UTF-8"},
};

// Process-wide state: replaced only while no file is open and no call
// overlaps. A replaced converter or collator stays open until unload: a
// caller may still hold the pointer it was given. Each is made on first use,
// which files opened by several threads at once may reach together: hence
// the atomics, and the lock below around the making.
std::atomic<UConverter*> gConverter{nullptr};
std::atomic<unsigned> gConverterChanges{0};
std::atomic<UCollator*> gCollator{nullptr};

// The one process-wide lock: the locale lookup works on the shared texts
// below, and the converter and collator are made and retained under it.
CriticalSection gLocaleLock;
std::string gLocaleLanguage;
std::string gLocaleCountry;

struct CollatorCloser {
    void operator()(UCollator* coll) const { ucol_close(coll); }
};

// Takes ownership until unload and returns the converter. Under gLocaleLock.
UConverter* Retain(UConverter* cnv) {
    static std::vector<ConverterPtr> retained;
    retained.emplace_back(cnv);
    return cnv;
}

UCollator* Retain(UCollator* coll) {
    static std::vector<std::unique_ptr<UCollator, CollatorCloser>> retained;
    retained.emplace_back(coll);
    return coll;
}

const char* TableName(long codePage) {
    for (const CodePageName& entry : kCodePages)
        if (entry.codePage == codePage) return entry.name;
    return nullptr;
}

bool IcuKnows(const char* name) {
    UErrorCode err = U_ZERO_ERROR;
    return ucnv_countAliases(name, &err) > 0 && U_SUCCESS(err);
}

bool EqualNoCase(const char* a, const char* b) {
    for (; *a && *b; ++a, ++b)
        if (u_tolower(static_cast<unsigned char>(*a)) != u_tolower(static_cast<unsigned char>(*b)))
            return false;
    return *a == *b;
}

bool StartsNoCase(const char* text, const char* prefix) {
    for (; *prefix; ++text, ++prefix)
        if (!*text || u_tolower(static_cast<unsigned char>(*text)) !=
                          u_tolower(static_cast<unsigned char>(*prefix)))
            return false;
    return true;
}

// A decimal number from 1 to 99999 that makes up all of text, else 0.
long CodePageNumber(const char* text) {
    size_t digits = strspn(text, "0123456789");
    if (digits == 0 || digits > 5 || text[digits] != '\0') return 0;
    return strtol(text, nullptr, 10);
}

// The number of a "cp<number>" alias, else 0.
long CpFormNumber(const char* alias) {
    return strlen(alias) >= 5 && StartsNoCase(alias, "cp") ? CodePageNumber(alias + 2) : 0;
}

// The number of a "windows-<number>" or "windows_<number>" alias, else 0.
long WindowsFormNumber(const char* alias) {
    if (strlen(alias) < 11 || (alias[7] != '-' && alias[7] != '_')) return 0;
    return StartsNoCase(alias, "windows") ? CodePageNumber(alias + 8) : 0;
}

const char* Alias(const char* name, uint16_t i) {
    UErrorCode err = U_ZERO_ERROR;
    const char* alias = ucnv_getAlias(name, i, &err);
    return U_SUCCESS(err) ? alias : nullptr;
}

uint16_t AliasCount(const char* name) {
    UErrorCode err = U_ZERO_ERROR;
    uint16_t n = ucnv_countAliases(name, &err);
    return U_SUCCESS(err) ? n : 0;
}

const char* IanaName(const char* name) {
    UErrorCode err = U_ZERO_ERROR;
    const char* iana = ucnv_getStandardName(name, "IANA", &err);
    return U_SUCCESS(err) ? iana : nullptr;
}

// Substitutes "?" and leaves a warning that tells unassigned from illegal
// input, so a conversion can report a loss.
UErrorCode SubstitutionWarning(UConverterCallbackReason reason) {
    return reason == UCNV_UNASSIGNED ? kSubstitutedUnassigned : kSubstitutedIllegal;
}

void ToUnicodeSubstitute(const void*, UConverterToUnicodeArgs* args, const char*, int32_t,
                         UConverterCallbackReason reason, UErrorCode* err) {
    if (reason > UCNV_IRREGULAR) return;
    *err = U_ZERO_ERROR;
    const UChar question = 0x3F;
    ucnv_cbToUWriteUChars(args, &question, 1, 0, err);
    if (U_SUCCESS(*err)) *err = SubstitutionWarning(reason);
}

void FromUnicodeSubstitute(const void* context, UConverterFromUnicodeArgs* args, const UChar* units,
                           int32_t length, UChar32 c, UConverterCallbackReason reason,
                           UErrorCode* err) {
    if (reason > UCNV_IRREGULAR) return;
    UCNV_FROM_U_CALLBACK_SUBSTITUTE(context, args, units, length, c, reason, err);
    if (U_SUCCESS(*err)) *err = SubstitutionWarning(reason);
}

UConverter* OpenWithSubstitution(const char* name) {
    UErrorCode err = U_ZERO_ERROR;
    UConverter* cnv = ucnv_open(name, &err);
    if (U_FAILURE(err)) return nullptr;
    const UChar question = 0x3F;
    ucnv_setSubstString(cnv, &question, 1, &err);
    ucnv_setToUCallBack(cnv, ToUnicodeSubstitute, nullptr, nullptr, nullptr, &err);
    ucnv_setFromUCallBack(cnv, FromUnicodeSubstitute, nullptr, nullptr, nullptr, &err);
    if (U_FAILURE(err)) {
        ucnv_close(cnv);
        return nullptr;
    }
    return cnv;
}

const char* ConverterName(UConverter* cnv) {
    UErrorCode err = U_ZERO_ERROR;
    const char* name = ucnv_getName(cnv, &err);
    return U_SUCCESS(err) ? name : "";
}

std::string ValidLocale(const UCollator* coll) {
    UErrorCode err = U_ZERO_ERROR;
    const char* locale = ucol_getLocaleByType(coll, ULOC_VALID_LOCALE, &err);
    return U_SUCCESS(err) && locale ? locale : "";
}

// The display name chosen among the aliases of an encoding without an IANA name.
std::string DisplayNameFromAliases(const char* name) {
    std::string utf, iso, windows, cp, other;
    for (uint16_t i = 0, n = AliasCount(name); i < n; ++i) {
        const char* alias = Alias(name, i);
        if (!alias) continue;
        if (StartsNoCase(alias, "UTF")) {
            if (utf.empty()) utf = alias;
        } else if (StartsNoCase(alias, "ISO")) {
            if (iso.empty()) iso = alias;
        } else if (long number = WindowsFormNumber(alias)) {
            const char* tableName = TableName(number);
            if (windows.empty()) windows = tableName ? tableName : alias;
        } else if (CpFormNumber(alias)) {
            if (cp.empty() || strlen(alias) < cp.size()) cp = alias;
        } else if (other.empty() && !(strlen(alias) > 3 && StartsNoCase(alias, "ibm"))) {
            other = alias;
        }
    }
    for (const std::string* found : {&utf, &iso, &windows, &cp, &other})
        if (!found->empty()) return *found;
    return name;
}

}  // namespace

bool CodePageToEncodingName(long codePage, std::string& name) {
    name.clear();
    const char* candidate = TableName(codePage);
    char formatted[32];
    if (!candidate || !IcuKnows(candidate)) {
        snprintf(formatted, sizeof formatted, "windows-%03ld", codePage);
        if (!IcuKnows(formatted)) snprintf(formatted, sizeof formatted, "cp%03ld", codePage);
        if (!IcuKnows(formatted)) return false;
        candidate = formatted;
    }
    const char* iana = IanaName(candidate);
    name = iana ? iana : candidate;
    return true;
}

long EncodingNameToCodePage(const char* name) {
    if (!name) return 0;
    uint16_t count = AliasCount(name);
    if (count == 0) return EqualNoCase(name, "windows-28591") ? 28591 : 0;
    long windows = 0, cp = 0;
    for (uint16_t i = 0; i < count; ++i) {
        const char* alias = Alias(name, i);
        if (!alias) continue;
        if (long number = CpFormNumber(alias)) {
            if (cp == 0) cp = number;
        } else if (long number = WindowsFormNumber(alias)) {
            if (windows == 0) windows = number;
        } else if (strcmp(alias, "ISO-8859-1") == 0) {
            windows = 28591;
        }
    }
    return windows > 0 ? windows : cp;
}

UConverter* OpenConverter(const char* name) {
    std::string resolved;
    if (!name) {
        name = gConverter ? ConverterName(gConverter) : ucnv_getDefaultName();
    } else if (long codePage = CodePageNumber(name)) {
        if (!CodePageToEncodingName(codePage, resolved)) return nullptr;
        name = resolved.c_str();
    }
    UConverter* cnv = OpenWithSubstitution(name);
    if (!cnv && EqualNoCase(name, "windows-28591")) cnv = OpenWithSubstitution("ISO-8859-1");
    return cnv;
}

UConverter* CurrentConverter() {
    if (UConverter* cnv = gConverter) return cnv;
    CriticalSection::Lock lock(gLocaleLock);
    if (!gConverter) {
        if (UConverter* cnv = OpenConverter(nullptr)) {
            gConverter = Retain(cnv);
            ++gConverterChanges;
        }
    }
    return gConverter;
}

ConverterPtr CloneConverter(UConverter* cnv) {
    UErrorCode err = U_ZERO_ERROR;
    ConverterPtr clone(ucnv_clone(cnv ? cnv : CurrentConverter(), &err));
    if (U_FAILURE(err)) clone.reset();
    return clone;
}

UConverter* ExchangeCurrentConverter(UConverter* cnv) {
    ++gConverterChanges;
    return gConverter.exchange(cnv);
}

unsigned CodePageConverterChanges() { return gConverterChanges; }

std::string EncodingDisplayName(UConverter* cnv) {
    if (!cnv) cnv = CurrentConverter();
    if (!cnv) return "";
    const char* name = ConverterName(cnv);
    if (const char* iana = IanaName(name))
        return EqualNoCase(iana, "Shift_JIS") ? "windows-31j" : iana;
    return DisplayNameFromAliases(name);
}

bool SetCodePageConverter(const char* name) {
    UConverter* cnv = OpenConverter(name);
    if (!cnv) return false;
    CriticalSection::Lock lock(gLocaleLock);
    if (!gConverter || strcmp(ConverterName(cnv), ConverterName(gConverter)) != 0) {
        gConverter = Retain(cnv);
        ++gConverterChanges;
    } else {
        ucnv_close(cnv);
    }
    return true;
}

UCollator* CurrentCollator() {
    if (UCollator* coll = gCollator) return coll;
    CriticalSection::Lock lock(gLocaleLock);
    if (!gCollator) {
        UErrorCode err = U_ZERO_ERROR;
        UCollator* coll = ucol_open(uloc_getDefault(), &err);
        if (U_SUCCESS(err)) gCollator = Retain(coll);
    }
    return gCollator;
}

bool SetCollatorLocale(const char* locale) {
    UErrorCode err = U_ZERO_ERROR;
    UCollator* coll = ucol_open(locale, &err);
    if (U_FAILURE(err)) return false;
    CriticalSection::Lock lock(gLocaleLock);
    UCollator* current = CurrentCollator();
    if (current && ValidLocale(coll) == ValidLocale(current)) {
        ucol_close(coll);
    } else {
        gCollator = Retain(coll);
    }
    return true;
}

int GetLocaleString(char* buffer, int size) {
    UCollator* coll = CurrentCollator();
    std::string locale = coll ? ValidLocale(coll) : "";
    std::string encoding = EncodingDisplayName(nullptr);
    if (locale.empty() || encoding.empty() || !buffer) return 0;
    std::string text = locale + "." + encoding;
    if (size < 0 || text.size() + 1 > static_cast<size_t>(size)) return 0;
    memcpy(buffer, text.c_str(), text.size() + 1);
    return static_cast<int>(text.size());
}

bool GetSystemLocaleInfo(std::string& locale, std::string& encoding) {
    locale.clear();
    encoding.clear();
    const char* name = setlocale(LC_ALL, nullptr);
    const char* dot = name ? strchr(name, '.') : nullptr;
    if (!dot) return false;
    // A POSIX name may end in a modifier ("@euro") that is no part of the code page.
    std::string codePage(dot + 1, strcspn(dot + 1, "@;"));
    ConverterPtr cnv(OpenConverter(codePage.c_str()));
    if (!cnv) return false;
    std::string language, country;
    LocaleToIsoCodes(language, country);
    std::string id = country.empty() ? language : language + "_" + country;
    UErrorCode err = U_ZERO_ERROR;
    UCollator* coll = ucol_open(id.c_str(), &err);
    if (U_FAILURE(err)) return false;
    locale = ValidLocale(coll);
    ucol_close(coll);
    encoding = EncodingDisplayName(cnv.get());
    if (locale.empty() || encoding.empty()) {
        locale.clear();
        encoding.clear();
        return false;
    }
    return true;
}

bool IsSameEncoding(const char* a, const char* b) {
    if (!a || !b || AliasCount(a) == 0 || AliasCount(b) == 0) return false;
    const char* canonicalA = Alias(a, 0);
    const char* canonicalB = Alias(b, 0);
    return canonicalA && canonicalB && strcmp(canonicalA, canonicalB) == 0;
}

std::string InterfaceEncodingName() {
    return mbIsUtf8Mode() ? "UTF-8" : EncodingDisplayName(nullptr);
}

namespace {

// A name part matches a locale by its English name (the Windows form,
// "German_Germany.1252") or by its ISO code (the POSIX form, "de_DE.UTF-8").
bool NameMatches(const std::string& part, const char* english, const char* iso) {
    return mbEqualNoCase(part.c_str(), -1, english, -1, nullptr) ||
           mbEqualNoCase(part.c_str(), -1, iso, -1, nullptr);
}

}  // namespace

void LocaleToIsoCodes(std::string& language, std::string& country) {
    LocaleNameToIsoCodes(setlocale(LC_CTYPE, nullptr), language, country);
}

void LocaleNameToIsoCodes(const char* name, std::string& language, std::string& country) {
    CriticalSection::Lock lock(gLocaleLock);
    gLocaleLanguage.clear();
    gLocaleCountry.clear();
    if (const char* underscore = name ? strchr(name, '_') : nullptr) {
        gLocaleLanguage.assign(name, underscore - name);
        // The country runs to the code page, or to a POSIX modifier or the end.
        gLocaleCountry.assign(underscore + 1, strcspn(underscore + 1, ".@"));
    }
    language = "en";
    country.clear();
    size_t count = 0;
    const SystemLocale* locales = SystemLocales(count);
    for (size_t i = 0; i < count && !gLocaleLanguage.empty(); ++i) {
        const SystemLocale& known = locales[i];
        if (!NameMatches(gLocaleLanguage, known.englishLanguage, known.isoLanguage)) continue;
        if (gLocaleCountry.empty()) {
            language = known.isoLanguage;
            break;
        }
        if (!NameMatches(gLocaleCountry, known.englishCountry, known.isoCountry)) continue;
        language = known.isoLanguage;
        country = known.isoCountry;
        break;
    }
    gLocaleLanguage.clear();
    gLocaleCountry.clear();
}
