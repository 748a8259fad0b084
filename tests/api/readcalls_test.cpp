// Opening, closing and the counts, through the exported calls on files made
// by the fixture builder.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <fstream>
#include <iterator>
#include <memory>
#include <vector>

#include "SystemFileDataSource.h"
#include "api_handles.h"
#include "handletable.h"
#include "memory_source.h"
#include "sysfile_builder.h"

namespace {

using fixture::Endian;
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

class ReadCalls : public ::testing::TestWithParam<Endian> {};

TEST_P(ReadCalls, CountsVariablesCasesAndCaseSize) {
    SysFileBuilder b(GetParam());
    b.Numeric("AGE");
    b.String("NAME", 20);  // 3 value units
    b.String("CODE", 3);
    b.Case({30.0, "Ann", "x"}).Case({41.0, "Bob", "y"});
    OpenHandle h;
    fixture::OpenForRead(b.WriteTemp(), h);
    int count = -5;
    EXPECT_EQ(qoraGetNumberofVariables(h.get(), &count), QORA_STATUS_OK);
    EXPECT_EQ(count, 3);
    EXPECT_EQ(qoraGetNumberofCases(h.get(), &count), QORA_STATUS_OK);
    EXPECT_EQ(count, 2);
    count = -5;
    EXPECT_EQ(qoraGetEstimatedNofCases(h.get(), &count), QORA_STATUS_OK);
    EXPECT_EQ(count, 2);
    EXPECT_EQ(qoraGetCaseSize(h.get(), &count), QORA_STATUS_OK);
    EXPECT_EQ(count, 5 * 8);
}

TEST_P(ReadCalls, UnknownCaseCountIsMinusOne) {
    SysFileBuilder b(GetParam());
    b.Numeric("X");
    b.header().caseCount = -1;
    OpenHandle h;
    fixture::OpenForRead(b.WriteTemp(), h);
    int count = 7;
    EXPECT_EQ(qoraGetNumberofCases(h.get(), &count), QORA_STATUS_OK);
    EXPECT_EQ(count, -1);
}

INSTANTIATE_TEST_SUITE_P(Orders, ReadCalls, ::testing::Values(Endian::Native, Endian::Swapped),
                         fixture::EndianName);

TEST(OpenRead, RefusesMissingAndMalformedFilesLeavingNoHandle) {
    fixture::TempDir dir;
    int handle = 3;
    EXPECT_EQ(qoraOpenRead((dir.Path() + "/absent.qsf").c_str(), &handle), QORA_STATUS_BAD_FILE);
    EXPECT_EQ(handle, -1);
    SysFileBuilder b;
    b.Numeric("X");
    const auto bytes = fixture::Truncated(b.Build(), 100);
    handle = 3;
    EXPECT_EQ(qoraOpenRead(b.WriteTemp(bytes, "short.qsf").c_str(), &handle), QORA_STATUS_BAD_FILE);
    EXPECT_EQ(handle, -1);
    EXPECT_EQ(qoraOpenRead(nullptr, &handle), QORA_STATUS_BAD_FILE);
    EXPECT_EQ(qoraOpenRead(b.WriteTemp().c_str(), nullptr), QORA_STATUS_BAD_FILE);
    // Nothing of the failed opens holds a slot.
    OpenHandle h;
    fixture::OpenForRead(b.WriteTemp(), h);
    EXPECT_EQ(h.get(), 0);
}

TEST(OpenRead, HundredHandlesThenFourAndTheClosedNumberComesBack) {
    SysFileBuilder b;
    b.Numeric("X");
    const std::string path = b.WriteTemp();
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

    EXPECT_EQ(qoraCloseRead(37), QORA_STATUS_OK);
    handles[37]->Forget();
    OpenHandle again;
    fixture::OpenForRead(path, again);
    EXPECT_EQ(again.get(), 37);
}

TEST(CloseCalls, RefuseBadHandlesAndCloseAnyMode) {
    EXPECT_EQ(qoraCloseRead(100), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(qoraCloseRead(-1), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(qoraCloseAppend(0), QORA_STATUS_BAD_FILE_HANDLE);
    SysFileBuilder b;
    b.Numeric("X");
    int handle = -1;
    ASSERT_EQ(qoraOpenRead(b.WriteTemp().c_str(), &handle), QORA_STATUS_OK);
    EXPECT_EQ(qoraCloseWrite(handle), QORA_STATUS_OK);
    EXPECT_EQ(qoraCloseRead(handle), QORA_STATUS_BAD_FILE_HANDLE);
    fixture::TempDir dir;
    ASSERT_EQ(qoraOpenWrite((dir.Path() + "/w.qsf").c_str(), &handle), QORA_STATUS_OK);
    EXPECT_EQ(qoraCloseAppend(handle), QORA_STATUS_OK);
}

TEST(CountCalls, ClearOutputsOnBadHandlesAndRefuseNullOutputs) {
    int count = 9;
    EXPECT_EQ(qoraGetNumberofVariables(5, &count), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(count, 0);
    count = 9;
    EXPECT_EQ(qoraGetNumberofCases(-3, &count), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(count, -1);
    count = 9;
    EXPECT_EQ(qoraGetCaseSize(100, &count), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(count, 0);
    SysFileBuilder b;
    b.Numeric("X");
    OpenHandle h;
    fixture::OpenForRead(b.WriteTemp(), h);
    EXPECT_EQ(qoraGetNumberofVariables(h.get(), nullptr), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(qoraGetNumberofCases(h.get(), nullptr), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(qoraGetCaseSize(h.get(), nullptr), QORA_STATUS_BAD_FILE_HANDLE);
}

TEST(OpenWrite, GivesAnUncommittedWriteHandle) {
    fixture::TempDir dir;
    OpenHandle h;
    fixture::OpenForWrite(dir.Path() + "/out.qsf", h);
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
    // The probe creates nothing that stays behind.
    EXPECT_FALSE(FileExists(dir.Path() + "/out.qsf"));

    FileEntry* entry = nullptr;
    ASSERT_EQ(TheHandleTable().Lookup(h.get(), AccessDefine, &entry), QORA_STATUS_OK);
    ASSERT_TRUE(entry->HasSystemFile());
    EXPECT_EQ(entry->fpDataSource->GetFileName(), dir.Path() + "/out.qsf");
    EXPECT_EQ(entry->fpSystemFile->Settings().fProduct,
              "@(#) QORA DATA FILE MS Windows Release 16.0 qoraio32.dll");
}

TEST(OpenWrite, RefusesUnwritablePathsAndLeavesExistingFilesAlone) {
    fixture::TempDir dir;
    int handle = 4;
    EXPECT_EQ(qoraOpenWrite((dir.Path() + "/no/such/dir/x.qsf").c_str(), &handle),
              QORA_STATUS_CANNOT_OPEN);
    EXPECT_EQ(handle, -1);
    EXPECT_EQ(qoraOpenWrite(nullptr, &handle), QORA_STATUS_CANNOT_OPEN);
    EXPECT_EQ(qoraOpenWrite(dir.Path().c_str(), &handle), QORA_STATUS_CANNOT_OPEN);

    const std::string path = dir.Path() + "/existing.qsf";
    std::ofstream(path) << "keep me";
    OpenHandle h;
    fixture::OpenForWrite(path, h);
    EXPECT_EQ(Contents(path), "keep me");
}

TEST(OpenWrite, NeitherTruncatesNorRemovesAnExistingUnreadableFile) {
    fixture::TempDir dir;
    const std::string writeOnly = dir.Path() + "/writeonly.qsf";
    std::ofstream(writeOnly) << "data";
    ::chmod(writeOnly.c_str(), 0200);
    if (std::ifstream(writeOnly).good()) GTEST_SKIP() << "running with rights to read anything";
    OpenHandle w;
    fixture::OpenForWrite(writeOnly, w);
    ::chmod(writeOnly.c_str(), 0600);
    EXPECT_EQ(Contents(writeOnly), "data");
}

TEST(AccessChecks, DefineCallsOnReadHandlesGiveEight) {
    SysFileBuilder b;
    b.Numeric("X");
    OpenHandle h;
    fixture::OpenForRead(b.WriteTemp(), h);
    EXPECT_EQ(qoraSetVarName(h.get(), "Y", 0), QORA_STATUS_OPENED_FOR_READING);
    EXPECT_EQ(qoraSetVarLabel(h.get(), "X", "l"), QORA_STATUS_OPENED_FOR_READING);
    EXPECT_EQ(qoraSetVarNValueLabel(h.get(), "X", 1.0, "l"), QORA_STATUS_OPENED_FOR_READING);
    // An append entry is committed from the start.
    int handle = -1;
    auto entry = std::make_unique<FileEntry>(std::make_unique<MemorySource>(), AppendMode);
    ASSERT_EQ(TheHandleTable().Insert(std::move(entry), &handle), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetVarName(handle, "Y", 0), QORA_STATUS_DICT_COMMITTED);
    EXPECT_EQ(qoraCloseAppend(handle), QORA_STATUS_OK);
}

// Any negative count means unknown: none is passed on as a number of cases,
// and counts beyond 32 bits are unknown too.
TEST(CountCalls, NegativeAndHugeCaseCountsAreMinusOne) {
    struct CountedSource : MemorySource {
        explicit CountedSource(int64_t cases) : fCases(cases) {}
        int64_t CaseCount() const override { return fCases; }
        int64_t fCases;
    };
    for (int64_t cases : {-4294967295LL, -5LL, 2147483648LL, 2147483647LL}) {
        int handle = -1;
        auto entry = std::make_unique<FileEntry>(std::make_unique<CountedSource>(cases), ReadMode);
        ASSERT_EQ(TheHandleTable().Insert(std::move(entry), &handle), QORA_STATUS_OK);
        OpenHandle h(handle);
        int count = 7;
        EXPECT_EQ(qoraGetNumberofCases(h.get(), &count), QORA_STATUS_OK);
        EXPECT_EQ(count, cases == 2147483647LL ? 2147483647 : -1) << cases;
    }
}

// The name index and the system file view, on entries over sources made in
// memory.
TEST(FileEntryTables, DuplicateKeysAreRefusedAndNamesFoundIgnoringCaseAndBlanks) {
    auto source = std::make_unique<MemorySource>();
    source->Add(0, "Age");
    source->Add(12, "Name");
    FileEntry entry(std::move(source), ReadMode);
    ASSERT_EQ(entry.BuildNameIndex(), QORA_STATUS_OK);
    EXPECT_EQ(entry.FindVariable("  aGE "), 0);
    EXPECT_EQ(entry.FindVariable("NAME"), 1);
    EXPECT_EQ(entry.FindVariable("NAM"), -1);
    EXPECT_EQ(entry.FindVariable(""), -1);
    EXPECT_EQ(entry.FindVariable(nullptr), -1);
    ASSERT_EQ(entry.fValueSlots.size(), 2u);
    EXPECT_EQ(entry.fValueSlots[1].offset, 1);
    EXPECT_EQ(entry.fValueSlots[1].width, 12);

    static_cast<MemorySource&>(*entry.fpDataSource).Add(0, "AGE");
    EXPECT_EQ(entry.BuildNameIndex(), QORA_STATUS_BAD_FILE);
}

TEST(FileEntryTables, SystemFileViewFallsBackToTheParent) {
    SystemFileDataSource parent;
    auto child = std::make_unique<MemorySource>();
    child->SetParent(&parent);
    const FileEntry entry(std::move(child), ReadMode);
    EXPECT_FALSE(entry.HasSystemFile());
    EXPECT_EQ(entry.SystemFileOrParent(), &parent);
    const FileEntry plain(std::make_unique<MemorySource>(), ReadMode);
    EXPECT_EQ(plain.SystemFileOrParent(), nullptr);
    const FileEntry own(std::make_unique<SystemFileDataSource>(), WriteMode);
    EXPECT_TRUE(own.HasSystemFile());
    EXPECT_EQ(own.SystemFileOrParent(), own.fpSystemFile);
}

}  // namespace
