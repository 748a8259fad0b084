// Conversion between a code page and UTF-8: cuts, blanks, terminators, losses.
// Without a length the result is terminated; with one it gets one blank after
// it when shorter than the destination. A cut sets the error to 1, a
// substitution to 3.
#include "mbtest.h"

namespace {

TEST(Convert, CutsBlanksTerminatorsAndErrors) {
    const struct {
        const char* cnv;
        bool toUtf8;
        std::string src;
        int srcLen, dstSize, result;
        std::string dst;  // the leading bytes of the destination
        int error;
    } rows[] = {
        // clang-format off
        {"cp1252", true, "caf\xE9 \x80\0"s, -1, 16, 9, "caf\xC3\xA9 \xE2\x82\xAC\0"s, 0},
        // Room for 3 bytes and the terminator: the second character would be split.
        {"cp1252", true, "\xE9\xE9\xE9\0"s, -1, 4, 2, "\xC3\xA9\0x"s, 1},
        {"cp1252", true, "\xE9\0"s, -1, 1, 0, "\0"s, 1},
        // The cut is found in the bytes written, never past the destination.
        {"cp1252", true, "\xE9\xE9", 2, 3, 2, "\xC3\xA9 ", 1},
        {"cp1252", true, "\xE9\xE9", 1, 5, 2, "\xC3\xA9 xx", 0},
        {"cp1252", true, "a\0\xE9"s, 3, 8, 4, "a\0\xC3\xA9 "s, 0},  // a zero byte too
        {"GBK", true, "a\xD6\xD0\0"s, -1, 16, 4, "a\xE4\xB8\xAD\0"s, 0},
        // A lead byte at the end of the given length is illegal input: substituted.
        {"GBK", true, "a\xD6", 2, 16, 2, "a? ", 3},
        // To GBK, cut before the double-byte character that does not fit.
        {"GBK", false, "a\xE4\xB8\xAD\xE4\xB8\xAD", 7, 4, 3, "a\xD6\xD0 ", 1},
        {"cp1252", false, "a\xE4\xB8\xAD\xE2\x82\xAC\0"s, -1, 16, 3, "a?\x80\0"s, 3},
        {"cp1252", false, "\0"s, -1, 16, 0, "\0"s, 0},
        // Malformed UTF-8: a lone lead byte, an invalid byte, overlong, surrogate.
        {"cp1252", false, "a\xC3", 2, 16, 2, "a? ", 3},
        {"cp1252", false, "a\xFF", 2, 16, 2, "a? ", 3},
        {"cp1252", false, "a\xC0\x80", 3, 16, 3, "a?? ", 3},
        {"cp1252", false, "a\xED\xA0\x80", 4, 16, 4, "a??? ", 3},
        // clang-format on
    };
    for (size_t i = 0; i < std::size(rows); ++i) {
        const auto& r = rows[i];
        SCOPED_TRACE(testing::Message() << "row " << i);
        ConverterPtr cnv(OpenConverter(r.cnv));
        ASSERT_NE(cnv, nullptr);
        auto src = Exact(r.src);
        auto dst = Exact(std::string(r.dstSize, 'x'));
        int error = -7;
        EXPECT_EQ((r.toUtf8 ? mbCodePageToUtf8 : mbUtf8ToCodePage)(cnv.get(), dst.get(), r.dstSize,
                                                                   src.get(), r.srcLen, &error),
                  r.result);
        EXPECT_EQ(Bytes(dst.get(), r.dst.size()), r.dst);
        EXPECT_EQ(error, r.error);
    }
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
    EXPECT_EQ(mbCodePageToUtf8(nullptr, dst, sizeof dst, "\xE9", -1, &error), 2);
    EXPECT_STREQ(dst, "\xC3\xA9");
    EXPECT_EQ(mbUtf8ToCodePageLength(nullptr, "\xC3\xA9\xC3\xA9", -1, &error), 2);
    EXPECT_EQ(mbUtf8ToCodePage(nullptr, dst, sizeof dst, "\xC3\xA9", -1, nullptr), 1);
    EXPECT_STREQ(dst, "\xE9");
}

}  // namespace
