#include "inmemfile.h"

#include <gtest/gtest.h>

#include <cstring>
#include <vector>

namespace {

TEST(InMemoryFileTest, GrowsByHalfUntilOneStepCoversTheWrite) {
    QORA_InMemoryFile f;
    EXPECT_EQ(4096u, f.Capacity());
    std::vector<char> data(5000, 'x');
    data[4999] = 'z';
    EXPECT_EQ(5000u, f.Write(data.data(), 5000));
    EXPECT_EQ(20736u, f.Capacity());  // 4096, 6144, 9216, 13824, 20736
    EXPECT_EQ(5000u, f.Size());
    EXPECT_EQ(5000, f.Tell());

    // The steps are measured against the count, not the shortfall:
    // 31104 (+10368) and 46656 (+15552) fall short of 16000, 69984 does not.
    std::vector<char> more(16000, 'y');
    f.Write(more.data(), 16000);
    EXPECT_EQ(69984u, f.Capacity());
    EXPECT_EQ('z', f.Data()[4999]);
    EXPECT_EQ('y', f.Data()[20999]);
}

TEST(InMemoryFileTest, ReadWriteSeekWithinTheData) {
    QORA_InMemoryFile f;
    f.Write("0123456789", 10);
    EXPECT_EQ(0, f.Seek(2, 0));
    f.Write("ab", 2);
    EXPECT_EQ(10u, f.Size());
    EXPECT_EQ(0, f.Seek(-4, 1));
    EXPECT_EQ(0, f.Tell());
    char buf[16];
    EXPECT_EQ(10u, f.Read(buf, 16));
    EXPECT_EQ(0, std::memcmp(buf, "01ab456789", 10));
    EXPECT_TRUE(f.AtEnd());
    EXPECT_EQ(0u, f.Read(buf, 1));

    EXPECT_EQ(-1, f.Seek(-1, 0));
    EXPECT_EQ(-1, f.Seek(11, 0));
    EXPECT_EQ(-1, f.Seek(1, 1));
    EXPECT_EQ(-2, f.Seek(0, 3));
    EXPECT_EQ(10, f.Tell());  // refused seeks leave the position
    EXPECT_EQ(0, f.Seek(-3, 2));
    EXPECT_EQ(7, f.Tell());
    EXPECT_FALSE(f.AtEnd());
    // Only the low 32 bits of an offset count.
    EXPECT_EQ(0, f.Seek((int64_t{1} << 32) + 5, 0));
    EXPECT_EQ(5, f.Tell());
    EXPECT_TRUE(f.IsGood());
}

}  // namespace
