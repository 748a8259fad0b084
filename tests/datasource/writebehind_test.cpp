#include "writebehind.h"

#include <gtest/gtest.h>

#include <string>

#include "inmemfile.h"

namespace {

std::string Contents(const QORA_InMemoryFile& file) {
    return std::string(file.Data(), file.Size());
}

// Pieces that follow each other, one that goes back over written bytes, and
// one larger than the collection all land where they belong, and only what
// the stream was given is there before the flush.
TEST(WriteBehind, EveryPieceLandsAtItsPlace) {
    QORA_InMemoryFile file;
    file.Write("header", 6);
    WriteBehind out(file);
    ASSERT_TRUE(out.Append("abc", 3));
    ASSERT_TRUE(out.Append("def", 3));
    EXPECT_EQ("header", Contents(file));
    ASSERT_TRUE(out.Put(7, "XY", 2));  // back over collected bytes
    EXPECT_EQ("headerabcdef", Contents(file));
    const std::string large(WriteBehind::kSize + 10, 'L');
    ASSERT_TRUE(out.Put(12, large.data(), uint32_t(large.size())));
    EXPECT_EQ("headeraXYdef" + large, Contents(file));
    ASSERT_TRUE(out.Append("!", 1));
    ASSERT_TRUE(out.Flush());
    EXPECT_EQ("headeraXYdef" + large + "!", Contents(file));
}

}  // namespace
