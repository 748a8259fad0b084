#include "variable.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <string>

#include "specialvalues.h"

namespace {

double FromBits(uint64_t bits) {
    double x;
    std::memcpy(&x, &bits, sizeof x);
    return x;
}

TEST(VariableTest, DefaultsFollowTheType) {
    QORA_Variable num(0);
    EXPECT_EQ(num.GetType(), 0);
    EXPECT_EQ(num.GetPrintFormatWord(), 0x00050802u);
    EXPECT_EQ(num.GetWriteFormatWord(), 0x00050802u);
    EXPECT_EQ(num.GetColumnWidth(), 8);
    EXPECT_EQ(num.GetMeasureLevel(), 0);
    EXPECT_EQ(num.GetAlignment(), 1);
    EXPECT_EQ(num.GetMissingCode(), 0);
    EXPECT_EQ(num.GetLabel(), nullptr);
    EXPECT_FALSE(num.GetValueLabels().IsValid());
    EXPECT_EQ(num.GetAttributes().Size(), 0);
    EXPECT_TRUE(num.GetName().empty());

    QORA_Variable wide(200);
    EXPECT_EQ(wide.GetColumnWidth(), 50);
    EXPECT_EQ(wide.GetPrintFormat(), (QORA_Format{1, 200, 0}));
    EXPECT_EQ(wide.GetMeasureLevel(), 1);
    EXPECT_EQ(wide.GetAlignment(), 0);
    EXPECT_EQ(wide.ValueUnits(), 25);
    EXPECT_EQ(QORA_Variable(50).GetColumnWidth(), 50);
    EXPECT_EQ(QORA_Variable(51).GetColumnWidth(), 50);
    EXPECT_EQ(QORA_Variable(7).GetColumnWidth(), 7);
}

TEST(VariableTest, TypeOutsideTheRangeIsRefused) {
    EXPECT_THROW(QORA_Variable(-1), ErrorText);
    EXPECT_THROW(QORA_Variable(32768), ErrorText);
    EXPECT_FALSE(QORA_Variable::IsValidType(32768));
    EXPECT_TRUE(QORA_Variable::IsValidType(32767));
    QORA_Variable v(3);
    EXPECT_THROW(v.SetType(32768), ErrorText);
    EXPECT_THROW(QORA_Variable().GetType(), ErrorText);
}

TEST(VariableTest, IdentitiesAreNewPerVariableAndKeptByCopies) {
    QORA_Variable a(0), b(0);
    EXPECT_EQ(a.GetID() % 16, 0);
    EXPECT_EQ(b.GetID() - a.GetID(), 16);
    QORA_Variable c = a;
    c.SetName("other");
    EXPECT_EQ(c.GetID(), a.GetID());
    c.SetType(30);
    EXPECT_EQ(c.GetID(), a.GetID());
}

TEST(VariableTest, NameDropsTrailingBlanksAndKeysUpperCase) {
    QORA_Variable v(0);
    v.SetName("age   ");
    EXPECT_EQ(v.GetName(), "age");
    EXPECT_EQ(v.GetKey(), "AGE");
    v.SetName("  x y  ", 6);
    EXPECT_EQ(v.GetName(), "  x y");
}

TEST(VariableTest, RetypingKeepsHexFormatsWhileTheyFit) {
    QORA_Variable v(10);
    v.SetPrintFormat({2, 20, 0});
    v.SetType(100);
    EXPECT_EQ(v.GetPrintFormat(), (QORA_Format{2, 200, 0}));
    EXPECT_EQ(v.GetWriteFormat(), (QORA_Format{1, 100, 0}));
    v.SetType(127);
    EXPECT_EQ(v.GetPrintFormat(), (QORA_Format{1, 127, 0}));

    QORA_Variable n(0);
    n.SetPrintFormat({5, 12, 2});
    const double one = 1;
    n.SetMissingNumbers(&one, nullptr, nullptr);
    n.SetColumnWidth(17);
    n.SetType(4);
    EXPECT_EQ(n.GetPrintFormat(), (QORA_Format{1, 4, 0}));
    EXPECT_EQ(n.GetWriteFormat(), (QORA_Format{1, 4, 0}));
    EXPECT_EQ(n.GetColumnWidth(), 17);
    EXPECT_EQ(n.GetMissingCode(), 1);
    n.SetType(0);
    EXPECT_EQ(n.GetPrintFormat(), (QORA_Format{5, 8, 2}));
}

TEST(VariableTest, FormatWordsKeepWideStringWidths) {
    EXPECT_EQ(PackFormat({1, 300, 0}), 0x00012C01u);
    EXPECT_EQ(UnpackFormat(0x00012C01u), (QORA_Format{1, 300, 0}));
    EXPECT_EQ(PackFormat({5, 8, 2}), 0x00050802u);
    QORA_Variable v(300);
    v.SetWriteFormat({1, 300, 0});
    EXPECT_EQ(v.GetWriteFormat(), (QORA_Format{1, 300, 0}));
    EXPECT_EQ(UnpackFormat(PackFormat({1, 32767, 0})), (QORA_Format{1, 32767, 0}));
    // Other formats carry only the width's low byte back from the word.
    EXPECT_EQ(PackFormat({5, 300, 2}), 0x01052C02u);
    EXPECT_EQ(UnpackFormat(0x01052C02u), (QORA_Format{5, 44, 2}));
}

TEST(VariableTest, LevelsAndAlignmentKeepTheLowTwoBits) {
    QORA_Variable v(0);
    v.SetMeasureLevel(7);
    v.SetAlignment(6);
    EXPECT_EQ(v.GetMeasureLevel(), 3);
    EXPECT_EQ(v.GetAlignment(), 2);
}

TEST(VariableTest, LabelsAbsentEmptyAndCopied) {
    QORA_Variable v(0);
    v.SetLabel("");
    ASSERT_NE(v.GetLabel(), nullptr);
    EXPECT_STREQ(v.GetLabel(), "");
    v.SetLabel("Income of household", 6);
    EXPECT_STREQ(v.GetLabel(), "Income");
    v.SetLabel(nullptr);
    EXPECT_EQ(v.GetLabel(), nullptr);
}

TEST(VariableTest, ChangingOneHandleLeavesTheOtherAlone) {
    QORA_Variable a(8);
    a.SetLabel("old");
    QORA_Variable b = a;
    EXPECT_EQ(a.GetLabel(), b.GetLabel());  // one shared object
    b.SetLabel("new");
    EXPECT_STREQ(a.GetLabel(), "old");
    EXPECT_STREQ(b.GetLabel(), "new");
    EXPECT_NE(a.GetLabel(), b.GetLabel());
    EXPECT_EQ(a.GetID(), b.GetID());
    b.SetType(20);
    EXPECT_EQ(a.GetType(), 8);
}

TEST(VariableTest, RangeAndDiscreteNumericMissingValues) {
    QORA_Variable v(0);
    const double low = 1, high = 5, nine = 9;
    v.SetMissingRange(&low, &high, &nine);
    EXPECT_EQ(v.GetMissingCode(), -3);
    for (double x : {1.0, 3.0, 5.0, 9.0}) EXPECT_TRUE(v.IsMissing(&x)) << x;
    for (double x : {0.999, 6.0, 8.0}) EXPECT_FALSE(v.IsMissing(&x)) << x;
    const double nan = std::numeric_limits<double>::quiet_NaN();
    EXPECT_FALSE(v.IsMissing(&nan));
    const double sysmis = SysmisValue();
    EXPECT_TRUE(v.IsMissing(&sysmis));

    v.SetMissingRange(nullptr, &high, nullptr);
    EXPECT_EQ(v.GetMissingCode(), -2);
    const double veryLow = -1e300;
    EXPECT_TRUE(v.IsMissing(&veryLow));
    v.SetMissingRange(&high, nullptr, nullptr);
    const double veryHigh = std::numeric_limits<double>::max();
    EXPECT_TRUE(v.IsMissing(&veryHigh));
    double slots[3];
    EXPECT_EQ(v.GetMissingValues(&slots[0], &slots[1], nullptr), -2);
    EXPECT_EQ(slots[1], FromBits(0x7FEFFFFFFFFFFFFFull));
}

TEST(VariableTest, DiscreteNumericMissingValuesCompareBitForBit) {
    QORA_Variable v(0);
    const double zero = 0.0, two = 2.0;
    v.SetMissingNumbers(&zero, &two, nullptr);
    EXPECT_EQ(v.GetMissingCode(), 2);
    const double negZero = -0.0, plusZero = 0.0, three = 3.0;
    EXPECT_TRUE(v.IsMissing(&plusZero));
    EXPECT_FALSE(v.IsMissing(&negZero));
    EXPECT_TRUE(v.IsMissing(&two));
    EXPECT_FALSE(v.IsMissing(&three));
    // Only the system-missing bits count as system-missing, not its neighbours.
    const double lowest = FromBits(0xFFEFFFFFFFFFFFFEull);
    EXPECT_FALSE(v.IsMissing(&lowest));
    v.SetMissingNumbers(nullptr, nullptr, nullptr);
    EXPECT_FALSE(v.IsMissing(&plusZero));
    const double sysmis = SysmisValue();
    EXPECT_TRUE(v.IsMissing(&sysmis));
}

TEST(VariableTest, MissingValuePreconditions) {
    QORA_Variable num(0), str(4);
    const double one = 1;
    EXPECT_THROW(num.SetMissingNumbers(nullptr, &one, nullptr), ErrorText);
    EXPECT_THROW(str.SetMissingNumbers(&one, nullptr, nullptr), ErrorText);
    EXPECT_THROW(num.SetMissingStrings("a", nullptr, nullptr), ErrorText);
    EXPECT_THROW(str.SetMissingStrings("a", nullptr, "c"), ErrorText);
    EXPECT_THROW(str.SetMissingRange(&one, &one, nullptr), ErrorText);
    EXPECT_THROW(num.SetMissingValues(3, &one, &one, nullptr), ErrorText);
    for (int code : {-4, -1, 4, 100}) {
        EXPECT_FALSE(QORA_Variable::IsValidMissingCode(code));
        EXPECT_THROW(num.SetMissingValues(code, &one, &one, &one), ErrorText);
    }
    EXPECT_EQ(num.GetMissingCode(), 0);
}

TEST(VariableTest, StringMissingValuesOnWideStrings) {
    QORA_Variable v(12);
    v.SetMissingStrings("AB", nullptr, nullptr);
    char slot[8];
    EXPECT_EQ(v.GetMissingValues(slot, nullptr, nullptr), 1);
    EXPECT_EQ(std::string(slot, 8), "AB      ");
    std::string value = "AB" + std::string(14, ' ');  // two units
    EXPECT_TRUE(v.IsMissing(value.data()));
    value[9] = 'X';
    EXPECT_FALSE(v.IsMissing(value.data()));
    value = "AC" + std::string(14, ' ');
    EXPECT_FALSE(v.IsMissing(value.data()));

    v.SetMissingStrings("ABCDEFGHIJ", "x", nullptr);
    EXPECT_EQ(v.GetMissingValues(slot, nullptr, nullptr), 2);
    EXPECT_EQ(std::string(slot, 8), "ABCDEFGH");
    value = "ABCDEFGH" + std::string(8, ' ');
    EXPECT_TRUE(v.IsMissing(value.data()));
}

TEST(VariableTest, StringMissingValuesByCodeFromRawSlots) {
    QORA_Variable v(8);
    const char a[9] = "one     ", b[9] = "two     ", c[9] = "three   ";
    v.SetMissingValues(3, a, b, c);
    EXPECT_TRUE(v.IsMissing(c));
    EXPECT_FALSE(v.IsMissing("four    "));
    // A range code on a string variable never makes a value missing.
    v.SetMissingValues(-2, a, b, nullptr);
    EXPECT_FALSE(v.IsMissing(a));
}

TEST(VariableTest, EqualityIgnoresIdentityAndUnusedSlots) {
    QORA_Variable a(0), b(0);
    a.SetName("x");
    b.SetName("x");
    EXPECT_TRUE(a == b);
    const double one = 1, two = 2;
    a.SetMissingNumbers(&one, &two, nullptr);
    b.SetMissingNumbers(&one, nullptr, nullptr);
    EXPECT_FALSE(a == b);
    a.SetMissingNumbers(&one, nullptr, nullptr);
    EXPECT_TRUE(a == b);  // slot 2 still differs but is not in use

    b.SetLabel("L");
    EXPECT_FALSE(a == b);
    a.SetLabel("L");
    EXPECT_TRUE(a == b);
    b.SetName("X");
    EXPECT_FALSE(a == b);
    b.SetName("x");
    b.SetPrintFormat({5, 9, 2});
    EXPECT_FALSE(a == b);
    b.SetPrintFormat(a.GetPrintFormat());
    b.SetColumnWidth(3);
    EXPECT_FALSE(a == b);
    b.SetColumnWidth(a.GetColumnWidth());

    QORA_VLMap labels(0);
    labels.Insert(1.0, "Yes");
    a.SetValueLabels(labels);
    EXPECT_FALSE(a == b);
    QORA_VLMap same(0);
    same.Insert(1.0, "Yes");
    b.SetValueLabels(same);
    EXPECT_TRUE(a == b);

    Attributes roles;
    roles.Set("role", {"input"});
    b.SetAttributes(roles);
    EXPECT_FALSE(a == b);
    a.SetAttributes(b.GetAttributes());
    EXPECT_TRUE(a == b);
    EXPECT_THROW((void)(a == QORA_Variable()), ErrorText);
}

TEST(VariableTest, ValueLabelsOfCopiesAreSeparate) {
    QORA_Variable a(0);
    QORA_VLMap labels(0);
    labels.Insert(1.0, "Yes");
    a.SetValueLabels(labels);
    QORA_Variable b = a;
    QORA_VLMap bLabels = b.GetValueLabels();
    bLabels.Insert(2.0, "No");
    b.SetValueLabels(bLabels);
    EXPECT_EQ(a.GetValueLabels().Count(), 1);
    EXPECT_EQ(b.GetValueLabels().Count(), 2);
}

struct FormatCase {
    int type, code, width, decimals;
    int result;
    QORA_Format fixed;
};

TEST(VariableTest, ValidateFormat) {
    const FormatCase cases[] = {
        {0, 5, 8, 2, 0, {5, 8, 2}},
        {0, 5, 50, 20, 2, {5, 40, 16}},
        {0, 5, 0, 0, 2, {5, 1, 0}},
        {0, 1, 8, 0, 1, {5, 8, 2}},
        {0, 2, 8, 0, 1, {5, 8, 2}},
        {0, 0, 8, 0, 1, {5, 8, 2}},
        {0, 40, 8, 0, 1, {5, 8, 2}},
        {0, 6, 8, 0, 1, {5, 8, 2}},  // not in the numeric table
        {0, 20, 5, 0, 2, {20, 9, 0}},
        {0, 20, 10, 2, 3, {20, 10, 0}},
        {0, 21, 12, 4, 3, {21, 12, 3}},
        {0, 22, 17, 1, 3, {22, 17, 0}},  // reserve above the width
        {0, 39, 8, 8, 0, {39, 8, 8}},
        {0, 5, 8, -1, 3, {5, 8, 7}},
        {0, 5, 30, 16, 0, {5, 30, 16}},
        {0, 5, 30, 17, 3, {5, 30, 16}},
        {10, 1, 10, 0, 0, {1, 10, 0}},
        {10, 1, 12, 0, 2, {1, 10, 0}},
        {10, 1, 10, 3, 3, {1, 10, 0}},
        {10, 1, 12, 3, 2, {1, 10, 0}},
        {10, 2, 20, 0, 0, {2, 20, 0}},
        {10, 2, 10, 0, 2, {2, 20, 0}},
        {20000, 2, 40000, 0, 1, {1, 20000, 0}},
        {10, 5, 8, 2, 1, {1, 10, 0}},
        {-1, 99, 99, 99, 0, {99, 99, 99}},
    };
    for (const FormatCase& c : cases) {
        int code = c.code, width = c.width, decimals = c.decimals;
        EXPECT_EQ(QORA_Variable::ValidateFormat(c.type, code, width, decimals, false), c.result)
            << c.type << " " << c.code << " " << c.width << " " << c.decimals;
        EXPECT_EQ((QORA_Format{code, width, decimals}), (QORA_Format{c.code, c.width, c.decimals}));
        EXPECT_EQ(QORA_Variable::ValidateFormat(c.type, code, width, decimals, true), c.result);
        EXPECT_EQ((QORA_Format{code, width, decimals}), c.fixed)
            << c.type << " " << c.code << " " << c.width << " " << c.decimals;
    }
}

}  // namespace
