// Reading the header and the dictionary of well-formed files, in both byte
// orders.
#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <tuple>
#include <vector>

#include "HeaderSettings.h"
#include "reader_support.h"
#include "variableset.h"

using namespace fixture;

namespace {

class Reader : public ByteOrders {};
INSTANTIATE_TEST_SUITE_P(Orders, Reader, ::testing::Values(Endian::Native, Endian::Swapped),
                         EndianName);

}  // namespace

TEST_P(Reader, EndRecordAloneGivesAnEmptyDictionary) {
    SysFileBuilder b(GetParam());
    auto source = OpenFixture(b.WriteTemp());
    EXPECT_EQ(source->ColumnCount(), 0);
    EXPECT_EQ(source->Settings().fCaseSize, 0);
    EXPECT_EQ(source->DataStart(), 176 + 8);
    EXPECT_EQ(source->IsSwapped(), Swapped());
    std::unique_ptr<QORA_InputCaseIterator> it(source->NewIterator(nullptr));
    EXPECT_FALSE(it->ReadCase());
    EXPECT_EQ(source->FileSystemMissing(), kSysmis);
}

TEST_P(Reader, HeaderFieldsReachTheSettingsAndTheSource) {
    SysFileBuilder b(GetParam());
    b.Numeric("X");
    b.header().label = "Survey 2026";
    b.header().bias = 99.5;
    b.header().caseCount = 5;
    b.Compressed();
    const std::string path = b.WriteTemp();
    auto source = OpenFixture(path);
    const HeaderSettings& s = source->Settings();
    EXPECT_EQ(s.fProduct, "@(#) QORA DATA FILE test fixture");
    EXPECT_EQ(s.fLayoutCode, 2);
    EXPECT_EQ(s.fBias, 99.5);
    EXPECT_TRUE(s.fCompressed);
    EXPECT_EQ(source->CaseCount(), 5);
    EXPECT_STREQ(source->GetIdString(), "Survey 2026");
    EXPECT_EQ(source->GetTimeStamp(), 14015783803.0);  // 04 Dec 26 17:16:43
    EXPECT_EQ(source->GetFileName(), path);
    EXPECT_EQ(source->CaseCountRecordPosition(), 0);  // no such record

    b.header().caseCount = -1;
    b.header().date = " 4 Dec 26";  // unreadable: the stamp stays as made
    source = OpenFixture(b.WriteTemp());
    EXPECT_EQ(source->CaseCount(), -1);
    EXPECT_NE(source->GetTimeStamp(), 14015783803.0);
}

// Codes as the reader sees them: 2, 0 and 256 read from a file written the
// other way round, 1 and 255 from one in the reader's order.
TEST(Reader, LayoutCodesOutsideOneTo255MeanTheOtherOrder) {
    for (int32_t written : {2, 0, 0x00010000}) {
        SysFileBuilder b(Endian::Swapped);
        b.header().layoutCode = written;
        b.header().caseCount = 5;
        auto source = OpenFixture(b.WriteTemp());
        EXPECT_TRUE(source->IsSwapped()) << written;
        EXPECT_EQ(source->Settings().fLayoutCode, written);
        EXPECT_EQ(source->CaseCount(), 5) << written;
    }
    for (int32_t written : {1, 255}) {
        SysFileBuilder b(Endian::Native);
        b.header().layoutCode = written;
        EXPECT_FALSE(OpenFixture(b.WriteTemp())->IsSwapped()) << written;
    }
}

// One record listing variables of both kinds and several widths: each
// variable gets labels of its own kind and width, found by their own values.
TEST_P(Reader, ValueLabelsServeOnlyVariablesOfTheirKindAndWidth) {
    SysFileBuilder b(GetParam());
    const int s20 = b.String("S20", 20).Slot();
    const int n = b.Numeric("N").Slot();
    const int s3 = b.String("S3", 3).Slot();
    const int t20 = b.String("T20", 20).Slot();
    const int s255 = b.String("S255", 255).Slot();
    b.ValueLabels({{"ABCDEFGH", "long"}, {"AB", "short"}}, {s20, n, s3, t20, s255});
    auto source = OpenFixture(b.WriteTemp());

    EXPECT_FALSE(source->GetVariable(1).GetValueLabels().IsValid());
    const QORA_VLMap wide = source->GetVariable(0).GetValueLabels();
    EXPECT_TRUE(wide.SameObject(source->GetVariable(3).GetValueLabels()));
    const QORA_VLMap narrow = source->GetVariable(2).GetValueLabels();
    const QORA_VLMap widest = source->GetVariable(4).GetValueLabels();
    ASSERT_EQ(wide.KeyType(), 20);
    ASSERT_EQ(narrow.KeyType(), 3);
    ASSERT_EQ(widest.KeyType(), 255);
    // Widths that cut the values alike hold one copy of the labels.
    EXPECT_EQ(&wide.Impl()->Pairs(), &widest.Impl()->Pairs());
    for (QORA_VLMap map : {wide, narrow, widest}) {
        std::string text, label;
        int count = 0;
        for (map.Reset(); map.NextText(text, label); ++count) {
            ASSERT_EQ(int(text.size()), map.KeyType());
            ASSERT_NE(map.Lookup(text.data(), int(text.size())), nullptr) << text;
            EXPECT_EQ(*map.Lookup(text.data(), int(text.size())), label);
        }
        EXPECT_EQ(count, 2);
    }
}

