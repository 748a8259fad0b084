// The case reading calls, end to end over fixture files.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>
#include <string>

#include "case_files.h"
#include "qoraio32.h"

namespace {

using namespace fixture;

uint64_t Bits(double value) {
    uint64_t bits;
    std::memcpy(&bits, &value, sizeof bits);
    return bits;
}

int OpenCases(const std::string& path) {
    int handle = -1;
    EXPECT_EQ(qoraOpenRead(path.c_str(), &handle), QORA_STATUS_OK);
    return handle;
}

class CaseCallsTest : public ::testing::TestWithParam<DataForm> {
  protected:
    CaseCallsTest() : b(std::get<0>(GetParam())) { b.Compressed(std::get<1>(GetParam())); }
    ~CaseCallsTest() override {
        if (handle >= 0) qoraCloseRead(handle);
    }

    void Open(int cases) {
        StandardCases(b, cases);
        handle = OpenCases(b.WriteTemp());
    }

    // The values of the current case through the value calls.
    void ExpectValues(int i) {
        double x = -1, y = -1;
        char s[13];
        EXPECT_EQ(qoraGetValueNumeric(handle, 1.0, &x), QORA_STATUS_OK);
        EXPECT_EQ(qoraGetValueChar(handle, 2.0, s, sizeof s), QORA_STATUS_OK);
        EXPECT_EQ(qoraGetValueNumeric(handle, 3.0, &y), QORA_STATUS_OK);
        EXPECT_EQ(x, ExpectedX(i));
        EXPECT_EQ(std::string(s), ExpectedS(i));
        EXPECT_EQ(Bits(y), Bits(ExpectedY(i)));
    }

    SysFileBuilder b;
    int handle = -1;
};

INSTANTIATE_TEST_SUITE_P(Forms, CaseCallsTest, AllDataForms(), DataFormName);

}  // namespace

// A count that is unknown or lies either way is the true one once the end
// was met; the end warns until a seek, and a seek leaves no current case.
TEST_P(CaseCallsTest, ReadsToTheEndThenSeeks) {
    for (int32_t claimed : {-1, 9, 2}) {
        SCOPED_TRACE(claimed);
        if (handle >= 0) qoraCloseRead(handle);
        b = SysFileBuilder(std::get<0>(GetParam()));
        b.Compressed(std::get<1>(GetParam()));
        b.header().caseCount = claimed;
        Open(5);
        for (int i = 0; i < 5; ++i) {
            ASSERT_EQ(qoraReadCaseRecord(handle), QORA_STATUS_OK);
            ExpectValues(i);
        }
        EXPECT_EQ(qoraReadCaseRecord(handle), QORA_WARN_END_OF_FILE);
        EXPECT_EQ(qoraReadCaseRecord(handle), QORA_WARN_END_OF_FILE);
        int count = 0;
        EXPECT_EQ(qoraGetNumberofCases(handle, &count), QORA_STATUS_OK);
        EXPECT_EQ(count, 5);
    }
    double x;
    EXPECT_EQ(qoraGetValueNumeric(handle, 1.0, &x), QORA_STATUS_NO_CURRENT_CASE);
    EXPECT_EQ(qoraSeekNextCase(handle, 0), QORA_STATUS_OK);
    ASSERT_EQ(qoraReadCaseRecord(handle), QORA_STATUS_OK);
    ExpectValues(0);
    EXPECT_EQ(qoraSeekNextCase(handle, -1), QORA_STATUS_READ_FAILED);
    EXPECT_EQ(qoraGetValueNumeric(handle, 1.0, &x), QORA_STATUS_NO_CURRENT_CASE);
    EXPECT_EQ(qoraSeekNextCase(handle, 3), QORA_STATUS_OK);
    ASSERT_EQ(qoraReadCaseRecord(handle), QORA_STATUS_OK);
    ExpectValues(3);
    EXPECT_EQ(qoraSeekNextCase(handle, 2147483647), QORA_STATUS_OK);
    EXPECT_EQ(qoraReadCaseRecord(handle), QORA_WARN_END_OF_FILE);
}

// The whole case comes in the file's layout with numbers in the machine's
// order, whatever the file's.
TEST_P(CaseCallsTest, WholeCaseInCopiesTheCaseAndLeavesNoCurrentCase) {
    Open(3);
    double record[4];
    double x = 5;
    EXPECT_EQ(qoraGetValueNumeric(handle, 1.0, &x), QORA_STATUS_NO_CURRENT_CASE);
    EXPECT_EQ(x, 0.0);
    for (int i = 0; i < 3; ++i) {
        ASSERT_EQ(qoraWholeCaseIn(handle, record), QORA_STATUS_OK);
        EXPECT_EQ(record[0], ExpectedX(i));
        EXPECT_EQ(std::string(reinterpret_cast<char*>(&record[1]), 16), ExpectedS(i) + "    ");
        EXPECT_EQ(Bits(record[3]), Bits(ExpectedY(i)));
        EXPECT_EQ(qoraGetValueNumeric(handle, 1.0, &x), QORA_STATUS_NO_CURRENT_CASE);
    }
    EXPECT_EQ(qoraWholeCaseIn(handle, record), QORA_WARN_END_OF_FILE);
    EXPECT_EQ(qoraWholeCaseIn(handle, record), QORA_WARN_END_OF_FILE);
    EXPECT_EQ(qoraSeekNextCase(handle, 2), QORA_STATUS_OK);
    ASSERT_EQ(qoraWholeCaseIn(handle, record), QORA_STATUS_OK);
    EXPECT_EQ(record[0], 2.0);
}

