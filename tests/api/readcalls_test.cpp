// Opening and closing through the exported calls.
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

// Refusals leave no handle; the table holds a hundred files, hands out the
// lowest free number and then refuses, and a close takes any mode once.
TEST(OpenAndClose, RefusalsLeaveNoHandleAndTheLowestFreeNumberComesBack) {
    const OneVariableFile file;
    const std::string shortFile =
        file.fBuilder.WriteTemp(fixture::Truncated(file.fBuilder.Build(), 100), "short.qsf");
    for (const char* path : {"/nonexistent/absent.qsf", shortFile.c_str(), (const char*)nullptr}) {
        int handle = 3;
        EXPECT_EQ(qoraOpenRead(path, &handle), QORA_STATUS_BAD_FILE);
        EXPECT_EQ(handle, -1);
    }
    EXPECT_EQ(qoraOpenRead(file.path.c_str(), nullptr), QORA_STATUS_BAD_FILE);
    std::vector<std::unique_ptr<OpenHandle>> handles;
    for (int expected = 0; expected < 100; ++expected) {
        handles.push_back(std::make_unique<OpenHandle>());
        fixture::OpenForRead(file.path, *handles.back());
        ASSERT_EQ(handles.back()->get(), expected);
    }
    int extra = 12;
    EXPECT_EQ(qoraOpenRead(file.path.c_str(), &extra), QORA_STATUS_TOO_MANY_FILES);
    EXPECT_EQ(extra, -1);
    // A full table makes qoraOpenWrite report 1, and leave no file behind.
    fixture::TempDir dir;
    const std::string out = dir.Path() + "/new.qsf";
    EXPECT_EQ(qoraOpenWrite(out.c_str(), &extra), QORA_STATUS_CANNOT_OPEN);
    EXPECT_FALSE(FileExists(out));
    for (int closed : {37, 5}) {
        EXPECT_EQ(qoraCloseWrite(closed), QORA_STATUS_OK);  // any close takes any mode
        EXPECT_EQ(qoraCloseRead(closed), QORA_STATUS_BAD_FILE_HANDLE);
        handles[size_t(closed)]->Forget();
    }
    OpenHandle five, thirtySeven;
    fixture::OpenForRead(file.path, five);
    fixture::OpenForRead(file.path, thirtySeven);
    EXPECT_EQ(five.get() * 100 + thirtySeven.get(), 537);
    EXPECT_EQ(qoraCloseAppend(100), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(qoraCloseRead(-1), QORA_STATUS_BAD_FILE_HANDLE);
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
