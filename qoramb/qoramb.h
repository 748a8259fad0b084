// Byte-string routines that respect character boundaries in the interface
// encoding: the code page of the current locale, or UTF-8. Each entry point
// picks its implementation from the process-wide interface encoding flag.
//
// Texts are byte strings, zero-terminated unless a length is given; a length
// of -1 means "up to the terminator". No routine reads past the length it is
// given or past a terminator. Cuts keep whole characters only: a character
// that a length would split is dropped, while bytes that form no character at
// all count as one-byte units and are kept.
#pragma once

#include <unicode/ucnv.h>
#include <unicode/umachine.h>

#include <cstddef>
#include <string>
#include <string_view>

#include "codepage.h"

// The interface encoding flag: 0 code-page mode (the state at load), 1 UTF-8.
int mbIsUtf8Mode();
void mbSetUtf8Mode(int flag);
// Changes with every change of the interface encoding or of the current
// code-page converter, so caches of converted text can tell they are stale.
unsigned mbGeneration();

// Handles text in another encoding than the interface's until destroyed,
// then puts the mode and the current converter back: how a file's text is
// read in the file's own encoding before it is converted.
class mbTextEncodingScope {
  public:
    // UTF-8 mode; the code page stays as it is.
    mbTextEncodingScope();
    // Code-page mode in the code page of cnv, which the scope takes over.
    // Character lengths then come from that converter, not from the
    // runtime's locale, which need not share its code page.
    explicit mbTextEncodingScope(ConverterPtr cnv);
    ~mbTextEncodingScope();
    mbTextEncodingScope(const mbTextEncodingScope&) = delete;
    mbTextEncodingScope& operator=(const mbTextEncodingScope&) = delete;

  private:
    int fMode;
    bool fLengthsFromConverter;
    ConverterPtr fCnv;
    UConverter* fpPrevious = nullptr;
};

// Byte length of the character at text; 0 for a null or empty text or n = 0,
// -1 when the bytes do not form a whole character within n bytes.
int mbCharLength(const char* text, size_t n);

// Case mapping with ICU's simple mapping per character. A character whose
// mapping the encoding cannot hold, or whose mapping takes more bytes, is
// kept as it is, so a text never grows and never loses a character.
// In place: the byte length never changes; a shorter result is blank-padded.
void mbToUpperInPlace(char* text);
void mbToLowerInPlace(char* text);
// Case mapping into a separate destination of dstLen bytes; returns the
// number of bytes written, followed by a terminator when there is room.
// error (may be null): 0, 1 when a character did not fit, 3 when the source
// is malformed (malformed bytes are copied as they are).
int mbToUpper(const char* src, int srcLen, char* dst, int dstLen, int* error);
int mbToLower(const char* src, int srcLen, char* dst, int dstLen, int* error);

// 1 when the texts are equal after case folding, else 0. error (may be null)
// is set to 3 when a text is malformed.
int mbEqualNoCase(const char* a, int lenA, const char* b, int lenB, int* error);
// -1, 0 or 1: the case-folded ordering of two zero-terminated texts.
int mbCompareNoCase(const char* a, const char* b);

// Terminates text at the largest whole-character boundary not beyond n bytes.
char* mbTruncate(char* text, int n);
// The longest prefix of text, up to its first NUL, of at most maxBytes bytes
// that ends on a whole character.
std::string mbPrefix(std::string_view text, size_t maxBytes);
// Copies the longest run of whole characters that fits in size - 1 bytes and
// zero-fills the rest of the size bytes.
void mbCopyBounded(char* dst, const char* src, size_t size);
// Copies the longest run of whole characters that fits within
// min(size, srcLen) bytes and blank-fills the rest of size (no terminator).
void mbCopyPadded(char* dst, size_t size, const char* src, int srcLen);
// The last occurrence of the code point c in text, or null.
const char* mbFindLastChar(const char* text, UChar32 c);

// Conversion between a code page (the converter's, or the current one when
// cnv is null) and UTF-8, independent of the interface encoding. Returns the
// number of bytes in the destination; error is 0, 1 (cut) or 3 (lossy).
// A srcLen of -1 converts up to the terminator and terminates the result
// within dstSize. With a given length no terminator is written: a cut result
// is blank-filled to dstSize, a shorter one gets one blank after it. A cut
// always falls between whole characters of the destination's encoding.
int mbCodePageToUtf8(UConverter* cnv, char* dst, int dstSize, const char* src, int srcLen,
                     int* error);
int mbUtf8ToCodePage(UConverter* cnv, char* dst, int dstSize, const char* src, int srcLen,
                     int* error);
int mbCodePageToUtf8Length(UConverter* cnv, const char* src, int srcLen, int* error);
int mbUtf8ToCodePageLength(UConverter* cnv, const char* src, int srcLen, int* error);
