// The multibyte routines in UTF-8 mode and in code-page mode under single-byte
// and double-byte code pages. Inputs sit in blocks of exactly their bytes; a
// terminator is part of the bytes only where the row gives no length.
#include "mbtest.h"

namespace {

#define TRACE(i, e) SCOPED_TRACE(testing::Message() << "row " << (i) << " " << (e).converter)

TEST(Routines, CharLength) {
    const struct {
        Encoding enc;
        std::string bytes;
        size_t n;
        int expected;
    } rows[] = {
        // clang-format off
        {kUtf8, "\xC3\xA9", 2, 2}, {kUtf8, "\xA9", 1, -1},
        {kUtf8, "\xC3\0"s, 2, -1},  // lead byte followed by the terminator
        {kUtf8, "\0"s, 5, 0}, {kUtf8, "a", 0, 0}, {kUtf8, "a", 1, 1},
        {kUtf8, "\xF0\x9F\x98\x80", 4, 4},
        {kUtf8, "\xC0\x80", 2, -1},      // overlong
        {kUtf8, "\xE0\x80\x80", 3, -1},  // overlong
        {kUtf8, "\xED\xA0\x80", 3, -1},  // surrogate
        {kUtf8, "\xF4\x90\x80\x80", 4, -1}, {kUtf8, "\xFE", 1, -1}, {kUtf8, "\xFF", 1, -1},
        {kUtf8, "\xE4\xB8", 2, -1},  // longer than the bytes given
        {kUtf8, "\xE4\xB8\xAD", 3, 3},
        {kCp1252, "\xE9", 1, 1},
        {kGbk, "\xD6\xD0", 2, 2}, {kGbk, "a", 1, 1}, {kGbk, "\xD6", 1, -1}, {kGbk, "\0"s, 1, 0},
        // clang-format on
    };
    for (size_t i = 0; i < std::size(rows); ++i) {
        TRACE(i, rows[i].enc);
        EncodingScope scope(rows[i].enc);
        EXPECT_EQ(mbCharLength(Exact(rows[i].bytes).get(), rows[i].n), rows[i].expected);
    }
    EncodingScope scope(kUtf8);
    EXPECT_EQ(mbCharLength(nullptr, 5), 0);
}

TEST(Routines, CaseMappingInPlaceKeepsTheByteLength) {
    const struct {
        Encoding enc;
        bool upper;
        std::string text, expected;
    } rows[] = {
        // clang-format off
        {kUtf8, true, "a\xC4\xB1z", "AIZ "},  // the dotless i upper-cases to one byte
        {kUtf8, false, "\xC4\xB0X", "ix "},   // capital I with dot lower-cases to one byte
        {kUtf8, true, "stra\xC3\x9F\x65 \xC3\xA9t\xC3\xA9", "STRA\xC3\x9F\x45 \xC3\x89T\xC3\x89"},
        {kUtf8, true, "\xC9\x90x", "\xC9\x90X"},  // grows to 3 bytes: kept as it is
        {kUtf8, true, "a\xFF\xC3", "A\xFF\xC3"},
        {kCp1252, true, "\xE9t\xE9 \xFF", "\xC9T\xC9 \x9F"},
        {kCp1252, true, "\xB5m", "\xB5M"},  // micro's capital is not in cp1252: kept, not "?"
        {kLatin1, true, "\xFF\xE0", "\xFF\xC0"},
        {kGbk, true, "a\xD6\xD0\x62", "A\xD6\xD0\x42"},
        {kGbk, true, "\x81\x61z", "\x81\x61Z"},  // an ASCII trail byte stays as it is
        // clang-format on
    };
    for (size_t i = 0; i < std::size(rows); ++i) {
        TRACE(i, rows[i].enc);
        EncodingScope scope(rows[i].enc);
        auto text = Exact(rows[i].text + '\0');
        rows[i].upper ? mbToUpperInPlace(text.get()) : mbToLowerInPlace(text.get());
        EXPECT_EQ(text.get(), rows[i].expected);
    }
}

TEST(Routines, CaseMappingIntoABoundedDestination) {
    const struct {
        Encoding enc;
        bool upper;
        std::string src;
        int srcLen, dstLen, result;
        std::string dst;
        int error;
    } rows[] = {
        // clang-format off
        {kUtf8, true, "a\xC3\xA9\x62\0"s, -1, 4, 4, "A\xC3\x89\x42", 0},
        {kUtf8, true, "a\xC3\xA9\0"s, -1, 2, 1, "A\0"s, 1},  // a character that does not fit
        {kUtf8, false, "abc\xC3", 4, 8, 4, "abc\xC3", 3},
        {kUtf8, false, "ABC", 2, 8, 2, "ab\0"s, 0},
        {kLatin1, false, "\xC0\xC9\0"s, -1, 4, 2, "\xE0\xE9\0"s, 0},
        // clang-format on
    };
    for (size_t i = 0; i < std::size(rows); ++i) {
        const auto& r = rows[i];
        TRACE(i, r.enc);
        EncodingScope scope(r.enc);
        auto src = Exact(r.src);
        auto dst = Exact(std::string(r.dstLen, 'x'));
        int error = -7;
        EXPECT_EQ(
            (r.upper ? mbToUpper : mbToLower)(src.get(), r.srcLen, dst.get(), r.dstLen, &error),
            r.result);
        EXPECT_EQ(Bytes(dst.get(), r.dst.size()), r.dst);
        EXPECT_EQ(error, r.error);
    }
    EncodingScope scope(kUtf8);
    char out[4];
    EXPECT_EQ(mbToLower("AB", -1, out, sizeof out, nullptr), 2);
}

TEST(Routines, EqualAndCompareIgnoringCase) {
    const struct {
        Encoding enc;
        std::string a;
        int lenA;
        std::string b;
        int lenB, equal, error;
    } rows[] = {
        // clang-format off
        {kUtf8, "WITH\0"s, -1, "with\0"s, -1, 1, 0},
        {kUtf8, "with\0"s, -1, "withx\0"s, -1, 0, 0},
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
    for (size_t i = 0; i < std::size(rows); ++i) {
        const auto& r = rows[i];
        TRACE(i, r.enc);
        EncodingScope scope(r.enc);
        int error = -7;
        EXPECT_EQ(mbEqualNoCase(Exact(r.a).get(), r.lenA, Exact(r.b).get(), r.lenB, &error),
                  r.equal);
        EXPECT_EQ(error, r.error);
    }

    const struct {
        Encoding enc;
        const char *a, *b;
        int order;
    } order[] =
        {
            {kUtf8, "abc", "ABD", -1},
            {kUtf8, "ABC", "abc", 0},
            {kUtf8, "ab", "abc", -1},
            {kUtf8, "abc", "ab", 1},
            {kUtf8, "\xC3\xA9", "z", 1},
            {kUtf8, "", nullptr, 0},
            {kCp1252, "\xE4", "\xC4", 0},
            {kGbk, "\xD6\xD0", "\xCE\xC4", -1},  // by code point (U+4E2D before U+6587), not byte
        };
    for (size_t i = 0; i < std::size(order); ++i) {
        TRACE(i, order[i].enc);
        EncodingScope scope(order[i].enc);
        EXPECT_EQ(mbCompareNoCase(order[i].a, order[i].b), order[i].order);
    }
}

TEST(Routines, TruncateAndFindLastCharRespectCharacters) {
    const struct {
        Encoding enc;
        std::string text;
        int n;
        std::string expected;
    } cuts[] = {
        // clang-format off
        {kUtf8, "ab\xC3\xA9z", 3, "ab"},         {kUtf8, "ab\xC3\xA9z", 4, "ab\xC3\xA9"},
        {kUtf8, "ab\xC3\xA9", 40, "ab\xC3\xA9"}, {kUtf8, "\xE4\xB8\xADx", 2, ""},
        {kUtf8, "a\xFF\x62", 2, "a\xFF"},        {kCp1252, "\x80\x80\x80", 2, "\x80\x80"},
        {kGbk, "a\xD6\xD0\xCE\xC4", 2, "a"},     {kGbk, "a\xD6\xD0\xCE\xC4", 4, "a\xD6\xD0"},
        // clang-format on
    };
    for (size_t i = 0; i < std::size(cuts); ++i) {
        TRACE(i, cuts[i].enc);
        EncodingScope scope(cuts[i].enc);
        auto text = Exact(cuts[i].text + '\0');
        EXPECT_EQ(mbTruncate(text.get(), cuts[i].n), cuts[i].expected);
    }

    const struct {
        Encoding enc;
        std::string text;
        UChar32 c;
        int at;  // -1: not found
    } finds[] = {
        // clang-format off
        {kUtf8, "a.b.c", '.', 3}, {kUtf8, "\xC3\xA9.\xC3\xA9x", 0xE9, 3},
        {kUtf8, "\xC3\xA9.\xC3\xA9x", 0x4E2D, -1}, {kUtf8, "a\xFF", -1, -1},
        {kCp1252, "\xE9x\xE9y", 0xE9, 2},
        // 0x81 0x5C is one character whose trail byte is the backslash.
        {kGbk, "x\\\x81\x5C", '\\', 1}, {kGbk, "\x81\x5C", '\\', -1},
        {kGbk, "\xD6\xD0x\xD6\xD0", 0x4E2D, 3},
        // clang-format on
    };
    for (size_t i = 0; i < std::size(finds); ++i) {
        const auto& r = finds[i];
        TRACE(i, r.enc);
        EncodingScope scope(r.enc);
        auto text = Exact(r.text + '\0');
        EXPECT_EQ(mbFindLastChar(text.get(), r.c), r.at < 0 ? nullptr : text.get() + r.at);
    }
    EXPECT_EQ(mbFindLastChar(nullptr, 'a'), nullptr);
}

TEST(Routines, CopiesCutAtCharactersAndFill) {
    // mbCopyBounded zero-fills and reads the source only up to size - 1 bytes.
    const struct {
        Encoding enc;
        std::string src;
        std::string dst;  // its size is the size given
    } bounded[] = {
        {kUtf8, "ab\xC3\xA9\0"s, "ab\0\0"s},
        {kUtf8, "xyz", "xyz\0"s},
        {kGbk, "a\xD6\xD0\0"s, "a\0\0"s},
    };
    for (size_t i = 0; i < std::size(bounded); ++i) {
        TRACE(i, bounded[i].enc);
        EncodingScope scope(bounded[i].enc);
        auto dst = Exact(std::string(bounded[i].dst.size(), 'x'));
        mbCopyBounded(dst.get(), Exact(bounded[i].src).get(), bounded[i].dst.size());
        EXPECT_EQ(Bytes(dst.get(), bounded[i].dst.size()), bounded[i].dst);
    }

    // mbCopyPadded blank-fills; a byte that starts no character is copied.
    const struct {
        Encoding enc;
        std::string src;
        int srcLen;
        std::string field;  // its size is the size given
    } padded[] = {
        // clang-format off
        {kUtf8, "abc", 3, "abc     "}, {kUtf8, "ab\xC3\xA9", 4, "ab "},
        {kUtf8, "ab\xC3\xA9", 3, "ab      "},  // the length cuts the character
        {kUtf8, "ab\xC3\xA9", 4, "ab\xC3\xA9    "},
        {kUtf8, "a\xFF\x62\0"s, -1, "a\xFF\x62     "},
        {kGbk, "a\xD6\xD0\0"s, -1, "a "}, {kGbk, "a\xD6\xD0", 2, "a   "},
        {kGbk, "a\xD6\xD0", 3, "a\xD6\xD0 "}, {kGbk, "\xFF\x61\0"s, -1, "\xFF\x61  "},
        // clang-format on
    };
    for (size_t i = 0; i < std::size(padded); ++i) {
        const auto& r = padded[i];
        TRACE(i, r.enc);
        EncodingScope scope(r.enc);
        auto field = Exact(std::string(r.field.size(), 'x'));
        mbCopyPadded(field.get(), r.field.size(), Exact(r.src).get(), r.srcLen);
        EXPECT_EQ(Bytes(field.get(), r.field.size()), r.field);
    }

    EncodingScope scope(kUtf8);
    auto dst = Exact("xxxx");
    mbCopyBounded(dst.get(), nullptr, 4);
    EXPECT_EQ(Bytes(dst.get(), 4), std::string(4, '\0'));
    mbCopyBounded(nullptr, "abc", 4);
    mbCopyPadded(dst.get(), 4, nullptr, 0);
    EXPECT_EQ(Bytes(dst.get(), 4), "    ");
    dst[0] = 'q';
    mbCopyPadded(dst.get(), 4, nullptr, 3);
    EXPECT_EQ(dst[0], 'q');
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

}  // namespace