// Variable handles are the index plus one, truncated; the type, the buffer
// and the file handle are checked, and a failed call clears its output.
TEST_P(CaseCallsTest, ValueCallsCheckTheirArguments) {
    Open(2);
    ASSERT_EQ(qoraReadCaseRecord(handle), QORA_STATUS_OK);
    double value = 9;
    char text[13] = "xxxxxxxxxxxx";
    for (double bad : {0.0, 0.99, -1.0, 4.0, 1e300, std::numeric_limits<double>::quiet_NaN()}) {
        EXPECT_EQ(qoraGetValueNumeric(handle, bad, &value), QORA_STATUS_BAD_VAR_HANDLE) << bad;
        EXPECT_EQ(qoraGetValueChar(handle, bad, text, 13), QORA_STATUS_BAD_VAR_HANDLE) << bad;
    }
    EXPECT_EQ(qoraGetValueNumeric(handle, 2.0, &value), QORA_STATUS_NUMERIC_REQUIRED);
    EXPECT_EQ(value, 0.0);
    EXPECT_EQ(qoraGetValueChar(handle, 1.0, text, 13), QORA_STATUS_STRING_REQUIRED);
    EXPECT_EQ(text[0], '\0');
    EXPECT_EQ(qoraGetValueChar(handle, 2.0, text, 12), QORA_STATUS_BUFFER_TOO_SHORT);
    EXPECT_EQ(qoraGetValueChar(handle, 2.0, text, 0), QORA_STATUS_BUFFER_TOO_SHORT);
    EXPECT_EQ(qoraGetValueNumeric(handle, 1.0, nullptr), QORA_STATUS_READ_FAILED);
    EXPECT_EQ(qoraGetValueChar(handle, 2.0, nullptr, 13), QORA_STATUS_READ_FAILED);
    EXPECT_EQ(qoraWholeCaseIn(handle, nullptr), QORA_STATUS_READ_FAILED);
    ASSERT_EQ(qoraReadCaseRecord(handle), QORA_STATUS_OK);
    EXPECT_EQ(qoraGetValueNumeric(handle, 3.9, &value), QORA_STATUS_OK);
    EXPECT_EQ(value, ExpectedY(1));
    EXPECT_EQ(qoraGetValueChar(handle, 2.9, text, 13), QORA_STATUS_OK);
    EXPECT_EQ(std::string(text, 13), ExpectedS(1) + '\0');
    EXPECT_EQ(qoraReadCaseRecord(-1), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(qoraWholeCaseIn(100, &value), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(qoraSeekNextCase(99, 0), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(qoraGetValueNumeric(handle + 1, 1.0, &value), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(qoraGetValueChar(handle + 1, 1.0, text, 4), QORA_STATUS_BAD_FILE_HANDLE);
}

// A case cut short is an error each time it is asked for, and leaves no
// half-read values behind.
TEST_P(CaseCallsTest, DataEndingInsideACaseFailsTheRead) {
    StandardCases(b, 3);
    const Bytes bytes = b.Build();
    handle = OpenCases(b.WriteTemp(Truncated(bytes, bytes.size() - 8), "cut.qsf"));
    ASSERT_EQ(qoraReadCaseRecord(handle), QORA_STATUS_OK);
    ASSERT_EQ(qoraReadCaseRecord(handle), QORA_STATUS_OK);
    EXPECT_EQ(qoraReadCaseRecord(handle), QORA_STATUS_READ_FAILED);
    double x;
    EXPECT_EQ(qoraGetValueNumeric(handle, 1.0, &x), QORA_STATUS_NO_CURRENT_CASE);
    double record[4];
    EXPECT_EQ(qoraWholeCaseIn(handle, record), QORA_STATUS_READ_FAILED);
    EXPECT_EQ(qoraSeekNextCase(handle, 1), QORA_STATUS_OK);
    ASSERT_EQ(qoraReadCaseRecord(handle), QORA_STATUS_OK);
    ExpectValues(1);
}

TEST(CaseCalls, SpecialValuesAreBitExact) {
    EXPECT_EQ(Bits(qoraSysmisVal()), 0xFFEFFFFFFFFFFFFFull);
    double sysmis = 0, lowest = 0, highest = 0;
    EXPECT_EQ(qoraHostSysmisVal(&sysmis), QORA_STATUS_OK);
    EXPECT_EQ(Bits(sysmis), 0xFFEFFFFFFFFFFFFFull);
    EXPECT_EQ(qoraLowHighVal(&lowest, &highest), QORA_STATUS_OK);
    EXPECT_EQ(Bits(lowest), 0xFFEFFFFFFFFFFFFEull);
    EXPECT_EQ(Bits(highest), 0x7FEFFFFFFFFFFFFFull);
    EXPECT_EQ(lowest, -1.7976931348623155e308);
    EXPECT_EQ(highest, 1.7976931348623157e308);
    EXPECT_EQ(qoraHostSysmisVal(nullptr), QORA_STATUS_OK);
    EXPECT_EQ(qoraLowHighVal(nullptr, nullptr), QORA_STATUS_OK);
}
