// Case data: the codes both compressing encoders write, malformed compressed
// data and random bytes; reading the cases of files in both byte orders, raw
// and compressed, in a random walk of reads and seeks against a model.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <functional>
#include <limits>
#include <memory>
#include <random>
#include <string>
#include <tuple>
#include <vector>

#include "CompressedSystemFile.h"
#include "SystemFileDataSource.h"
#include "case_files.h"
#include "dserror.h"
#include "inmemfile.h"
#include "sparsefileindex.h"
#include "sysfile_builder.h"

using namespace fixture;

namespace {

const int64_t kHeader = 16;  // bytes before the case data in every test file

// An in-memory file holding a header of kHeader bytes and then the data.
struct MemFile {
    explicit MemFile(const Bytes& data = {}) {
        const Bytes header(kHeader, 'h');
        file.Write(header.data(), kHeader);
        if (!data.empty()) file.Write(data.data(), static_cast<uint32_t>(data.size()));
    }
    QORA_InMemoryFile file;
    SparseFileIndex index;
};

// Cases are the bytes of their units, one after the other.
Bytes Encode(uint32_t units, const std::vector<Bytes>& cases) {
    MemFile m;
    CompressedSystemFile c(units, &m.index, &m.file, kHeader);
    for (const Bytes& one : cases) c.WriteCase(one.data());
    c.Finish();
    return Bytes(m.file.Data() + kHeader, m.file.Data() + m.file.Size());
}

std::vector<Bytes> DecodeAll(uint32_t units, const Bytes& data) {
    MemFile m(data);
    CompressedSystemFile c(units, &m.index, &m.file, kHeader);
    std::vector<Bytes> cases;
    Bytes one(8 * units);
    while (c.ReadCase(one.data(), nullptr) == units) cases.push_back(one);
    return cases;
}

// The library's encoder and the fixture builder's write the expected bytes
// for the cases (numbers and strings of width 8), and they decode back.
void ExpectBothEncoders(const std::vector<std::vector<Value>>& rows, const Bytes& expected) {
    SysFileBuilder b;
    b.Compressed();
    for (size_t i = 0; i < rows.front().size(); ++i)
        rows.front()[i].IsString() ? b.String("V" + std::to_string(i), 8)
                                   : b.Numeric("V" + std::to_string(i));
    std::vector<Bytes> cases;
    for (const auto& row : rows) {
        b.Case(row);
        cases.emplace_back();
        for (const Value& value : row) {
            const Bytes unit = b.Unit(value);
            cases.back().insert(cases.back().end(), unit.begin(), unit.end());
        }
    }
    const Bytes file = b.Build();
    const uint32_t units = uint32_t(rows.front().size());
    EXPECT_EQ(Bytes(file.begin() + long(b.DataStart()), file.end()), expected) << "builder";
    EXPECT_EQ(Encode(units, cases), expected) << "library";
    EXPECT_EQ(DecodeAll(units, expected), cases);
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

double Number(const QORA_InputCaseIterator& it, int index) {
    double value;
    std::memcpy(&value, it.ValuePointer(index), sizeof value);
    return value;
}

class SystemFileIteratorTest : public ::testing::TestWithParam<DataForm> {};
INSTANTIATE_TEST_SUITE_P(Forms, SystemFileIteratorTest, AllDataForms(), DataFormName);

}  // namespace

TEST(CompressedCodes, BothEncodersWriteTheCodesOfTheLayout) {
    const double inf = std::numeric_limits<double>::infinity();
    // clang-format off
    const std::pair<Value, int> codes[] = {{0.0, 100}, {-99.0, 1}, {151.0, 251}, {100.0, 200},
        {1.0, 101}, {kSysmis, 255}, {"", 254}, {"ABCDEFGH", 253}, {"A", 253}, {0.5, 253},
        {-0.0, 253}, {-100.0, 253}, {152.0, 253}, {255.0, 253}, {1.0000001, 253}, {-1.5, 253},
        {1e300, 253}, {-1e300, 253}, {-99.5, 253}, {-100.5, 253}, {151.5, 253}, {inf, 253},
        {-inf, 253}, {std::numeric_limits<double>::quiet_NaN(), 253}, {-2147483648.0, 253},
        {4294967297.0, 253}, {5e-324, 253}};
    // clang-format on
    // Each alone, then all in one case: whole blocks are coded eight units at a time.
    std::vector<Value> row;
    Bytes all;
    for (size_t i = 0, block = 0; i < std::size(codes); ++i) {
        const auto& [value, code] = codes[i];
        SCOPED_TRACE(value.IsString() ? value.Text() : std::to_string(value.Number()));
        const Bytes raw = code == 253 ? SysFileBuilder().Unit(value) : Bytes();
        Bytes expected = {uint8_t(code), 0, 0, 0, 0, 0, 0, 0};
        expected.insert(expected.end(), raw.begin(), raw.end());
        ExpectBothEncoders({{value}}, expected);
        row.push_back(value);
        if (i % 8 == 0) {  // a block's control bytes, then the raws of its codes
            block = all.size();
            all.resize(block + 8, 0);
        }
        all[block + i % 8] = uint8_t(code);
        all.insert(all.end(), raw.begin(), raw.end());
    }
    ExpectBothEncoders({row}, all);
    ExpectBothEncoders({{1.0, 2.0, 3.0, "ABCDEFGH"}},
                       {101, 102, 103, 253, 0, 0, 0, 0, 'A', 'B', 'C', 'D', 'E', 'F', 'G', 'H'});
    // Nine cells make one full block and one padded one.
    ExpectBothEncoders(std::vector<std::vector<Value>>(9, {1.0}),
                       {101, 101, 101, 101, 101, 101, 101, 101, 101, 0, 0, 0, 0, 0, 0, 0});
    EXPECT_TRUE(Encode(3, {}).empty());
}

// 252 at the start, in the middle and at the end of blocks ends them; the
// codes after it (253 among them) have no raw values.
TEST(CompressedRead, Code252EndsItsBlock) {
    Bytes data = {101, 252, 253, 253, 102, 102, 102, 102, 252, 253, 253, 253,
                  253, 253, 253, 253, 103, 253, 104, 105, 106, 107, 108, 252};
    const Bytes quarter = SysFileBuilder().Unit(0.25);
    data.insert(data.end(), quarter.begin(), quarter.end());
    std::vector<Bytes> expect;
    for (double x : {1.0, 3.0, 0.25, 4.0, 5.0, 6.0, 7.0, 8.0})
        expect.push_back(SysFileBuilder().Unit(x));
    EXPECT_EQ(expect, DecodeAll(1, data));
    EXPECT_TRUE(DecodeAll(2, Bytes(64, 0)).empty());
    EXPECT_TRUE(DecodeAll(2, Bytes(64, 252)).empty());
}

TEST(CompressedRead, MalformedDataRaiseTooShort) {
    Bytes raws = {253, 253, 0, 0, 0, 0, 0, 0};  // two raws announced, 1.5 present
    raws.insert(raws.end(), 12, 0);
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

    MemFile m({101, 0, 0, 0, 0, 0, 0, 0});
    CompressedSystemFile c(1, &m.index, &m.file, kHeader);
    EXPECT_EQ(kShort + "nRead", Raised([&] { c.Seek(11); }));  // no block there
    EXPECT_NE("nothing", Raised([&] { c.Seek(64); }));         // beyond the data
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

// A random walk of reads and seeks against a model of where the iterator
// stands, over every kind of header count: exact, unknown, too high, too low.
// Enough cases to cross the read-ahead and to fill the sparse index.
TEST_P(SystemFileIteratorTest, RandomWalkOfReadsAndSeeksFollowsTheModel) {
    const int n = 9000;
    std::mt19937 random(7);
    for (int32_t claimed : {n, -1, n + 3, 3}) {
        SCOPED_TRACE(claimed);
        SysFileBuilder b(std::get<0>(GetParam()));
        b.Compressed(std::get<1>(GetParam()));
        StandardCases(b, n);
        b.header().caseCount = claimed;
        const auto source = std::make_unique<SystemFileDataSource>(b.WriteTemp().c_str());
        const std::unique_ptr<QORA_InputCaseIterator> it(source->NewIterator(nullptr));
        EXPECT_TRUE(it->CanSeek());
        EXPECT_EQ(source->CaseCount(), claimed);
        for (int i = 0; i < n; ++i) ASSERT_TRUE(it->ReadCase()) << i;
        EXPECT_EQ(source->CaseCount(), claimed);
        int64_t at = n, current = n - 1;  // the model: next case, case in the buffer
        for (int step = 0; step < 400; ++step) {
            const int op = int(random() % 4);
            if (op == 0) {
                // Beyond the end, before the first case, the last case, the case just
                // read again, or anywhere.
                const int64_t targets[] = {int64_t{1} << 40, -1, n - 1, current,
                                           int64_t(random() % (n + 20))};
                const int64_t to = targets[std::min<uint64_t>(random() % 8, 4)];
                ASSERT_EQ(it->SeekCase(to), to >= 0);
                if (to >= 0) at = to;
                ASSERT_EQ(it->TellCase(), at);
            } else if (op == 3) {
                double record[4];
                ASSERT_EQ(it->ReadCaseInto(record), at < n) << at;
                if (at >= n) continue;
                EXPECT_EQ(record[0], ExpectedX(int(at)));
                EXPECT_EQ(std::string(reinterpret_cast<char*>(&record[1]), 16),
                          ExpectedS(int(at)) + "    ");
                ++at;
                EXPECT_EQ(Number(*it, 0), ExpectedX(int(current)));
            } else if (at < n) {
                current = at++;
                ASSERT_TRUE(it->ReadCase()) << current;
                EXPECT_EQ(Number(*it, 0), ExpectedX(int(current)));
                EXPECT_EQ(std::string(static_cast<const char*>(it->ValuePointer(1)), 16),
                          ExpectedS(int(current)) + "    ");
                EXPECT_EQ(Number(*it, 2), ExpectedY(int(current)));
            } else {
                ASSERT_FALSE(it->ReadCase()) << at;
                ASSERT_FALSE(it->ReadCase()) << at;
                ASSERT_EQ(source->CaseCount(), n);
            }
        }
    }
}
