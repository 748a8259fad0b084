#include <gtest/gtest.h>

#include <cstring>
#include <memory>
#include <random>
#include <string>

#include "SystemFileDataSource.h"
#include "case_files.h"
#include "dserror.h"
#include "reader_support.h"

namespace {

using namespace fixture;

using IteratorPtr = std::unique_ptr<QORA_InputCaseIterator>;

double Number(const QORA_InputCaseIterator& it, int index) {
    double value;
    std::memcpy(&value, it.ValuePointer(index), sizeof value);
    return value;
}

std::string Text(const QORA_InputCaseIterator& it, int index, size_t width) {
    return std::string(static_cast<const char*>(it.ValuePointer(index)), width);
}

// The condition of the SystemFileException a read raises; empty when none.
std::string ReadFailure(QORA_InputCaseIterator& it) {
    try {
        it.ReadCase();
    } catch (const SystemFileException& e) {
        return std::to_string(e.Number()) + " " + e.Condition();
    }
    return "";
}

class SystemFileIteratorTest : public ::testing::TestWithParam<DataForm> {
  protected:
    SystemFileIteratorTest() : b(std::get<0>(GetParam())) { b.Compressed(std::get<1>(GetParam())); }

    void Open(int cases, std::optional<int32_t> headerCount = std::nullopt) {
        StandardCases(b, cases);
        if (headerCount) b.header().caseCount = *headerCount;
        it.reset();  // an iterator goes before its source
        source = OpenFixture(b.WriteTemp());
        it.reset(source->NewIterator(nullptr));
    }

    void ExpectCase(int i) {
        ASSERT_TRUE(it->ReadCase()) << "case " << i;
        EXPECT_EQ(Number(*it, 0), ExpectedX(i));
        EXPECT_EQ(Text(*it, 1, 16), ExpectedS(i) + "    ");
        EXPECT_EQ(Number(*it, 2), ExpectedY(i));
    }

    SysFileBuilder b;
    std::unique_ptr<SystemFileDataSource> source;
    IteratorPtr it;
};

INSTANTIATE_TEST_SUITE_P(Forms, SystemFileIteratorTest, AllDataForms(), DataFormName);

}  // namespace

TEST_P(SystemFileIteratorTest, ReadsEveryCaseThenReportsTheEndAgainAndAgain) {
    Open(7);
    EXPECT_TRUE(it->CanSeek());
    for (int i = 0; i < 7; ++i) ExpectCase(i);
    EXPECT_FALSE(it->ReadCase());
    EXPECT_FALSE(it->ReadCase());
    EXPECT_EQ(it->TellCase(), 7);
    EXPECT_EQ(source->CaseCount(), 7);
}

TEST_P(SystemFileIteratorTest, AnUnknownCountBecomesKnownAtTheEnd) {
    Open(7, -1);
    EXPECT_EQ(source->CaseCount(), -1);
    for (int i = 0; i < 7; ++i) ExpectCase(i);
    EXPECT_EQ(source->CaseCount(), -1);
    EXPECT_FALSE(it->ReadCase());
    EXPECT_EQ(source->CaseCount(), 7);
}

TEST_P(SystemFileIteratorTest, AHeaderCountThatLiesIsCorrectedAtTheEnd) {
    for (int32_t claimed : {10, 3}) {
        SCOPED_TRACE(claimed);
        b = SysFileBuilder(std::get<0>(GetParam()));
        b.Compressed(std::get<1>(GetParam()));
        Open(7, claimed);
        EXPECT_EQ(source->CaseCount(), claimed);
        for (int i = 0; i < 7; ++i) ExpectCase(i);
        EXPECT_FALSE(it->ReadCase());
        EXPECT_EQ(source->CaseCount(), 7);
    }
}

// The end met after a seek beyond it counts the cases the file holds, not
// the case asked for.
TEST_P(SystemFileIteratorTest, ASeekFarBeyondTheEndReadsNothingAndCountsTheCases) {
    Open(7, -1);
    ASSERT_TRUE(it->SeekCase(1000));
    EXPECT_EQ(it->TellCase(), 1000);
    EXPECT_FALSE(it->ReadCase());
    EXPECT_EQ(source->CaseCount(), 7);
    ASSERT_TRUE(it->SeekCase(6));
    ExpectCase(6);
    EXPECT_FALSE(it->ReadCase());
    ASSERT_TRUE(it->SeekCase(int64_t{1} << 40));
    EXPECT_FALSE(it->ReadCase());
    EXPECT_EQ(source->CaseCount(), 7);
}

