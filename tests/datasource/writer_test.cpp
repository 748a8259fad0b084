// The writer's bytes against the fixture builder's for the same dictionary
// and cases, and the movers that cut very long strings into segments.
#include <gtest/gtest.h>

#include <cstring>
#include <fstream>
#include <functional>
#include <iterator>
#include <regex>
#include <string>
#include <vector>

#include "SaveDS.h"
#include "api_handles.h"
#include "case.h"
#include "reader_support.h"

using namespace fixture;

namespace {

Bytes ReadBytes(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    return Bytes(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

int32_t Int32At(const Bytes& bytes, size_t offset) {
    int32_t value;
    std::memcpy(&value, bytes.data() + offset, sizeof value);
    return value;
}

// The written file as the builder lays it out: its type 7 records, which the
// record handlers produce, are dropped (they follow the classic records and
// precede the type 999 record, where the builder's file has none), and the
// creation stamp becomes the builder's after its form is checked.
Bytes Comparable(Bytes written, size_t recordsEnd) {
    size_t pos = recordsEnd;
    while (pos + 16 <= written.size() && Int32At(written, pos) == 7)
        pos += 16 + size_t(Int32At(written, pos + 8)) * size_t(Int32At(written, pos + 12));
    written.erase(written.begin() + long(recordsEnd), written.begin() + long(pos));
    const std::string stamp(written.begin() + 92, written.begin() + 109);
    EXPECT_TRUE(std::regex_match(stamp, std::regex(R"(\d\d [A-Z][a-z]{2} \d\d\d\d:\d\d:\d\d)")))
        << stamp;
    Patch(written, 92, Bytes{'0', '4', ' ', 'D', 'e', 'c', ' ', '2', '6'});
    Patch(written, 101, Bytes{'1', '7', ':', '1', '6', ':', '4', '3'});
    return written;
}

QORA_Variable& Add(QORA_DataSource& source, const char* name, int type) {
    int index;
    QORA_Variable& var = source.NewVariable(type, &index);
    var.SetName(name);
    const uint32_t format = type == 0 ? FormatWord(5, 8, 2) : StringFormat(type);
    var.SetPrintFormatWord(format);
    var.SetWriteFormatWord(format);
    return var;
}

struct WriterCase {
    const char* name;
    bool compressed;
    // Defines the same dictionary in the source and in the builder.
    std::function<void(QORA_DataSource&, SysFileBuilder&)> define;
    std::vector<std::vector<Value>> cases;
};

void PrintTo(const WriterCase& c, std::ostream* out) { *out << c.name; }

const std::string kLong300(300, 'L');

const WriterCase kWriterCases[] = {
    {"VariablesLabelsMissingAndContinuations",
     false,
     [](QORA_DataSource& s, SysFileBuilder& b) {
         const double missing[] = {-1.0, 99.0};
         Add(s, "AGE", 0).SetLabel("Age");
         s.GetVariable(0).SetMissingValues(2, &missing[0], &missing[1], nullptr);
         b.Numeric("AGE").Label("Age").Missing({-1.0, 99.0});
         Add(s, "CODE", 8).SetLabel("Wage");
         s.GetVariable(1).SetMissingStrings("NONE", nullptr, nullptr);
         b.String("CODE", 8).Label("Wage").MissingStrings({"NONE"});
         Add(s, "NAME", 9);
         b.String("NAME", 9);
         Add(s, "WIDEST", 255).SetLabel("Seven b");
         b.String("WIDEST", 255).Label("Seven b");
         const double low = 1.0, high = 5.0, one = 9.0;
         Add(s, "SCORE", 0).SetMissingRange(&low, &high, &one);
         b.Numeric("SCORE").MissingRange(1.0, 5.0, 9.0);
     },
     {{30.0, "ABC", "123456789", std::string(255, 'w'), 2.5}, {kSysmis, "", "", "", -7.0}}},
    {"ValueLabelsSharedByTheMapNotByItsContents",
     false,
     [](QORA_DataSource& s, SysFileBuilder& b) {
         QORA_VLMap shared(0);
         shared.Insert(1.0, "One");
         shared.Insert(2.0, kLong300);
         QORA_VLMap equal = shared;
         equal.Insert(1.0, "One");  // now a map of its own
         QORA_VLMap text(8);
         text.Insert("LDN", 3, "London");
         for (const char* name : {"X", "Y", "Z"}) b.Numeric(name);
         b.String("CITY", 8);
         Add(s, "X", 0).SetValueLabels(shared);
         Add(s, "Y", 0).SetValueLabels(equal);
         Add(s, "Z", 0).SetValueLabels(shared);
         Add(s, "CITY", 8).SetValueLabels(text);
         const std::vector<std::pair<Value, std::string>> labels = {{1.0, "One"}, {2.0, kLong300}};
         b.ValueLabels(labels, {1, 3});
         b.ValueLabels(labels, {2});
         b.ValueLabels({{"LDN", "London"}}, {4});
     },
     {{1.0, 2.0, 3.0, "PAR"}}},
    {"CompressedWithDocumentsWeightAndFileLabel",
     true,
     [](QORA_DataSource& s, SysFileBuilder& b) {
         Add(s, "N", 0);
         Add(s, "S", 12);
         Add(s, "M", 0);
         b.Compressed().Numeric("N");
         b.String("S", 12);
         b.Weight(b.Numeric("M"));
         s.SetCaseWeight(2);
         s.SetIdString("Sample survey");
         b.header().label = "Sample survey";
         // 170 bytes: two whole lines are kept, the last 10 bytes dropped.
         const std::string text = std::string(80, 'a') + std::string(80, 'b') + "0123456789";
         s.SetExtensionContent(kDocumentExtension, 1, int32_t(text.size()), text.data());
         b.Documents({std::string(80, 'a'), std::string(80, 'b')});
     },
     {{1.0, "ABCDEFGH", 0.5},
      {-99.0, "", kSysmis},
      {151.0, "x", 152.0},
      {-0.0, "    blank", 100.0},
      {7.0, "last", 8.0}}},
};

class WriterBytes : public ::testing::TestWithParam<WriterCase> {};
INSTANTIATE_TEST_SUITE_P(Dictionaries, WriterBytes, ::testing::ValuesIn(kWriterCases),
                         [](const auto& info) { return std::string(info.param.name); });

TEST_P(WriterBytes, MatchTheBuilderRecordForRecord) {
    const WriterCase& c = GetParam();
    SysFileBuilder b;
    b.header().product = "@(#) QORA DATA FILE MS Windows Release 16.0.0";
    TempDir dir;
    const std::string path = dir.Path() + "/written.qsf";
    {
        SystemFileDataSource source;
        source.SetFileName(path.c_str());
        source.SetCompression(c.compressed);
        c.define(source, b);
        source.CommitDictionary();
        for (const auto& row : c.cases) {
            QORA_Case units(source);
            for (int i = 0; i < source.ColumnCount(); ++i) {
                const Value& value = row[size_t(i)];
                if (value.IsString())
                    units.SetString(i, value.Text().c_str());
                else
                    units.SetNumeric(i, value.Number());
            }
            source.WriteCase(units.Buffer());
            b.Case(row);
        }
        source.FinishWriting();
    }
    const Bytes expected = b.Build();
    EXPECT_EQ(Comparable(ReadBytes(path), b.DataStart() - 8), expected);
}

// Names that share a lookup key stop the writing before the file exists.
TEST(Writer, DuplicateKeysWriteNothing) {
    TempDir dir;
    SystemFileDataSource source;
    source.SetFileName((dir.Path() + "/dup.qsf").c_str());
    Add(source, "age", 0);
    Add(source, "AGE", 0);
    EXPECT_THROW(source.CommitDictionary(), ErrorText);
    EXPECT_TRUE(ReadBytes(dir.Path() + "/dup.qsf").empty());
}

// Appending continues the last, half-filled block: the new code overwrites
// the first padding code and the block is written again whole.
TEST(Writer, AppendContinuesTheLastCompressedBlock) {
    SysFileBuilder b;
    b.Compressed().Numeric("N");
    for (double v : {1.0, 2.0, 0.25}) b.Case({v});
    const std::string path = b.WriteTemp();
    {
        SystemFileDataSource source(path.c_str());
        const double value = 4.0;
        source.WriteCase(&value);
        source.FinishWriting();
        EXPECT_EQ(source.CaseCount(), 4);
    }
    SysFileBuilder all;
    all.Compressed().Numeric("N");
    for (double v : {1.0, 2.0, 0.25, 4.0}) all.Case({v});
    EXPECT_EQ(ReadBytes(path), all.Build());
}

TEST(Movers, CutVeryLongStringsIntoSegments) {
    using SaveDS = SystemFileDataSource::SaveDS;
    Utf8Mode utf8;
    struct Cut {
        const char* name;
        int width;
        std::string text;
        std::vector<std::string> segments;  // each as written, padding included
    };
    const std::string e = "\xc3\xa9";  // two bytes
    const Cut cuts[] = {
        {"width600",
         600,
         std::string(600, 'a'),
         {std::string(255, 'a') + ' ', std::string(255, 'a') + ' ',
          std::string(90, 'a') + std::string(6, ' ')}},
        {"multipleOf252",
         504,
         std::string(504, 'b'),
         {std::string(255, 'b') + ' ', std::string(249, 'b') + std::string(7, ' ')}},
        {"blankAt254",
         300,
         std::string(254, 'c') + ' ' + e + std::string(43, 'c'),
         {std::string(254, 'c') + "  ", e + std::string(43, 'c') + "   "}},
        {"characterAcross255",
         300,
         std::string(254, 'd') + e + std::string(44, 'd'),
         {std::string(254, 'd') + '\0' + ' ', e + std::string(44, 'd') + "  "}},
    };
    for (const Cut& cut : cuts) {
        SCOPED_TRACE(cut.name);
        std::string source =
            cut.text + std::string(8 * size_t(ValueUnits(cut.width)) - cut.width, ' ');
        std::string expected;
        for (const std::string& segment : cut.segments) expected += segment;
        std::string output(expected.size(), '?');
        SaveDS::EStringMover mover(reinterpret_cast<unsigned char*>(&output[0]), cut.width);
        const auto* begin = reinterpret_cast<const unsigned char*>(source.data());
        EXPECT_EQ(mover.Move(begin), begin + source.size());
        EXPECT_EQ(output, expected);
    }
    unsigned char units[16] = {1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 16};
    unsigned char out[16] = {};
    SaveDS::OrdinaryMover ordinary(out, 2);
    EXPECT_EQ(ordinary.Move(units), units + 16);
    EXPECT_EQ(0, std::memcmp(out, units, 16));
}

}  // namespace
