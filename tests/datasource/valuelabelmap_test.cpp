#include "valuelabelmap.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>

#include "qoramb.h"

namespace {

std::vector<double> NumericKeys(QORA_VLMap map) {
    std::vector<double> keys;
    double value;
    std::string label;
    map.Reset();
    while (map.NextNumber(value, label)) keys.push_back(value);
    return keys;
}

TEST(VLMapTest, KeyUnitsForEveryWidth) {
    const std::pair<int, int> rows[] = {{0, 1},  {1, 1},  {8, 1},       {9, 2},
                                        {16, 2}, {17, 3}, {32767, 4096}};
    for (auto [width, units] : rows) EXPECT_EQ(QORA_VLMapImpl::UnitsFor(width), units) << width;
    EXPECT_FALSE(QORA_VLMapImpl::IsValidKeyType(32768));
    EXPECT_THROW(QORA_VLMap(-1), ErrorText);
}

TEST(VLMapTest, InsertReplacesLabelOfEqualKeyAndOrdersNumerically) {
    QORA_VLMap map(0);
    for (double v : {1.0, 1.0, 3.0, -2.0, 2.0, 0.0, -0.0}) map.Insert(v, "x");
    map.Insert(1.0, "True");
    map.Insert(-0.0, "minus");
    EXPECT_EQ(map.Count(), 6);
    const std::vector<double> keys = NumericKeys(map);
    EXPECT_EQ(keys, (std::vector<double>{-2.0, -0.0, 0.0, 1.0, 2.0, 3.0}));
    EXPECT_TRUE(std::signbit(keys[1]));  // signed zeros are two keys
    EXPECT_FALSE(std::signbit(keys[2]));
    EXPECT_EQ(*map.Lookup(1.0), "True");
    EXPECT_EQ(*map.Lookup(-0.0), "minus");
    EXPECT_EQ(*map.Lookup(0.0), "x");
    EXPECT_EQ(map.Lookup(4.0), nullptr);
    EXPECT_EQ(QORA_VLMap().Lookup(1.0), nullptr);
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

TEST(VLMapTest, StringKeysArePaddedToWholeUnitsAndOrderedByChunk) {
    QORA_VLMap map(10);
    map.Insert("AB", 2, "label");
    EXPECT_EQ(*map.Lookup("AB        ", 10), "label");
    EXPECT_EQ(*map.Lookup("AB", -1), "label");
    map.Reset();
    std::string units, text, label;
    ASSERT_EQ(map.Next(units, label), 1);
    EXPECT_EQ(units, "AB" + std::string(14, ' '));
    map.Reset();
    ASSERT_EQ(map.NextText(text, label), 1);
    EXPECT_EQ(text, "AB        ");
    map.Insert(std::string(40, 'x').c_str(), 40, "long");  // cut to the units
    EXPECT_EQ(*map.Lookup(std::string(16, 'x').c_str(), 16), "long");

    // The eighth byte of a chunk is the most significant, so BA sorts first.
    QORA_VLMap order(8);
    order.Insert("AB", 2, "ab");
    order.Insert("BA", 2, "ba");
    order.Reset();
    order.NextText(text, label);
    EXPECT_EQ(label, "ba");
}

TEST(VLMapTest, TextKeysAreCutAtWholeCharacters) {
    int saved = mbIsUtf8Mode();
    mbSetUtf8Mode(1);
    QORA_VLMap map(16);
    std::string text = std::string(15, 'a') + "\xc3\xa9";
    map.Insert(text.c_str(), static_cast<int>(text.size()), "x");
    mbSetUtf8Mode(saved);
    EXPECT_EQ(map.Impl()->Pairs()[0].key, std::string(15, 'a') + " ");
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

TEST(VLMapTest, ChangesThroughOneHandleNeverShowThroughAnother) {
    QORA_VLMap first(0);
    first.Insert(1.0, "one");
    QORA_VLMap second = first, third = first;
    EXPECT_TRUE(second.SameObject(first));
    second.Insert(2.0, "two");
    EXPECT_FALSE(second.SameObject(first));
    EXPECT_EQ(first.Count(), 1);
    EXPECT_EQ(first.Impl()->RefCount(), 2);  // first and third
    third.Insert(1.0, "uno");
    EXPECT_EQ(*first.Lookup(1.0), "one");
    // Changing the key type of a shared map unshares it too, empty or not.
    QORA_VLMap fourth = first;
    fourth.SetKeyType(8);
    EXPECT_EQ(first.KeyType(), 0);
    EXPECT_EQ(fourth.Count(), 1);
    QORA_VLMap empty(0), emptyCopy = empty;
    emptyCopy.SetKeyType(20);
    EXPECT_EQ(empty.KeyType(), 0);
    QORA_VLMap none;
    none.SetKeyType(4);
    EXPECT_TRUE(none.IsValid());
}

TEST(VLMapTest, CursorsAreCopiedNeverShared) {
    QORA_VLMap map(0);
    for (double v : {1.0, 2.0, 3.0}) map.Insert(v, "x");
    double value;
    std::string label;
    EXPECT_THROW(QORA_VLMap(map).NextNumber(value, label), ErrorText);  // no Reset yet
    EXPECT_THROW(QORA_VLMap(map).End(), ErrorText);
    EXPECT_EQ(QORA_VLMap().NextNumber(value, label), 0);
    map.Reset();
    map.NextNumber(value, label);
    QORA_VLMap copy = map;  // its own cursor at the same position
    for (double want : {2.0, 3.0}) {
        ASSERT_EQ(copy.NextNumber(value, label), 1);
        EXPECT_EQ(value, want);
    }
    EXPECT_EQ(copy.NextNumber(value, label), 0);
    ASSERT_EQ(map.NextNumber(value, label), 1);
    EXPECT_EQ(value, 2.0);
    copy.Insert(2.5, "y");  // the original walks on over its own pairs
    ASSERT_EQ(map.NextNumber(value, label), 1);
    EXPECT_EQ(value, 3.0);
    EXPECT_EQ(map.NextNumber(value, label), 0);
    EXPECT_TRUE(map.End());
}

TEST(VLMapTest, EqualityComparesPairsNotKeyType) {
    QORA_VLMap a(0), b(8), none;
    EXPECT_TRUE(none == QORA_VLMap());
    EXPECT_FALSE(a == none);
    EXPECT_TRUE(a == b);
    const double five = 5.0;
    a.Insert(reinterpret_cast<const char*>(&five), "five");
    EXPECT_FALSE(a == b);
    b.Insert(5.0, "five");
    EXPECT_TRUE(a == b);
    b.Insert(5.0, "FIVE");
    EXPECT_TRUE(a != b);
}

}  // namespace

TEST(VLMapTest, InsertAllEqualsInsertingOneByOne) {
    // Repeats, both zeros and keys that read as NaN, in an order of their own.
    std::vector<double> values;
    for (int i = 0; i < 200; ++i) values.push_back((i * 37 % 101) - 50.0);
    values.insert(values.end(), {0.0, -0.0, std::nan(""), 0.0, 7.0});
    QORA_VLMap oneByOne(0), all(0);
    all.Insert(7.0, "before");
    oneByOne.Insert(7.0, "before");
    std::vector<QORA_VLMapImpl::Pair> pairs;
    for (size_t i = 0; i < values.size(); ++i) {
        const std::string label = "L" + std::to_string(i);
        oneByOne.Insert(values[i], label);
        std::string key(8, '\0');
        std::memcpy(key.data(), &values[i], 8);  // the test host is little-endian
        pairs.push_back({key, label});
    }
    all.InsertAll(pairs);
    EXPECT_TRUE(all == oneByOne);
    EXPECT_EQ(all.Count(), 103);  // -50 to 50, -0 and NaN
}

TEST(VLMapTest, WideKeysHoldOnlyTheirValueAndMixWithOldWidths) {
    QORA_VLMap map(255);
    map.InsertAll({{map.KeyFromText("b", 1), "b"}, {map.KeyFromText("a", 1), "a"}});
    EXPECT_EQ(map.Impl()->Pairs()[0].key, "a       ");
    EXPECT_EQ(*map.Lookup((std::string("b") + std::string(254, ' ')).c_str(), 255), "b");
    std::string units, label;
    map.Reset();
    ASSERT_EQ(map.Next(units, label), 1);
    EXPECT_EQ(units, "a" + std::string(255, ' '));
    // A key stored at a narrower width is found again at the wider one.
    QORA_VLMap grown(8);
    grown.Insert("ab", 2, "ab");
    grown.SetKeyType(20);
    EXPECT_EQ(*grown.Lookup("ab", 2), "ab");
}