TEST_P(SystemFileIteratorTest, SeeksForwardBackwardAndToTheCaseJustRead) {
    Open(7);
    ASSERT_TRUE(it->SeekCase(5));
    ExpectCase(5);
    ASSERT_TRUE(it->SeekCase(2));
    ExpectCase(2);
    ExpectCase(3);
    ASSERT_TRUE(it->SeekCase(3));
    ExpectCase(3);
    ASSERT_TRUE(it->SeekCase(0));
    ExpectCase(0);
}

TEST_P(SystemFileIteratorTest, PositionsBeforeTheFirstCaseAreRefused) {
    Open(3);
    ExpectCase(0);
    EXPECT_FALSE(it->SeekCase(-1));
    EXPECT_EQ(it->TellCase(), 1);
    ExpectCase(1);
}

TEST_P(SystemFileIteratorTest, IteratorsReadIndependentlyAndAreCounted) {
    Open(4);
    EXPECT_EQ(source->LiveIterators(), 1);
    {
        IteratorPtr other(source->NewIterator(nullptr));
        EXPECT_EQ(source->LiveIterators(), 2);
        ExpectCase(0);
        ExpectCase(1);
        ASSERT_TRUE(other->ReadCase());
        EXPECT_EQ(Number(*other, 0), 0.0);
        ExpectCase(2);
    }
    EXPECT_EQ(source->LiveIterators(), 1);
    it.reset();
    EXPECT_EQ(source->LiveIterators(), 0);
}

TEST_P(SystemFileIteratorTest, FillsTheCallersBuffer) {
    Open(2);
    auto buffer = std::make_unique<double[]>(4);
    IteratorPtr own(source->NewIterator(buffer.get()));
    ASSERT_TRUE(own->ReadCase());
    own.reset();
    EXPECT_EQ(buffer[0], 0.0);
    EXPECT_EQ(std::memcmp(&buffer[1], "case 0          ", 16), 0);
    EXPECT_EQ(buffer[3], ExpectedY(0));
}

// Enough cases to cross the read-ahead and to fill the sparse index.
TEST_P(SystemFileIteratorTest, RandomSeeksOverManyCasesFindTheirCases) {
    const int n = 9000;
    Open(n);
    std::mt19937 random(7);
    for (int round = 0; round < 300; ++round) {
        const int i = int(random() % (n + 20));
        ASSERT_TRUE(it->SeekCase(i));
        if (i >= n) {
            EXPECT_FALSE(it->ReadCase());
            continue;
        }
        ExpectCase(i);
        if (i + 1 < n) ExpectCase(i + 1);
    }
    ASSERT_TRUE(it->SeekCase(0));
    for (int i = 0; i < n; ++i) {
        ASSERT_TRUE(it->ReadCase());
        ASSERT_EQ(Number(*it, 0), ExpectedX(i));
    }
    EXPECT_FALSE(it->ReadCase());
}

TEST_P(SystemFileIteratorTest, AFileWithoutVariablesHasNoCases) {
    source = OpenFixture(b.WriteTemp());
    it.reset(source->NewIterator(nullptr));
    EXPECT_FALSE(it->ReadCase());
    EXPECT_EQ(source->CaseCount(), 0);
}

