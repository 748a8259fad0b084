// Writing, appending and copying files through the exported calls, the
// access rules of write and append handles, and failing writes.
#include <gtest/gtest.h>
#include <strings.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstring>
#include <string>
#include <vector>

#include "api_handles.h"
#include "sysfile_builder.h"

using fixture::OpenHandle;

namespace {

const double kSysmis = fixture::kSysmis;

// Cases of the dictionary below: a number and two strings, one of them 255 wide.
struct Row {
    double number;
    std::string code;
    std::string text;
};

std::vector<Row> Rows(int count, int from = 0) {
    std::vector<Row> rows;
    for (int i = from; i < from + count; ++i) {
        const double number = i % 7 == 0 ? kSysmis : i * 0.5 - 20.0;
        rows.push_back({number, i % 3 ? "c" + std::to_string(i) : "",
                        std::string(size_t(i % 256), char('a' + i % 26))});
    }
    return rows;
}

void Define(int h, bool compressed) {
    ASSERT_EQ(qoraSetVarName(h, "Amount", 0), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarName(h, "code", 8), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarName(h, "TEXT", 255), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarLabel(h, "Amount", "Amount paid"), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarNMissingValues(h, "Amount", -2, 100.0, 200.0, 0.0), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarNValueLabel(h, "Amount", 1.0, "One"), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarCValueLabel(h, "code", "c1", "First"), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetCaseWeightVar(h, "amount"), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetIdString(h, "Round trip"), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetCompression(h, compressed ? 5 : 0), QORA_STATUS_OK);
}

// Even rows value by value, odd rows as whole cases.
void WriteRows(int h, const std::vector<Row>& rows) {
    for (size_t i = 0; i < rows.size(); ++i) {
        const Row& row = rows[i];
        if (i % 2 == 0) {
            ASSERT_EQ(qoraSetValueNumeric(h, 1.0, row.number), QORA_STATUS_OK);
            ASSERT_EQ(qoraSetValueChar(h, 2.0, row.code.c_str()), QORA_STATUS_OK);
            ASSERT_EQ(qoraSetValueChar(h, 3.9, row.text.c_str()), QORA_STATUS_OK);
            ASSERT_EQ(qoraCommitCaseRecord(h), QORA_STATUS_OK);
        } else {
            char record[8 * 34];
            std::memset(record, ' ', sizeof record);
            std::memcpy(record, &row.number, 8);
            std::memcpy(record + 8, row.code.data(), row.code.size());
            std::memcpy(record + 16, row.text.data(), row.text.size());
            ASSERT_EQ(qoraWholeCaseOut(h, record), QORA_STATUS_OK);
        }
    }
}

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
        EXPECT_EQ(std::string(code), row.code + std::string(8 - row.code.size(), ' '));
        EXPECT_EQ(std::string(text), row.text + std::string(255 - row.text.size(), ' '));
    }
    EXPECT_EQ(qoraReadCaseRecord(h.get()), QORA_WARN_END_OF_FILE);
}

std::string WriteFile(const std::string& path, bool compressed, const std::vector<Row>& rows) {
    OpenHandle h;
    fixture::OpenForWrite(path, h);
    Define(h.get(), compressed);
    EXPECT_EQ(qoraCommitHeader(h.get()), QORA_STATUS_OK);
    WriteRows(h.get(), rows);
    return path;
}

class WriteCalls : public ::testing::TestWithParam<bool> {
  protected:
    bool Compressed() const { return GetParam(); }
    fixture::TempDir fDir;
};
INSTANTIATE_TEST_SUITE_P(Forms, WriteCalls, ::testing::Bool(),
                         [](const auto& info) { return info.param ? "Compressed" : "Raw"; });

