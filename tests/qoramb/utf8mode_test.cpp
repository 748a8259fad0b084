// The multibyte routines in UTF-8 mode.
#include "mbtest.h"

namespace {

class Utf8Mode : public ::testing::Test {
  protected:
    EncodingScope fScope{"en_US.UTF-8", "UTF-8", 1};
};

TEST_F(Utf8Mode, CharLengthOfWellFormedAndMalformedSequences) {
    EXPECT_EQ(mbCharLength("\xC3\xA9", 2), 2);
    EXPECT_EQ(mbCharLength("\xA9", 1), -1);
    EXPECT_EQ(mbCharLength("\xC3", 2), -1);  // lead byte followed by the terminator
    EXPECT_EQ(mbCharLength("", 5), 0);
    EXPECT_EQ(mbCharLength(nullptr, 5), 0);
    EXPECT_EQ(mbCharLength("a", 0), 0);
    EXPECT_EQ(mbCharLength("a", 1), 1);
    EXPECT_EQ(mbCharLength("\xF0\x9F\x98\x80", 4), 4);
    EXPECT_EQ(mbCharLength("\xC0\x80", 2), -1);      // overlong
    EXPECT_EQ(mbCharLength("\xE0\x80\x80", 3), -1);  // overlong
    EXPECT_EQ(mbCharLength("\xED\xA0\x80", 3), -1);  // surrogate
    EXPECT_EQ(mbCharLength("\xF4\x90\x80\x80", 4), -1);
    EXPECT_EQ(mbCharLength("\xFE", 1), -1);
    EXPECT_EQ(mbCharLength("\xFF", 1), -1);
    // A character longer than the bytes given, in a block of exactly those bytes.
    auto cut = Exact("\xE4\xB8");
    EXPECT_EQ(mbCharLength(cut.get(), 2), -1);
    auto whole = Exact("\xE4\xB8\xAD");
    EXPECT_EQ(mbCharLength(whole.get(), 3), 3);
}

TEST_F(Utf8Mode, InPlaceCaseMappingKeepsTheByteLength) {
    char dotless[] = "a\xC4\xB1z";  // the dotless i upper-cases to one byte
    mbToUpperInPlace(dotless);
    EXPECT_STREQ(dotless, "AIZ ");
    char dotted[] = "\xC4\xB0X";  // capital I with dot lower-cases to one byte
    mbToLowerInPlace(dotted);
    EXPECT_STREQ(dotted, "ix ");
    char accents[] = "stra\xC3\x9F\x65 \xC3\xA9t\xC3\xA9";
    mbToUpperInPlace(accents);
    EXPECT_STREQ(accents, "STRA\xC3\x9F\x45 \xC3\x89T\xC3\x89");
    // U+0250 upper-cases to a 3-byte character: kept as it is, nothing is cut.
    char grows[] = "\xC9\x90x";
    mbToUpperInPlace(grows);
    EXPECT_STREQ(grows, "\xC9\x90X");
    char malformed[] = "a\xFF\xC3";
    mbToUpperInPlace(malformed);
    EXPECT_STREQ(malformed, "A\xFF\xC3");
}

TEST_F(Utf8Mode, CaseMappingIntoABoundedDestination) {
    int error = -7;
    auto dst = Exact("xxxx");
    EXPECT_EQ(mbToUpper("a\xC3\xA9\x62", -1, dst.get(), 4, &error), 4);
    EXPECT_EQ(Bytes(dst.get(), 4), "A\xC3\x89\x42");
    EXPECT_EQ(error, 0);
    // A character that does not fit whole is left out.
    char small[3] = {'x', 'x', 'x'};
    EXPECT_EQ(mbToUpper("a\xC3\xA9", -1, small, 2, &error), 1);
    EXPECT_EQ(Bytes(small, 3), std::string("A\0x", 3));
    EXPECT_EQ(error, 1);
    // The source length bounds reading; the source block has no terminator.
    auto src = Exact("abc\xC3");
    char out[8];
    EXPECT_EQ(mbToLower(src.get(), 4, out, sizeof out, &error), 4);
    EXPECT_EQ(Bytes(out, 4), "abc\xC3");
    EXPECT_EQ(error, 3);
    EXPECT_EQ(mbToLower("ABC", 2, out, sizeof out, nullptr), 2);
    EXPECT_STREQ(out, "ab");
}

TEST_F(Utf8Mode, EqualAndCompareIgnoringCase) {
    int error = -7;
    EXPECT_EQ(mbEqualNoCase("WITH", -1, "with", -1, &error), 1);
    EXPECT_EQ(error, 0);
    EXPECT_EQ(mbEqualNoCase("with", -1, "withx", -1, nullptr), 0);
    EXPECT_EQ(mbEqualNoCase("\xC3\x84\xC3\x96", -1, "\xC3\xA4\xC3\xB6", -1, nullptr), 1);
    auto a = Exact("ABC");
    auto b = Exact("abcd");
    EXPECT_EQ(mbEqualNoCase(a.get(), 3, b.get(), 3, &error), 1);
    EXPECT_EQ(mbEqualNoCase(a.get(), 3, b.get(), 4, &error), 0);
    // A lead byte at the end of the given length is malformed, not a character.
    auto cut = Exact("a\xC3\xA9");
    EXPECT_EQ(mbEqualNoCase(cut.get(), 2, "A\xC3", -1, &error), 1);
    EXPECT_EQ(error, 3);
    EXPECT_EQ(mbEqualNoCase("\xC3\xA9", -1, "\xC3", -1, &error), 0);
    // Malformed bytes stand for themselves: not folded as if they were Latin-1.
    EXPECT_EQ(mbEqualNoCase("\xC9", -1, "\xE9", -1, &error), 0);
    EXPECT_EQ(error, 3);

    EXPECT_EQ(mbCompareNoCase("abc", "ABD"), -1);
    EXPECT_EQ(mbCompareNoCase("ABC", "abc"), 0);
    EXPECT_EQ(mbCompareNoCase("ab", "abc"), -1);
    EXPECT_EQ(mbCompareNoCase("abc", "ab"), 1);
    EXPECT_EQ(mbCompareNoCase("\xC3\xA9", "z"), 1);
    EXPECT_EQ(mbCompareNoCase("", nullptr), 0);
}

TEST_F(Utf8Mode, TruncateAtCharacterBoundaries) {
    char text[] = "ab\xC3\xA9z";
    EXPECT_STREQ(mbTruncate(text, 3), "ab");
    char whole[] = "ab\xC3\xA9z";
    EXPECT_STREQ(mbTruncate(whole, 4), "ab\xC3\xA9");
    char longer[] = "ab\xC3\xA9";
    EXPECT_STREQ(mbTruncate(longer, 40), "ab\xC3\xA9");
    char three[] = "\xE4\xB8\xADx";
    EXPECT_STREQ(mbTruncate(three, 2), "");
    char malformed[] = "a\xFF\x62";
    EXPECT_STREQ(mbTruncate(malformed, 2), "a\xFF");
}

TEST_F(Utf8Mode, CopyBoundedCutsAndZeroFills) {
    auto dst = Exact("xxxx");
    mbCopyBounded(dst.get(), "ab\xC3\xA9", 4);
    EXPECT_EQ(Bytes(dst.get(), 4), std::string("ab\0\0", 4));
    // The source is read only up to size - 1 bytes when it has no terminator there.
    auto src = Exact("xyz");
    mbCopyBounded(dst.get(), src.get(), 4);
    EXPECT_EQ(Bytes(dst.get(), 4), std::string("xyz\0", 4));
    mbCopyBounded(dst.get(), nullptr, 4);
    EXPECT_EQ(Bytes(dst.get(), 4), std::string(4, '\0'));
    mbCopyBounded(nullptr, "abc", 4);
}

TEST_F(Utf8Mode, CopyPaddedCutsAndBlankFills) {
    auto field = Exact("xxxxxxxx");
    mbCopyPadded(field.get(), 8, "abc", 3);
    EXPECT_EQ(Bytes(field.get(), 8), "abc     ");
    auto src = Exact("ab\xC3\xA9");
    mbCopyPadded(field.get(), 3, src.get(), 4);
    EXPECT_EQ(Bytes(field.get(), 8), "ab      ");
    mbCopyPadded(field.get(), 8, src.get(), 3);  // the length cuts the character
    EXPECT_EQ(Bytes(field.get(), 8), "ab      ");
    mbCopyPadded(field.get(), 8, src.get(), 4);
    EXPECT_EQ(Bytes(field.get(), 8), "ab\xC3\xA9    ");
    mbCopyPadded(field.get(), 8, nullptr, 0);
    EXPECT_EQ(Bytes(field.get(), 8), "        ");
    field[0] = 'q';
    mbCopyPadded(field.get(), 8, nullptr, 3);
    EXPECT_EQ(field[0], 'q');
    mbCopyPadded(field.get(), 8, "a\xFF\x62", -1);
    EXPECT_EQ(Bytes(field.get(), 8), "a\xFF\x62     ");
}

TEST_F(Utf8Mode, FindLastChar) {
    const char* text = "a.b.c";
    EXPECT_EQ(mbFindLastChar(text, '.'), text + 3);
    const char* accents = "\xC3\xA9.\xC3\xA9x";
    EXPECT_EQ(mbFindLastChar(accents, 0xE9), accents + 3);
    EXPECT_EQ(mbFindLastChar(accents, 0x4E2D), nullptr);
    EXPECT_EQ(mbFindLastChar(nullptr, 'a'), nullptr);
    EXPECT_EQ(mbFindLastChar("a\xFF", -1), nullptr);
}

}  // namespace
