#include "qoramb.h"

#include <unicode/uchar.h>
#include <unicode/utf16.h>
#include <unicode/utf8.h>

#include <algorithm>
#include <atomic>
#include <cstring>
#include <cwchar>
#include <utility>

#include "codepage.h"

namespace {

// Changed only while no file is open; atomics keep concurrent readers sound.
std::atomic<bool> gUtf8Mode{false};
std::atomic<unsigned> gModeChanges{0};
// Set while a file's text is read in its own code page (mbTextEncodingScope).
std::atomic<bool> gLengthsFromConverter{false};

// Byte length of a text: up to its terminator, never beyond a given length
// (a negative length means the terminator ends it).
size_t TextLength(const char* text, int length) {
    if (!text) return 0;
    return length < 0 ? strlen(text) : strnlen(text, static_cast<size_t>(length));
}

// Decodes the UTF-8 character at p with n > 0 bytes available. Returns its
// byte length and sets cp. A byte that begins no well-formed sequence is a
// unit of its own with cp = -1. Returns 0 when a well-formed beginning runs
// into the end of the n bytes (a character cut off).
int Utf8Next(const char* p, size_t n, UChar32* cp) {
    const auto* s = reinterpret_cast<const unsigned char*>(p);
    unsigned char lead = s[0], low = 0x80, high = 0xBF;
    int length;
    UChar32 c;
    if (lead < 0x80) {
        *cp = lead;
        return 1;
    } else if (lead >= 0xC2 && lead <= 0xDF) {
        length = 2, c = lead & 0x1F;
    } else if (lead >= 0xE0 && lead <= 0xEF) {
        length = 3, c = lead & 0x0F;
        if (lead == 0xE0) low = 0xA0;   // no overlong forms
        if (lead == 0xED) high = 0x9F;  // no surrogates
    } else if (lead >= 0xF0 && lead <= 0xF4) {
        length = 4, c = lead & 0x07;
        if (lead == 0xF0) low = 0x90;
        if (lead == 0xF4) high = 0x8F;  // nothing beyond U+10FFFF
    } else {
        *cp = -1;
        return 1;
    }
    for (int i = 1; i < length; ++i, low = 0x80, high = 0xBF) {
        if (static_cast<size_t>(i) >= n) return 0;
        if (s[i] < low || s[i] > high) {
            *cp = -1;
            return 1;
        }
        c = (c << 6) | (s[i] & 0x3F);
    }
    *cp = c;
    return length;
}

// Sets the callbacks a codec converts with: stop at anything that cannot be
// converted, so the caller can keep such bytes as they are.
ConverterPtr StoppingClone(UConverter* cnv) {
    ConverterPtr clone = CloneConverter(cnv);
    if (!clone) return clone;
    UErrorCode err = U_ZERO_ERROR;
    ucnv_setToUCallBack(clone.get(), UCNV_TO_U_CALLBACK_STOP, nullptr, nullptr, nullptr, &err);
    ucnv_setFromUCallBack(clone.get(), UCNV_FROM_U_CALLBACK_STOP, nullptr, nullptr, nullptr, &err);
    return clone;
}

// Whether every byte below 0x80, read where a character begins, is that
// ASCII character on its own, and each ASCII character is written as that
// byte: such bytes need not go through the converter. Stateful and wide
// encodings are never taken to be so.
bool ConverterKeepsAscii(UConverter* cnv) {
    switch (ucnv_getType(cnv)) {
        case UCNV_SBCS:
        case UCNV_MBCS:
        case UCNV_LATIN_1:
        case UCNV_UTF8:
        case UCNV_US_ASCII:
        case UCNV_CESU8:
            break;
        default:
            return false;
    }
    bool keeps = true;
    for (int b = 0; b < 0x80 && keeps; ++b) {
        const char byte = static_cast<char>(b);
        const char* p = &byte;
        UErrorCode err = U_ZERO_ERROR;
        const UChar32 cp = ucnv_getNextUChar(cnv, &p, &byte + 1, &err);
        const UChar unit = static_cast<UChar>(b);
        char out[4];
        const int32_t length = ucnv_fromUChars(cnv, out, sizeof out, &unit, 1, &err);
        keeps = U_SUCCESS(err) && cp == b && length == 1 && out[0] == byte;
    }
    ucnv_reset(cnv);
    return keeps;
}

// A stopping clone of the current converter, kept per thread and lent to one
// codec at a time: cloning for every call cost more than upper-casing a name.
// Made again when the current converter has been replaced.
struct LentConverter {
    ConverterPtr cnv;
    unsigned changes = 0;
    bool lent = false;
    bool keepsAscii = false;
};
thread_local LentConverter tLent;

// Reads and writes single characters of one encoding: UTF-8 directly, a code
// page through a private converter that stops at anything it cannot convert
// (so the caller can keep such bytes as they are).
class CharCodec {
  public:
    // The interface encoding (the current converter in code-page mode).
    CharCodec() : CharCodec(mbIsUtf8Mode(), nullptr) {}
    // The code page of cnv.
    explicit CharCodec(UConverter* cnv) : CharCodec(false, cnv) {}
    CharCodec(const CharCodec&) = delete;
    CharCodec& operator=(const CharCodec&) = delete;
    ~CharCodec() {
        if (fBorrowed) tLent.lent = false;
    }