// A string has no range of missing values: a file that codes one keeps the
// values as discrete ones.
TEST_P(Reader, StringMissingRangesBecomeDiscreteValues) {
    SysFileBuilder b(GetParam());
    b.String("S", 8).MissingRaw(-3, {"lo", "hi", "x"});
    b.String("T", 8).MissingRaw(-2, {"a", "b"});
    auto source = OpenFixture(b.WriteTemp());
    char values[3][8];
    EXPECT_EQ(source->GetVariable(0).GetMissingValues(values[0], values[1], values[2]), 3);
    EXPECT_EQ(std::string(values[0], 24), "lo      hi      x       ");
    EXPECT_EQ(source->GetVariable(1).GetMissingCode(), 2);
}

// The creation stamp counts seconds from the Gregorian start; a field that
// does not parse is refused whole.
TEST(Reader, CreationStampOfTheHeaderFields) {
    const std::tuple<const char*, const char*, double> rows[] = {
        {"04 Dec 26", "17:16:43", 14015783803.0},
        {"04 DEC 69", "17:16:43", 15372782203.0},  // 00-69: 2000s
        {"04 dec 70", "17:16:43", 12248558203.0},  // 70-99: 1900s
        {"29 Feb 00", "00:00:00", 13171161600.0},
        {" 4 Dec 26", "17:16:43", -1.0},  // a blank is no digit
        {"04 Xyz 26", "17:16:43", -1.0},
        {"00 Dec 26", "17:16:43", -1.0},
        {"32 Dec 26", "17:16:43", -1.0},
        {"04 Dec 26", "24:00:00", -1.0},
        {"04 Dec 26", "23:60:00", -1.0},
        {"04 Dec 26", "23:59:60", -1.0},
        {"\0\0\0\0\0\0\0\0\0", "\0\0\0\0\0\0\0\0", -1.0},
    };
    for (const auto& [date, time, stamp] : rows) {
        double parsed = -1.0;
        EXPECT_EQ(ParseCreationStamp(date, time, &parsed) ? parsed : -1.0, stamp) << date;
    }
}

TEST_P(Reader, WeightNamesTheFirstUnitOfAVariableOrNothing) {
    SysFileBuilder b(GetParam());
    b.String("S", 20);
    const Var& w = b.Numeric("W");
    b.Weight(w);
    EXPECT_EQ(OpenFixture(b.WriteTemp())->GetCaseWeight(), 1);
    for (int32_t index : {2, 0, -5, 5, 99}) {  // continuation, none, out of range
        b.header().weightIndex = index;
        EXPECT_EQ(OpenFixture(b.WriteTemp())->GetCaseWeight(), -1) << index;
    }
}

TEST_P(Reader, DocumentsAndUnknownExtensionsAreStoredWhole) {
    SysFileBuilder b(GetParam());
    b.Numeric("X");
    b.Documents({"First line", "Second"});
    b.Extension(12, 4, {1, 2, 3, 4, 5, 6, 7, 8});
    b.Extension(99, 1, {'z'});
    b.Extension(150, 2, {'a', 'b'});
    auto source = OpenFixture(b.WriteTemp());

    ASSERT_TRUE(source->HasExtension(0));
    const std::string& docs = source->GetExtension(0).Impl()->Content();
    EXPECT_EQ(docs,
              (std::string("First line") + std::string(70, ' ') + "Second" + std::string(74, ' ')));
    const QORA_ExtensionImpl* twelve = source->GetExtension(12).Impl();
    EXPECT_EQ(twelve->ElementSize(), 4);
    EXPECT_EQ(twelve->Content(), std::string("\1\2\3\4\5\6\7\10", 8));
    EXPECT_TRUE(source->HasExtension(150));

    // Seen records are noted only for subtypes below a hundred.
    for (int32_t type : {-1, 0, 12, 13, 99, 150})
        EXPECT_EQ(source->HasExtensionRecord(type), type == 0 || type == 12 || type == 99) << type;
    int major = 0, minor = 0, revision = 0;
    EXPECT_FALSE(source->GetReleaseInfo(&major, &minor, &revision));
}

