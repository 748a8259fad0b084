// The buffered file stream under every read and write: mixed sizes, append
// and positions beyond 32 bits.
#include "filestream.h"

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>
#include <cstring>
#include <fstream>
#include <string>
#include <vector>

#include "dserror.h"

namespace {

class FileStreamTest : public ::testing::Test {
  protected:
    void SetUp() override {
        fDir = ::testing::TempDir() + "qorafs_" + std::to_string(::getpid()) + "_" +
               ::testing::UnitTest::GetInstance()->current_test_info()->name();
        ::mkdir(fDir.c_str(), 0700);
    }
    void TearDown() override { std::system(("rm -rf '" + fDir + "'").c_str()); }

    std::string Path(const char* leaf) const { return fDir + "/" + leaf; }

    static std::vector<char> Pattern(size_t n, int seed = 0) {
        std::vector<char> bytes(n);
        for (size_t i = 0; i < n; ++i) bytes[i] = static_cast<char>((i * 7 + seed) % 251);
        return bytes;
    }
    static void Put(const std::string& path, const std::vector<char>& bytes) {
        std::ofstream(path, std::ios::binary).write(bytes.data(), bytes.size());
    }
    static std::vector<char> Get(const std::string& path) {
        std::ifstream in(path, std::ios::binary);
        return std::vector<char>(std::istreambuf_iterator<char>(in), {});
    }
    static std::string ReadAt(QORA_FileStream& s, int64_t at, uint32_t n) {
        if (at >= 0) s.Seek(at, 0);
        std::string bytes(n, '\0');
        bytes.resize(s.Read(bytes.data(), n));
        return bytes;
    }
    std::string fDir;
};

TEST_F(FileStreamTest, WriteReadBackMixedSizes) {
    std::vector<char> expect;
    {
        QORA_FileStream s(Path("m").c_str(), "w+b");
        for (size_t n : {3u, 4093u, 1u, 9000u, 4096u, 200u, 4095u, 5000u}) {
            const std::vector<char> part = Pattern(n, static_cast<int>(n));
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
    EXPECT_EQ(expect, Get(Path("m")));
}

TEST_F(FileStreamTest, AppendModeStartsAtEnd) {
    Put(Path("a"), Pattern(700));
    {
        QORA_FileStream s(Path("a").c_str(), "ab");
        EXPECT_EQ(700, s.Tell());
        s.Write("end", 3);
    }
    std::vector<char> expect = Pattern(700);
    expect.insert(expect.end(), {'e', 'n', 'd'});
    EXPECT_EQ(expect, Get(Path("a")));
}

TEST_F(FileStreamTest, PositionsBeyondFourGigabytes) {
    const int64_t at = int64_t{5} << 30;
    try {
        QORA_FileStream s(Path("big").c_str(), "w+b");
        s.Seek(at, 0);
        s.Write("large", 5);
        s.Flush();
    } catch (const ErrorText& e) {
        GTEST_SKIP() << "the file system refuses a sparse 5 GB file: " << e.Text();
    }
    QORA_FileStream s(Path("big").c_str(), "rb");
    ASSERT_EQ(0, s.Seek(0, 2));
    EXPECT_EQ(at + 5, s.Tell());
    EXPECT_EQ(ReadAt(s, at - 3, 16), std::string("\0\0\0large", 8));
    EXPECT_EQ(at + 5, s.Tell());
}

}  // namespace