TEST_P(WriteCalls, RoundTripKeepsDictionaryAndCases) {
    const std::vector<Row> rows = Rows(300);
    const std::string path = WriteFile(fDir.Path() + "/rt.qsf", Compressed(), rows);
    ExpectRows(path, rows);

    OpenHandle h;
    fixture::OpenForRead(path, h);
    char text[256];
    int value = -1;
    EXPECT_EQ(qoraGetCompression(h.get(), &value), QORA_STATUS_OK);
    EXPECT_EQ(value, Compressed() ? 1 : 0);
    EXPECT_EQ(qoraGetIdString(h.get(), text), QORA_STATUS_OK);
    EXPECT_STREQ(text, "Round trip");
    EXPECT_EQ(qoraGetCaseWeightVar(h.get(), text), QORA_STATUS_OK);
    EXPECT_EQ(strcasecmp(text, "amount"), 0);
    EXPECT_EQ(qoraGetVarLabel(h.get(), "amount", text), QORA_STATUS_OK);
    EXPECT_STREQ(text, "Amount paid");
    EXPECT_EQ(qoraGetVarNValueLabel(h.get(), "amount", 1.0, text), QORA_STATUS_OK);
    EXPECT_STREQ(text, "One");
    EXPECT_EQ(qoraGetVarCValueLabel(h.get(), "code", "c1", text), QORA_STATUS_OK);
    EXPECT_STREQ(text, "First");
    EXPECT_EQ(qoraGetSystemString(h.get(), text), QORA_STATUS_OK);
    EXPECT_STREQ(text, "MS Windows Release 16.0 qoraio32.dll");
    char date[10], time[9];
    EXPECT_EQ(qoraGetTimeStamp(h.get(), date, time), QORA_STATUS_OK);
    EXPECT_EQ(std::strlen(date), 9u);
    EXPECT_EQ(std::strlen(time), 8u);
}

// Appending lands after the cases already there and counts them all; the
// compressed form continues its half-filled last block.
TEST_P(WriteCalls, AppendAddsCasesAfterTheExistingOnes) {
    const std::vector<Row> first = Rows(5), second = Rows(4, 5);
    const std::string path = WriteFile(fDir.Path() + "/ap.qsf", Compressed(), first);
    {
        OpenHandle h;
        ASSERT_EQ(qoraOpenAppend(path.c_str(), h.out()), QORA_STATUS_OK);
        EXPECT_EQ(qoraSetVarName(h.get(), "more", 0), QORA_STATUS_DICT_COMMITTED);
        WriteRows(h.get(), second);
    }
    std::vector<Row> all = first;
    all.insert(all.end(), second.begin(), second.end());
    ExpectRows(path, all);
}

TEST_P(WriteCalls, CopyCarriesTheDictionaryOfItsSource) {
    const std::string source = WriteFile(fDir.Path() + "/src.qsf", Compressed(), Rows(2));
    const std::string path = fDir.Path() + "/copy.qsf";
    {
        OpenHandle h;
        ASSERT_EQ(qoraOpenWriteCopy(path.c_str(), source.c_str(), h.out()), QORA_STATUS_OK);
        EXPECT_EQ(qoraCommitHeader(h.get()), QORA_STATUS_OK);
        WriteRows(h.get(), Rows(3, 10));
    }
    ExpectRows(path, Rows(3, 10));
    OpenHandle h;
    fixture::OpenForRead(path, h);
    char text[121];
    EXPECT_EQ(qoraGetVarLabel(h.get(), "amount", text), QORA_STATUS_OK);
    EXPECT_STREQ(text, "Amount paid");
    int handle = 7;
    EXPECT_EQ(qoraOpenWriteCopy(path.c_str(), (fDir.Path() + "/none").c_str(), &handle),
              QORA_STATUS_CANNOT_OPEN);
    EXPECT_EQ(handle, -1);
}

// The access rules of each mode and dictionary state, one call of each kind.
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
        {"SetVarName", [](int h) { return qoraSetVarName(h, "y", 0); },  //
         8, 0, 30, 30},
        {"SetCompression", [](int h) { return qoraSetCompression(h, 1); }, 8, 0, 30, 30},
        {"SetValueNumeric", [](int h) { return qoraSetValueNumeric(h, 1.0, 2.0); },  //
         8, 31, 0, 0},
        {"CommitCaseRecord", qoraCommitCaseRecord, 8, 31, 0, 0},
        {"ReadCaseRecord", qoraReadCaseRecord, 0, 9, 9, 9},
        {"SeekNextCase", [](int h) { return qoraSeekNextCase(h, 0); }, 0, 9, 9, 9},
    };
    for (const auto& rule : rules) {
        SCOPED_TRACE(rule.call);
        EXPECT_EQ(rule.run(read.get()), rule.read);
        EXPECT_EQ(rule.run(committed.get()), rule.committed);
        EXPECT_EQ(rule.run(append.get()), rule.append);
    }
    // The fresh handle last: its define calls succeed and would change it.
    for (const auto& rule : rules) EXPECT_EQ(rule.run(fresh.get()), rule.fresh) << rule.call;
}

