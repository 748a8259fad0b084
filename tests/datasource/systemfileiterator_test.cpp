// Reading cases of files in both byte orders, raw and compressed: a random walk
// of reads and seeks against a model.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <memory>
#include <random>
#include <string>

#include "SystemFileDataSource.h"
#include "case_files.h"
#include "reader_support.h"

namespace {

using namespace fixture;

double Number(const QORA_InputCaseIterator& it, int index) {
    double value;
    std::memcpy(&value, it.ValuePointer(index), sizeof value);
    return value;
}

std::string Text(const QORA_InputCaseIterator& it, int index, size_t width) {
    return std::string(static_cast<const char*>(it.ValuePointer(index)), width);
}

class SystemFileIteratorTest : public ::testing::TestWithParam<DataForm> {
  protected:
    // The standard cases in this form, under the header's count given.
    void Open(int cases, int32_t headerCount) {
        b = SysFileBuilder(std::get<0>(GetParam()));
        b.Compressed(std::get<1>(GetParam()));
        StandardCases(b, cases);
        b.header().caseCount = headerCount;
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
    std::unique_ptr<QORA_InputCaseIterator> it;
};

INSTANTIATE_TEST_SUITE_P(Forms, SystemFileIteratorTest, AllDataForms(), DataFormName);

}  // namespace

// A random walk of reads and seeks against a model of where the iterator
// stands, over every kind of header count: exact, unknown, too high, too low.
// Enough cases to cross the read-ahead and to fill the sparse index.
TEST_P(SystemFileIteratorTest, RandomWalkOfReadsAndSeeksFollowsTheModel) {
    const int n = 9000;
    std::mt19937 random(7);
    for (int32_t claimed : {n, -1, n + 3, 3}) {
        SCOPED_TRACE(claimed);
        Open(n, claimed);
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
                ExpectCase(int(current));
            } else {
                ASSERT_FALSE(it->ReadCase()) << at;
                ASSERT_FALSE(it->ReadCase()) << at;
                ASSERT_EQ(source->CaseCount(), n);
            }
        }
    }
}
