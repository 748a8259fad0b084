// What the reader makes of dictionaries that other writers get wrong, in both
// byte orders: labels, missing values, weights, continuations, names and sets.
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
        // clang-format off
        {"04 Dec 26", "17:16:43", 14015783803.0},
        {"04 DEC 69", "17:16:43", 15372782203.0},  // 00-69: 2000s
        {"04 dec 70", "17:16:43", 12248558203.0},  // 70-99: 1900s
        {"29 Feb 00", "00:00:00", 13171161600.0},
        {" 4 Dec 26", "17:16:43", -1.0},  // a blank is no digit
        {"04 Xyz 26", "17:16:43", -1.0}, {"00 Dec 26", "17:16:43", -1.0},
        {"32 Dec 26", "17:16:43", -1.0}, {"04 Dec 26", "24:00:00", -1.0},
        {"04 Dec 26", "23:60:00", -1.0}, {"04 Dec 26", "23:59:60", -1.0},
        {"\0\0\0\0\0\0\0\0\0", "\0\0\0\0\0\0\0\0", -1.0},
        // clang-format on
    };
    for (const auto& [date, time, stamp] : rows) {
        double parsed = -1.0;
        EXPECT_EQ(ParseCreationStamp(date, time, &parsed) ? parsed : -1.0, stamp) << date;
    }
}

TEST_P(Reader, WeightNamesTheFirstUnitOfAVariableOrNothing) {
    SysFileBuilder b(GetParam());
    b.String("S", 20);
    b.Weight(b.Numeric("W"));
    EXPECT_EQ(OpenFixture(b.WriteTemp())->GetCaseWeight(), 1);
    for (int32_t index : {2, 0, -5, 5, 99}) {  // continuation, none, out of range
        b.header().weightIndex = index;
        EXPECT_EQ(OpenFixture(b.WriteTemp())->GetCaseWeight(), -1) << index;
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
    // Age differs from AGE only in case: no lookup could tell them apart.
    for (const char* name : {"AGE", "AGE", "V1", "#X", "Age", "A-B", "\xC3\xA9T\xC3\xA9"})
        b.Numeric(name);
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
