// A file carrying every extension record a writer puts in, in both byte
// orders, raw and compressed, read whole through the exported calls: long
// names, very long strings joined again, long value labels, display
// parameters and the 64-bit case count.
#include <gtest/gtest.h>

#include <array>
#include <map>
#include <string>
#include <tuple>
#include <vector>

#include "api_handles.h"
#include "qoraio32.h"
#include "sysfile_builder.h"

namespace {

using fixture::Endian;
using fixture::OpenHandle;
using fixture::SysFileBuilder;

const std::string kLongName = "RespondentNumber_" + std::string(46, 'x') + "Z";  // 64 bytes
// A long name whose two-byte character would end at byte 65 is cut before it.
const std::string kCutName(63, 'm');

struct Text {
    const char* shortName;
    const char* longName;
    int width;
};
const Text kTexts[] = {{"S255", "Text255", 255},    {"S256", "Text256", 256},
                       {"S2000", "Text2000", 2000}, {"S32767", "Text32767", 32767},
                       {"LAB20", "Labelled20", 20}, {"LAB600", "Labelled600", 600}};

// A value that fills its width, different in every case and every segment.
std::string Filled(int width, int row) {
    std::string text(size_t(width), ' ');
    for (int i = 0; i < width; ++i) text[size_t(i)] = char('A' + (i / 7 + row) % 26);
    return text;
}

class WholeFile : public ::testing::TestWithParam<std::tuple<Endian, bool>> {};

INSTANTIATE_TEST_SUITE_P(Forms, WholeFile,
                         ::testing::Combine(::testing::Values(Endian::Native, Endian::Swapped),
                                            ::testing::Bool()));

TEST_P(WholeFile, EveryRecordReadsBackThroughTheCalls) {
    SysFileBuilder b(std::get<0>(GetParam()));
    b.Compressed(std::get<1>(GetParam()));
    b.header().caseCount = -1;
    fixture::Utf8Mode utf8;
    b.Numeric("RESPONDE").LongName(kLongName);
    b.Numeric("M").LongName(kCutName + "\xC3\xA9o");
    std::vector<std::array<int32_t, 3>> display{{1, 12, 1}, {1, 12, 1}};
    for (const Text& t : kTexts) {
        b.String(t.shortName, t.width).LongName(t.longName);
        const int segments = t.width <= 255 ? 1 : (t.width + 251) / 252;
        for (int s = 0; s < segments; ++s) display.push_back({s == 0 ? 2 : 1, 7 + s, 0});
    }
    b.IntegerInfo();
    b.FloatInfo();
    b.DisplayParams(display);
    b.LongNames();
    b.VeryLongStrings();
    b.CaseCount64(3);
    b.LongValueLabelsRecord({{"Labelled20", 20, {{"alpha", "First"}, {"beta", "Second"}}},
                             {"Labelled600", 600, {{"x", std::string(300, 'L')}}}});
    for (int row = 0; row < 3; ++row) {
        std::vector<fixture::Value> values{double(row + 1), 0.0};
        for (const Text& t : kTexts) values.emplace_back(Filled(t.width, row));
        b.Case(values);
    }
    OpenHandle h;
    fixture::OpenForRead(b.WriteTemp(), h);

    int count = 0;
    ASSERT_EQ(qoraGetNumberofCases(h.get(), &count), QORA_STATUS_OK);
    EXPECT_EQ(count, 3);
    ASSERT_EQ(qoraGetNumberofVariables(h.get(), &count), QORA_STATUS_OK);
    ASSERT_EQ(count, 8);
    char name[65];
    int type = -1;
    ASSERT_EQ(qoraGetVarInfo(h.get(), 0, name, &type), QORA_STATUS_OK);
    EXPECT_EQ(name, kLongName);
    ASSERT_EQ(qoraGetVarInfo(h.get(), 1, name, &type), QORA_STATUS_OK);
    EXPECT_EQ(name, kCutName);
    for (int i = 0; i < 6; ++i) {
        ASSERT_EQ(qoraGetVarInfo(h.get(), i + 2, name, &type), QORA_STATUS_OK);
        EXPECT_EQ(std::string(name) + "/" + std::to_string(type),
                  std::string(kTexts[i].longName) + "/" + std::to_string(kTexts[i].width));
        int level = 0, width = 0, alignment = -1;
        qoraGetVarMeasureLevel(h.get(), name, &level);
        qoraGetVarColumnWidth(h.get(), name, &width);
        qoraGetVarAlignment(h.get(), name, &alignment);
        EXPECT_EQ(std::to_string(level) + std::to_string(width) + std::to_string(alignment), "270");
    }

    char** values = nullptr;
    char** labels = nullptr;
    ASSERT_EQ(qoraGetVarCValueLabels(h.get(), "labelled20", &values, &labels, &count),
              QORA_STATUS_OK);
    ASSERT_EQ(count, 2);
    // Values come as whole value units: 24 bytes for a width of 20.
    std::map<std::string, std::string> byLabel;
    for (int i = 0; i < count; ++i) byLabel[labels[i]] = values[i];
    EXPECT_EQ(byLabel["First"], "alpha" + std::string(19, ' '));
    EXPECT_EQ(byLabel["Second"], "beta" + std::string(20, ' '));
    qoraFreeVarCValueLabels(values, labels, count);
    ASSERT_EQ(qoraGetVarCValueLabels(h.get(), "LABELLED600", &values, &labels, &count),
              QORA_STATUS_OK);
    ASSERT_EQ(count, 1);
    EXPECT_EQ(values[0], "x" + std::string(599, ' '));
    EXPECT_EQ(labels[0], std::string(300, 'L'));
    qoraFreeVarCValueLabels(values, labels, count);

    std::vector<char> buffer(32768);
    for (int row = 0; row < 3; ++row) {
        ASSERT_EQ(qoraReadCaseRecord(h.get()), QORA_STATUS_OK) << row;
        double number = 0;
        ASSERT_EQ(qoraGetValueNumeric(h.get(), 1.0, &number), QORA_STATUS_OK);
        EXPECT_EQ(number, row + 1);
        for (int i = 0; i < 6; ++i) {
            ASSERT_EQ(qoraGetValueChar(h.get(), i + 3.0, buffer.data(), int(buffer.size())),
                      QORA_STATUS_OK);
            EXPECT_EQ(buffer.data(), Filled(kTexts[i].width, row)) << kTexts[i].longName;
        }
    }
    EXPECT_EQ(qoraReadCaseRecord(h.get()), QORA_WARN_END_OF_FILE);
}

}  // namespace
