// Encoding names, code page numbers, converters, collator and locale lookup.
#include "mbtest.h"

namespace {

std::string NameOf(UConverter* cnv) {
    UErrorCode err = U_ZERO_ERROR;
    return cnv ? ucnv_getName(cnv, &err) : "";
}

TEST(CodePageTable, NumbersAndNames) {
    for (auto [codePage, expected] : {std::pair<long, const char*>{1252, "windows-1252"},
                                      {936, "GBK"},
                                      {932, "Shift_JIS"},
                                      {437, "IBM437"},  // not in the table: windows-437
                                      {65001, "UTF-8"},
                                      {99998, "failed:"}}) {
        std::string name = "untouched";
        EXPECT_EQ(CodePageToEncodingName(codePage, name) ? name : "failed:" + name, expected);
    }
    for (auto [name, codePage] : {std::pair<const char*, long>{"windows-1252", 1252},
                                  {"ISO-8859-1", 28591},
                                  {"latin1", 28591},
                                  {"UTF-8", 65001},  // from its alias windows-65001
                                  {"GBK", 936},
                                  {"Shift_JIS", 932},  // windows-932 before cp932
                                  {"ibm-813", 813},    // only a cp alias
                                  {"Windows-28591", 28591},
                                  {"no-such-encoding", 0},
                                  {nullptr, 0}})
        EXPECT_EQ(EncodingNameToCodePage(name), codePage) << (name ? name : "null");
}

TEST(Converters, OpenCompareAndDisplay) {
    ConverterPtr byNumber(OpenConverter("1252"));
    ASSERT_NE(byNumber, nullptr);
    EXPECT_EQ(NameOf(byNumber.get()), NameOf(ConverterPtr(OpenConverter("windows-1252")).get()));
    EXPECT_EQ(ConverterPtr(OpenConverter("123456")), nullptr);  // a name, not a number
    EXPECT_EQ(ConverterPtr(OpenConverter("99998")), nullptr);
    EXPECT_EQ(NameOf(ConverterPtr(OpenConverter("windows-28591")).get()), "ISO-8859-1");
    {
        EncodingScope scope({"C", "GBK", 0});
        EXPECT_EQ(NameOf(ConverterPtr(OpenConverter(nullptr)).get()), NameOf(CurrentConverter()));
    }

    for (auto [name, shown] : {std::pair{"Shift_JIS", "windows-31j"},
                               {"cp1252", "windows-1252"},
                               {"GBK", "GBK"},
                               {"ibm-813", "cp813"},
                               {"iso-8859_11-2001", "iso-8859_11-2001"},
                               {"ibm-942", "cp932"}}) {
        ConverterPtr cnv(OpenConverter(name));
        ASSERT_NE(cnv, nullptr) << name;
        EXPECT_EQ(EncodingDisplayName(cnv.get()), shown) << name;
    }
    EncodingScope scope({"C", "ISO-8859-1", 0});
    EXPECT_EQ(EncodingDisplayName(nullptr), "ISO_8859-1:1987");

    EXPECT_TRUE(IsSameEncoding("cp1252", "windows-1252"));
    EXPECT_TRUE(IsSameEncoding("GBK", "CP936"));
    EXPECT_FALSE(IsSameEncoding("cp1252", "ISO-8859-1"));
    EXPECT_FALSE(IsSameEncoding("no-such-encoding", "no-such-encoding"));
    EXPECT_FALSE(IsSameEncoding(nullptr, "UTF-8"));
}

TEST(Locale, LocaleStringNeedsRoomForTheTerminator) {
    EncodingScope scope({"C", "cp1252", 0});
    ASSERT_TRUE(SetCollatorLocale("de_DE"));
    EXPECT_FALSE(SetCollatorLocale("de@collation=no;such=thing;;"));
    const std::string expected = "de.windows-1252";
    const int size = static_cast<int>(expected.size());
    auto exact = Exact(std::string(size + 1, 'x'));
    EXPECT_EQ(GetLocaleString(exact.get(), size), 0);
    EXPECT_EQ(exact[0], 'x');
    EXPECT_EQ(GetLocaleString(exact.get(), size + 1), size);
    EXPECT_STREQ(exact.get(), expected.c_str());
    EXPECT_EQ(GetLocaleString(nullptr, 100), 0);
}

TEST(Locale, IsoCodesFromPosixAndWindowsNames) {
    for (auto [name, expected] : {std::pair<const char*, const char*>{"de_DE.UTF-8", "de|DE"},
                                  {"German_Germany.1252", "de|DE"},
                                  {"german_austria.1252", "de|AT"},
                                  {"en_US.ISO-8859-1", "en|US"},
                                  {"zh_CN.GBK", "zh|CN"},
                                  {"Chinese_Taiwan.950", "zh|TW"},
                                  {"fr_CA", "fr|CA"},
                                  {"de_DE@euro", "de|DE"},
                                  {"French_.1252", "fr|"},
                                  {"de_XX.UTF-8", "en|"},
                                  {"C", "en|"},
                                  {nullptr, "en|"}}) {
        std::string language, country;
        LocaleNameToIsoCodes(name, language, country);
        EXPECT_EQ(language + "|" + country, expected) << (name ? name : "null");
    }
    EncodingScope scope({"de_DE.UTF-8", "UTF-8", 0});
    std::string language, country;
    LocaleToIsoCodes(language, country);
    EXPECT_EQ(language + "|" + country, "de|DE");
}

TEST(Locale, SystemLocaleInfo) {
    const struct {
        Encoding enc;
        bool found;
        const char *locale, *encoding;
    } rows[] = {
        {{"de_DE.UTF-8", "UTF-8", 0}, true, "de", "UTF-8"},
        {kGbk, true, "zh_Hans_CN", "GBK"},
        {kLatin1, true, "en_US", "ISO_8859-1:1987"},
        {{"C", "ISO-8859-1", 0}, false, "", ""},
    };
    for (const auto& r : rows) {
        EncodingScope scope(r.enc);
        std::string locale = "x", encoding = "x";
        EXPECT_EQ(GetSystemLocaleInfo(locale, encoding), r.found) << r.enc.locale;
        EXPECT_EQ(locale, r.locale);
        EXPECT_EQ(encoding, r.encoding);
    }
}

}  // namespace
