// The multibyte routines, conversions and code pages, in UTF-8 mode and in
// code-page mode under single-byte and double-byte code pages. Inputs sit in
// heap blocks of exactly their bytes, so the sanitizer catches a read past a
// length; a terminator is part of the bytes only where the row gives no length.
// A conversion into a bounded destination without a length terminates the
// result, with one it puts one blank after a result shorter than the
// destination; a cut sets the error to 1, a substitution to 3.
#include <gtest/gtest.h>

#include <cstring>
#include <memory>
#include <string>

#include "encoding_scope.h"  // with the code page and multibyte routines

using namespace std::string_literals;

namespace {

// The bytes in a heap block of exactly their size, without terminator.
std::unique_ptr<char[]> Exact(const std::string& bytes) {
    std::unique_ptr<char[]> block(new char[bytes.size()]);
    memcpy(block.get(), bytes.data(), bytes.size());
    return block;
}

// A routine's result as text; size is that of the destination it fills, if any.
using Routine = std::string (*)(const std::string& bytes, int arg, size_t size);

std::string CharLength(const std::string& bytes, int n, size_t) {
    return std::to_string(mbCharLength(Exact(bytes).get(), size_t(n)));
}
// In place: upper case when arg is 1, lower case when 0.
std::string Mapped(const std::string& bytes, int upper, size_t) {
    auto text = Exact(bytes + '\0');
    upper ? mbToUpperInPlace(text.get()) : mbToLowerInPlace(text.get());
    return text.get();
}
std::string Truncate(const std::string& bytes, int n, size_t) {
    auto text = Exact(bytes + '\0');
    return mbTruncate(text.get(), n);
}
std::string LastChar(const std::string& bytes, int c, size_t) {
    auto text = Exact(bytes + '\0');
    const char* at = mbFindLastChar(text.get(), c);
    return at ? std::to_string(at - text.get()) : "none";
}
// Zero-fills, and reads the source only up to size - 1 bytes.
std::string Bounded(const std::string& bytes, int, size_t size) {
    auto dst = Exact(std::string(size, 'x'));
    mbCopyBounded(dst.get(), Exact(bytes).get(), size);
    return std::string(dst.get(), size);
}
// Blank-fills; a byte that starts no character is copied.
std::string Padded(const std::string& bytes, int srcLen, size_t size) {
    auto dst = Exact(std::string(size, 'x'));
    mbCopyPadded(dst.get(), size, Exact(bytes).get(), srcLen);
    return std::string(dst.get(), size);
}

TEST(Routines, EachRespectsWholeCharacters) {
    const std::tuple<Encoding, Routine, std::string, int, std::string> rows[] = {
        // clang-format off
        {kUtf8, CharLength, "\xC3\xA9", 2, "2"}, {kUtf8, CharLength, "\xA9", 1, "-1"},
        {kUtf8, CharLength, "\0"s, 5, "0"}, {kUtf8, CharLength, "a", 0, "0"},
        {kUtf8, CharLength, "a", 1, "1"}, {kUtf8, CharLength, "\xF0\x9F\x98\x80", 4, "4"},
        // A lead byte before the terminator, overlong forms, a surrogate, beyond U+10FFFF,
        // bytes that lead nothing, and a character longer than the bytes given.
        {kUtf8, CharLength, "\xC3\0"s, 2, "-1"}, {kUtf8, CharLength, "\xC0\x80", 2, "-1"},
        {kUtf8, CharLength, "\xE0\x80\x80", 3, "-1"}, {kUtf8, CharLength, "\xED\xA0\x80", 3, "-1"},
        {kUtf8, CharLength, "\xF4\x90\x80\x80", 4, "-1"}, {kUtf8, CharLength, "\xFE", 1, "-1"},
        {kUtf8, CharLength, "\xFF", 1, "-1"}, {kUtf8, CharLength, "\xE4\xB8", 2, "-1"},
        {kUtf8, CharLength, "\xE4\xB8\xAD", 3, "3"}, {kCp1252, CharLength, "\xE9", 1, "1"},
        {kGbk, CharLength, "\xD6\xD0", 2, "2"}, {kGbk, CharLength, "a", 1, "1"},
        {kGbk, CharLength, "\xD6", 1, "-1"}, {kGbk, CharLength, "\0"s, 1, "0"},
        // The dotless i upper-cases and the capital I with dot lower-cases to one byte;
        // a character that would grow, or whose capital the code page lacks, is kept.
        {kUtf8, Mapped, "a\xC4\xB1z", 1, "AIZ "}, {kUtf8, Mapped, "\xC4\xB0X", 0, "ix "},
        {kUtf8, Mapped, "stra\xC3\x9F\x65 \xC3\xA9t\xC3\xA9", 1,
         "STRA\xC3\x9F\x45 \xC3\x89T\xC3\x89"},
        {kUtf8, Mapped, "\xC9\x90x", 1, "\xC9\x90X"}, {kUtf8, Mapped, "a\xFF\xC3", 1, "A\xFF\xC3"},
        {kCp1252, Mapped, "\xB5m", 1, "\xB5M"}, {kLatin1, Mapped, "\xFF\xE0", 1, "\xFF\xC0"},
        {kCp1252, Mapped, "\xE9t\xE9 \xFF", 1, "\xC9T\xC9 \x9F"},
        {kGbk, Mapped, "a\xD6\xD0\x62", 1, "A\xD6\xD0\x42"},
        {kGbk, Mapped, "\x81\x61z", 1, "\x81\x61Z"},  // an ASCII trail byte stays as it is
        {kUtf8, Truncate, "ab\xC3\xA9z", 3, "ab"},
        {kUtf8, Truncate, "ab\xC3\xA9z", 4, "ab\xC3\xA9"},
        {kUtf8, Truncate, "ab\xC3\xA9", 40, "ab\xC3\xA9"},
        {kUtf8, Truncate, "\xE4\xB8\xADx", 2, ""}, {kUtf8, Truncate, "a\xFF\x62", 2, "a\xFF"},
        {kCp1252, Truncate, "\x80\x80\x80", 2, "\x80\x80"},
        {kGbk, Truncate, "a\xD6\xD0\xCE\xC4", 2, "a"},
        {kGbk, Truncate, "a\xD6\xD0\xCE\xC4", 4, "a\xD6\xD0"}, {kUtf8, LastChar, "a.b.c", '.', "3"},
        {kUtf8, LastChar, "\xC3\xA9.\xC3\xA9x", 0xE9, "3"},
        {kUtf8, LastChar, "\xC3\xA9.\xC3\xA9x", 0x4E2D, "none"},
        {kUtf8, LastChar, "a\xFF", -1, "none"}, {kCp1252, LastChar, "\xE9x\xE9y", 0xE9, "2"},
        // 0x81 0x5C is one character whose trail byte is the backslash.
        {kGbk, LastChar, "x\\\x81\x5C", '\\', "1"}, {kGbk, LastChar, "\x81\x5C", '\\', "none"},
        {kGbk, LastChar, "\xD6\xD0x\xD6\xD0", 0x4E2D, "3"},
        {kUtf8, Bounded, "ab\xC3\xA9\0"s, 0, "ab\0\0"s}, {kUtf8, Bounded, "xyz", 0, "xyz\0"s},
        {kGbk, Bounded, "a\xD6\xD0\0"s, 0, "a\0\0"s}, {kUtf8, Padded, "abc", 3, "abc     "},
        // A length that cuts a character leaves it out.
        {kUtf8, Padded, "ab\xC3\xA9", 4, "ab "}, {kUtf8, Padded, "ab\xC3\xA9", 3, "ab      "},
        {kUtf8, Padded, "ab\xC3\xA9", 4, "ab\xC3\xA9    "}, {kGbk, Padded, "a\xD6\xD0", 2, "a   "},
        {kUtf8, Padded, "a\xFF\x62\0"s, -1, "a\xFF\x62     "},
        {kGbk, Padded, "a\xD6\xD0\0"s, -1, "a "}, {kGbk, Padded, "a\xD6\xD0", 3, "a\xD6\xD0 "},
        {kGbk, Padded, "\xFF\x61\0"s, -1, "\xFF\x61  "},
        // clang-format on
    };
    for (const auto& [enc, routine, bytes, arg, expected] : rows) {
        EncodingScope scope(enc);
        EXPECT_EQ(routine(bytes, arg, expected.size()), expected) << enc.converter << " " << bytes;
    }
    EncodingScope scope(kUtf8);
    EXPECT_EQ(mbCharLength(nullptr, 5), 0);
    EXPECT_EQ(mbFindLastChar(nullptr, 'a'), nullptr);
    auto dst = Exact("xxxx");
    mbCopyBounded(dst.get(), nullptr, 4);
    EXPECT_EQ(std::string(dst.get(), 4), std::string(4, '\0'));
    mbCopyBounded(nullptr, "abc", 4);
    mbCopyPadded(dst.get(), 4, nullptr, 0);
    EXPECT_EQ(std::string(dst.get(), 4), "    ");
    dst[0] = 'q';
    mbCopyPadded(dst.get(), 4, nullptr, 3);
    EXPECT_EQ(dst[0], 'q');
}

TEST(Routines, EqualAndCompareIgnoringCase) {
    // Both texts with their lengths, then whether equal and the error.
    const std::tuple<Encoding, std::string, int, std::string, int, int, int> equal[] = {
        // clang-format off
        {kUtf8, "WITH\0"s, -1, "with\0"s, -1, 1, 0}, {kUtf8, "with\0"s, -1, "withx\0"s, -1, 0, 0},
        {kUtf8, "\xC3\x84\xC3\x96\0"s, -1, "\xC3\xA4\xC3\xB6\0"s, -1, 1, 0},
        {kUtf8, "ABC", 3, "abcd", 3, 1, 0}, {kUtf8, "ABC", 3, "abcd", 4, 0, 0},
        // A lead byte at the end of the given length is malformed, not a character.
        {kUtf8, "a\xC3\xA9", 2, "A\xC3\0"s, -1, 1, 3},
        {kUtf8, "\xC3\xA9\0"s, -1, "\xC3\0"s, -1, 0, 3},
        // Malformed bytes stand for themselves: not folded as if they were Latin-1.
        {kUtf8, "\xC9\0"s, -1, "\xE9\0"s, -1, 0, 3},
        {kCp1252, "\xC4RGER\0"s, -1, "\xE4rger\0"s, -1, 1, 0},
        {kGbk, "ABC\xD6\xD0\0"s, -1, "abc\xD6\xD0\0"s, -1, 1, 0},
        {kGbk, "ab\xD6", 3, "AB\xD6\0"s, -1, 1, 3},
        // clang-format on
    };
    for (const auto& [enc, a, lenA, b, lenB, same, expectedError] : equal) {
        EncodingScope scope(enc);
        int error = -7;
        EXPECT_EQ(mbEqualNoCase(Exact(a).get(), lenA, Exact(b).get(), lenB, &error), same) << a;
        EXPECT_EQ(error, expectedError) << a;
    }
    // By code point, not byte: U+4E2D before U+6587 in GBK.
    const std::tuple<Encoding, const char*, const char*, int> order[] = {
        // clang-format off
        {kUtf8, "abc", "ABD", -1}, {kUtf8, "ABC", "abc", 0}, {kUtf8, "ab", "abc", -1},
        {kUtf8, "abc", "ab", 1}, {kUtf8, "\xC3\xA9", "z", 1}, {kUtf8, "", nullptr, 0},
        {kCp1252, "\xE4", "\xC4", 0}, {kGbk, "\xD6\xD0", "\xCE\xC4", -1},
        // clang-format on
    };
    for (const auto& [enc, a, b, expected] : order) {
        EncodingScope scope(enc);
        EXPECT_EQ(mbCompareNoCase(a, b), expected) << a;
    }
}

TEST(Routines, GenerationChangesWithModeAndConverter) {
    EncodingScope scope({"C", "cp1252", 0});
    const unsigned start = mbGeneration();
    mbSetUtf8Mode(0);
    EXPECT_EQ(mbGeneration(), start);
    mbSetUtf8Mode(1);
    const unsigned utf8 = mbGeneration();
    EXPECT_NE(utf8, start);
    mbSetUtf8Mode(1);
    EXPECT_EQ(mbGeneration(), utf8);
    EXPECT_TRUE(SetCodePageConverter("GBK"));
    const unsigned gbk = mbGeneration();
    EXPECT_NE(gbk, utf8);
    EXPECT_TRUE(SetCodePageConverter("936"));  // the same converter
    EXPECT_FALSE(SetCodePageConverter("no-such-encoding"));
    EXPECT_EQ(mbGeneration(), gbk);
}

// Each routine here writes into a bounded destination of the current encoding.
using Into = int (*)(const char* src, int srcLen, char* dst, int dstSize, int* error);
int ToUtf8(const char* src, int srcLen, char* dst, int dstSize, int* error) {
    return mbCodePageToUtf8(nullptr, dst, dstSize, src, srcLen, error);
}
int FromUtf8(const char* src, int srcLen, char* dst, int dstSize, int* error) {
    return mbUtf8ToCodePage(nullptr, dst, dstSize, src, srcLen, error);
}

TEST(Convert, CutsBlanksTerminatorsAndErrors) {
    // The source with its length, the destination size, the result, the
    // leading bytes of the destination and the error.
    const std::tuple<Encoding, Into, std::string, int, int, int, std::string, int> rows[] = {
        // clang-format off
        {kCp1252, ToUtf8, "caf\xE9 \x80\0"s, -1, 16, 9, "caf\xC3\xA9 \xE2\x82\xAC\0"s, 0},
        // Room for 3 bytes and the terminator: the second character would be split.
        {kCp1252, ToUtf8, "\xE9\xE9\xE9\0"s, -1, 4, 2, "\xC3\xA9\0x"s, 1},
        {kCp1252, ToUtf8, "\xE9\0"s, -1, 1, 0, "\0"s, 1},
        // The cut is found in the bytes written, never past the destination.
        {kCp1252, ToUtf8, "\xE9\xE9", 2, 3, 2, "\xC3\xA9 ", 1},
        {kCp1252, ToUtf8, "\xE9\xE9", 1, 5, 2, "\xC3\xA9 xx", 0},
        {kCp1252, ToUtf8, "a\0\xE9"s, 3, 8, 4, "a\0\xC3\xA9 "s, 0},  // a zero byte too
        {kGbk, ToUtf8, "a\xD6\xD0\0"s, -1, 16, 4, "a\xE4\xB8\xAD\0"s, 0},
        // A lead byte at the end of the given length is illegal input: substituted.
        {kGbk, ToUtf8, "a\xD6", 2, 16, 2, "a? ", 3},
        // To GBK, cut before the double-byte character that does not fit.
        {kGbk, FromUtf8, "a\xE4\xB8\xAD\xE4\xB8\xAD", 7, 4, 3, "a\xD6\xD0 ", 1},
        {kCp1252, FromUtf8, "a\xE4\xB8\xAD\xE2\x82\xAC\0"s, -1, 16, 3, "a?\x80\0"s, 3},
        {kCp1252, FromUtf8, "\0"s, -1, 16, 0, "\0"s, 0},
        // Malformed UTF-8: a lone lead byte, an invalid byte, overlong, surrogate.
        {kCp1252, FromUtf8, "a\xC3", 2, 16, 2, "a? ", 3},
        {kCp1252, FromUtf8, "a\xFF", 2, 16, 2, "a? ", 3},
        {kCp1252, FromUtf8, "a\xC0\x80", 3, 16, 3, "a?? ", 3},
        {kCp1252, FromUtf8, "a\xED\xA0\x80", 4, 16, 4, "a??? ", 3},
        // Case mapping into a destination: a character that does not fit is left out.
        {kUtf8, mbToUpper, "a\xC3\xA9\x62\0"s, -1, 4, 4, "A\xC3\x89\x42", 0},
        {kUtf8, mbToUpper, "a\xC3\xA9\0"s, -1, 2, 1, "A\0"s, 1},
        {kUtf8, mbToLower, "abc\xC3", 4, 8, 4, "abc\xC3", 3},
        {kUtf8, mbToLower, "ABC", 2, 8, 2, "ab\0"s, 0},
        {kLatin1, mbToLower, "\xC0\xC9\0"s, -1, 4, 2, "\xE0\xE9\0"s, 0},
        // clang-format on
    };
    for (const auto& [enc, routine, src, srcLen, dstSize, result, dst, expectedError] : rows) {
        EncodingScope scope(enc);
        auto out = Exact(std::string(dstSize, 'x'));
        int error = -7;
        EXPECT_EQ(routine(Exact(src).get(), srcLen, out.get(), dstSize, &error), result) << src;
        EXPECT_EQ(std::string(out.get(), dst.size()), dst) << src;
        EXPECT_EQ(error, expectedError) << src;
    }
    EncodingScope scope(kUtf8);
    char out[4];
    EXPECT_EQ(mbToLower("AB", -1, out, sizeof out, nullptr), 2);
}

// The runtime locale's own locale and encoding, when it names a code page.
TEST(Locale, SystemLocaleInfo) {
    std::string locale, encoding;
    EncodingScope gbk(kGbk);
    ASSERT_TRUE(GetSystemLocaleInfo(locale, encoding));
    EXPECT_EQ(locale + " " + encoding, "zh_Hans_CN GBK");
    EncodingScope none({"C", "ISO-8859-1", 0});
    EXPECT_FALSE(GetSystemLocaleInfo(locale, encoding));
}

}  // namespace
