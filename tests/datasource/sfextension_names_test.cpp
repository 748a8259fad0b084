// The long names, very long strings and long value labels records: the bytes
// written and read back, and files whose records break the format or are
// ignored.
#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "SystemFileExtensionRecord.h"
#include "memory_source.h"
#include "reader_support.h"

using namespace fixture;
using namespace std::string_literals;

namespace {

std::string Export(int32_t subtype, QORA_DataSource& source, HeaderSettings& settings) {
    SystemFileExtensionRecord record;
    FindExtensionHandler(subtype)->Export(source, settings, record);
    return record.Text();
}

void Import(int32_t subtype, QORA_DataSource& source, HeaderSettings& settings,
            const std::string& text) {
    SystemFileExtensionRecord record;
    record.SetText(text);
    FindExtensionHandler(subtype)->Import(source, settings, record);
}

// The contents of the only record of a builder without variables.
std::string Contents(const SysFileBuilder& b) {
    const fixture::Bytes file = b.Build();
    return std::string(file.begin() + 176 + 16, file.end() - 8);
}

// A value that fills the width, different at every position a segment may end.
std::string Sample(int width) {
    std::string text;
    while (int(text.size()) < width) text += std::to_string(text.size()) + "|";
    return text.substr(0, size_t(width));
}

class LongStringRecords : public ByteOrders {};
INSTANTIATE_TEST_SUITE_P(Orders, LongStringRecords,
                         ::testing::Values(Endian::Native, Endian::Swapped), EndianName);

}  // namespace

// Exported as a writer does (14, 13), then imported as a reader does (13, 14)
// into the dictionary the file holds: names, segments and sets come back whole.
TEST(LongNamesRecords, ExportedBytesMatchTheFixtureAndReadBackWhole) {
    MemorySource original;
    original.Add(0, "age");
    original.Add(0, "Income");
    original.GetVariable(original.Add(600, "Remarks")).SetLabel("Free text");
    const std::string set = "things= Income Remarks\n";
    original.SetExtensionContent(kVariableSetExtension, 1, int32_t(set.size()), set.data());

    MemorySource written(original);
    HeaderSettings out;
    const std::string strings = Export(kVeryLongStringsExtension, written, out);
    const std::string names = Export(kLongNamesExtension, written, out);
    EXPECT_EQ(strings, std::string("REMARKS=600\0\t", 13));
    EXPECT_EQ(names, Contents(SysFileBuilder().LongNames(
                         {{"AGE", "age"}, {"INCOME", "Income"}, {"REMARKS", "Remarks"}})));
    EXPECT_EQ(out.fVeryLongStrings, (std::vector<std::pair<int, int>>{{2, 600}}));
    EXPECT_EQ(written.GetExtension(kVariableSetExtension).Impl()->Content(),
              "things= INCOME REMARKS\n");

    MemorySource read(written);
    HeaderSettings in;
    Import(kLongNamesExtension, read, in, names);
    Import(kVeryLongStringsExtension, read, in, strings);
    ASSERT_EQ(read.ColumnCount(), original.ColumnCount());
    for (int i = 0; i < read.ColumnCount(); ++i)
        EXPECT_TRUE(read.GetVariable(i) == original.GetVariable(i))
            << read.GetVariable(i).GetName();
    EXPECT_EQ(read.GetExtension(kVariableSetExtension).Impl()->Content(), set);
}

// Each file fails to open with the condition, or opens with the number of
// variables (6 while both strings are in segments) and reads its case.
TEST_P(LongStringRecords, MalformedAndIgnoredRecords) {
    const std::string names = "S600=Remarks\tT300=Other";
    const struct {
        std::string names, strings;
        std::string value, stray;  // of one long value labels entry for Remarks, if any
        int32_t nameLength;        // written over the entry's, if not 0
        const char* condition;
        int columns;
    } rows[] = {
        {"A=alpha\tB", "", "", "", 0, "i != notFound && extString[i] == '='", 0},
        {"A=al=pha", "", "", "", 0, "j == len || extString[j] == '\\t'", 0},
        {names, "S600=600\0\tT300=300\0\t"s, "", "", 0, "", 3},
        {"", "S600=600\0\t"s, "", "", 0, "", 6},
        {names + "\tABCDEFGHIJKLMNO=Remarks", "ABCDEFGHIJKLMNO=600\0\t"s, "", "", 0, "", 4},
        {names + "\tABCDEFGHIJKLMNOP=Remarks", "ABCDEFGHIJKLMNOP=600\0\t"s, "", "", 0, "", 6},
        {names, "S600=100600\0\tT300=300\0\t"s, "", "", 0, "", 6},
        {names, "S600=700\0\tT300=300\0\t"s, "", "", 0, "", 5},
        {names, "T300=0\0\tS600=100\0\t"s, "", "", 0, "", 6},
        // R1 names the last two segments of Remarks as a string of width 348.
        {names + "\tR1=REMAR1", "S600=600\0\tR1=348\0\t"s, "", "", 0, "", 4},
        {names, "", "none", "", 0, "", 6},  // Remarks is still in segments: skipped
        {names, "", "none", "0123456789", 0, "r+13 < endr", 0},
        {names, "", std::string(601, 'v'), "", 0, "valLen <= varType", 0},
        {names, "", "none", "", -7, "nameLength >= 0", 0},
    };
    for (const auto& row : rows) {
        SysFileBuilder b(GetParam());
        b.String("S600", 600).LongName("Remarks");
        b.String("T300", 300).LongName("Other");
        b.Numeric("N");
        b.Case({Sample(600), Sample(300), 1.0});
        if (!row.names.empty()) b.TextExtension(13, row.names);
        if (!row.strings.empty()) b.TextExtension(14, row.strings);
        if (!row.value.empty()) {
            std::string entry =
                Contents(SysFileBuilder(GetParam())
                             .LongValueLabelsRecord({{"Remarks", 600, {{row.value, "Nil"}}}})) +
                row.stray;
            const fixture::Bytes nameLength = b.Int32(row.nameLength);
            if (row.nameLength != 0)
                entry.replace(entry.begin(), entry.begin() + 4, nameLength.begin(),
                              nameLength.end());
            b.Extension(21, 1, fixture::Bytes(entry.begin(), entry.end()));
        }
        const std::string path = b.WriteTemp();
        const OpenFailure f = FailureOf(path);
        EXPECT_EQ(f.condition, row.condition) << row.names << " " << f.text;
        if (f.number != 0) continue;
        auto source = OpenFixture(path);
        EXPECT_EQ(source->ColumnCount(), row.columns) << row.names << " " << row.strings;
        std::unique_ptr<QORA_InputCaseIterator> it(source->NewIterator(nullptr));
        EXPECT_TRUE(it->ReadCase());
    }
}
