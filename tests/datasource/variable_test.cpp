// Formats as a file or a caller gives them, judged against the variable's
// type and repaired only when asked; numeric missing values bit for bit; value
// labels whose string keys read as NaN.
#include "variable.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <tuple>

#include "specialvalues.h"
#include "sysfile_builder.h"
#include "valuelabelmap.h"

using fixture::FromBits;

TEST(VariableTest, ValidateFormat) {
    struct Row {
        int type, code, width, decimals, result;
        QORA_Format fixed;
    };
    const Row rows[] = {
        // clang-format off
        {0, 5, 8, 2, 0, {5, 8, 2}}, {0, 5, 50, 20, 2, {5, 40, 16}}, {0, 5, 0, 0, 2, {5, 1, 0}},
        {0, 1, 8, 0, 1, {5, 8, 2}}, {0, 2, 8, 0, 1, {5, 8, 2}}, {0, 0, 8, 0, 1, {5, 8, 2}},
        {0, 40, 8, 0, 1, {5, 8, 2}},
        {0, 6, 8, 0, 1, {5, 8, 2}},  // not in the numeric table
        {0, 20, 5, 0, 2, {20, 9, 0}}, {0, 20, 10, 2, 3, {20, 10, 0}},
        {0, 21, 12, 4, 3, {21, 12, 3}},
        {0, 22, 17, 1, 3, {22, 17, 0}},  // reserve above the width
        {0, 39, 8, 8, 0, {39, 8, 8}}, {0, 5, 8, -1, 3, {5, 8, 7}}, {0, 5, 30, 16, 0, {5, 30, 16}},
        {0, 5, 30, 17, 3, {5, 30, 16}}, {10, 1, 10, 0, 0, {1, 10, 0}},
        {10, 1, 12, 0, 2, {1, 10, 0}}, {10, 1, 10, 3, 3, {1, 10, 0}}, {10, 1, 12, 3, 2, {1, 10, 0}},
        {10, 2, 20, 0, 0, {2, 20, 0}}, {10, 2, 10, 0, 2, {2, 20, 0}},
        {20000, 2, 40000, 0, 1, {1, 20000, 0}}, {10, 5, 8, 2, 1, {1, 10, 0}},
        {-1, 99, 99, 99, 0, {99, 99, 99}},
        // clang-format on
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

// Discrete values and system-missing match bit for bit, never a neighbour or
// the other zero; a range takes its ends and its open sides.
TEST(VariableTest, NumericMissingValues) {
    const double low = 1, high = 5, nine = 9, zero = 0, two = 2;
    QORA_Variable range(0), discrete(0), none(0), below(0), above(0);
    range.SetMissingRange(&low, &high, &nine);
    discrete.SetMissingNumbers(&zero, &two, nullptr);
    below.SetMissingRange(nullptr, &high, nullptr);
    above.SetMissingRange(&high, nullptr, nullptr);
    const double nan = std::numeric_limits<double>::quiet_NaN();
    const std::tuple<const QORA_Variable*, double, bool> rows[] = {
        // clang-format off
        {&range, 1.0, true}, {&range, 3.0, true}, {&range, 5.0, true}, {&range, 9.0, true},
        {&range, SysmisValue(), true}, {&range, 0.999, false}, {&range, 6.0, false},
        {&range, 8.0, false}, {&range, nan, false}, {&discrete, 0.0, true},
        {&discrete, -0.0, false}, {&discrete, 2.0, true}, {&discrete, 3.0, false},
        {&discrete, FromBits(0xFFEFFFFFFFFFFFFEull), false}, {&none, 0.0, false},
        {&none, FromBits(0xFFEFFFFFFFFFFFFFull), true}, {&below, -1e300, true},
        {&below, 6.0, false}, {&above, std::numeric_limits<double>::max(), true},
        {&above, 4.0, false},
        // clang-format on
    };
    for (const auto& [var, x, missing] : rows) EXPECT_EQ(var->IsMissing(&x), missing) << x;
}

TEST(VLMapTest, KeysThatReadAsNaNStayFindable) {
    // String chunks whose top bytes are FF read as NaNs; every key must still
    // be found and none stored twice.
    QORA_VLMap map(8);
    const char* texts[] = {"\xff\xff\xff\xff\xff\xff\xff\xff", "a\xff\xff\xff\xff\xff\xff\xff",
                           "abc\0\0\0\0\0", "\x01\x02\x03\x04\x05\x06\xf8\xff", "zzz\0\0\0\0\0"};
    for (int round = 0; round < 2; ++round)
        for (const char* t : texts) map.Insert(std::string(t, 8).data(), t);
    EXPECT_EQ(map.Count(), 5);
    for (const char* t : texts) {
        const std::string* label = map.Lookup(std::string(t, 8).data());
        ASSERT_NE(label, nullptr);
        EXPECT_EQ(*label, t);
    }
    map.Insert(std::nan(""), "nan");
    EXPECT_EQ(*map.Lookup(std::nan("")), "nan");
}