// The plan comes from the very long strings record; here it is installed
// as that record's handler would.
TEST_P(SystemFileIteratorTest, VeryLongStringsAreJoinedFromTheirSegments) {
    std::string text;
    for (int i = 0; i < 300; ++i) text += char('A' + i % 26);
    b.Numeric("A");
    b.String("S", 300);
    b.Numeric("B");
    b.Case({1.5, text, -2.0});
    b.Case({2.0, "short", 3.0});
    source = OpenFixture(b.WriteTemp());
    ASSERT_EQ(source->ValueCount(), 40);
    auto plan = std::make_unique<SystemFileDechunker>();
    plan->Add(SystemFileDechunker::LeadingEntry(1));
    plan->Add(SystemFileDechunker::StringEntry(1, 300, 1, 1));
    source->Settings().fpDechunker = std::move(plan);
    it.reset(source->NewIterator(nullptr));
    ASSERT_TRUE(it->ReadCase());
    EXPECT_EQ(Number(*it, 0), 1.5);
    EXPECT_EQ(std::string(static_cast<const char*>(it->ValuePointer(1)), 304), text + "    ");
    EXPECT_EQ(
        *reinterpret_cast<const double*>(static_cast<const char*>(it->Case().Buffer()) + 39 * 8),
        -2.0);
    ASSERT_TRUE(it->ReadCase());
    EXPECT_EQ(std::string(static_cast<const char*>(it->ValuePointer(1)), 304),
              "short" + std::string(299, ' '));
    EXPECT_FALSE(it->ReadCase());
}

TEST_P(SystemFileIteratorTest, APlanThatLeavesTheCaseIsRefusedWhenTheIteratorIsMade) {
    Open(1);
    it.reset();
    auto plan = std::make_unique<SystemFileDechunker>();
    plan->Add(SystemFileDechunker::StringEntry(1, 300, 1, 1));
    source->Settings().fpDechunker = std::move(plan);
    try {
        it.reset(source->NewIterator(nullptr));
        FAIL() << "made an iterator over a plan beyond the case";
    } catch (const SystemFileException& e) {
        EXPECT_EQ(e.Number(), kErrBadFormat);
    }
    EXPECT_EQ(source->LiveIterators(), 0);
}

TEST_P(SystemFileIteratorTest, DataEndingInsideACaseIsAnErrorEveryTime) {
    StandardCases(b, 3);
    Bytes bytes = b.Build();
    // The last case loses its final unit (a raw value when compressed).
    const std::string path = b.WriteTemp(Truncated(bytes, bytes.size() - 8), "cut.qsf");
    source = OpenFixture(path);
    it.reset(source->NewIterator(nullptr));
    ExpectCase(0);
    ExpectCase(1);
    const std::string expected = std::get<1>(GetParam()) ? "1205 nRead == nu*sizeof(OBS)"
                                                         : "1205 readLen== 0 || readLen == caseLen";
    EXPECT_EQ(ReadFailure(*it), expected);
    EXPECT_EQ(ReadFailure(*it), expected);
    ASSERT_TRUE(it->SeekCase(1));
    ExpectCase(1);
}

// ------------------------------------------------------------- hand-made blocks

namespace {

class CompressedBlocksTest : public ByteOrders {
  protected:
    void SetUp() override {
        b = SysFileBuilder(GetParam());
        b.Compressed();
        b.header().caseCount = -1;
    }
    void Open() {
        it.reset();  // an iterator goes before its source
        source = OpenFixture(b.WriteTemp());
        it.reset(source->NewIterator(nullptr));
    }
    std::vector<double> ReadAllX() {
        std::vector<double> values;
        while (it->ReadCase()) values.push_back(Number(*it, 0));
        return values;
    }
    SysFileBuilder b;
    std::unique_ptr<SystemFileDataSource> source;
    IteratorPtr it;
};

INSTANTIATE_TEST_SUITE_P(Orders, CompressedBlocksTest,
                         ::testing::Values(Endian::Native, Endian::Swapped), EndianName);

}  // namespace

// A 252 ends the block wherever it stands: the codes after it, raw ones
// included, count for nothing.
TEST_P(CompressedBlocksTest, Code252EndsItsBlockAtAnyPosition) {
    for (int at = 0; at < 8; ++at) {
        SCOPED_TRACE(at);
        SetUp();
        b.Numeric("X");
        std::array<uint8_t, 8> codes;
        codes.fill(253);
        std::vector<double> expected;
        std::vector<Value> raws;
        for (int k = 0; k < at; ++k) {
            codes[k] = k % 2 ? 253 : 101 + k;
            expected.push_back(k % 2 ? 0.5 + k : 1.0 + k);
            if (k % 2) raws.push_back(0.5 + k);
        }
        codes[at] = 252;
        b.Data(b.Block(codes, raws));
        b.Data(b.Block({253, 0, 0, 0, 0, 0, 0, 0}, {Value(-7.5)}));
        expected.push_back(-7.5);
        Open();
        EXPECT_EQ(ReadAllX(), expected);
        EXPECT_EQ(source->CaseCount(), int64_t(expected.size()));
    }
}