    // Whether bytes below 0x80 are ASCII characters of their own both ways.
    bool KeepsAscii() const { return fKeepsAscii; }

    // The contract of Utf8Next, in this codec's encoding.
    int Next(const char* p, size_t n, UChar32* cp) {
        if (fUtf8) return Utf8Next(p, n, cp);
        if (fKeepsAscii && static_cast<unsigned char>(*p) < 0x80) {
            *cp = static_cast<unsigned char>(*p);
            return 1;
        }
        if (!fCnv) {
            *cp = static_cast<unsigned char>(*p);
            return 1;
        }
        const char* end = p;
        UErrorCode err = U_ZERO_ERROR;
        UChar32 c = ucnv_getNextUChar(fCnv, &end, p + n, &err);
        int length = static_cast<int>(end - p);
        if (U_FAILURE(err)) ucnv_resetToUnicode(fCnv);
        if (err == U_TRUNCATED_CHAR_FOUND) return 0;
        *cp = U_SUCCESS(err) ? c : -1;
        return std::max(length, 1);
    }

    // Encodes cp into out (room for 16 bytes); the byte length, or -1 when
    // the encoding cannot hold it.
    int Encode(UChar32 cp, char* out) {
        if (fUtf8) {
            int length = 0;
            U8_APPEND_UNSAFE(out, length, cp);
            return length;
        }
        if (!fCnv) return -1;
        UChar units[2];
        int32_t count = 0;
        U16_APPEND_UNSAFE(units, count, cp);
        UErrorCode err = U_ZERO_ERROR;
        int32_t length = ucnv_fromUChars(fCnv, out, 16, units, count, &err);
        return U_SUCCESS(err) && length > 0 ? length : -1;
    }

  private:
    CharCodec(bool utf8, UConverter* cnv) : fUtf8(utf8), fKeepsAscii(utf8) {
        if (fUtf8) return;
        if (cnv == nullptr && !tLent.lent) {
            UConverter* current = CurrentConverter();
            if (current != nullptr && (!tLent.cnv || tLent.changes != CodePageConverterChanges())) {
                tLent.cnv = StoppingClone(current);
                tLent.changes = CodePageConverterChanges();
                tLent.keepsAscii = tLent.cnv && ConverterKeepsAscii(tLent.cnv.get());
            }
            fCnv = tLent.cnv.get();
            fBorrowed = tLent.lent = fCnv != nullptr;
            fKeepsAscii = fBorrowed && tLent.keepsAscii;
        } else {
            fOwn = StoppingClone(cnv);
            fCnv = fOwn.get();
        }
        if (fCnv) ucnv_reset(fCnv);
    }

