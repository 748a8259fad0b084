// Opening, closing and the counts, through the exported calls on files made
// by the fixture builder, and the entry tables behind them.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <algorithm>
#include <fstream>
#include <iterator>
#include <memory>
#include <vector>

#include "api_handles.h"
#include "sysfile_builder.h"

namespace {

using fixture::OpenHandle;
using fixture::SysFileBuilder;

bool FileExists(const std::string& path) {
    struct stat info;
    return ::stat(path.c_str(), &info) == 0;
}

std::string Contents(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(in), {});
}

// A file with one numeric variable, there while this lives.
struct OneVariableFile {
    OneVariableFile() {
        fBuilder.Numeric("X");
        path = fBuilder.WriteTemp();
    }
    SysFileBuilder fBuilder;
    std::string path;
};

// The counts of variables and cases are checked by the round trip. Any
// negative count means unknown, and so do counts beyond 32 bits.
TEST(ReadCalls, CaseSizeAndCaseCounts) {
    for (const int64_t cases : {-5LL, 2147483648LL, 2147483647LL}) {
        SysFileBuilder b;
        b.Numeric("AGE");
        b.String("NAME", 20);  // 3 value units
        b.String("CODE", 3);
        b.header().caseCount = int32_t(std::max<int64_t>(cases, -1));
        if (cases > 2147483647LL) b.CaseCount64(cases);
        OpenHandle h;
        fixture::OpenForRead(b.WriteTemp(), h);
        int count = -5;
        EXPECT_EQ(qoraGetNumberofCases(h.get(), &count), QORA_STATUS_OK);
        EXPECT_EQ(count, cases == 2147483647LL ? 2147483647 : -1) << cases;
        EXPECT_EQ(qoraGetEstimatedNofCases(h.get(), &count), QORA_STATUS_OK);
        EXPECT_EQ(count, cases == 2147483647LL ? 2147483647 : -1) << cases;
        EXPECT_EQ(qoraGetCaseSize(h.get(), &count), QORA_STATUS_OK);
        EXPECT_EQ(count, 5 * 8);
    }
}

TEST(CountCalls, ClearOutputsOnBadHandlesAndRefuseNullOutputs) {
    OpenHandle h;
    fixture::OpenForRead(OneVariableFile().path, h);
    const struct {
        int (*call)(int, int*);
        int cleared;
    } calls[] = {{qoraGetNumberofVariables, 0}, {qoraGetNumberofCases, -1}, {qoraGetCaseSize, 0}};
    for (const auto& c : calls) {
        for (int handle : {-2147483647 - 1, -3, 5, 100, 2147483647}) {
            int count = 9;
            EXPECT_EQ(c.call(handle, &count), QORA_STATUS_BAD_FILE_HANDLE);
            EXPECT_EQ(count, c.cleared);
        }
        EXPECT_EQ(c.call(h.get(), nullptr), QORA_STATUS_BAD_FILE_HANDLE);
    }
}

TEST(OpenRead, RefusesMissingAndMalformedFilesLeavingNoHandle) {
    fixture::TempDir dir;
    SysFileBuilder b;
    b.Numeric("X");
    const std::string shortFile = b.WriteTemp(fixture::Truncated(b.Build(), 100), "short.qsf");
    for (const std::string& path : {dir.Path() + "/absent.qsf", shortFile}) {
        int handle = 3;
        EXPECT_EQ(qoraOpenRead(path.c_str(), &handle), QORA_STATUS_BAD_FILE) << path;
        EXPECT_EQ(handle, -1);
    }
    int handle = 3;
    EXPECT_EQ(qoraOpenRead(nullptr, &handle), QORA_STATUS_BAD_FILE);
    EXPECT_EQ(qoraOpenRead(b.WriteTemp().c_str(), nullptr), QORA_STATUS_BAD_FILE);
    // Nothing of the failed opens holds a slot.
    OpenHandle h;
    fixture::OpenForRead(b.WriteTemp(), h);
    EXPECT_EQ(h.get(), 0);
}

