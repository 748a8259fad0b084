// Conversion between a code page and UTF-8: cuts, blanks, terminators, losses.
#include "mbtest.h"

namespace {

class Convert : public ::testing::Test {
  protected:
    ConverterPtr Open(const char* name) {
        ConverterPtr cnv(OpenConverter(name));
        EXPECT_NE(cnv, nullptr) << name;
        return cnv;
    }
    int fError = -7;
};

TEST_F(Convert, CodePageToUtf8InTerminatorMode) {
    ConverterPtr cp1252 = Open("cp1252");
    char dst[16];
    EXPECT_EQ(mbCodePageToUtf8(cp1252.get(), dst, sizeof dst, "caf\xE9 \x80", -1, &fError), 9);
    EXPECT_STREQ(dst, "caf\xC3\xA9 \xE2\x82\xAC");
    EXPECT_EQ(fError, 0);
    // Room for 3 bytes and the terminator: the second character would be split.
    auto small = Exact("xxxx");
    EXPECT_EQ(mbCodePageToUtf8(cp1252.get(), small.get(), 4, "\xE9\xE9\xE9", -1, &fError), 2);
    EXPECT_EQ(Bytes(small.get(), 4), std::string("\xC3\xA9\0x", 4));
    EXPECT_EQ(fError, 1);
    // No room but the terminator's: an empty, terminated result.
    auto one = Exact("x");
    EXPECT_EQ(mbCodePageToUtf8(cp1252.get(), one.get(), 1, "\xE9", -1, &fError), 0);
    EXPECT_EQ(one[0], '\0');
    EXPECT_EQ(fError, 1);
}

TEST_F(Convert, CodePageToUtf8WithLengths) {
    ConverterPtr cp1252 = Open("cp1252");
    // The cut is found in the bytes written, never past the destination.
    auto src = Exact("\xE9\xE9");
    auto dst = Exact("xxx");
    EXPECT_EQ(mbCodePageToUtf8(cp1252.get(), dst.get(), 3, src.get(), 2, &fError), 2);
    EXPECT_EQ(Bytes(dst.get(), 3), "\xC3\xA9 ");
    EXPECT_EQ(fError, 1);
    // A shorter result gets one blank after it.
    auto wide = Exact("xxxxx");
    EXPECT_EQ(mbCodePageToUtf8(cp1252.get(), wide.get(), 5, src.get(), 1, &fError), 2);
    EXPECT_EQ(Bytes(wide.get(), 5), "\xC3\xA9 xx");
    EXPECT_EQ(fError, 0);
    EXPECT_EQ(mbCodePageToUtf8(cp1252.get(), nullptr, 0, src.get(), 2, &fError), 0);
    EXPECT_EQ(fError, 1);
    // A given length converts every byte, a zero byte too.
    char zero[8];
    EXPECT_EQ(
        mbCodePageToUtf8(cp1252.get(), zero, 8, std::string("a\0\xE9", 3).c_str(), 3, &fError), 4);
    EXPECT_EQ(Bytes(zero, 5), std::string("a\0\xC3\xA9 ", 5));
    EXPECT_EQ(mbCodePageToUtf8Length(cp1252.get(), "a\0b", 3, &fError), 3);
}

TEST_F(Convert, DoubleByteCodePage) {
    ConverterPtr gbk = Open("GBK");
    char dst[16];
    EXPECT_EQ(mbCodePageToUtf8(gbk.get(), dst, sizeof dst, "a\xD6\xD0", -1, &fError), 4);
    EXPECT_STREQ(dst, "a\xE4\xB8\xAD");
    // A lead byte at the end of the given length is illegal input: substituted.
    auto lead = Exact("a\xD6");
    EXPECT_EQ(mbCodePageToUtf8(gbk.get(), dst, sizeof dst, lead.get(), 2, &fError), 2);
    EXPECT_EQ(Bytes(dst, 3), "a? ");
    EXPECT_EQ(fError, 3);
    // To GBK, cut before the double-byte character that does not fit.
    auto field = Exact("xxxx");
    EXPECT_EQ(mbUtf8ToCodePage(gbk.get(), field.get(), 4, "a\xE4\xB8\xAD\xE4\xB8\xAD", 7, &fError),
              3);
    EXPECT_EQ(Bytes(field.get(), 4), "a\xD6\xD0 ");
    EXPECT_EQ(fError, 1);
    EXPECT_EQ(mbCodePageToUtf8Length(gbk.get(), "a\xD6\xD0\xCE\xC4", -1, &fError), 7);
    EXPECT_EQ(fError, 0);
    EXPECT_EQ(mbUtf8ToCodePageLength(gbk.get(), "a\xE4\xB8\xAD", 4, &fError), 3);
    EXPECT_EQ(fError, 0);
}

TEST_F(Convert, Utf8ToCodePageLossesAndMalformedInput) {
    ConverterPtr cp1252 = Open("cp1252");
    char dst[16];
    EXPECT_EQ(
        mbUtf8ToCodePage(cp1252.get(), dst, sizeof dst, "a\xE4\xB8\xAD\xE2\x82\xAC", -1, &fError),
        3);
    EXPECT_STREQ(dst, "a?\x80");
    EXPECT_EQ(fError, 3);
    for (const char* malformed : {"a\xC3", "a\xFF", "a\xC0\x80", "a\xED\xA0\x80"}) {
        auto src = Exact(malformed);
        int n = mbUtf8ToCodePage(cp1252.get(), dst, sizeof dst, src.get(),
                                 static_cast<int>(strlen(malformed)), &fError);
        EXPECT_GE(n, 2) << malformed;
        EXPECT_EQ(dst[0], 'a');
        EXPECT_EQ(dst[1], '?');
        EXPECT_EQ(fError, 3) << malformed;
    }
    EXPECT_EQ(mbUtf8ToCodePage(cp1252.get(), dst, sizeof dst, "", -1, &fError), 0);
    EXPECT_STREQ(dst, "");
    EXPECT_EQ(fError, 0);
}

TEST_F(Convert, WithoutConverterUsesTheCurrentOne) {
    EncodingScope scope("de_DE.CP1252", "cp1252", 0);
    char dst[8];
    EXPECT_EQ(mbCodePageToUtf8(nullptr, dst, sizeof dst, "\xE9", -1, &fError), 2);
    EXPECT_STREQ(dst, "\xC3\xA9");
    EXPECT_EQ(mbUtf8ToCodePageLength(nullptr, "\xC3\xA9\xC3\xA9", -1, &fError), 2);
    EXPECT_EQ(mbUtf8ToCodePage(nullptr, dst, sizeof dst, "\xC3\xA9", -1, nullptr), 1);
    EXPECT_STREQ(dst, "\xE9");
}

}  // namespace