    bool fUtf8;
    bool fKeepsAscii;
    bool fBorrowed = false;
    ConverterPtr fOwn;
    UConverter* fCnv = nullptr;
};

// The runtime library's view of the character at p: its byte length, 1 for a
// byte that starts no character, 0 for a character cut off by n.
int RuntimeStep(const char* p, size_t n) {
    mbstate_t state{};
    size_t length = mbrlen(p, n, &state);
    if (length == static_cast<size_t>(-2)) return 0;
    return length == static_cast<size_t>(-1) || length == 0 ? 1 : static_cast<int>(length);
}

// The byte length of the longest run of whole characters in the n bytes at
// text. Bytes that form no character are kept as units of their own unless
// stopAtMalformed; a character cut off by n always ends the run.
template <typename Step>
size_t WholeRun(const char* text, size_t n, Step step) {
    size_t pos = 0;
    while (pos < n) {
        int length = step(text + pos, n - pos);
        if (length <= 0) break;
        pos += length;
    }
    return pos;
}

size_t CodecRun(CharCodec& codec, const char* text, size_t n, bool stopAtMalformed) {
    return WholeRun(text, n, [&](const char* p, size_t k) {
        UChar32 cp = -1;
        int length = codec.Next(p, k, &cp);
        return cp < 0 && stopAtMalformed ? 0 : length;
    });
}

// What ICU's simple case mapping makes of an ASCII character.
char AsciiCase(char c, bool upper) {
    if (upper) return c >= 'a' && c <= 'z' ? static_cast<char>(c - 'a' + 'A') : c;
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

// Maps each character of the n bytes at src with ICU's simple case mapping
// into dst (dst may be src). A mapped character that the encoding cannot
// hold, or that would take more bytes than the original, is kept as it was,
// so a text never grows and nothing is lost. Stops before a character that
// does not fit in dstLen (error 1); malformed bytes are copied (error 3).
size_t CaseMap(const char* src, size_t n, char* dst, size_t dstLen, bool upper, int* error) {
    CharCodec codec;
    size_t read = 0, written = 0;
    while (read < n) {
        if (codec.KeepsAscii() && static_cast<unsigned char>(src[read]) < 0x80) {
            if (written == dstLen) {
                *error = 1;
                break;
            }
            dst[written++] = AsciiCase(src[read++], upper);
            continue;
        }
        UChar32 cp;
        int length = codec.Next(src + read, n - read, &cp);
        if (length == 0) length = static_cast<int>(n - read), cp = -1;
        if (cp < 0) *error = 3;
        char mapped[16];
        const char* out = src + read;
        int outLength = length;
        if (cp >= 0) {
            UChar32 target = upper ? u_toupper(cp) : u_tolower(cp);
            int m = target == cp ? -1 : codec.Encode(target, mapped);
            if (m > 0 && m <= length) out = mapped, outLength = m;
        }
        if (written + outLength > dstLen) {
            *error = 1;
            break;
        }
        memmove(dst + written, out, outLength);
        written += outLength;
        read += length;
    }
    return written;
}

void CaseMapInPlace(char* text, bool upper) {
    if (!text) return;
    size_t length = strlen(text);
    int error = 0;
    size_t written = CaseMap(text, length, text, length, upper, &error);
    memset(text + written, ' ', length - written);
}

int CaseMapInto(const char* src, int srcLen, char* dst, int dstLen, bool upper, int* error) {
    int ignored;
    if (!error) error = &ignored;
    *error = 0;
    if (!dst || dstLen <= 0) return 0;
    size_t written = CaseMap(src, TextLength(src, srcLen), dst, dstLen, upper, error);
    if (written < static_cast<size_t>(dstLen)) dst[written] = '\0';
    return static_cast<int>(written);
}

// The case-folded ordering of two texts: -1, 0 or 1.
int CompareNoCase(const char* a, size_t lenA, const char* b, size_t lenB, int* error) {
    CharCodec codecA, codecB;
    size_t posA = 0, posB = 0;
    auto next = [error](CharCodec& codec, const char* text, size_t n, size_t& pos) {
        UChar32 cp;
        int length = codec.Next(text + pos, n - pos, &cp);
        if (length == 0 || cp < 0) {
            // A malformed sequence: its first byte stands for itself, unfolded.
            if (error) *error = 3;
            pos += 1;
            return static_cast<UChar32>(static_cast<unsigned char>(text[pos - 1]));
        }
        pos += length;
        return u_tolower(cp);
    };
    while (posA < lenA && posB < lenB) {
        UChar32 ca = next(codecA, a, lenA, posA);
        UChar32 cb = next(codecB, b, lenB, posB);
        if (ca != cb) return ca < cb ? -1 : 1;
    }
    if (posA < lenA) return 1;
    return posB < lenB ? -1 : 0;
}

// The number of bytes in front of the UTF-8 character that a cut at c bytes
// splits, or c when the cut splits none. Looks only at the c bytes written.
int Utf8CutPoint(const char* dst, int c) {
    int start = c - 1;
    while (start > 0 && c - start < 4 && U8_IS_TRAIL(dst[start])) --start;
    auto lead = static_cast<unsigned char>(dst[start]);
    int length = lead >= 0xF0 ? 4 : lead >= 0xE0 ? 3 : lead >= 0xC0 ? 2 : 1;
    return start + length > c ? start : c;
}

int ErrorOf(UErrorCode err) {
    if (err == U_BUFFER_OVERFLOW_ERROR) return 1;
    if (err == kSubstitutedUnassigned || err == kSubstitutedIllegal || U_FAILURE(err)) return 3;
    return 0;
}

// One conversion between a code page and UTF-8 through the given converter,
// or a private clone of the current one when none is given.
class Conversion {
  public:
    Conversion(bool toUtf8, UConverter* cnv)
        : fToUtf8(toUtf8),
          fClone(cnv ? nullptr : CloneConverter(nullptr)),
          fCnv(cnv ? cnv : fClone.get()) {}

    UConverter* Converter() const { return fCnv; }

    // ICU's algorithmic conversion from the start state of the direction:
    // at most capacity bytes go to dst; returns the full length needed.
    int Run(char* dst, int capacity, const char* src, int srcLen, UErrorCode* err) {
        const char* source = src ? src : "";
        int length = srcLen < 0 ? static_cast<int>(strlen(source)) : src ? srcLen : 0;
        if (fToUtf8) {
            ucnv_resetToUnicode(fCnv);
            return ucnv_toAlgorithmic(UCNV_UTF8, fCnv, dst, capacity, source, length, err);
        }
        ucnv_resetFromUnicode(fCnv);
        return ucnv_fromAlgorithmic(fCnv, UCNV_UTF8, dst, capacity, source, length, err);
    }

  private:
    bool fToUtf8;
    ConverterPtr fClone;
    UConverter* fCnv;
};

// Converts with the cut, blank and terminator rules of the entry points.
int Convert(bool toUtf8, UConverter* cnv, char* dst, int dstSize, const char* src, int srcLen,
            int* error) {
    int ignored;
    if (!error) error = &ignored;
    *error = 0;
    Conversion conversion(toUtf8, cnv);
    if (!conversion.Converter()) {
        *error = 3;
        return 0;
    }
    if (!dst) dstSize = 0;
    bool terminate = srcLen < 0;
    int c = terminate && dstSize > 0 ? dstSize - 1 : std::max(dstSize, 0);
    UErrorCode err = U_ZERO_ERROR;
    int n = conversion.Run(dst, c, src, srcLen, &err);
    *error = ErrorOf(err);
    if (U_FAILURE(err) && err != U_BUFFER_OVERFLOW_ERROR) n = 0;
    if (n > c) {
        // Cut to whole characters, also when there is no room at all, so that
        // neither the count nor the terminator ever goes past the buffer.
        n = 0;
        if (c > 0) {
            CharCodec codec(conversion.Converter());
            n = toUtf8 ? Utf8CutPoint(dst, c)
                       : static_cast<int>(CodecRun(codec, dst, strnlen(dst, c), true));
            memset(dst + n, ' ', c - n);
        }
    } else if (n < c && !terminate) {
        dst[n] = ' ';
    }
    if (terminate && dstSize > 0) dst[n] = '\0';
    return n;
}

int ConvertedLength(bool toUtf8, UConverter* cnv, const char* src, int srcLen, int* error) {
    int ignored;
    if (!error) error = &ignored;
    Conversion conversion(toUtf8, cnv);
    if (!conversion.Converter()) {
        *error = 3;
        return 0;
    }
    UErrorCode err = U_ZERO_ERROR;
    int n = conversion.Run(nullptr, 0, src, srcLen, &err);
    if (err == U_BUFFER_OVERFLOW_ERROR) err = U_ZERO_ERROR;
    *error = ErrorOf(err);
    return U_FAILURE(err) ? 0 : n;
}

}  // namespace

int mbIsUtf8Mode() { return gUtf8Mode ? 1 : 0; }

void mbSetUtf8Mode(int flag) {
    if (gUtf8Mode.exchange(flag != 0) != (flag != 0)) ++gModeChanges;
}

unsigned mbGeneration() { return gModeChanges + CodePageConverterChanges(); }

mbTextEncodingScope::mbTextEncodingScope()
    : fMode(mbIsUtf8Mode()), fLengthsFromConverter(gLengthsFromConverter) {
    mbSetUtf8Mode(1);
}

mbTextEncodingScope::mbTextEncodingScope(ConverterPtr cnv)
    : fMode(mbIsUtf8Mode()), fLengthsFromConverter(gLengthsFromConverter), fCnv(std::move(cnv)) {
    fpPrevious = ExchangeCurrentConverter(fCnv.get());
    gLengthsFromConverter = true;
    mbSetUtf8Mode(0);
}

mbTextEncodingScope::~mbTextEncodingScope() {
    mbSetUtf8Mode(fMode);
    gLengthsFromConverter = fLengthsFromConverter;
    if (fCnv) ExchangeCurrentConverter(fpPrevious);
}

int mbCharLength(const char* text, size_t n) {
    if (!text || n == 0 || *text == '\0') return 0;
    if (mbIsUtf8Mode() || gLengthsFromConverter) {
        CharCodec codec;
        UChar32 cp;
        int length = codec.Next(text, n, &cp);
        return length == 0 || cp < 0 ? -1 : length;
    }
    // Letters, digits and the underscore are single bytes in every locale's
    // initial shift state, as the C standard has it.
    const char c = *text;
    if ((c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') || c == '_')
        return 1;
    mbstate_t state{};
    size_t length = mbrlen(text, n, &state);
    return length == static_cast<size_t>(-1) || length == static_cast<size_t>(-2)
               ? -1
               : static_cast<int>(length);
}

void mbToUpperInPlace(char* text) { CaseMapInPlace(text, true); }
void mbToLowerInPlace(char* text) { CaseMapInPlace(text, false); }

int mbToUpper(const char* src, int srcLen, char* dst, int dstLen, int* error) {
    return CaseMapInto(src, srcLen, dst, dstLen, true, error);
}

int mbToLower(const char* src, int srcLen, char* dst, int dstLen, int* error) {
    return CaseMapInto(src, srcLen, dst, dstLen, false, error);
}

int mbEqualNoCase(const char* a, int lenA, const char* b, int lenB, int* error) {
    if (error) *error = 0;
    return CompareNoCase(a, TextLength(a, lenA), b, TextLength(b, lenB), error) == 0;
}

int mbCompareNoCase(const char* a, const char* b) {
    return CompareNoCase(a, TextLength(a, -1), b, TextLength(b, -1), nullptr);
}

char* mbTruncate(char* text, int n) {
    if (!text) return text;
    CharCodec codec;
    text[CodecRun(codec, text, TextLength(text, std::max(n, 0)), false)] = '\0';
    return text;
}

std::string mbPrefix(std::string_view text, size_t maxBytes) {
    std::string cut(text.substr(0, maxBytes));
    cut.resize(strlen(mbTruncate(&cut[0], int(cut.size()))));
    return cut;
}

void mbCopyBounded(char* dst, const char* src, size_t size) {
    if (!dst || size == 0) return;
    size_t n = src ? strnlen(src, size - 1) : 0;
    CharCodec codec;
    size_t run = n ? CodecRun(codec, src, n, false) : 0;
    if (run) memmove(dst, src, run);
    memset(dst + run, 0, size - run);
}

void mbCopyPadded(char* dst, size_t size, const char* src, int srcLen) {
    if (!dst || size == 0 || (!src && srcLen != 0)) return;
    size_t limit = srcLen < 0 ? size : std::min(size, static_cast<size_t>(srcLen));
    size_t n = src ? strnlen(src, limit) : 0;
    size_t run;
    if (mbIsUtf8Mode() || gLengthsFromConverter) {
        CharCodec codec;
        run = CodecRun(codec, src, n, false);
    } else {
        run = WholeRun(src, n, RuntimeStep);
    }
    if (run) memmove(dst, src, run);
    memset(dst + run, ' ', size - run);
}

const char* mbFindLastChar(const char* text, UChar32 c) {
    if (!text || c < 0) return nullptr;
    // Only UTF-8 keeps ASCII bytes out of its multibyte sequences; a
    // double-byte code page may use them as trail bytes.
    if (c >= 0 && c < 0x80 && mbIsUtf8Mode()) return strrchr(text, c);
    CharCodec codec;
    const char* found = nullptr;
    for (size_t pos = 0, n = strlen(text); pos < n;) {
        UChar32 cp;
        int length = codec.Next(text + pos, n - pos, &cp);
        if (length == 0) break;
        if (cp == c) found = text + pos;
        pos += length;
    }
    return found;
}

int mbCodePageToUtf8(UConverter* cnv, char* dst, int dstSize, const char* src, int srcLen,
                     int* error) {
    return Convert(true, cnv, dst, dstSize, src, srcLen, error);
}

int mbUtf8ToCodePage(UConverter* cnv, char* dst, int dstSize, const char* src, int srcLen,
                     int* error) {
    return Convert(false, cnv, dst, dstSize, src, srcLen, error);
}

int mbCodePageToUtf8Length(UConverter* cnv, const char* src, int srcLen, int* error) {
    return ConvertedLength(true, cnv, src, srcLen, error);
}

int mbUtf8ToCodePageLength(UConverter* cnv, const char* src, int srcLen, int* error) {
    return ConvertedLength(false, cnv, src, srcLen, error);
}
