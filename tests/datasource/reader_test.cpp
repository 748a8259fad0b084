// Reading the header and the dictionary of well-formed files, in both byte
// orders.
#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "reader_support.h"
#include "variableset.h"

using namespace fixture;

namespace {

class Reader : public ByteOrders {};
INSTANTIATE_TEST_SUITE_P(Orders, Reader, ::testing::Values(Endian::Native, Endian::Swapped),
                         EndianName);

std::vector<double> MissingNumbers(const QORA_Variable& var) {
    double v[3] = {};
    const int code = var.GetMissingValues(&v[0], &v[1], &v[2]);
    return std::vector<double>(v, v + std::abs(code));
}

std::string Slot(const QORA_Variable& var, int k) {
    char v[3][8];
    var.GetMissingValues(v[0], v[1], v[2]);
    return std::string(v[k], 8);
}

}  // namespace

TEST_P(Reader, EndRecordAloneGivesAnEmptyDictionary) {
    SysFileBuilder b(GetParam());
    auto source = OpenFixture(b.WriteTemp());
    EXPECT_EQ(source->ColumnCount(), 0);
    EXPECT_EQ(source->Settings().fCaseSize, 0);
    EXPECT_EQ(source->DataStart(), 176 + 8);
    EXPECT_EQ(source->IsSwapped(), Swapped());
    EXPECT_EQ(source->NewIterator(nullptr), nullptr);
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

TEST_P(Reader, VariablesKeepTheirPropertiesAndUnits) {
    SysFileBuilder b(GetParam());
    b.Numeric("AGE").Label("Age").Missing({-1.0, 99.0});
    b.String("NAME", 20).Label("Name in full").MissingStrings({"none", "N/A"});
    b.Numeric("INCOME")
        .MissingRange(1.0, 5.0, 9.0)
        .Formats(FormatWord(5, 12, 3), FormatWord(3, 10, 1));
    b.String("CODE", 8).Label("12345678");
    b.Numeric("SCORE").MissingRange(kSysmis, 10.0);
    auto source = OpenFixture(b.WriteTemp());
    ASSERT_EQ(source->ColumnCount(), 5);
    EXPECT_EQ(source->ValueCount(), 1 + 3 + 1 + 1 + 1);
    EXPECT_EQ(source->ValueOffset(2), 4);

    const QORA_Variable& age = source->GetVariable(0);
    EXPECT_EQ(age.GetName(), "age");
    EXPECT_STREQ(age.GetLabel(), "Age");
    EXPECT_EQ(MissingNumbers(age), (std::vector<double>{-1.0, 99.0}));

    const QORA_Variable& name = source->GetVariable(1);
    EXPECT_EQ(name.GetType(), 20);
    EXPECT_STREQ(name.GetLabel(), "Name in full");
    EXPECT_EQ(name.GetPrintFormat(), (QORA_Format{1, 20, 0}));
    EXPECT_EQ(Slot(name, 0) + Slot(name, 1), "none    N/A     ");

    const QORA_Variable& income = source->GetVariable(2);
    EXPECT_EQ(income.GetMissingCode(), -3);
    EXPECT_EQ(MissingNumbers(income), (std::vector<double>{1.0, 5.0, 9.0}));
    EXPECT_EQ(income.GetPrintFormat(), (QORA_Format{5, 12, 3}));
    EXPECT_EQ(income.GetWriteFormat(), (QORA_Format{3, 10, 1}));
    EXPECT_STREQ(source->GetVariable(3).GetLabel(), "12345678");
    EXPECT_EQ(MissingNumbers(source->GetVariable(4)), (std::vector<double>{kSysmis, 10.0}));
}

TEST_P(Reader, ValueLabelSetsAreSharedAndTyped) {
    SysFileBuilder b(GetParam());
    const int q1 = b.Numeric("Q1").Slot();
    const int s = b.String("S", 12).Slot();
    const int q2 = b.Numeric("Q2").Slot();
    const int e = b.Numeric("E").Slot();
    b.ValueLabels({{1.0, "Yes"}, {2.0, "No-label"}, {-0.5, ""}}, {q1, q2});
    b.ValueLabels({{"AB", "Letters"}}, {s});
    b.ValueLabels({}, {e});
    auto source = OpenFixture(b.WriteTemp());

    const QORA_VLMap numbers = source->GetVariable(0).GetValueLabels();
    ASSERT_EQ(numbers.Count(), 3);
    EXPECT_TRUE(numbers.SameObject(source->GetVariable(2).GetValueLabels()));
    EXPECT_EQ(numbers.KeyType(), 0);
    EXPECT_EQ(*numbers.Lookup(1.0), "Yes");
    EXPECT_EQ(*numbers.Lookup(2.0), "No-label");
    EXPECT_EQ(*numbers.Lookup(-0.5), "");

    const QORA_VLMap text = source->GetVariable(1).GetValueLabels();
    EXPECT_EQ(text.KeyType(), 12);
    EXPECT_EQ(*text.Lookup("AB", 2), "Letters");

    const QORA_VLMap empty = source->GetVariable(3).GetValueLabels();
    EXPECT_TRUE(empty.IsValid());
    EXPECT_EQ(empty.Count(), 0);
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

// A large dictionary of every kind of variable reads back exactly.
TEST_P(Reader, ThousandVariablesReadBackExactly) {
    SysFileBuilder b(GetParam());
    for (int i = 0; i < 1000; ++i) {
        const std::string name = "V" + std::to_string(i);
        const int kind = i % 4;
        if (kind == 0) {
            b.Numeric(name).Label("Number " + std::to_string(i)).Missing({double(i)});
        } else if (kind == 1) {
            b.String(name, 1 + i % 255).Label(std::string(i % 200, 'x'));
        } else if (kind == 2) {
            b.Numeric(name).MissingRange(-double(i), double(i));
        } else {
            b.String(name, 8).MissingStrings({"m" + std::to_string(i % 100)});
        }
    }
    // Value label records follow the variable records.
    for (int i = 0; i < 1000; i += 4)
        b.ValueLabels({{double(i), "L" + std::to_string(i)}}, {b.Slot("V" + std::to_string(i))});
    auto source = OpenFixture(b.WriteTemp());
    ASSERT_EQ(source->ColumnCount(), 1000);
    EXPECT_EQ(source->ValueCount(), b.CaseUnits());
    for (int i = 0; i < 1000; ++i) {
        const QORA_Variable& var = source->GetVariable(i);
        ASSERT_EQ(var.GetName(), "v" + std::to_string(i));
        EXPECT_EQ(source->ValueOffset(i) + 1, b.Slot("V" + std::to_string(i)));
        switch (i % 4) {
            case 0:
                EXPECT_STREQ(var.GetLabel(), ("Number " + std::to_string(i)).c_str());
                EXPECT_EQ(MissingNumbers(var), std::vector<double>{double(i)});
                EXPECT_EQ(*var.GetValueLabels().Lookup(double(i)), "L" + std::to_string(i));
                break;
            case 1:
                EXPECT_EQ(var.GetType(), 1 + i % 255);
                EXPECT_EQ(var.GetLabel(), std::string(i % 200, 'x'));
                break;
            case 2:
                EXPECT_EQ(var.GetMissingCode(), -2);
                EXPECT_EQ(MissingNumbers(var), (std::vector<double>{-double(i), double(i)}));
                break;
            default:
                EXPECT_EQ(Slot(var, 0), ("m" + std::to_string(i % 100) + "      ").substr(0, 8));
        }
    }
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
