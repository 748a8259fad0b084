// Writing, appending and copying files through the exported calls, the
// access rules of write and append handles, and failing writes.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <cstring>
#include <string>
#include <vector>

#include "api_handles.h"
#include "sysfile_builder.h"

using fixture::OpenHandle;

namespace {

// Case i of the dictionary below: a number and strings of width 8 and 255.
struct Row {
    double number;
    std::string code, text;
};

std::vector<Row> Rows(int count, int from = 0) {
    std::vector<Row> rows;
    for (int i = from; i < from + count; ++i)
        rows.push_back({i % 7 ? i * 0.5 - 20.0 : fixture::kSysmis,
                        i % 3 ? "c" + std::to_string(i) : "",
                        std::string(size_t(i % 256), char('a' + i % 26))});
    return rows;
}

// Even rows go value by value, odd rows as whole cases.
void WriteRows(int h, const std::vector<Row>& rows) {
    for (size_t i = 0; i < rows.size(); ++i) {
        const Row& row = rows[i];
        char record[8 * 34];
        std::memset(record, ' ', sizeof record);
        std::memcpy(record, &row.number, 8);
        std::memcpy(record + 8, row.code.data(), row.code.size());
        std::memcpy(record + 16, row.text.data(), row.text.size());
        if (i % 2) {
            ASSERT_EQ(qoraWholeCaseOut(h, record), QORA_STATUS_OK);
            continue;
        }
        ASSERT_EQ(qoraSetValueNumeric(h, 1.0, row.number), QORA_STATUS_OK);
        ASSERT_EQ(qoraSetValueChar(h, 2.0, row.code.c_str()), QORA_STATUS_OK);
        ASSERT_EQ(qoraSetValueChar(h, 3.9, row.text.c_str()), QORA_STATUS_OK);
        ASSERT_EQ(qoraCommitCaseRecord(h), QORA_STATUS_OK);
    }
}

std::string WriteFile(const std::string& path, bool compressed, const std::vector<Row>& rows) {
    OpenHandle h;
    fixture::OpenForWrite(path, h);
    EXPECT_EQ(qoraSetVarName(h.get(), "Amount", 0), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetVarName(h.get(), "code", 8), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetVarName(h.get(), "TEXT", 255), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetVarLabel(h.get(), "Amount", "Amount paid"), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetVarNValueLabel(h.get(), "Amount", 1.0, "One"), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetVarCValueLabel(h.get(), "code", "c1", "First"), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetCaseWeightVar(h.get(), "amount"), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetIdString(h.get(), "Round trip"), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetCompression(h.get(), compressed ? 5 : 0), QORA_STATUS_OK);
    EXPECT_EQ(qoraCommitHeader(h.get()), QORA_STATUS_OK);
    WriteRows(h.get(), rows);
    return path;
}

// The file holds exactly these cases, and says so.
void ExpectRows(const std::string& path, const std::vector<Row>& rows) {
    OpenHandle h;
    fixture::OpenForRead(path, h);
    int count = 0;
    EXPECT_EQ(qoraGetNumberofCases(h.get(), &count), QORA_STATUS_OK);
    EXPECT_EQ(count, int(rows.size()));
    for (const Row& row : rows) {
        ASSERT_EQ(qoraReadCaseRecord(h.get()), QORA_STATUS_OK);
        double number = 0;
        char code[9], text[256];
        EXPECT_EQ(qoraGetValueNumeric(h.get(), 1.0, &number), QORA_STATUS_OK);
        EXPECT_EQ(qoraGetValueChar(h.get(), 2.0, code, sizeof code), QORA_STATUS_OK);
        EXPECT_EQ(qoraGetValueChar(h.get(), 3.0, text, sizeof text), QORA_STATUS_OK);
        EXPECT_EQ(number, row.number);
        EXPECT_EQ(std::string(code), (row.code + std::string(8, ' ')).substr(0, 8));
        EXPECT_EQ(std::string(text), (row.text + std::string(255, ' ')).substr(0, 255));
    }
    EXPECT_EQ(qoraReadCaseRecord(h.get()), QORA_WARN_END_OF_FILE);
}

class WriteCalls : public ::testing::TestWithParam<bool> {
  protected:
    fixture::TempDir fDir;
};
INSTANTIATE_TEST_SUITE_P(Forms, WriteCalls, ::testing::Bool(),
                         [](const auto& info) { return info.param ? "Compressed" : "Raw"; });

// Appended cases follow the ones already there (the compressed form continues
// its half-filled last block), and a copy starts with its source's dictionary.
TEST_P(WriteCalls, AppendAndCopy) {
    const std::string path = WriteFile(fDir.Path() + "/ap.qsf", GetParam(), Rows(5));
    {
        OpenHandle h;
        ASSERT_EQ(qoraOpenAppend(path.c_str(), h.out()), QORA_STATUS_OK);
        WriteRows(h.get(), Rows(4, 5));
    }
    ExpectRows(path, Rows(9));

    const std::string copy = fDir.Path() + "/copy.qsf";
    {
        OpenHandle h;
        ASSERT_EQ(qoraOpenWriteCopy(copy.c_str(), path.c_str(), h.out()), QORA_STATUS_OK);
        EXPECT_EQ(qoraCommitHeader(h.get()), QORA_STATUS_OK);
        WriteRows(h.get(), Rows(3, 10));
    }
    ExpectRows(copy, Rows(3, 10));
    OpenHandle h;
    fixture::OpenForRead(copy, h);
    char text[121];
    EXPECT_EQ(qoraGetVarLabel(h.get(), "amount", text), QORA_STATUS_OK);
    EXPECT_STREQ(text, "Amount paid");
}

TEST(WriteAccess, StatusesFollowModeAndCommitment) {
    fixture::TempDir dir;
    const std::string path = WriteFile(dir.Path() + "/a.qsf", false, Rows(1));
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

    // A half-built case is dropped at the close.
    const std::string half = WriteFile(dir.Path() + "/half.qsf", true, Rows(3));
    OpenHandle append;
    ASSERT_EQ(qoraOpenAppend(half.c_str(), append.out()), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetValueNumeric(append.get(), 1.0, 5.0), QORA_STATUS_OK);
    EXPECT_EQ(qoraCloseAppend(append.get()), QORA_STATUS_OK);
    append.Forget();
    ExpectRows(half, Rows(3));
}

}  // namespace
