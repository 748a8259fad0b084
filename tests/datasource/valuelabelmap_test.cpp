// Value label maps: keys that read as NaN, and copies that never share a change.
#include "valuelabelmap.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>


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
