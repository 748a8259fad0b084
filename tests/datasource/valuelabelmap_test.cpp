// Value label maps: keys that read as NaN, keys cut at whole characters,
// copies that never share a change, and the bulk insert against one by one.
#include "valuelabelmap.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>

#include "qoramb.h"

namespace {

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

TEST(VLMapTest, TextKeysAreCutAtWholeCharacters) {
    int saved = mbIsUtf8Mode();
    mbSetUtf8Mode(1);
    QORA_VLMap map(16);
    std::string text = std::string(15, 'a') + "\xc3\xa9";
    map.Insert(text.c_str(), static_cast<int>(text.size()), "x");
    mbSetUtf8Mode(saved);
    EXPECT_EQ(map.Impl()->Pairs()[0].key, std::string(15, 'a') + " ");
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
