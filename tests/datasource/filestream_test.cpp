#include "filestream.h"

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>
#include <cstring>
#include <fstream>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "dserror.h"
#include "qoramb.h"

namespace {

class FileStreamTest : public ::testing::Test {
  protected:
    void SetUp() override {
        fWasUtf8 = mbIsUtf8Mode();
        mbSetUtf8Mode(1);
        fDir = ::testing::TempDir() + "qorafs_" + std::to_string(::getpid()) + "_" +
               ::testing::UnitTest::GetInstance()->current_test_info()->name();
        ::mkdir(fDir.c_str(), 0700);
    }
    void TearDown() override {
        std::system(("rm -rf '" + fDir + "'").c_str());
        mbSetUtf8Mode(fWasUtf8);
    }

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
    // Bytes [at, at + n) of a pattern, and n bytes read at a position.
    static std::string Part(size_t at, size_t n, int seed = 0) {
        const std::vector<char> all = Pattern(at + n, seed);
        return std::string(all.begin() + at, all.end());
    }
    static std::string ReadAt(QORA_FileStream& s, int64_t at, uint32_t n) {
        if (at >= 0) s.Seek(at, 0);
        std::string bytes(n, '\0');
        bytes.resize(s.Read(bytes.data(), n));
        return bytes;
    }
    static bool Exists(const std::string& path) { return ::access(path.c_str(), F_OK) == 0; }
    // Changes bytes of the file behind the stream's back, so a test can tell
    // buffered bytes (old) from bytes read again from the device (new).
    static void Overwrite(const std::string& path, long at, const std::vector<char>& bytes) {
        std::fstream f(path, std::ios::binary | std::ios::in | std::ios::out);
        f.seekp(at);
        f.write(bytes.data(), bytes.size());
    }