TEST(WriteCalls, ValueCallsCheckTypesWidthsAndHandles) {
    fixture::TempDir dir;
    OpenHandle h;
    fixture::OpenForWrite(dir.Path() + "/v.qsf", h);
    Define(h.get(), false);
    int relInfo[3] = {1, 1, 1};
    EXPECT_EQ(qoraGetReleaseInfo(h.get(), relInfo), QORA_STATUS_OK);
    EXPECT_EQ(relInfo[0] + relInfo[1] + relInfo[2], 0);
    char name[9] = "x";
    EXPECT_EQ(qoraGetVarCompatName(h.get(), "amount", name), QORA_STATUS_DICT_NOT_COMMITTED);
    ASSERT_EQ(qoraCommitHeader(h.get()), QORA_STATUS_OK);
    EXPECT_EQ(qoraGetVarCompatName(h.get(), "nothing", name), QORA_STATUS_VAR_NOT_FOUND);
    EXPECT_EQ(qoraGetVarCompatName(h.get(), "amount", name), QORA_STATUS_OK);
    EXPECT_EQ(strcasecmp(name, "AMOUNT"), 0);
    EXPECT_EQ(qoraSetValueNumeric(h.get(), 2.0, 1.0), QORA_STATUS_NUMERIC_REQUIRED);
    EXPECT_EQ(qoraSetValueChar(h.get(), 1.0, "a"), QORA_STATUS_STRING_REQUIRED);
    EXPECT_EQ(qoraSetValueChar(h.get(), 2.0, "123456789"), QORA_STATUS_STRING_TOO_LONG);
    EXPECT_EQ(qoraSetValueNumeric(h.get(), 0.0, 1.0), QORA_STATUS_BAD_VAR_HANDLE);
    EXPECT_EQ(qoraSetValueNumeric(h.get(), 4.0, 1.0), QORA_STATUS_BAD_VAR_HANDLE);
    EXPECT_EQ(qoraWholeCaseOut(h.get(), nullptr), QORA_STATUS_WRITE_FAILED);
}

bool Exists(const std::string& path) {
    struct stat st;
    return stat(path.c_str(), &st) == 0;
}

// A file that cannot be written fails with the calls' statuses; closing then
// never crashes and never leaves a count above the cases in the file.
TEST(WriteFailures, FailedWritesReportTheirStatus) {
    fixture::TempDir dir;
    {  // the directory is gone before the commit
        const std::string sub = dir.Path() + "/gone";
        ASSERT_EQ(mkdir(sub.c_str(), 0700), 0);
        OpenHandle h;
        fixture::OpenForWrite(sub + "/x.qsf", h);
        ASSERT_EQ(qoraSetVarName(h.get(), "x", 0), QORA_STATUS_OK);
        ASSERT_EQ(rmdir(sub.c_str()), 0);
        EXPECT_EQ(qoraCommitHeader(h.get()), QORA_STATUS_BAD_FILE_HANDLE);
        EXPECT_EQ(qoraSetVarName(h.get(), "y", 0), QORA_STATUS_OK);  // still uncommitted
    }
    if (Exists("/dev/full")) {  // every write of the device fails
        OpenHandle h;
        fixture::OpenForWrite("/dev/full", h);
        ASSERT_EQ(qoraSetVarName(h.get(), "x", 0), QORA_STATUS_OK);
        ASSERT_EQ(qoraCommitHeader(h.get()), QORA_STATUS_OK);  // still in the buffer
        int status = QORA_STATUS_OK;
        for (int i = 0; i < 1000 && status == QORA_STATUS_OK; ++i)
            status = qoraCommitCaseRecord(h.get());
        EXPECT_EQ(status, QORA_STATUS_WRITE_FAILED);
        EXPECT_EQ(qoraCommitCaseRecord(h.get()), QORA_STATUS_WRITE_FAILED);
        EXPECT_EQ(qoraCloseWrite(h.get()), QORA_STATUS_OK);
        h.Forget();
    }
    {  // closed before the commit: no file; with a half-built case: the whole ones
        const std::string never = dir.Path() + "/never.qsf";
        int handle;
        ASSERT_EQ(qoraOpenWrite(never.c_str(), &handle), QORA_STATUS_OK);
        ASSERT_EQ(qoraSetVarName(handle, "x", 0), QORA_STATUS_OK);
        EXPECT_EQ(qoraCloseWrite(handle), QORA_STATUS_OK);
        EXPECT_FALSE(Exists(never));
        const std::string half = WriteFile(dir.Path() + "/half.qsf", true, Rows(3));
        OpenHandle append;
        ASSERT_EQ(qoraOpenAppend(half.c_str(), append.out()), QORA_STATUS_OK);
        EXPECT_EQ(qoraSetValueNumeric(append.get(), 1.0, 5.0), QORA_STATUS_OK);
        EXPECT_EQ(qoraCloseAppend(append.get()), QORA_STATUS_OK);
        append.Forget();
        ExpectRows(half, Rows(3));
    }
}

}  // namespace
