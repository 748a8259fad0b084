// Encoding names, code page numbers, converters, collator and locale lookup.
#include "mbtest.h"

namespace {

std::string NameOf(UConverter* cnv) {
    UErrorCode err = U_ZERO_ERROR;
    return cnv ? ucnv_getName(cnv, &err) : "";
}

std::string CodePageName(long codePage) {
    std::string name = "untouched";
    return CodePageToEncodingName(codePage, name) ? name : "failed:" + name;
}

TEST(CodePageTable, CodePageToEncodingName) {
    EXPECT_EQ(CodePageName(1252), "windows-1252");
    EXPECT_EQ(CodePageName(936), "GBK");
    EXPECT_EQ(CodePageName(932), "Shift_JIS");
    EXPECT_EQ(CodePageName(437), "IBM437");  // not in the table: windows-437
    EXPECT_EQ(CodePageName(65001), "UTF-8");
    EXPECT_EQ(CodePageName(99998), "failed:");
}

TEST(CodePageTable, EncodingNameToCodePage) {
    EXPECT_EQ(EncodingNameToCodePage("windows-1252"), 1252);
    EXPECT_EQ(EncodingNameToCodePage("ISO-8859-1"), 28591);
    EXPECT_EQ(EncodingNameToCodePage("latin1"), 28591);
    EXPECT_EQ(EncodingNameToCodePage("UTF-8"), 65001);  // from its alias windows-65001
    EXPECT_EQ(EncodingNameToCodePage("GBK"), 936);
    EXPECT_EQ(EncodingNameToCodePage("Shift_JIS"), 932);  // windows-932 before cp932
    EXPECT_EQ(EncodingNameToCodePage("ibm-813"), 813);    // only a cp alias
    EXPECT_EQ(EncodingNameToCodePage("Windows-28591"), 28591);
    EXPECT_EQ(EncodingNameToCodePage("no-such-encoding"), 0);
    EXPECT_EQ(EncodingNameToCodePage(nullptr), 0);
}

TEST(Converters, OpenByNameNumberOrCurrent) {
    ConverterPtr byNumber(OpenConverter("1252"));
    ConverterPtr byName(OpenConverter("windows-1252"));
    ASSERT_TRUE(byNumber && byName);
    EXPECT_EQ(NameOf(byNumber.get()), NameOf(byName.get()));
    EXPECT_EQ(ConverterPtr(OpenConverter("123456")), nullptr);  // a name, not a number
    EXPECT_EQ(ConverterPtr(OpenConverter("99998")), nullptr);
    ConverterPtr latin1(OpenConverter("windows-28591"));
    EXPECT_EQ(NameOf(latin1.get()), "ISO-8859-1");
    EncodingScope scope("C", "GBK", 0);
    ConverterPtr current(OpenConverter(nullptr));
    EXPECT_EQ(NameOf(current.get()), NameOf(CurrentConverter()));
}

TEST(Converters, DisplayNames) {
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
    EncodingScope scope("C", "ISO-8859-1", 0);
    EXPECT_EQ(EncodingDisplayName(nullptr), "ISO_8859-1:1987");
}

TEST(Converters, SameEncoding) {
    EXPECT_TRUE(IsSameEncoding("cp1252", "windows-1252"));
    EXPECT_TRUE(IsSameEncoding("GBK", "CP936"));
    EXPECT_FALSE(IsSameEncoding("cp1252", "ISO-8859-1"));
    EXPECT_FALSE(IsSameEncoding("no-such-encoding", "no-such-encoding"));
    EXPECT_FALSE(IsSameEncoding(nullptr, "UTF-8"));
}

TEST(Locale, LocaleStringNeedsRoomForTheTerminator) {
    EncodingScope scope("C", "cp1252", 0);
    ASSERT_TRUE(SetCollatorLocale("de_DE"));
    EXPECT_FALSE(SetCollatorLocale("de@collation=no;such=thing;;"));
    std::string expected = "de.windows-1252";
    auto exact = Exact(std::string(expected.size() + 1, 'x'));
    EXPECT_EQ(GetLocaleString(exact.get(), static_cast<int>(expected.size())), 0);
    EXPECT_EQ(exact[0], 'x');
    EXPECT_EQ(GetLocaleString(exact.get(), static_cast<int>(expected.size() + 1)),
              static_cast<int>(expected.size()));
    EXPECT_STREQ(exact.get(), expected.c_str());
    EXPECT_EQ(GetLocaleString(nullptr, 100), 0);
}

TEST(Locale, IsoCodesFromPosixAndWindowsNames) {
    std::string language, country;
    auto codes = [&](const char* name) {
        LocaleNameToIsoCodes(name, language, country);
        return language + "|" + country;
    };
    EXPECT_EQ(codes("de_DE.UTF-8"), "de|DE");
    EXPECT_EQ(codes("German_Germany.1252"), "de|DE");
    EXPECT_EQ(codes("german_austria.1252"), "de|AT");
    EXPECT_EQ(codes("en_US.ISO-8859-1"), "en|US");
    EXPECT_EQ(codes("zh_CN.GBK"), "zh|CN");
    EXPECT_EQ(codes("Chinese_Taiwan.950"), "zh|TW");
    EXPECT_EQ(codes("fr_CA"), "fr|CA");
    EXPECT_EQ(codes("de_DE@euro"), "de|DE");
    EXPECT_EQ(codes("French_.1252"), "fr|");
    EXPECT_EQ(codes("de_XX.UTF-8"), "en|");
    EXPECT_EQ(codes("C"), "en|");
    EXPECT_EQ(codes(nullptr), "en|");
}

TEST(Locale, SystemLocaleInfo) {
    std::string locale, encoding;
    {
        EncodingScope scope("de_DE.UTF-8", "UTF-8", 0);
        EXPECT_TRUE(GetSystemLocaleInfo(locale, encoding));
        EXPECT_EQ(locale, "de");
        EXPECT_EQ(encoding, "UTF-8");
        std::string language, country;
        LocaleToIsoCodes(language, country);
        EXPECT_EQ(language + "|" + country, "de|DE");
    }
    {
        EncodingScope scope("zh_CN.GBK", "GBK", 0);
        EXPECT_TRUE(GetSystemLocaleInfo(locale, encoding));
        EXPECT_EQ(locale, "zh_Hans_CN");
        EXPECT_EQ(encoding, "GBK");
    }
    {
        EncodingScope scope("en_US.ISO-8859-1", "ISO-8859-1", 0);
        EXPECT_TRUE(GetSystemLocaleInfo(locale, encoding));
        EXPECT_EQ(locale, "en_US");
        EXPECT_EQ(encoding, "ISO_8859-1:1987");
    }
    EncodingScope scope("C", "ISO-8859-1", 0);
    EXPECT_FALSE(GetSystemLocaleInfo(locale, encoding));
    EXPECT_EQ(locale + encoding, "");
}

}  // namespace
