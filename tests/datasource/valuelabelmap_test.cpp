#include "valuelabelmap.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>

#include "qoramb.h"

namespace {

std::string Units(double value) {
    std::string bytes(8, '\0');
    uint64_t bits;
    std::memcpy(&bits, &value, 8);
    for (int i = 0; i < 8; ++i) bytes[i] = static_cast<char>(bits >> (8 * i));
    return bytes;
}

std::vector<double> NumericKeys(QORA_VLMap map) {
    std::vector<double> keys;
    double value;
    std::string label;
    map.Reset();
    while (map.NextNumber(value, label)) keys.push_back(value);
    return keys;
}

TEST(VLMapTest, KeyUnitsForEveryWidth) {
    EXPECT_EQ(QORA_VLMapImpl::UnitsFor(0), 1);
    EXPECT_EQ(QORA_VLMapImpl::UnitsFor(1), 1);
    EXPECT_EQ(QORA_VLMapImpl::UnitsFor(8), 1);
    EXPECT_EQ(QORA_VLMapImpl::UnitsFor(9), 2);
    EXPECT_EQ(QORA_VLMapImpl::UnitsFor(16), 2);
    EXPECT_EQ(QORA_VLMapImpl::UnitsFor(17), 3);
    EXPECT_EQ(QORA_VLMapImpl::UnitsFor(32767), 4096);
    EXPECT_FALSE(QORA_VLMapImpl::IsValidKeyType(-1));
    EXPECT_FALSE(QORA_VLMapImpl::IsValidKeyType(32768));
    EXPECT_THROW(QORA_VLMap(-1), ErrorText);
}

TEST(VLMapTest, InsertReplacesLabelOfEqualKeyAndOrdersNumerically) {
    QORA_VLMap map(0);
    map.Insert(1.0, "Yes");
    map.Insert(1.0, "True");
    ASSERT_EQ(map.Count(), 1);
    EXPECT_EQ(*map.Lookup(1.0), "True");
    map.Insert(3.0, "c");
    map.Insert(-2.0, "a");
    map.Insert(2.0, "b");
    EXPECT_EQ(NumericKeys(map), (std::vector<double>{-2.0, 1.0, 2.0, 3.0}));
    EXPECT_EQ(map.Lookup(4.0), nullptr);
    EXPECT_EQ(QORA_VLMap().Lookup(1.0), nullptr);
}

TEST(VLMapTest, SignedZerosAreTwoKeysAndNeverDuplicated) {
    QORA_VLMap map(0);
    map.Insert(0.0, "plus");
    map.Insert(-0.0, "minus");
    map.Insert(0.0, "plus again");
    map.Insert(-0.0, "minus again");
    ASSERT_EQ(map.Count(), 2);
    std::vector<double> keys = NumericKeys(map);
    EXPECT_TRUE(std::signbit(keys[0]));
    EXPECT_FALSE(std::signbit(keys[1]));
    EXPECT_EQ(*map.Lookup(0.0), "plus again");
    EXPECT_EQ(*map.Lookup(-0.0), "minus again");
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
    map.Insert(1.0, "one");
    EXPECT_EQ(*map.Lookup(std::nan("")), "nan");
    EXPECT_EQ(*map.Lookup(1.0), "one");
}

TEST(VLMapTest, StringKeysArePaddedToWholeUnits) {
    QORA_VLMap map(10);
    map.Insert("AB", 2, "label");
    ASSERT_EQ(map.Count(), 1);
    EXPECT_EQ(map.Impl()->Pairs()[0].key, "AB" + std::string(14, ' '));
    EXPECT_EQ(*map.Lookup("AB        ", 10), "label");
    EXPECT_EQ(*map.Lookup("AB", -1), "label");
    map.Reset();
    std::string text, label;
    ASSERT_EQ(map.NextText(text, label), 1);
    EXPECT_EQ(text, "AB        ");
    // A text longer than the units is cut to them.
    map.Insert(std::string(40, 'x').c_str(), 40, "long");
    EXPECT_EQ(*map.Lookup(std::string(16, 'x').c_str(), 16), "long");
}

TEST(VLMapTest, WidestKeysWork) {
    QORA_VLMap map(32767);
    std::string a(32768, 'a'), b(32768, 'a');
    b[32767] = 'b';
    map.Insert(a.data(), "a");
    map.Insert(b.data(), "b");
    EXPECT_EQ(map.Count(), 2);
    EXPECT_EQ(*map.Lookup(b.data()), "b");
    std::string units, label;
    map.Reset();
    ASSERT_EQ(map.Next(units, label), 1);
    EXPECT_EQ(units.size(), 32768u);
}

TEST(VLMapTest, StringKeysFollowTheNumericOrderOfTheirChunks) {
    // The eighth byte of a chunk is the most significant, so BA sorts before AB.
    QORA_VLMap map(8);
    map.Insert("AB", 2, "ab");
    map.Insert("BA", 2, "ba");
    map.Reset();
    std::string text, label;
    map.NextText(text, label);
    EXPECT_EQ(label, "ba");
}

TEST(VLMapTest, ChangesThroughOneHandleNeverShowThroughAnother) {
    QORA_VLMap first(0);
    first.Insert(1.0, "one");
    QORA_VLMap second = first;
    EXPECT_TRUE(second.SameObject(first));
    second.Insert(2.0, "two");
    EXPECT_FALSE(second.SameObject(first));
    EXPECT_EQ(first.Count(), 1);
    EXPECT_EQ(second.Count(), 2);
    QORA_VLMap third;
    third = first;
    third.Insert(1.0, "uno");
    EXPECT_EQ(*first.Lookup(1.0), "one");
    // Changing the key type of a shared non-empty map unshares it too.
    QORA_VLMap fourth = first;
    fourth.SetKeyType(8);
    EXPECT_EQ(first.KeyType(), 0);
    EXPECT_EQ(fourth.KeyType(), 8);
    EXPECT_EQ(fourth.Count(), 1);
}

TEST(VLMapTest, EmptyMapGetsANewObjectForANewKeyType) {
    QORA_VLMap first(0);
    QORA_VLMap second = first;
    second.SetKeyType(20);
    EXPECT_EQ(first.KeyType(), 0);
    EXPECT_EQ(second.KeyType(), 20);
    QORA_VLMap none;
    none.SetKeyType(4);
    EXPECT_TRUE(none.IsValid());
    EXPECT_EQ(none.Count(), 0);
}

TEST(VLMapTest, CursorsAreCopiedNeverShared) {
    QORA_VLMap map(0);
    for (double v : {1.0, 2.0, 3.0}) map.Insert(v, "x");
    double value;
    std::string label;
    map.Reset();
    map.NextNumber(value, label);
    QORA_VLMap copy = map;  // its own cursor at the same position
    ASSERT_EQ(copy.NextNumber(value, label), 1);
    EXPECT_EQ(value, 2.0);
    ASSERT_EQ(copy.NextNumber(value, label), 1);
    EXPECT_EQ(value, 3.0);
    EXPECT_EQ(copy.NextNumber(value, label), 0);
    ASSERT_EQ(map.NextNumber(value, label), 1);
    EXPECT_EQ(value, 2.0);
    // A change through the copy leaves the original's walk on its own pairs.
    copy.Insert(2.5, "y");
    ASSERT_EQ(map.NextNumber(value, label), 1);
    EXPECT_EQ(value, 3.0);
    EXPECT_EQ(map.NextNumber(value, label), 0);
    EXPECT_TRUE(map.End());
}

TEST(VLMapTest, WalkingWithoutResetViolatesThePrecondition) {
    QORA_VLMap map(0);
    map.Insert(1.0, "x");
    QORA_VLMap fresh = map;  // copied from a handle without a cursor
    double value;
    std::string label;
    EXPECT_THROW(fresh.NextNumber(value, label), ErrorText);
    EXPECT_THROW(fresh.End(), ErrorText);
    QORA_VLMap none;
    EXPECT_EQ(none.NextNumber(value, label), 0);
}

TEST(VLMapTest, EqualityComparesPairsNotKeyType) {
    QORA_VLMap a(0), b(8), none;
    EXPECT_TRUE(none == QORA_VLMap());
    EXPECT_FALSE(a == none);
    EXPECT_TRUE(a == b);
    a.Insert(Units(5.0).data(), "five");
    EXPECT_FALSE(a == b);
    b.Insert(5.0, "five");
    EXPECT_TRUE(a == b);
    b.Insert(5.0, "FIVE");
    EXPECT_TRUE(a != b);
    QORA_VLMap c = a;
    EXPECT_TRUE(c == a);
}

TEST(VLMapTest, SharedMapOfTwoHoldersStaysApart) {
    // Two variables holding one map: a label added through one stays there.
    QORA_VLMap read(0);
    read.Insert(1.0, "a");
    QORA_VLMap varA = read, varB = read;
    varA.Insert(2.0, "b");
    EXPECT_EQ(varB.Lookup(2.0), nullptr);
    EXPECT_TRUE(varB.SameObject(read));
    EXPECT_EQ(read.Impl()->RefCount(), 2);
}

}  // namespace

namespace {

TEST(VLMapTest, TextKeysAreCutAtWholeCharacters) {
    int saved = mbIsUtf8Mode();
    mbSetUtf8Mode(1);
    QORA_VLMap map(16);
    std::string text = std::string(15, 'a') + "\xc3\xa9";
    map.Insert(text.c_str(), static_cast<int>(text.size()), "x");
    mbSetUtf8Mode(saved);
    EXPECT_EQ(map.Impl()->Pairs()[0].key, std::string(15, 'a') + " ");
}

}  // namespace
