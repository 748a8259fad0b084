// Writing the long names, very long strings and long value labels records:
// short names, the bytes of each record, and reading them back.
#include <gtest/gtest.h>

#include <string>
#include <utility>
#include <vector>

#include "../qoramb/mbtest.h"
#include "HeaderSettings.h"
#include "SFExtensionExtNames.h"
#include "SystemFileExtensionRecord.h"
#include "memory_source.h"
#include "sysfile_builder.h"

using namespace fixture;

namespace {

std::string Export(int32_t subtype, QORA_DataSource& source, HeaderSettings& settings) {
    SystemFileExtensionRecord record;
    FindExtensionHandler(subtype)->Export(source, settings, record);
    return record.Text();
}

void Import(int32_t subtype, QORA_DataSource& source, HeaderSettings& settings,
            const std::string& text) {
    SystemFileExtensionRecord record(1, int32_t(text.size()));
    record.SetContents(text.data());
    FindExtensionHandler(subtype)->Import(source, settings, record);
}

// The contents of the only record of a builder without variables.
std::string Contents(const SysFileBuilder& b) {
    const fixture::Bytes file = b.Build();
    return std::string(file.begin() + 176 + 16, file.end() - 8);
}

std::vector<std::string> ShortNames(const std::vector<std::string>& names) {
    MemorySource source;
    for (const std::string& name : names) source.Add(0, name.c_str());
    HeaderSettings settings;
    GenerateShortNames(source, settings);
    std::vector<std::string> shortNames;
    for (const auto& pair : settings.fNameList) shortNames.push_back(pair.second);
    return shortNames;
}

}  // namespace

TEST(ShortNames, KeysCutAtEightBytesElseNumberedByPosition) {
    EncodingScope utf8(kUtf8);
    EXPECT_EQ(ShortNames({"income_2004", "ab.cdefg_hij", "abcdefg._x", "bcdefgh\xC3\xA9z", "age",
                          "x", "income_2004b"}),
              (std::vector<std::string>{"INCOME_2", "AB.CDEFG", "ABCDEFG", "BCDEFGH", "AGE", "X",
                                        "V7_A"}));
    // V30_A to V30_Z are taken: the suffix goes on to AA.
    std::vector<std::string> names, expected;
    for (char c = 'A'; c <= 'Z'; ++c) {
        names.push_back("v30_" + std::string(1, char(c + 32)));
        expected.push_back("V30_" + std::string(1, c));
    }
    names.insert(names.end(), {"a", "b", "c", "v30_z____x"});
    expected.insert(expected.end(), {"A", "B", "C", "V30_AA"});
    EXPECT_EQ(ShortNames(names), expected);
}

// Exported as a writer does (21, 14, 13), then imported as a reader does
// (13, 14, 21) into the dictionary the file holds.
TEST(LongNamesRecords, ExportedBytesMatchTheFixtureAndReadBackWhole) {
    MemorySource original;
    original.Add(0, "age");
    original.Add(0, "Income");
    QORA_VLMap remarksLabels(600), notesLabels(20);
    remarksLabels.Insert("none", -1, "Nothing said");
    notesLabels.Insert("a", -1, "Alpha");
    notesLabels.Insert("b", -1, std::string(300, 'L'));
    original.GetVariable(original.Add(600, "Remarks")).SetValueLabels(remarksLabels);
    original.GetVariable(2).SetLabel("Free text");
    original.GetVariable(original.Add(20, "Notes")).SetValueLabels(notesLabels);
    const std::string set = "things= Income Remarks\n";
    original.SetExtensionContent(kVariableSetExtension, 1, int32_t(set.size()), set.data());

    MemorySource written(original);
    HeaderSettings out;
    const std::string labels = Export(kLongValueLabelsExtension, written, out);
    const std::string strings = Export(kVeryLongStringsExtension, written, out);
    const std::string names = Export(kLongNamesExtension, written, out);

    const std::string pad(19, ' ');
    EXPECT_EQ(labels,
              Contents(SysFileBuilder().LongValueLabelsRecord(
                  {{"Remarks", 600, {{"none" + std::string(596, ' '), "Nothing said"}}},
                   {"Notes", 20, {{"a" + pad, "Alpha"}, {"b" + pad, std::string(300, 'L')}}}})));
    EXPECT_EQ(strings, std::string("REMARKS=600\0\t", 13));
    EXPECT_EQ(
        names,
        Contents(SysFileBuilder().LongNames(
            {{"AGE", "age"}, {"INCOME", "Income"}, {"REMARKS", "Remarks"}, {"NOTES", "Notes"}})));
    std::vector<std::string> layout;
    for (int i = 0; i < written.ColumnCount(); ++i) {
        const QORA_Variable& var = written.GetVariable(i);
        layout.push_back(var.GetName() + ":" + std::to_string(var.GetType()) + ":" +
                         std::to_string(var.GetPrintFormat().width) +
                         (var.GetValueLabels().IsValid() ? "+labels" : ""));
    }
    EXPECT_EQ(layout, (std::vector<std::string>{"AGE:0:8", "INCOME:0:8", "REMARKS:255:255",
                                                "REMAR0:255:255", "REMAR1:96:96", "NOTES:20:20"}));
    EXPECT_EQ(out.fVeryLongStrings, (std::vector<std::pair<int, int>>{{2, 600}}));
    EXPECT_EQ(written.GetExtension(kVariableSetExtension).Impl()->Content(),
              "things= INCOME REMARKS\n");

    MemorySource read(written);
    HeaderSettings in;
    Import(kLongNamesExtension, read, in, names);
    Import(kVeryLongStringsExtension, read, in, strings);
    Import(kLongValueLabelsExtension, read, in, labels);
    ASSERT_EQ(read.ColumnCount(), original.ColumnCount());
    for (int i = 0; i < read.ColumnCount(); ++i)
        EXPECT_TRUE(read.GetVariable(i) == original.GetVariable(i))
            << read.GetVariable(i).GetName();
    EXPECT_EQ(read.GetExtension(kVariableSetExtension).Impl()->Content(), set);
    ASSERT_TRUE(in.fpDechunker);
    EXPECT_EQ(in.fpDechunker->Entries().size(), 2u);  // age and Income, then Remarks and Notes
    EXPECT_NO_THROW(in.fpDechunker->Validate(written.ValueCount(), read.ValueCount()));
}
