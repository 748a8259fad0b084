#include "variable.h"

#include <gtest/gtest.h>

#include <cstring>
#include <functional>
#include <iterator>
#include <limits>
#include <string>

#include "specialvalues.h"

namespace {

double FromBits(uint64_t bits) {
    double x;
    std::memcpy(&x, &bits, sizeof x);
    return x;
}

bool Missing(const QORA_Variable& v, double x) { return v.IsMissing(&x); }

TEST(VariableTest, DefaultsFollowTheType) {
    struct Row {
        int type, columnWidth, measure, alignment;
        QORA_Format print;
    };
    const Row rows[] = {{0, 8, 0, 1, {5, 8, 2}},
                        {7, 7, 1, 0, {1, 7, 0}},
                        {51, 50, 1, 0, {1, 51, 0}},
                        {200, 50, 1, 0, {1, 200, 0}}};
    for (const Row& r : rows) {
        SCOPED_TRACE(r.type);
        QORA_Variable v(r.type);
        EXPECT_EQ(v.GetColumnWidth(), r.columnWidth);
        EXPECT_EQ(v.GetMeasureLevel(), r.measure);
        EXPECT_EQ(v.GetAlignment(), r.alignment);
        EXPECT_EQ(v.GetPrintFormat(), r.print);
        EXPECT_EQ(v.GetWriteFormat(), r.print);
    }
    EXPECT_EQ(QORA_Variable(200).ValueUnits(), 25);
    EXPECT_THROW(QORA_Variable(-1), ErrorText);
    EXPECT_THROW(QORA_Variable(32768), ErrorText);
    EXPECT_THROW(QORA_Variable(3).SetType(32768), ErrorText);
    EXPECT_THROW(QORA_Variable().GetType(), ErrorText);
}

TEST(VariableTest, IdentitiesAreNewPerVariableAndKeptByCopies) {
    QORA_Variable a(8), b(0);
    EXPECT_EQ(a.GetID() % 16, 0);
    EXPECT_EQ(b.GetID() - a.GetID(), 16);
    a.SetLabel("old");
    QORA_Variable c = a;
    EXPECT_EQ(a.GetLabel(), c.GetLabel());  // one shared object
    c.SetLabel("new");
    c.SetType(30);
    EXPECT_EQ(c.GetID(), a.GetID());
    EXPECT_STREQ(a.GetLabel(), "old");
    EXPECT_EQ(a.GetType(), 8);
}

TEST(VariableTest, NamesLabelsLevels) {
    QORA_Variable v(0);
    v.SetName("age   ");
    EXPECT_EQ(v.GetName(), "age");
    EXPECT_EQ(v.GetKey(), "AGE");
    v.SetName("  x y  ", 6);
    EXPECT_EQ(v.GetName(), "  x y");
    v.SetLabel("");
    ASSERT_NE(v.GetLabel(), nullptr);  // empty, not absent
    EXPECT_STREQ(v.GetLabel(), "");
    v.SetLabel("Income of household", 6);
    EXPECT_STREQ(v.GetLabel(), "Income");
    v.SetLabel(nullptr);
    EXPECT_EQ(v.GetLabel(), nullptr);
    v.SetMeasureLevel(7);
    v.SetAlignment(6);
    EXPECT_EQ(v.GetMeasureLevel(), 3);
    EXPECT_EQ(v.GetAlignment(), 2);
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
    EXPECT_EQ(n.GetColumnWidth(), 17);
    EXPECT_EQ(n.GetMissingCode(), 1);
    n.SetType(0);
    EXPECT_EQ(n.GetPrintFormat(), (QORA_Format{5, 8, 2}));
}

TEST(VariableTest, FormatWordsKeepWideStringWidths) {
    EXPECT_EQ(PackFormat({1, 300, 0}), 0x00012C01u);
    EXPECT_EQ(UnpackFormat(0x00012C01u), (QORA_Format{1, 300, 0}));
    EXPECT_EQ(PackFormat({5, 8, 2}), 0x00050802u);
    EXPECT_EQ(UnpackFormat(PackFormat({1, 32767, 0})), (QORA_Format{1, 32767, 0}));
    // Other formats carry only the width's low byte back from the word.
    EXPECT_EQ(PackFormat({5, 300, 2}), 0x01052C02u);
    EXPECT_EQ(UnpackFormat(0x01052C02u), (QORA_Format{5, 44, 2}));
}

TEST(VariableTest, RangeAndDiscreteNumericMissingValues) {
    QORA_Variable v(0);
    const double low = 1, high = 5, nine = 9;
    v.SetMissingRange(&low, &high, &nine);
    EXPECT_EQ(v.GetMissingCode(), -3);
    for (double x : {1.0, 3.0, 5.0, 9.0, SysmisValue()}) EXPECT_TRUE(Missing(v, x)) << x;
    for (double x : {0.999, 6.0, 8.0, std::numeric_limits<double>::quiet_NaN()})
        EXPECT_FALSE(Missing(v, x)) << x;
    v.SetMissingRange(nullptr, &high, nullptr);
    EXPECT_EQ(v.GetMissingCode(), -2);
    EXPECT_TRUE(Missing(v, -1e300));
    v.SetMissingRange(&high, nullptr, nullptr);
    EXPECT_TRUE(Missing(v, std::numeric_limits<double>::max()));
    double slots[3];
    EXPECT_EQ(v.GetMissingValues(&slots[0], &slots[1], nullptr), -2);
    EXPECT_EQ(slots[1], FromBits(0x7FEFFFFFFFFFFFFFull));
}

TEST(VariableTest, DiscreteNumericMissingValuesCompareBitForBit) {
    QORA_Variable v(0);
    const double zero = 0.0, two = 2.0;
    v.SetMissingNumbers(&zero, &two, nullptr);
    EXPECT_EQ(v.GetMissingCode(), 2);
    EXPECT_TRUE(Missing(v, 0.0));
    EXPECT_FALSE(Missing(v, -0.0));
    EXPECT_TRUE(Missing(v, 2.0));
    EXPECT_FALSE(Missing(v, 3.0));
    // Only the system-missing bits count as system-missing, not its neighbours.
    EXPECT_FALSE(Missing(v, FromBits(0xFFEFFFFFFFFFFFFEull)));
    v.SetMissingNumbers(nullptr, nullptr, nullptr);
    EXPECT_FALSE(Missing(v, 0.0));
    EXPECT_TRUE(Missing(v, FromBits(0xFFEFFFFFFFFFFFFFull)));
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
    v.SetMissingStrings("ABCDEFGHIJ", "x", nullptr);
    EXPECT_EQ(v.GetMissingValues(slot, nullptr, nullptr), 2);
    EXPECT_EQ(std::string(slot, 8), "ABCDEFGH");
    value = "ABCDEFGH" + std::string(8, ' ');
    EXPECT_TRUE(v.IsMissing(value.data()));

    QORA_Variable s(8);
    const char a[9] = "one     ", b[9] = "two     ", c[9] = "three   ";
    s.SetMissingValues(3, a, b, c);
    EXPECT_TRUE(s.IsMissing(c));
    EXPECT_FALSE(s.IsMissing("four    "));
    s.SetMissingValues(-2, a, b, nullptr);  // a range never applies to strings
    EXPECT_FALSE(s.IsMissing(a));
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

    QORA_VLMap labels(0);
    labels.Insert(1.0, "Yes");
    Attributes roles;
    roles.Set("role", {"input"});
    // Each change makes b differ; the same change on a makes them equal again.
    const std::function<void(QORA_Variable&)> changes[] = {
        [](QORA_Variable& v) { v.SetLabel("L"); },
        [](QORA_Variable& v) { v.SetName("X"); },
        [](QORA_Variable& v) {
            v.SetPrintFormat({5, 9, 2});
        },
        [](QORA_Variable& v) { v.SetColumnWidth(3); },
        [&](QORA_Variable& v) { v.SetValueLabels(QORA_VLMap(labels)); },
        [&](QORA_Variable& v) { v.SetAttributes(roles); },
    };
    for (size_t i = 0; i < std::size(changes); ++i) {
        SCOPED_TRACE(i);
        changes[i](b);
        EXPECT_FALSE(a == b);
        changes[i](a);
        EXPECT_TRUE(a == b);
    }
    QORA_VLMap same(0);  // another map with equal pairs
    same.Insert(1.0, "Yes");
    b.SetValueLabels(same);
    EXPECT_TRUE(a == b);
    EXPECT_THROW((void)(a == QORA_Variable()), ErrorText);
}

TEST(VariableTest, ValidateFormat) {
    struct Row {
        int type, code, width, decimals, result;
        QORA_Format fixed;
    };
    const Row rows[] = {
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
    for (const Row& r : rows) {
        SCOPED_TRACE(::testing::Message()
                     << r.type << " " << r.code << " " << r.width << " " << r.decimals);
        int code = r.code, width = r.width, decimals = r.decimals;
        EXPECT_EQ(QORA_Variable::ValidateFormat(r.type, code, width, decimals, false), r.result);
        EXPECT_EQ((QORA_Format{code, width, decimals}), (QORA_Format{r.code, r.width, r.decimals}));
        EXPECT_EQ(QORA_Variable::ValidateFormat(r.type, code, width, decimals, true), r.result);
        EXPECT_EQ((QORA_Format{code, width, decimals}), r.fixed);
    }
}

}  // namespace
