#include <gtest/gtest.h>
#include <unistd.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <fstream>
#include <functional>
#include <limits>
#include <random>
#include <string>
#include <tuple>
#include <vector>

#include "CompressedSystemFile.h"
#include "dserror.h"
#include "filestream.h"
#include "inmemfile.h"
#include "sparsefileindex.h"

namespace {

using Bytes = std::vector<unsigned char>;
using Unit = std::array<unsigned char, 8>;

const int64_t kHeader = 16;  // bytes before the case data in every test file

Unit Num(double d) {
    Unit u;
    std::memcpy(u.data(), &d, 8);
    return u;
}
Unit Str(const char* s8) {
    Unit u;
    std::memcpy(u.data(), s8, 8);
    return u;
}
Unit Sysmis() { return Num(-std::numeric_limits<double>::max()); }  // FFEF..FF
void Append(Bytes& out, const Unit& u) { out.insert(out.end(), u.begin(), u.end()); }

// An in-memory file holding a header of kHeader bytes and then the data.
struct MemFile {
    explicit MemFile(const Bytes& data = {}) {
        const Bytes header(kHeader, 'h');
        file.Write(header.data(), kHeader);
        if (!data.empty()) file.Write(data.data(), static_cast<uint32_t>(data.size()));
    }
    Bytes Data() const { return Bytes(file.Data() + kHeader, file.Data() + file.Size()); }
    QORA_InMemoryFile file;
    SparseFileIndex index;
};

Bytes Encode(uint32_t units, const std::vector<std::vector<Unit>>& cases) {
    MemFile m;
    CompressedSystemFile c(units, &m.index, &m.file, kHeader);
    for (const auto& one : cases) c.WriteCase(one.data());
    c.Finish();
    return m.Data();
}

std::vector<std::vector<Unit>> DecodeAll(uint32_t units, const Bytes& data) {
    MemFile m(data);
    CompressedSystemFile c(units, &m.index, &m.file, kHeader);
    std::vector<std::vector<Unit>> cases;
    std::vector<Unit> one(units);
    while (c.ReadCase(one.data(), nullptr) == units) cases.push_back(one);
    return cases;
}

// The number and condition of the format error an action raises.
std::string Raised(const std::function<void()>& action) {
    try {
        action();
    } catch (const SystemFileException& e) {
        return std::to_string(e.Number()) + " " + e.Condition();
    }
    return "nothing";
}
const std::string kShort = std::to_string(kErrTooShort) + " ";

TEST(CompressedCodes, EncoderTable) {
    const std::pair<Unit, int> rows[] = {
        {Num(0.0), 100}, {Num(-99.0), 1}, {Num(151.0), 251},      {Num(100.0), 200},
        {Num(1.0), 101}, {Sysmis(), 255}, {Str("        "), 254}, {Str("ABCDEFGH"), 253}};
    std::vector<Unit> all;
    for (const auto& [unit, code] : rows) {
        EXPECT_EQ(code, CompressedSystemFile::Encode(unit.data()));
        all.push_back(unit);
    }
    for (double raw :
         {0.5, -0.0, -100.0, 152.0, 255.0, 1.0000001, -1.5, 1e300, -1e300, -99.5, -100.5, 151.5,
          std::numeric_limits<double>::infinity(), -std::numeric_limits<double>::infinity(),
          std::numeric_limits<double>::quiet_NaN(), -2147483648.0, 4294967297.0, 5e-324}) {
        EXPECT_EQ(253, CompressedSystemFile::Encode(Num(raw).data())) << raw;
        all.push_back(Num(raw));
    }
    // Whole blocks of one case are coded eight units at a time: the same codes.
    const Bytes data = Encode(uint32_t(all.size()), {all});
    for (size_t block = 0, at = 0; block * 8 < all.size(); ++block) {
        for (size_t i = 0; i < 8 && block * 8 + i < all.size(); ++i)
            EXPECT_EQ(CompressedSystemFile::Encode(all[block * 8 + i].data()), data[at + i]) << i;
        at += 8 + 8 * size_t(std::count(&data[at], &data[at + 8], 253));
    }
}

TEST(CompressedWrite, DocumentedExamplesByteByByte) {
    Bytes expect = {101, 102, 103, 253, 0, 0, 0, 0};
    Append(expect, Str("ABCDEFGH"));
    EXPECT_EQ(expect, Encode(4, {{Num(1), Num(2), Num(3), Str("ABCDEFGH")}}));
    // Nine cells make one full block and one padded one.
    std::vector<std::vector<Unit>> cases(9, {Num(1.0)});
    const Bytes data = Encode(1, cases);
    EXPECT_EQ(Bytes({101, 101, 101, 101, 101, 101, 101, 101, 101, 0, 0, 0, 0, 0, 0, 0}), data);
    EXPECT_EQ(cases, DecodeAll(1, data));
    EXPECT_TRUE(Encode(3, {}).empty());
}

TEST(CompressedRoundTrip, MixedCasesDecodeToTheSameBytes) {
    std::mt19937 rng(7);
    const Unit pool[] = {Num(0),    Num(-99), Num(151),        Num(0.5),        Num(-0.0),
                         Num(1e10), Sysmis(), Str("        "), Str("abcdefgh"), Num(42)};
    // The last form spans many writes of collected blocks.
    for (auto [units, count] : {std::pair{1u, 50}, {3u, 50}, {8u, 50}, {13u, 50}, {13u, 5000}}) {
        std::vector<std::vector<Unit>> cases(count, std::vector<Unit>(units));
        for (auto& one : cases) {
            for (auto& u : one) u = pool[rng() % 10];
        }
        EXPECT_EQ(cases, DecodeAll(units, Encode(units, cases))) << units;
    }
}

TEST(CompressedRead, PaddedLastBlockEndsCleanlyAndStaysAtEnd) {
    MemFile m({101, 102, 103, 0, 0, 0, 0, 0});
    CompressedSystemFile c(1, &m.index, &m.file, kHeader);
    Unit u;
    for (double want : {1.0, 2.0, 3.0}) {
        ASSERT_EQ(1u, c.ReadCase(u.data(), nullptr));
        EXPECT_EQ(Num(want), u);
    }
    EXPECT_EQ(0u, c.ReadCase(u.data(), nullptr));
    EXPECT_TRUE(c.AtEnd());
    EXPECT_EQ(3, c.CurrentCase());
    EXPECT_EQ(0u, c.ReadCase(u.data(), nullptr));
    EXPECT_TRUE(DecodeAll(2, Bytes(64, 0)).empty());
    EXPECT_TRUE(DecodeAll(2, Bytes(64, 252)).empty());
}

TEST(CompressedRead, Code252SkipsTheRestOfItsBlock) {
    // 252 at the start, in the middle and at the end of blocks; the codes
    // after it (253 among them) have no raw values.
    Bytes data = {101, 252, 253, 253, 102, 102, 102, 102, 252, 253, 253, 253,
                  253, 253, 253, 253, 103, 253, 104, 105, 106, 107, 108, 252};
    Append(data, Num(0.25));
    const std::vector<std::vector<Unit>> expect = {{Num(1)}, {Num(3)}, {Num(0.25)}, {Num(4)},
                                                   {Num(5)}, {Num(6)}, {Num(7)},    {Num(8)}};
    EXPECT_EQ(expect, DecodeAll(1, data));
}

TEST(CompressedRead, MalformedDataRaiseTooShort) {
    Bytes raws = {253, 253, 0, 0, 0, 0, 0, 0};  // two raws announced, 1.5 present
    Append(raws, Num(0.5));
    raws.insert(raws.end(), 4, 0);
    const std::tuple<uint32_t, Bytes, const char*> rows[] = {
        // The data stop after 3 of a case's 5 cells.
        {5, {101, 102, 103, 0, 0, 0, 0, 0}, "iCell == 0"},
        {5, {101, 102, 103, 252, 101, 101, 101, 101}, "iCell == 0"},
        // Control bytes cut short, at the start and after whole cases.
        {1, {101, 102, 103}, "nRead == 0"},
        {1, {101, 101, 101, 101, 101, 101, 101, 101, 101}, "nRead == 0"},
        {1, raws, "nRead == nu*sizeof(OBS)"}};
    for (const auto& [units, data, condition] : rows)
        EXPECT_EQ(kShort + condition, Raised([&] { DecodeAll(units, data); }));
}

TEST(CompressedRead, RandomBytesNeverCrashOrHang) {
    std::mt19937 rng(11);
    for (int round = 0; round < 500; ++round) {
        Bytes data(rng() % 200);
        for (auto& b : data) {
            // Favour the control codes so blocks and raws are exercised.
            const unsigned pick = rng() % 8;
            b = pick < 6 ? static_cast<unsigned char>(250 + pick)
                         : static_cast<unsigned char>(rng());
        }
        const std::string raised = Raised([&] { DecodeAll(1 + rng() % 9, data); });
        EXPECT_TRUE(raised == "nothing" || raised.rfind(kShort, 0) == 0) << raised;
    }
}

TEST(CompressedRead, SwapMaskReversesRawCellsOnly) {
    Bytes data = {253, 105, 253, 0, 0, 0, 0, 0};
    Unit big = Num(1234.5);
    std::reverse(big.begin(), big.end());
    Append(data, big);
    Append(data, Str("ABCDEFGH"));
    MemFile m(data);
    CompressedSystemFile c(3, &m.index, &m.file, kHeader);
    const unsigned char mask[3] = {1, 1, 0};
    std::vector<Unit> out(3);
    ASSERT_EQ(3u, c.ReadCase(out.data(), mask));
    EXPECT_EQ(Num(1234.5), out[0]);
    EXPECT_EQ(Num(5), out[1]);
    EXPECT_EQ(Str("ABCDEFGH"), out[2]);
}

// Cases of 3 units whose raw values land all over the blocks.
std::vector<std::vector<Unit>> Numbered(int count) {
    std::vector<std::vector<Unit>> cases;
    for (int i = 0; i < count; ++i) {
        cases.push_back({Num(i), Num(i + 0.5), Num(i % 3 ? 1 : 0.75)});
    }
    return cases;
}

TEST(CompressedPosition, TellAndSeekReturnToEveryCase) {
    const auto cases = Numbered(40);
    MemFile m(Encode(3, cases));
    CompressedSystemFile c(3, &m.index, &m.file, kHeader);
    std::vector<int64_t> starts;
    std::vector<Unit> out(3);
    for (size_t i = 0; i < cases.size(); ++i) {
        starts.push_back(c.Tell());
        ASSERT_EQ(3u, c.ReadCase(out.data(), nullptr));
    }
    // 120 cells fill 15 blocks: after the last case no block is loaded and
    // the position names where a next block would start.
    EXPECT_EQ(static_cast<int64_t>(m.Data().size()), c.Tell());
    for (size_t i = cases.size(); i-- > 0;) {
        c.Seek(starts[i]);
        EXPECT_EQ(starts[i], c.Tell());
        ASSERT_EQ(3u, c.ReadCase(out.data(), nullptr));
        EXPECT_EQ(cases[i], out) << i;
    }
    // The end of the data is a position too: reading there finds no case.
    c.Seek(static_cast<int64_t>(m.Data().size()));
    EXPECT_EQ(0u, c.ReadCase(out.data(), nullptr));
}

TEST(CompressedPosition, SeekWhereNoBlockIsRaises) {
    MemFile m({101, 0, 0, 0, 0, 0, 0, 0});
    CompressedSystemFile c(1, &m.index, &m.file, kHeader);
    EXPECT_EQ(kShort + "nRead", Raised([&] { c.Seek(11); }));
    EXPECT_NE("nothing", Raised([&] { c.Seek(64); }));  // beyond the in-memory data
}

TEST(CompressedPosition, RequestedCasesInAnyOrder) {
    const auto cases = Numbered(3000);
    MemFile m(Encode(3, cases));
    CompressedSystemFile c(3, &m.index, &m.file, kHeader);
    std::vector<Unit> out(3);
    for (int64_t want : {5, 2, 2, 1, 2999, 1500, 0, 1499, 1500, 1501, 7, 2000}) {
        c.SetRequestedCase(want);
        ASSERT_EQ(3u, c.ReadCase(out.data(), nullptr)) << want;
        EXPECT_EQ(cases[want], out) << want;
        EXPECT_EQ(want + 1, c.CurrentCase());
    }
    EXPECT_GT(m.index.Count(), 0u);
    // Beyond the end: positioning stops at the end of the data.
    c.SetRequestedCase(100000);
    EXPECT_EQ(0u, c.ReadCase(out.data(), nullptr));
    EXPECT_EQ(3000, c.CurrentCase());
    c.SetRequestedCase(2999);
    ASSERT_EQ(3u, c.ReadCase(out.data(), nullptr));
    EXPECT_EQ(cases[2999], out);
}

TEST(CompressedAppend, KeepsRawValuesAndFillsIntoNewBlocks) {
    const auto first = Numbered(5);  // 15 cells: the last block is partly used
    MemFile m(Encode(3, first));
    {
        CompressedSystemFile c(3, &m.index, &m.file, kHeader);
        c.PrepareAppend(5);
        for (const auto& one : Numbered(9)) c.WriteCase(one.data());
        c.Finish();
    }
    auto expect = first;
    for (const auto& one : Numbered(9)) expect.push_back(one);
    EXPECT_EQ(expect, DecodeAll(3, m.Data()));
    // The same bytes as writing all cases in one go.
    EXPECT_EQ(Encode(3, expect), m.Data());
}

class CompressedFileTest : public ::testing::Test {
  protected:
    void SetUp() override {
        fPath = ::testing::TempDir() + "qoracomp_" + std::to_string(::getpid()) + "_" +
                ::testing::UnitTest::GetInstance()->current_test_info()->name();
    }
    void TearDown() override { std::remove(fPath.c_str()); }
    Bytes Data() const {
        std::ifstream in(fPath, std::ios::binary);
        Bytes all((std::istreambuf_iterator<char>(in)), {});
        return Bytes(all.begin() + kHeader, all.end());
    }
    std::string fPath;
};

TEST_F(CompressedFileTest, WriteThenAppendThroughReopenedFile) {
    SparseFileIndex index;
    {
        QORA_FileStream out(fPath.c_str(), "wb");
        out.Write(std::string(kHeader, 'h').data(), kHeader);
        CompressedSystemFile c(1, &index, &out, kHeader);
        for (double v : {1.0, 2.0, 3.0}) c.WriteCase(Num(v).data());
    }
    EXPECT_EQ(Bytes({101, 102, 103, 0, 0, 0, 0, 0}), Data());
    {
        SparseFileIndex appendIndex;
        QORA_FileStream file(fPath.c_str(), "rb");
        CompressedSystemFile c(1, &appendIndex, &file, kHeader);
        c.PrepareAppend(3);
        EXPECT_EQ(3, c.Tell());
        for (double v : {4.0, 0.5}) c.WriteCase(Num(v).data());
        c.Finish();
    }
    Bytes expect = {101, 102, 103, 104, 253, 0, 0, 0};
    Append(expect, Num(0.5));
    EXPECT_EQ(expect, Data());
}

TEST_F(CompressedFileTest, AppendFailsWhenTheFileCannotBeReopened) {
    { QORA_FileStream out(fPath.c_str(), "wb"); }
    SparseFileIndex index;
    QORA_FileStream file(fPath.c_str(), "rb");
    CompressedSystemFile c(1, &index, &file, 0);
    std::remove(fPath.c_str());
    ::mkdir(fPath.c_str(), 0700);  // the name now belongs to a directory
    EXPECT_EQ(std::to_string(kErrCannotOpen) + " m_->_file.Open(m_->_file.Name(), \"r+b\")",
              Raised([&] { c.PrepareAppend(0); }));
    ::rmdir(fPath.c_str());
}

}  // namespace