TEST_P(Reader, CaseCountRecordPositionIsWhereItsDataStart) {
    SysFileBuilder b(GetParam());
    b.Numeric("X");
    b.IntegerInfo();
    b.CaseCount64(7);
    const Bytes bytes = b.Build();
    auto source = OpenFixture(b.WriteTemp());
    const int64_t at = source->CaseCountRecordPosition();
    // The record's data: the byte-order marker 1 and the count 7, 8 bytes each.
    ASSERT_GT(at, 16);
    ASSERT_LE(size_t(at) + 16, bytes.size());
    Bytes expected = b.Int64(1);
    const Bytes count = b.Int64(7);
    expected.insert(expected.end(), count.begin(), count.end());
    EXPECT_EQ(Bytes(bytes.begin() + at, bytes.begin() + at + 16), expected);
    int major = 0, minor = 0, revision = 0;
    EXPECT_TRUE(source->GetReleaseInfo(&major, &minor, &revision));
}

TEST_P(Reader, SwapMaskFollowsTheDictionaryNotTheHeader) {
    for (int32_t caseSize : {1, 5, 100, -1}) {
        SysFileBuilder b(GetParam());
        b.Numeric("A");
        b.String("S", 20);
        b.Numeric("B");
        b.header().caseSize = caseSize;
        auto source = OpenFixture(b.WriteTemp());
        EXPECT_EQ(source->Settings().fCaseSize, 5);
        if (Swapped())
            EXPECT_EQ(source->Settings().fSwapMask, (std::vector<uint8_t>{1, 0, 0, 0, 1}));
        else
            EXPECT_TRUE(source->Settings().fSwapMask.empty());
    }
}

TEST_P(Reader, ContinuationRecordsAreNotCounted) {
    SysFileBuilder b(GetParam());
    b.String("S", 20).Continuations(5);  // two would be right
    b.String("T", 9).Continuations(0);
    b.Numeric("N");
    auto source = OpenFixture(b.WriteTemp());
    ASSERT_EQ(source->ColumnCount(), 3);
    EXPECT_EQ(source->ValueCount(), 3 + 2 + 1);
}

TEST_P(Reader, RepeatedAndInvalidNamesAreRenamed) {
    SysFileBuilder b(GetParam());
    b.Numeric("AGE");
    b.Numeric("AGE");
    b.Numeric("V1");
    b.Numeric("#X");
    b.Numeric("Age");  // only case differs: no lookup could tell it from AGE
    b.Numeric("A-B");
    b.Numeric("\xC3\xA9T\xC3\xA9");
    auto source = OpenFixture(b.WriteTemp());
    std::vector<std::string> names;
    for (int i = 0; i < source->ColumnCount(); ++i)
        names.push_back(source->GetVariable(i).GetName());
    ASSERT_EQ(names.size(), 7u);
    names.pop_back();  // the multibyte name is not checked here
    EXPECT_EQ(names, (std::vector<std::string>{"age", "v2", "v1", "v3", "v4", "v5"}));  // V1 taken
}

TEST_P(Reader, SetsLoseMembersTheFileDoesNotHave) {
    SysFileBuilder b(GetParam());
    b.Numeric("A");
    b.Numeric("B");
    b.MultipleResponseSets({SysFileBuilder::CategorySetLine("$ab", "Set", {"a", "GONE", "B"}),
                            SysFileBuilder::CategorySetLine("$none", "X", {"GONE"})});
    b.VariableSets({SysFileBuilder::VariableSetLine("Group", {"A", "B"})});
    auto source = OpenFixture(b.WriteTemp());

    const QORA_VariableSetList mr = LoadVariableSets(*source, QORA_SetFamily::kMultipleResponse);
    ASSERT_EQ(mr.size(), 1u);
    EXPECT_EQ(mr[0].GetName(), "$ab");
    EXPECT_EQ(mr[0].GetLabel(), "Set");
    EXPECT_EQ(mr[0].GetVariables(), (std::vector<std::string>{"a", "B"}));
    const QORA_VariableSetList groups = LoadVariableSets(*source, QORA_SetFamily::kVariableSets);
    ASSERT_EQ(groups.size(), 1u);
    EXPECT_EQ(groups[0].GetVariables(), (std::vector<std::string>{"A", "B"}));
}
