// The buffered file stream under every read and write: mixed sizes, the end
// of a short file, and append; and the collector of the writer's pieces.
#include "filestream.h"

#include <gtest/gtest.h>

#include <cstring>
#include <fstream>
#include <string>
#include <vector>

#include "inmemfile.h"
#include "sysfile_builder.h"
#include "writebehind.h"

namespace {

std::vector<char> Get(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    return std::vector<char>(std::istreambuf_iterator<char>(in), {});
}

}  // namespace

TEST(FileStream, WriteReadBackMixedSizes) {
    fixture::TempDir dir;
    const std::string path = dir.Path() + "/m";
    std::vector<char> expect;
    {
        QORA_FileStream s(path.c_str(), "w+b");
        for (size_t n : {3u, 4093u, 1u, 9000u, 4096u, 200u, 4095u, 5000u}) {
            std::vector<char> part(n);
            for (size_t i = 0; i < n; ++i) part[i] = static_cast<char>((i * 7 + n) % 251);
            ASSERT_EQ(n, s.Write(part.data(), static_cast<uint32_t>(n)));
            expect.insert(expect.end(), part.begin(), part.end());
        }
        // Seek from the end counts the buffered bytes past the device's end.
        ASSERT_EQ(0, s.Seek(0, 2));
        EXPECT_EQ(int64_t(expect.size()), s.Tell());
        // Rewrite inside data already on the device, then read everything back.
        s.Seek(4000, 0);
        s.Write("xyz", 3);
        std::memcpy(expect.data() + 4000, "xyz", 3);
        s.Seek(0, 0);
        std::vector<char> back(expect.size() + 10);
        EXPECT_EQ(expect.size(), s.Read(back.data(), static_cast<uint32_t>(back.size())));
        back.resize(expect.size());
        EXPECT_EQ(expect, back);
    }
    EXPECT_EQ(expect, Get(path));
}

// A short file read twice: the second read finds the block at 0 again, so the
// stream is not at its end. Appending starts at the end of what is there.
TEST(FileStream, ShortFileReadTwiceThenAppendedTo) {
    fixture::TempDir dir;
    const std::string path = dir.Path() + "/three";
    std::ofstream(path, std::ios::binary) << "abc";
    {
        QORA_FileStream s(path.c_str(), "rb");
        char buffer[10];
        EXPECT_EQ(s.Read(buffer, 10), 3u);
        EXPECT_EQ(s.Read(buffer, 10), 0u);
        EXPECT_FALSE(s.AtEnd());
        EXPECT_EQ(3, s.Tell());
    }
    {
        QORA_FileStream s(path.c_str(), "ab");
        EXPECT_EQ(3, s.Tell());
        s.Write("end", 3);
    }
    EXPECT_EQ(Get(path), (std::vector<char>{'a', 'b', 'c', 'e', 'n', 'd'}));
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
    EXPECT_EQ("header", std::string(file.Data(), file.Size()));
    ASSERT_TRUE(out.Put(7, "XY", 2));  // back over collected bytes
    EXPECT_EQ("headerabcdef", std::string(file.Data(), file.Size()));
    const std::string large(WriteBehind::kSize + 10, 'L');
    ASSERT_TRUE(out.Put(12, large.data(), uint32_t(large.size())));
    EXPECT_EQ("headeraXYdef" + large, std::string(file.Data(), file.Size()));
    ASSERT_TRUE(out.Append("!", 1));
    ASSERT_TRUE(out.Flush());
    EXPECT_EQ("headeraXYdef" + large + "!", std::string(file.Data(), file.Size()));
}