TEST_P(CompressedBlocksTest, BlocksWithoutCellsEndCleanly) {
    b.Numeric("X");
    for (int k = 0; k < 2000; ++k) b.Data(b.Block({0, 0, 252, 253, 253, 0, 0, 0}, {}));
    Open();
    EXPECT_TRUE(ReadAllX().empty());
    EXPECT_EQ(source->CaseCount(), 0);
}

TEST_P(CompressedBlocksTest, ControlBytesCutShortAreAnError) {
    b.Numeric("X");
    b.Data(b.Block({101, 102, 0, 0, 0, 0, 0, 0}, {}));
    b.Data({103, 104, 105});
    Open();
    for (double x : {1.0, 2.0}) {
        ASSERT_TRUE(it->ReadCase());
        EXPECT_EQ(Number(*it, 0), x);
    }
    EXPECT_EQ(ReadFailure(*it), "1205 nRead == 0");
}

TEST_P(CompressedBlocksTest, DataEndingInsideACaseAreAnError) {
    b.Numeric("X");
    b.Numeric("Y");
    b.String("S", 20);
    b.Numeric("Z");
    // One whole case of 6 cells, then 3 cells of the next.
    b.Data(b.Block({101, 102, 254, 254, 254, 103, 104, 105}, {}));
    b.Data(b.Block({254, 0, 0, 0, 0, 0, 0, 0}, {}));
    Open();
    ASSERT_TRUE(it->ReadCase());
    EXPECT_EQ(Number(*it, 3), 3.0);
    EXPECT_EQ(ReadFailure(*it), "1205 iCell == 0");
    // Positioning over the cut case meets the same end.
    ASSERT_TRUE(it->SeekCase(5));
    EXPECT_EQ(ReadFailure(*it), "1205 iCell == 0");
}

// Raw numbers are reversed for a file of the other order; codes are bytes.
TEST_P(CompressedBlocksTest, RawCellsFollowTheFileOrderAndStringsNever) {
    b.Numeric("X");
    b.String("S", 8);
    b.Data(b.Block({253, 253, 255, 254, 0, 0, 0, 0}, {Value(1e300), Value("ABCDEFGH")}));
    Open();
    ASSERT_TRUE(it->ReadCase());
    EXPECT_EQ(Number(*it, 0), 1e300);
    EXPECT_EQ(Text(*it, 1, 8), "ABCDEFGH");
    ASSERT_TRUE(it->ReadCase());
    EXPECT_EQ(Number(*it, 0), kSysmis);
    EXPECT_EQ(Text(*it, 1, 8), "        ");
    EXPECT_FALSE(it->ReadCase());
}

TEST_P(SystemFileIteratorTest, TheLastCaseCanBeReadAgainAfterTheEnd) {
    Open(3);
    for (int i = 0; i < 3; ++i) ExpectCase(i);
    EXPECT_FALSE(it->ReadCase());
    ASSERT_TRUE(it->SeekCase(2));
    ExpectCase(2);
    EXPECT_FALSE(it->ReadCase());
}

// 24-byte cases never line up with the read-ahead or the stream's blocks.
TEST_P(SystemFileIteratorTest, CasesStraddlingTheReadAheadArriveWhole) {
    const int n = 15000;
    b.Numeric("X");
    b.String("S", 9);
    for (int i = 0; i < n; ++i) b.Case({i * 0.5, std::to_string(i)});
    source = OpenFixture(b.WriteTemp());
    it.reset(source->NewIterator(nullptr));
    for (int i = 0; i < n; ++i) {
        ASSERT_TRUE(it->ReadCase());
        ASSERT_EQ(Number(*it, 0), i * 0.5);
        const std::string digits = std::to_string(i);
        ASSERT_EQ(Text(*it, 1, 16), digits + std::string(16 - digits.size(), ' '));
    }
    EXPECT_FALSE(it->ReadCase());
    EXPECT_EQ(source->CaseCount(), n);
}