    std::string fDir;
    int fWasUtf8 = 0;
};

// A 3-byte file read twice: the second read finds the block at 0 again, so
// the stream is not at its end; only a block starting at the end is.
TEST_F(FileStreamTest, ShortFileReadTwiceAndAtEnd) {
    Put(Path("three"), {'a', 'b', 'c'});
    QORA_FileStream s(Path("three").c_str(), "rb");
    EXPECT_EQ(ReadAt(s, -1, 10), "abc");
    EXPECT_EQ(ReadAt(s, -1, 10), "");
    EXPECT_FALSE(s.AtEnd());
    EXPECT_EQ(3, s.Tell());

    Put(Path("f"), Pattern(512));
    QORA_FileStream f(Path("f").c_str(), "rb");
    EXPECT_EQ(ReadAt(f, 512, 10), "");
    EXPECT_TRUE(f.AtEnd());
    f.Seek(0, 0);
    EXPECT_FALSE(f.AtEnd());
}

// 5000 bytes at 100: 4508 go straight to the caller up to the block boundary
// at 4608, the other 492 come through a buffered block.
TEST_F(FileStreamTest, LargeReadGoesDirectToBlockBoundaryThenBuffers) {
    Put(Path("f"), Pattern(10000));
    QORA_FileStream s(Path("f").c_str(), "rb");
    EXPECT_EQ(ReadAt(s, 100, 5000), Part(100, 5000));
    EXPECT_EQ(5100, s.Tell());
    // Changed behind the stream's back: buffered bytes (4096 from 4608) stay old.
    Overwrite(Path("f"), 0, Pattern(10000, 1));
    EXPECT_EQ(ReadAt(s, 4608, 8), Part(4608, 8));
    EXPECT_EQ(ReadAt(s, 8690, 8), Part(8690, 8));
    EXPECT_EQ(ReadAt(s, 4600, 8), Part(4600, 8, 1));  // never buffered: read anew
}

TEST_F(FileStreamTest, SmallWritesStayBufferedUntilFlush) {
    QORA_FileStream s(Path("w").c_str(), "wb");
    const std::vector<char> data = Pattern(100);
    EXPECT_EQ(100u, s.Write(data.data(), 100));
    s.Seek(10, 0);
    EXPECT_EQ(5u, s.Write("ABCDE", 5));
    EXPECT_EQ(15, s.Tell());
    EXPECT_TRUE(Get(Path("w")).empty());
    // Seek from the end counts the buffered bytes past the device's end.
    s.Seek(0, 2);
    EXPECT_EQ(100, s.Tell());
    EXPECT_TRUE(s.Flush());
    std::vector<char> expect = data;
    std::memcpy(expect.data() + 10, "ABCDE", 5);
    EXPECT_EQ(expect, Get(Path("w")));
}

TEST_F(FileStreamTest, WriteReadBackMixedSizes) {
    std::vector<char> expect;
    {
        QORA_FileStream s(Path("m").c_str(), "w+b");
        for (size_t n : {3u, 4093u, 1u, 9000u, 4096u, 200u, 4095u, 5000u}) {
            const std::vector<char> part = Pattern(n, static_cast<int>(n));
            ASSERT_EQ(n, s.Write(part.data(), static_cast<uint32_t>(n)));
            expect.insert(expect.end(), part.begin(), part.end());
        }
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

TEST_F(FileStreamTest, CopiesKeepTheirOwnPosition) {
    Put(Path("c"), Pattern(9000));
    auto original = std::make_unique<QORA_FileStream>(Path("c").c_str(), "rb");
    QORA_FileStream copy(*original);
    EXPECT_EQ(ReadAt(*original, 8000, 4), Part(8000, 4));
    EXPECT_EQ(ReadAt(copy, -1, 4), Part(0, 4));
    EXPECT_STREQ(original->Name(), copy.Name());
    original.reset();
    EXPECT_EQ(ReadAt(copy, -1, 4), Part(4, 4));
}

TEST_F(FileStreamTest, DeleteWhenClosed) {
    {
        QORA_FileStream s(Path("d1").c_str(), "w+D");
        s.Write("x", 1);
    }
    EXPECT_FALSE(Exists(Path("d1")));

    auto original = std::make_unique<QORA_FileStream>(Path("d2").c_str(), "w+bD");
    original->Write("y", 1);
    original->Flush();
    auto copy = std::make_unique<QORA_FileStream>(*original);
    original.reset();
    EXPECT_TRUE(Exists(Path("d2")));  // the copy still shares the name
    copy.reset();
    EXPECT_FALSE(Exists(Path("d2")));
}

TEST_F(FileStreamTest, ReopenByOwnNameAndNonAsciiName) {
    const std::string name = Path("d\xC3\xA4ta.bin");
    QORA_FileStream s(name.c_str(), "wb");
    EXPECT_STREQ(name.c_str(), s.Name());
    s.Write("abc", 3);
    // Reopening by the stream's own name writes out the buffer first.
    ASSERT_TRUE(s.Open(s.Name(), "r+b"));
    EXPECT_STREQ(name.c_str(), s.Name());
    EXPECT_EQ(ReadAt(s, -1, 3), "abc");
}

TEST_F(FileStreamTest, ClosedStreamAndNegativePositionsAnswerQuietly) {
    QORA_FileStream s;
    char buf[4];
    EXPECT_EQ(nullptr, s.Name());
    EXPECT_EQ(0u, s.Read(buf, 4));
    EXPECT_EQ(0u, s.Write(buf, 4));
    EXPECT_EQ(-1, s.Seek(0, 0));
    EXPECT_FALSE(s.Commit());
    EXPECT_FALSE(s.Open(Path("missing").c_str(), "rb"));
    EXPECT_FALSE(s.IsGood());

    Put(Path("n"), Pattern(10));
    QORA_FileStream n(Path("n").c_str(), "rb");
    EXPECT_EQ(0, n.Seek(-5, 0));
    EXPECT_EQ(0u, n.Read(buf, 4));
    EXPECT_TRUE(n.IsGood());
}

void ExpectError(long number, const std::function<void()>& action) {
    try {
        action();
        ADD_FAILURE() << "no error " << number;
    } catch (const ErrorText& e) {
        EXPECT_NE(std::string::npos, e.Text().find("Datasource error # " + std::to_string(number)))
            << e.Text();
    }
}

TEST_F(FileStreamTest, FailuresRaiseStreamErrors) {
    ExpectError(kErrStreamOpen, [&] { QORA_FileStream s(Path("missing").c_str(), "rb"); });

    Put(Path("ro"), Pattern(10));
    QORA_FileStream readOnly(Path("ro").c_str(), "rb");
    std::vector<char> big = Pattern(5000);
    ExpectError(kErrStreamWrite, [&] { readOnly.Write(big.data(), 5000); });
    EXPECT_FALSE(readOnly.IsGood());
    readOnly.ClearError();
    EXPECT_TRUE(readOnly.IsGood());
    readOnly.Seek(0, 0);
    readOnly.Write("x", 1);  // buffered: the failure shows at the flush
    ExpectError(kErrStreamWrite, [&] { readOnly.Flush(); });

    QORA_FileStream writeOnly(Path("wo").c_str(), "wb");
    char buf[4];
    ExpectError(kErrStreamRead, [&] { writeOnly.Read(buf, 4); });
    EXPECT_FALSE(writeOnly.IsGood());

    QORA_FileStream negative(Path("neg").c_str(), "wb");
    negative.Seek(-1, 0);
    ExpectError(kErrStreamWrite, [&] { negative.Write("x", 1); });
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
