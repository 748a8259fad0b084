// The multibyte routines in code-page mode, under single-byte and double-byte
// code pages.
#include "mbtest.h"

namespace {

TEST(CodePageMode, Cp1252CaseMapping) {
    EncodingScope scope("de_DE.CP1252", "cp1252", 0);
    EXPECT_EQ(mbCharLength("\xE9", 1), 1);
    char text[] = "\xE9t\xE9 \xFF";
    mbToUpperInPlace(text);
    EXPECT_STREQ(text, "\xC9T\xC9 \x9F");  // y with diaeresis has its capital in cp1252
    // Micro sign upper-cases to a Greek capital cp1252 lacks: kept, not "?".
    char micro[] = "\xB5m";
    mbToUpperInPlace(micro);
    EXPECT_STREQ(micro, "\xB5M");
    EXPECT_EQ(mbEqualNoCase("\xC4RGER", -1, "\xE4rger", -1, nullptr), 1);
    EXPECT_EQ(mbCompareNoCase("\xE4", "\xC4"), 0);
    const char* find = "\xE9x\xE9y";
    EXPECT_EQ(mbFindLastChar(find, 0xE9), find + 2);
    char euro[] = "\x80\x80\x80";
    EXPECT_STREQ(mbTruncate(euro, 2), "\x80\x80");
}

TEST(CodePageMode, Latin1KeepsWhatItCannotUpperCase) {
    EncodingScope scope("en_US.ISO-8859-1", "ISO-8859-1", 0);
    char text[] = "\xFF\xE0";
    mbToUpperInPlace(text);
    EXPECT_STREQ(text, "\xFF\xC0");
    char out[4];
    int error = -7;
    EXPECT_EQ(mbToLower("\xC0\xC9", -1, out, sizeof out, &error), 2);
    EXPECT_STREQ(out, "\xE0\xE9");
    EXPECT_EQ(error, 0);
}

class Gbk : public ::testing::Test {
  protected:
    EncodingScope fScope{"zh_CN.GBK", "GBK", 0};
};

TEST_F(Gbk, CharLength) {
    EXPECT_EQ(mbCharLength("\xD6\xD0", 2), 2);
    EXPECT_EQ(mbCharLength("a", 1), 1);
    auto lead = Exact("\xD6");
    EXPECT_EQ(mbCharLength(lead.get(), 1), -1);
    EXPECT_EQ(mbCharLength("", 1), 0);
}

TEST_F(Gbk, CutsAtDoubleByteBoundaries) {
    char text[] = "a\xD6\xD0\xCE\xC4";
    EXPECT_STREQ(mbTruncate(text, 2), "a");
    char whole[] = "a\xD6\xD0\xCE\xC4";
    EXPECT_STREQ(mbTruncate(whole, 4), "a\xD6\xD0");

    auto dst = Exact("xxx");
    mbCopyBounded(dst.get(), "a\xD6\xD0", 3);
    EXPECT_EQ(Bytes(dst.get(), 3), std::string("a\0\0", 3));

    auto field = Exact("xxxx");
    mbCopyPadded(field.get(), 2, "a\xD6\xD0", -1);
    EXPECT_EQ(Bytes(field.get(), 2), "a ");
    auto src = Exact("a\xD6\xD0");
    mbCopyPadded(field.get(), 4, src.get(), 2);  // the source length cuts the character
    EXPECT_EQ(Bytes(field.get(), 4), "a   ");
    mbCopyPadded(field.get(), 4, src.get(), 3);
    EXPECT_EQ(Bytes(field.get(), 4), "a\xD6\xD0 ");
    // A byte that starts no character is copied, not dropped with all after it.
    mbCopyPadded(field.get(), 4, "\xFF\x61", -1);
    EXPECT_EQ(Bytes(field.get(), 4), "\xFF\x61  ");
}

TEST_F(Gbk, CaseMappingAndComparison) {
    char text[] = "a\xD6\xD0\x62";
    mbToUpperInPlace(text);
    EXPECT_STREQ(text, "A\xD6\xD0\x42");
    EXPECT_EQ(mbEqualNoCase("ABC\xD6\xD0", -1, "abc\xD6\xD0", -1, nullptr), 1);
    int error = -7;
    auto cut = Exact("ab\xD6");
    EXPECT_EQ(mbEqualNoCase(cut.get(), 3, "AB\xD6", -1, &error), 1);
    EXPECT_EQ(error, 3);
    // Ordered by code point (U+4E2D before U+6587), not by byte.
    EXPECT_EQ(mbCompareNoCase("\xD6\xD0", "\xCE\xC4"), -1);
}

TEST_F(Gbk, FindLastCharDoesNotMatchTrailBytes) {
    // 0x81 0x5C is one character whose trail byte is the backslash.
    const char* text = "x\\\x81\x5C";
    EXPECT_EQ(mbFindLastChar(text, '\\'), text + 1);
    EXPECT_EQ(mbFindLastChar("\x81\x5C", '\\'), nullptr);
    const char* han = "\xD6\xD0x\xD6\xD0";
    EXPECT_EQ(mbFindLastChar(han, 0x4E2D), han + 3);
}

TEST(Generation, ChangesWithModeAndConverter) {
    EncodingScope scope("C", "cp1252", 0);
    unsigned start = mbGeneration();
    mbSetUtf8Mode(0);
    EXPECT_EQ(mbGeneration(), start);
    mbSetUtf8Mode(1);
    unsigned utf8 = mbGeneration();
    EXPECT_NE(utf8, start);
    mbSetUtf8Mode(1);
    EXPECT_EQ(mbGeneration(), utf8);
    EXPECT_TRUE(SetCodePageConverter("GBK"));
    unsigned gbk = mbGeneration();
    EXPECT_NE(gbk, utf8);
    EXPECT_TRUE(SetCodePageConverter("936"));  // the same converter
    EXPECT_EQ(mbGeneration(), gbk);
    EXPECT_FALSE(SetCodePageConverter("no-such-encoding"));
    EXPECT_EQ(mbGeneration(), gbk);
}

}  // namespace
