// Text in any encoding through the calls: files written in each interface
// mode or built in a code page or UTF-8, read back in either mode under real
// locales and compared character for character; the encoding and locale calls.
#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <clocale>
#include <iterator>
#include <string>

#include "api_handles.h"
#include "encoding_scope.h"
#include "sysfile_builder.h"

using namespace fixture;

namespace {

// The text converted from UTF-8 to the code page named, or back.
std::string Recode(const std::string& cnvName, const std::string& text, bool toUtf8) {
    ConverterPtr cnv(OpenConverter(cnvName.c_str()));
    std::string out(4 * text.size() + 1, '\0');
    int error = 0;
    const int n = (toUtf8 ? mbCodePageToUtf8 : mbUtf8ToCodePage)(
        cnv.get(), &out[0], int(out.size()), text.data(), int(text.size()), &error);
    EXPECT_EQ(error, 0) << cnvName << ": " << text;
    return out.substr(0, size_t(n));
}

std::string Trimmed(std::string s) { return s.erase(s.find_last_not_of(' ') + 1); }

struct Row {
    const Encoding* locale;    // for code-page mode; kUtf8: its code page is UTF-8
    std::string fileEncoding;  // a number: named by the character code, not by a record
    std::string name, label, valueLabel, value;  // UTF-8; the value fits in 8 bytes
};

const Row kRows[] = {
    {&kLatin1, "ISO-8859-1", "Größe", "Maß der Länge", "groß", "Café"},
    {&kCp1252, "1252", "Preis€", "Preis in €", "über 5 €", "5 €"},
    {&kGbk, "GBK", "姓名", "中文标签", "男性", "北京"},
    {&kUtf8, "windows-31j", "名前", "日本語の名前", "男性", "東京"},
    {&kCp1252, "UTF-8", "Größe€", "Maß in €", "über", "5 €"},
    {&kGbk, "UTF-8", "姓名", "中文标签", "男性", "北京"},
};

// Built in the file's encoding; the file lives as long as the builder.
std::string BuiltFile(const Row& r, SysFileBuilder& b) {
    auto file = [&](const std::string& text) { return Recode(r.fileEncoding, text, false); };
    b.Numeric("N").LongName(file(r.name)).Label(file(r.label));
    b.String("TEXT", 8).MissingStrings({file(r.value)});
    b.ValueLabels({{1.0, file(r.valueLabel)}}, {b.Slot("N")});
    b.ValueLabels({{file(r.value), file(r.valueLabel)}}, {b.Slot("TEXT")});
    if (isdigit(r.fileEncoding[0]))
        b.IntegerInfo({16, 0, 0, 720, 1, 1, 2, std::stoi(r.fileEncoding)});
    else
        b.Encoding(r.fileEncoding);
    b.LongNames().Case({1.0, file(r.value)});
    return b.WriteTemp();
}

// Written through the calls in the current interface mode.
std::string WrittenFile(const Row& r, const std::string& path, bool utf8) {
    auto text = [&](const std::string& s) {
        return utf8 ? s : Recode(r.locale->converter, s, false);
    };
    const std::string name = text(r.name), value = text(r.value), valueLabel = text(r.valueLabel);
    OpenHandle h;
    OpenForWrite(path, h);
    qoraSetVarName(h.get(), name.c_str(), 0);
    qoraSetVarName(h.get(), "TEXT", 8);
    qoraSetVarLabel(h.get(), name.c_str(), text(r.label).c_str());
    qoraSetVarNValueLabel(h.get(), name.c_str(), 1.0, valueLabel.c_str());
    qoraSetVarCValueLabel(h.get(), "TEXT", value.c_str(), valueLabel.c_str());
    qoraSetVarCMissingValues(h.get(), "TEXT", 1, value.c_str(), nullptr, nullptr);
    EXPECT_EQ(qoraCommitHeader(h.get()), QORA_STATUS_OK);
    qoraSetValueNumeric(h.get(), 1.0, 1.0);
    qoraSetValueChar(h.get(), 2.0, value.c_str());
    EXPECT_EQ(qoraCommitCaseRecord(h.get()), QORA_STATUS_OK);
    return path;
}

// Name, label, value labels, the string's width, missing value and value.
std::string ReadBack(const std::string& path) {
    OpenHandle h;
    OpenForRead(path, h);
    char name[65], label[121], valueLabel[121], value[256], missing[3][64] = {};
    char** values = nullptr;
    char** labels = nullptr;
    int width = 0, count = 0;
    qoraGetVarInfo(h.get(), 0, name, &count);
    qoraGetVarInfo(h.get(), 1, value, &width);
    qoraGetVarLabel(h.get(), name, label);
    qoraGetVarNValueLabel(h.get(), name, 1.0, valueLabel);
    EXPECT_EQ(qoraGetVarCValueLabels(h.get(), "TEXT", &values, &labels, &count), 0);
    const std::string pair = count == 1 ? Trimmed(values[0]) + "=" + labels[0] : "?";
    qoraFreeVarCValueLabels(values, labels, count);
    qoraGetVarCMissingValues(h.get(), "TEXT", &count, missing[0], missing[1], missing[2]);
    EXPECT_EQ(qoraReadCaseRecord(h.get()), QORA_STATUS_OK);
    qoraGetValueChar(h.get(), 2.0, value, sizeof value);
    return std::string(name) + "|" + label + "|" + valueLabel + "|" + pair + "|" +
           std::to_string(width) + "|" + Trimmed(missing[0]) + "|" + Trimmed(value);
}

TEST(Encodings, EveryFileReadsBackInEitherModeCharacterForCharacter) {
    for (const Row& r : kRows) {
        const Encoding& locale = *r.locale;
        const bool utf8Locale = r.locale == &kUtf8;
        for (int source = 0; source < 3; ++source) {  // built, written in code page, in UTF-8
            SysFileBuilder b;
            TempDir dir;
            std::string path;
            {
                EncodingScope writing({locale.locale, locale.converter, source == 2});
                path = source == 0 ? BuiltFile(r, b)
                                   : WrittenFile(r, dir.Path() + "/w.qsf", source == 2);
            }
            const bool inCodePage =
                source == 0 ? r.fileEncoding != "UTF-8" : source == 1 && !utf8Locale;
            for (int utf8 = 0; utf8 <= 1; ++utf8) {
                SCOPED_TRACE(r.fileEncoding + " source " + std::to_string(source) + " utf8 " +
                             std::to_string(utf8));
                EncodingScope reading({locale.locale, locale.converter, utf8});
                const std::string read = ReadBack(path);
                // Strings three times as wide keep no missing values a call can show.
                const bool wide = inCodePage && (utf8 || utf8Locale);
                EXPECT_EQ(utf8 ? read : Recode(locale.converter, read, true),
                          r.name + "|" + r.label + "|" + r.valueLabel + "|" + r.value + "=" +
                              r.valueLabel + "|" + (wide ? "24||" : "8|" + r.value + "|") +
                              r.value);
            }
        }
    }
}

TEST(Encodings, CallsGiveTheirStatusesAndNeverPassTheBuffer) {
    EncodingScope scope(kLatin1);
    SysFileBuilder b, swapped(Endian::Swapped);
    b.Numeric("A");
    b.Encoding(std::string(300, 'x'));  // no converter knows it
    swapped.Numeric("A");
    swapped.Encoding("latin1");
    char name[80];
    int codePage = -1, compatible = -1;
    {
        OpenHandle h, other;
        OpenForRead(b.WriteTemp(), h);  // shown as it stands
        OpenForRead(swapped.WriteTemp(), other);
        EXPECT_EQ(qoraSetInterfaceEncoding(2), QORA_STATUS_BAD_ENCODING);
        EXPECT_EQ(qoraSetInterfaceEncoding(1), QORA_STATUS_FILES_OPEN);
        std::fill(std::begin(name), std::end(name), '#');
        ASSERT_EQ(qoraGetFileEncoding(h.get(), name), QORA_STATUS_OK);
        EXPECT_EQ(name + std::string(name + 65, 2), std::string(64, 'x') + "##");
        EXPECT_EQ(qoraGetFileCodePage(h.get(), &codePage), QORA_STATUS_NO_SYSTEM_FILE);
        // The file's encoding is the interface's, but its byte order is not.
        ASSERT_EQ(qoraIsCompatibleEndoding(other.get(), &compatible), QORA_STATUS_OK);
        EXPECT_EQ(std::to_string(qoraGetInterfaceEncoding()) + std::to_string(codePage) +
                      std::to_string(compatible),
                  "000");
        EXPECT_STREQ(qoraSetLocale(LC_ALL, "zh_CN.GBK"), "en_US.ISO-8859-1");
    }
    EXPECT_STREQ(qoraSetLocale(LC_ALL, "zh_CN.GBK"), "zh_CN.GBK");
    EXPECT_EQ(qoraSetLocale(LC_ALL, "xx_NO.SUCH"), nullptr);
    EXPECT_EQ(setlocale(LC_ALL, nullptr) + EncodingDisplayName(nullptr), "zh_CN.GBKGBK");

    ASSERT_EQ(qoraSetInterfaceEncoding(1), QORA_STATUS_OK);
    OpenHandle h;
    EXPECT_EQ(qoraOpenRead(b.WriteTemp().c_str(), h.out()), QORA_STATUS_BAD_FILE);
    OpenForWrite(b.WriteTemp("new.qsf"), h);
    qoraGetFileEncoding(h.get(), name);
    qoraGetFileCodePage(h.get(), &codePage);
    qoraIsCompatibleEndoding(h.get(), &compatible);
    EXPECT_EQ(name + std::to_string(codePage) + std::to_string(compatible), "UTF-8650011");
}

}  // namespace
