// The access rules of read, write and append handles, and failing writes.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <string>

#include "api_handles.h"
#include "sysfile_builder.h"

using fixture::OpenHandle;

namespace {

// A file of two variables, a number and a string of width 8, and its cases.
std::string BuiltFile(fixture::SysFileBuilder& b, int cases) {
    b.Numeric("X");
    b.String("CODE", 8);
    for (int i = 0; i < cases; ++i) b.Case({i * 1.5, "c" + std::to_string(i)});
    return b.WriteTemp();
}

TEST(WriteAccess, StatusesFollowModeAndCommitment) {
    fixture::TempDir dir;
    fixture::SysFileBuilder b;
    const std::string path = BuiltFile(b, 1);
    OpenHandle read, fresh, committed, append;
    fixture::OpenForRead(path, read);
    fixture::OpenForWrite(dir.Path() + "/b.qsf", fresh);
    fixture::OpenForWrite(dir.Path() + "/c.qsf", committed);
    ASSERT_EQ(qoraSetVarName(committed.get(), "x", 0), QORA_STATUS_OK);
    ASSERT_EQ(qoraCommitHeader(committed.get()), QORA_STATUS_OK);
    ASSERT_EQ(qoraOpenAppend(path.c_str(), append.out()), QORA_STATUS_OK);
    const struct {
        const char* call;
        int (*run)(int);
        int read, fresh, committed, append;
    } rules[] = {
        {"CommitHeader", qoraCommitHeader, 8, 11, 30, 30},
        {"SetVarName", [](int h) { return qoraSetVarName(h, "y", 0); }, 8, 0, 30, 30},
        {"SetVarLabel", [](int h) { return qoraSetVarLabel(h, "x", "l"); }, 8, 12, 30, 30},
        {"SetVarNValueLabel", [](int h) { return qoraSetVarNValueLabel(h, "x", 1, "l"); }, 8, 12,
         30, 30},
        {"SetCompression", [](int h) { return qoraSetCompression(h, 1); }, 8, 0, 30, 30},
        {"SetValueNumeric", [](int h) { return qoraSetValueNumeric(h, 1.0, 2.0); }, 8, 31, 0, 0},
        {"CommitCaseRecord", qoraCommitCaseRecord, 8, 31, 0, 0},
        {"ReadCaseRecord", qoraReadCaseRecord, 0, 9, 9, 9},
    };
    // The fresh handle last: its define calls change it.
    for (const auto& rule : rules) {
        EXPECT_EQ(rule.run(read.get()), rule.read) << rule.call;
        EXPECT_EQ(rule.run(committed.get()), rule.committed) << rule.call;
        EXPECT_EQ(rule.run(append.get()), rule.append) << rule.call;
    }
    for (const auto& rule : rules) EXPECT_EQ(rule.run(fresh.get()), rule.fresh) << rule.call;

    char name[9] = "x";
    EXPECT_EQ(qoraGetVarCompatName(fresh.get(), "y", name), QORA_STATUS_DICT_NOT_COMMITTED);
    EXPECT_EQ(qoraGetVarCompatName(committed.get(), "x", name), QORA_STATUS_OK);
    EXPECT_STREQ(name, "X");
    EXPECT_EQ(qoraSetValueChar(append.get(), 2.0, "123456789"), QORA_STATUS_STRING_TOO_LONG);
}

// Failing writes give the calls' statuses; closing never crashes and never
// leaves a count above the cases in the file.
TEST(WriteFailures, FailedWritesReportTheirStatus) {
    fixture::TempDir dir;
    const std::string gone = dir.Path() + "/gone";
    ASSERT_EQ(mkdir(gone.c_str(), 0700), 0);
    OpenHandle h;
    fixture::OpenForWrite(gone + "/x.qsf", h);
    ASSERT_EQ(qoraSetVarName(h.get(), "x", 0), QORA_STATUS_OK);
    ASSERT_EQ(rmdir(gone.c_str()), 0);
    EXPECT_EQ(qoraCommitHeader(h.get()), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(qoraSetVarName(h.get(), "y", 0), QORA_STATUS_OK);  // still uncommitted

    OpenHandle full;  // every write of the device fails once its buffer fills
    fixture::OpenForWrite("/dev/full", full);
    ASSERT_EQ(qoraSetVarName(full.get(), "x", 0), QORA_STATUS_OK);
    ASSERT_EQ(qoraCommitHeader(full.get()), QORA_STATUS_OK);
    int status = QORA_STATUS_OK;
    for (int i = 0; i < 100000 && status == QORA_STATUS_OK; ++i)
        status = qoraCommitCaseRecord(full.get());
    EXPECT_EQ(status, QORA_STATUS_WRITE_FAILED);
    EXPECT_EQ(qoraCommitCaseRecord(full.get()), QORA_STATUS_WRITE_FAILED);
    // The close reports what the file lacks, and frees the slot all the same.
    EXPECT_EQ(qoraCloseWrite(full.get()), QORA_STATUS_WRITE_FAILED);
    EXPECT_EQ(qoraCloseWrite(full.get()), QORA_STATUS_BAD_FILE_HANDLE);
    full.Forget();

    // A half-built case is dropped at the close.
    fixture::SysFileBuilder b;
    const std::string half = BuiltFile(b.Compressed(), 3);
    OpenHandle append;
    ASSERT_EQ(qoraOpenAppend(half.c_str(), append.out()), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetValueNumeric(append.get(), 1.0, 5.0), QORA_STATUS_OK);
    EXPECT_EQ(qoraCloseAppend(append.get()), QORA_STATUS_OK);
    append.Forget();
    OpenHandle read;
    fixture::OpenForRead(half, read);
    int count = 0;
    EXPECT_EQ(qoraGetNumberofCases(read.get(), &count), QORA_STATUS_OK);
    EXPECT_EQ(count, 3);
    for (int i = 0; i < 3; ++i) EXPECT_EQ(qoraReadCaseRecord(read.get()), QORA_STATUS_OK);
    EXPECT_EQ(qoraReadCaseRecord(read.get()), QORA_WARN_END_OF_FILE);
}

}  // namespace
