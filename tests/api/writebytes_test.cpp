// A thousand variables of every kind and ten thousand cases, written through
// the calls raw and compressed: the file is, byte for byte, the one the
// fixture builder makes for the same dictionary, every extension record
// included, and it reads back through the calls.
#include <gtest/gtest.h>

#include <array>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "api_handles.h"
#include "codepage.h"
#include "qoraio32.h"
#include "sysfile_builder.h"

namespace {

using namespace fixture;

const char kProduct[] = "@(#) QORA DATA FILE MS Windows Release 16.0 qoraio32.dll";
constexpr int kVariables = 1000;
constexpr int kCases = 10000;

struct Column {
    std::string name;       // as the caller defines it
    std::string shortName;  // as the writer names it in the file
    int width;
    bool labelled;
    int level, alignment, columns;
};

std::string Format(const char* format, int i) {
    char text[64];
    std::snprintf(text, sizeof text, format, i);
    return text;
}

// Short names follow from the names: short ones are their own upper case,
// long ones have unique first eight bytes.
std::vector<Column> Columns() {
    std::vector<Column> columns;
    for (int i = 0; i < kVariables; ++i) {
        static const int kWidths[] = {0, 0, 0, 0, 0, 0, 1, 8, 9, 20};
        const bool shortName = i % 3 == 0;
        Column c{shortName ? Format("q%d", i) : Format("Q%04dLongName", i),
                 shortName ? Format("Q%d", i) : Format("Q%04dLON", i),
                 kWidths[i % 10],
                 i % 4 == 0,
                 1 + i % 3,
                 i % 3,
                 1 + i % 40};
        if (i == 10) c = {"LongText256", "LONGTEXT", 256, true, 1, 0, 30};
        if (i == 20) c = {"Remarks600", "REMARKS6", 600, true, 1, 1, 40};
        if (i == 500) c = {"Diary2000Entries", "DIARY200", 2000, false, 1, 2, 50};
        columns.push_back(c);
    }
    return columns;
}

double Number(int row, int i) { return (row + i) % 97 == 0 ? kSysmis : (row * 7 + i) % 300 / 4.0; }
std::string Text(int row, const Column& c) {
    const std::string text =
        Format("r%d-", row) + std::string(size_t(c.width), char('a' + row % 26));
    return text.substr(0, size_t(std::min(c.width, 3 + row % 40 + c.width / 2)));
}

void Define(int h, const Column& c, int i) {
    const char* n = c.name.c_str();
    const auto check = [n](int status) { EXPECT_EQ(status, QORA_STATUS_OK) << n; };
    check(qoraSetVarName(h, n, c.width));
    if (c.labelled) check(qoraSetVarLabel(h, n, Format("Label of %d", i).c_str()));
    check(qoraSetVarMeasureLevel(h, n, c.level));
    check(qoraSetVarAlignment(h, n, c.alignment));
    check(qoraSetVarColumnWidth(h, n, c.columns));
    if (c.width == 0 && i % 5 == 0) check(qoraSetVarNMissingValues(h, n, 1, -1, 0, 0));
    if (c.width == 0 && i % 5 == 1) check(qoraSetVarNMissingValues(h, n, -2, -9, -5, 0));
    if (c.width > 0 && c.width <= 8 && i % 7 == 0)
        check(qoraSetVarCMissingValues(h, n, 1, "NA", nullptr, nullptr));
    if (c.width == 0 && i % 6 == 0) {
        check(qoraSetVarNValueLabel(h, n, 1.0, "one"));
        check(qoraSetVarNValueLabel(h, n, 2.0, "two"));
    }
    if (c.width > 0 && i % 6 == 2) check(qoraSetVarCValueLabel(h, n, "a", "Alpha"));
}

// The same dictionary as the builder lays it out, in the writer's record
// order: the variables and value labels first, the extension records later.
void DescribeVariables(SysFileBuilder& b, const std::vector<Column>& columns) {
    for (int i = 0; i < kVariables; ++i) {
        const Column& c = columns[size_t(i)];
        Var& var = c.width == 0 ? b.Numeric(c.shortName) : b.String(c.shortName, c.width);
        var.LongName(c.name);
        if (c.labelled) var.Label(Format("Label of %d", i));
        if (c.width == 0 && i % 5 == 0) var.Missing({-1.0});
        if (c.width == 0 && i % 5 == 1) var.MissingRange(-9.0, -5.0);
        if (c.width > 0 && c.width <= 8 && i % 7 == 0) var.MissingStrings({"NA"});
    }
    for (int i = 0; i < kVariables; ++i) {
        const Column& c = columns[size_t(i)];
        if (c.width == 0 && i % 6 == 0)
            b.ValueLabels({{1.0, "one"}, {2.0, "two"}}, {b.Slot(c.shortName)});
        if (c.width > 0 && c.width <= 8 && i % 6 == 2)
            b.ValueLabels({{"a", "Alpha"}}, {b.Slot(c.shortName)});
    }
}

void DescribeExtensions(SysFileBuilder& b, const std::vector<Column>& columns,
                        const std::string& encoding, int characterCode) {
    std::vector<std::array<int32_t, 3>> display;
    std::vector<std::pair<std::string, std::string>> names;
    std::vector<std::pair<std::string, int>> veryLong;
    std::vector<LongValueLabels> longLabels;
    for (int i = 0; i < kVariables; ++i) {
        const Column& c = columns[size_t(i)];
        const int segments = c.width > 255 ? (c.width + 251) / 252 : 1;
        for (int s = 0; s < segments; ++s) display.push_back({c.level, c.columns, c.alignment});
        names.emplace_back(c.shortName, c.name);
        if (c.width > 255) veryLong.emplace_back(c.shortName, c.width);
        if (c.width > 8 && i % 6 == 2)
            longLabels.push_back(
                {c.name, c.width, {{"a" + std::string(c.width - 1, ' '), "Alpha"}}});
    }
    b.IntegerInfo({16, 0, 0, 720, 1, 1, 2, characterCode});
    b.FloatInfo();
    b.DisplayParams(display);
    b.LongNames(names);
    b.VeryLongStrings(veryLong);
    b.CaseCount64(kCases);
    if (!encoding.empty()) b.Encoding(encoding);
    b.LongValueLabelsRecord(longLabels);
}

Bytes ReadBytes(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    return Bytes(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

// The subtype 20 text of a written file, empty when it has none.
std::string EncodingRecord(const Bytes& file, size_t from) {
    for (size_t at = from; at + 16 <= file.size();) {
        int32_t frame[4];
        std::memcpy(frame, file.data() + at, sizeof frame);
        if (frame[0] != 7) break;
        const size_t size = size_t(frame[2]) * size_t(frame[3]);
        if (frame[1] == 20)
            return std::string(file.begin() + long(at + 16), file.begin() + long(at + 16 + size));
        at += 16 + size;
    }
    return std::string();
}

class WriteBytes : public ::testing::TestWithParam<bool> {};
INSTANTIATE_TEST_SUITE_P(Forms, WriteBytes, ::testing::Bool(),
                         [](const auto& info) { return info.param ? "Compressed" : "Raw"; });

TEST_P(WriteBytes, AThousandVariablesMatchTheBuilderAndReadBack) {
    const bool compressed = GetParam();
    const std::vector<Column> columns = Columns();
    TempDir dir;
    const std::string path = dir.Path() + "/thousand.qsf";
    SysFileBuilder b;
    b.header().product = kProduct;
    b.header().label = "Thousand variables";
    b.Compressed(compressed);
    DescribeVariables(b, columns);
    {
        OpenHandle h;
        OpenForWrite(path, h);
        for (int i = 0; i < kVariables; ++i) Define(h.get(), columns[size_t(i)], i);
        ASSERT_EQ(qoraSetIdString(h.get(), "Thousand variables"), QORA_STATUS_OK);
        ASSERT_EQ(qoraSetCompression(h.get(), compressed), QORA_STATUS_OK);
        ASSERT_EQ(qoraCommitHeader(h.get()), QORA_STATUS_OK);
        for (int row = 0; row < kCases; ++row) {
            std::vector<Value> values;
            for (int i = 0; i < kVariables; ++i) {
                const Column& c = columns[size_t(i)];
                const int status = c.width == 0
                                       ? qoraSetValueNumeric(h.get(), i + 1.0, Number(row, i))
                                       : qoraSetValueChar(h.get(), i + 1.0, Text(row, c).c_str());
                ASSERT_EQ(status, QORA_STATUS_OK);
                values.push_back(c.width == 0 ? Value(Number(row, i)) : Value(Text(row, c)));
            }
            ASSERT_EQ(qoraCommitCaseRecord(h.get()), QORA_STATUS_OK);
            b.Case(values);
        }
        ASSERT_EQ(qoraCloseWrite(h.get()), QORA_STATUS_OK);
        h.Forget();
    }
    Bytes written = ReadBytes(path);
    ASSERT_GT(written.size(), 176u);
    // The clock's stamp is the one field the builder cannot know.
    Patch(written, 92, Bytes{'0', '4', ' ', 'D', 'e', 'c', ' ', '2', '6'});
    Patch(written, 101, Bytes{'1', '7', ':', '1', '6', ':', '4', '3'});
    // The encoding the writer names follows the interface, and the character
    // code its code page; the builder's records say the same.
    const std::string encoding = EncodingRecord(written, b.DataStart() - 8);
    const long codePage = EncodingNameToCodePage(encoding.c_str());
    DescribeExtensions(b, columns, encoding, codePage != 0 ? int(codePage) : 2);
    const Bytes expected = b.Build();
    ASSERT_EQ(written.size(), expected.size());
    for (size_t at = 0; at < written.size(); ++at)
        ASSERT_EQ(written[at], expected[at]) << "first difference at byte " << at;

    OpenHandle h;
    OpenForRead(path, h);
    int count = 0;
    ASSERT_EQ(qoraGetNumberofCases(h.get(), &count), QORA_STATUS_OK);
    EXPECT_EQ(count, kCases);
    char name[65];
    int type = 0;
    ASSERT_EQ(qoraGetVarInfo(h.get(), 500, name, &type), QORA_STATUS_OK);
    EXPECT_EQ(std::string(name) + "/" + std::to_string(type), "Diary2000Entries/2000");
}

}  // namespace
