// Conversion between a code page and UTF-8, and case mapping, into bounded
// destinations. Without a length the result is terminated; with one it gets one
// blank after it when shorter than the destination. A cut sets the error to 1,
// a substitution to 3.
#include "mbtest.h"

namespace {

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

TEST(Convert, LengthsNoDestinationAndTheCurrentConverter) {
    ConverterPtr cp1252(OpenConverter("cp1252")), gbk(OpenConverter("GBK"));
    int error = -7;
    EXPECT_EQ(mbCodePageToUtf8(cp1252.get(), nullptr, 0, Exact("\xE9\xE9").get(), 2, &error), 0);
    EXPECT_EQ(error, 1);
    EXPECT_EQ(mbCodePageToUtf8Length(cp1252.get(), Exact("a\0b"s).get(), 3, &error), 3);
    EXPECT_EQ(mbCodePageToUtf8Length(gbk.get(), "a\xD6\xD0\xCE\xC4", -1, &error), 7);
    EXPECT_EQ(error, 0);
    EXPECT_EQ(mbUtf8ToCodePageLength(gbk.get(), Exact("a\xE4\xB8\xAD").get(), 4, &error), 3);
    EXPECT_EQ(error, 0);

    EncodingScope scope(kCp1252);
    char dst[8];
    EXPECT_EQ(mbUtf8ToCodePageLength(nullptr, "\xC3\xA9\xC3\xA9", -1, &error), 2);
    EXPECT_EQ(mbUtf8ToCodePage(nullptr, dst, sizeof dst, "\xC3\xA9", -1, nullptr), 1);
    EXPECT_STREQ(dst, "\xE9");
}

}  // namespace