TEST(OpenRead, HundredHandlesThenFourAndTheLowestClosedNumberComesBack) {
    const OneVariableFile file;
    const std::string& path = file.path;
    std::vector<std::unique_ptr<OpenHandle>> handles;
    for (int expected = 0; expected < 100; ++expected) {
        handles.push_back(std::make_unique<OpenHandle>());
        fixture::OpenForRead(path, *handles.back());
        ASSERT_EQ(handles.back()->get(), expected);
    }
    int extra = 12;
    EXPECT_EQ(qoraOpenRead(path.c_str(), &extra), QORA_STATUS_TOO_MANY_FILES);
    EXPECT_EQ(extra, -1);
    // A full table makes qoraOpenWrite report 1, and leave no file behind.
    fixture::TempDir dir;
    const std::string out = dir.Path() + "/new.qsf";
    EXPECT_EQ(qoraOpenWrite(out.c_str(), &extra), QORA_STATUS_CANNOT_OPEN);
    EXPECT_EQ(extra, -1);
    EXPECT_FALSE(FileExists(out));

    for (int closed : {37, 5}) {
        EXPECT_EQ(qoraCloseRead(closed), QORA_STATUS_OK);
        handles[closed]->Forget();
    }
    OpenHandle five, thirtySeven;
    fixture::OpenForRead(path, five);
    fixture::OpenForRead(path, thirtySeven);
    EXPECT_EQ(five.get(), 5);
    EXPECT_EQ(thirtySeven.get(), 37);
}

TEST(CloseCalls, RefuseBadHandlesAndCloseAnyMode) {
    EXPECT_EQ(qoraCloseRead(100), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(qoraCloseRead(-1), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(qoraCloseAppend(0), QORA_STATUS_BAD_FILE_HANDLE);
    int handle = -1;
    ASSERT_EQ(qoraOpenRead(OneVariableFile().path.c_str(), &handle), QORA_STATUS_OK);
    EXPECT_EQ(qoraCloseWrite(handle), QORA_STATUS_OK);
    EXPECT_EQ(qoraCloseRead(handle), QORA_STATUS_BAD_FILE_HANDLE);
    fixture::TempDir dir;
    ASSERT_EQ(qoraOpenWrite((dir.Path() + "/w.qsf").c_str(), &handle), QORA_STATUS_OK);
    EXPECT_EQ(qoraCloseAppend(handle), QORA_STATUS_OK);
}

TEST(OpenWrite, GivesAnUncommittedWriteHandleAndCreatesNothingYet) {
    fixture::TempDir dir;
    const std::string path = dir.Path() + "/out.qsf";
    OpenHandle h;
    fixture::OpenForWrite(path, h);
    int value = 5;
    EXPECT_EQ(qoraGetNumberofCases(h.get(), &value), QORA_STATUS_NOT_OPENED_FOR_READING);
    EXPECT_EQ(value, -1);
    value = 5;
    EXPECT_EQ(qoraGetCaseSize(h.get(), &value), QORA_STATUS_DICT_NOT_COMMITTED);
    EXPECT_EQ(value, 0);
    ASSERT_EQ(qoraSetVarName(h.get(), "a", 0), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarName(h.get(), "b", 20), QORA_STATUS_OK);
    EXPECT_EQ(qoraGetNumberofVariables(h.get(), &value), QORA_STATUS_OK);
    EXPECT_EQ(value, 2);
    EXPECT_FALSE(FileExists(path));
}

TEST(OpenWrite, RefusesUnwritablePathsAndLeavesExistingFilesAlone) {
    fixture::TempDir dir;
    for (const std::string& path : {dir.Path() + "/no/such/dir/x.qsf", dir.Path()}) {
        int handle = 4;
        EXPECT_EQ(qoraOpenWrite(path.c_str(), &handle), QORA_STATUS_CANNOT_OPEN) << path;
        EXPECT_EQ(handle, -1);
    }
    int handle = 4;
    EXPECT_EQ(qoraOpenWrite(nullptr, &handle), QORA_STATUS_CANNOT_OPEN);

    const std::string existing = dir.Path() + "/existing.qsf";
    const std::string writeOnly = dir.Path() + "/writeonly.qsf";
    std::ofstream(existing) << "keep me";
    std::ofstream(writeOnly) << "data";
    ::chmod(writeOnly.c_str(), 0200);
    {
        OpenHandle h, w;
        fixture::OpenForWrite(existing, h);
        fixture::OpenForWrite(writeOnly, w);
    }
    EXPECT_EQ(Contents(existing), "keep me");
    ::chmod(writeOnly.c_str(), 0600);
    EXPECT_EQ(Contents(writeOnly), "data");  // unreadable: neither truncated nor removed
}

}  // namespace
