// The writer's bytes against the fixture builder's for the same dictionary
// and cases, and the movers that cut very long strings into segments.
#include <gtest/gtest.h>

#include <cstring>
#include <fstream>
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

// One compressed file: value labels shared by the map, not by its contents,
// documents, a weight and a file label, against the builder's bytes.
TEST(Writer, BytesMatchTheBuilderRecordForRecord) {
    SysFileBuilder b;
    b.header().product = "@(#) QORA DATA FILE MS Windows Release 16.0.0";
    TempDir dir;
    const std::string path = dir.Path() + "/written.qsf";
    const std::string long300(300, 'L');
    const std::vector<std::vector<Value>> cases = {{1.0, 2.0, 3.0, "PAR", "ABCDEFGH", 0.5},
                                                   {-99.0, 151.0, -0.0, "", "", kSysmis},
                                                   {152.0, 7.0, 100.0, "x", "    blank", 8.0}};
    {
        SystemFileDataSource s;
        s.SetFileName(path.c_str());
        s.SetCompression(true);
        QORA_VLMap shared(0);
        shared.Insert(1.0, "One");
        shared.Insert(2.0, long300);
        QORA_VLMap equal = shared;
        equal.Insert(1.0, "One");  // now a map of its own
        QORA_VLMap text(8);
        text.Insert("LDN", 3, "London");
        Add(s, "X", 0).SetValueLabels(shared);
        Add(s, "Y", 0).SetValueLabels(equal);
        Add(s, "Z", 0).SetValueLabels(shared);
        Add(s, "CITY", 8).SetValueLabels(text);
        Add(s, "S", 12);
        Add(s, "M", 0);
        s.SetCaseWeight(5);
        s.SetIdString("Sample survey");
        // 170 bytes: two whole lines are kept, the last 10 bytes dropped.
        const std::string docs = std::string(80, 'a') + std::string(80, 'b') + "0123456789";
        s.SetExtensionContent(kDocumentExtension, 1, int32_t(docs.size()), docs.data());
        s.CommitDictionary();
        for (const auto& row : cases) {
            QORA_Case units(s);
            for (int i = 0; i < s.ColumnCount(); ++i) {
                const Value& value = row[size_t(i)];
                if (value.IsString())
                    units.SetString(i, value.Text().c_str());
                else
                    units.SetNumeric(i, value.Number());
            }
            s.WriteCase(units.Buffer());
        }
        s.FinishWriting();
    }
    b.Compressed();
    for (const char* name : {"X", "Y", "Z"}) b.Numeric(name);
    b.String("CITY", 8);
    b.String("S", 12);
    b.Weight(b.Numeric("M"));
    b.header().label = "Sample survey";
    const std::vector<std::pair<Value, std::string>> labels = {{1.0, "One"}, {2.0, long300}};
    b.ValueLabels(labels, {1, 3});
    b.ValueLabels(labels, {2});
    b.ValueLabels({{"LDN", "London"}}, {4});
    b.Documents({std::string(80, 'a'), std::string(80, 'b')});
    for (const auto& row : cases) b.Case(row);
    EXPECT_EQ(Comparable(ReadBytes(path), b.DataStart() - 8), b.Build());
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
