// Encoding names, code page numbers, converters and the runtime locale.
#include "mbtest.h"

namespace {

std::string NameOf(UConverter* cnv) {
    UErrorCode err = U_ZERO_ERROR;
    return cnv ? ucnv_getName(cnv, &err) : "";
}

TEST(CodePages, NamesNumbersAndConverters) {
    // 437 is not in the table: windows-437. UTF-8 comes from its alias windows-65001,
    // Shift_JIS from windows-932 before cp932, ibm-813 only from a cp alias.
    // clang-format off
    const std::pair<long, const char*> names[] = {{1252, "windows-1252"}, {936, "GBK"},
        {932, "Shift_JIS"}, {437, "IBM437"}, {65001, "UTF-8"}, {99998, "failed:"}};
    const std::pair<const char*, long> numbers[] = {{"windows-1252", 1252}, {"ISO-8859-1", 28591},
        {"latin1", 28591}, {"UTF-8", 65001}, {"GBK", 936}, {"Shift_JIS", 932}, {"ibm-813", 813},
        {"Windows-28591", 28591}, {"no-such-encoding", 0}, {nullptr, 0}};
    // clang-format on
    for (auto [codePage, expected] : names) {
        std::string name = "untouched";
        EXPECT_EQ(CodePageToEncodingName(codePage, name) ? name : "failed:" + name, expected);
    }
    for (auto [name, codePage] : numbers)
        EXPECT_EQ(EncodingNameToCodePage(name), codePage) << (name ? name : "null");

    ConverterPtr byNumber(OpenConverter("1252"));
    ASSERT_NE(byNumber, nullptr);
    EXPECT_EQ(NameOf(byNumber.get()), NameOf(ConverterPtr(OpenConverter("windows-1252")).get()));
    EXPECT_EQ(ConverterPtr(OpenConverter("123456")), nullptr);  // a name, not a number
    EXPECT_EQ(ConverterPtr(OpenConverter("99998")), nullptr);
    EXPECT_EQ(NameOf(ConverterPtr(OpenConverter("windows-28591")).get()), "ISO-8859-1");

    // clang-format off
    const std::pair<const char*, const char*> shown[] = {{"Shift_JIS", "windows-31j"},
        {"cp1252", "windows-1252"}, {"GBK", "GBK"}, {"ibm-813", "cp813"},
        {"iso-8859_11-2001", "iso-8859_11-2001"}, {"ibm-942", "cp932"}};
    // clang-format on
    for (auto [name, display] : shown) {
        ConverterPtr cnv(OpenConverter(name));
        ASSERT_NE(cnv, nullptr) << name;
        EXPECT_EQ(EncodingDisplayName(cnv.get()), display) << name;
    }
    EncodingScope scope({"C", "ISO-8859-1", 0});
    EXPECT_EQ(EncodingDisplayName(nullptr), "ISO_8859-1:1987");
    EXPECT_EQ(NameOf(ConverterPtr(OpenConverter(nullptr)).get()), NameOf(CurrentConverter()));

    EXPECT_TRUE(IsSameEncoding("cp1252", "windows-1252"));
    EXPECT_TRUE(IsSameEncoding("GBK", "CP936"));
    EXPECT_FALSE(IsSameEncoding("cp1252", "ISO-8859-1"));
    EXPECT_FALSE(IsSameEncoding("no-such-encoding", "no-such-encoding"));
    EXPECT_FALSE(IsSameEncoding(nullptr, "UTF-8"));
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
