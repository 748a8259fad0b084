// The handle table, the access checks of a file entry and the call frame
// that turns every exception into the call's catch-all status.
#include "handletable.h"

#include <gtest/gtest.h>

#include <new>
#include <stdexcept>

#include "dserror.h"
#include "qoracall.h"

namespace {

// Entries without a data source: the table and the checks never look at it.
std::unique_ptr<FileEntry> NewEntry(OpenMode mode) {
    return std::make_unique<FileEntry>(nullptr, mode);
}

TEST(FileEntry, StartsEmptyAndCommittedUnlessWriting) {
    for (OpenMode mode : {ReadMode, WriteMode, AppendMode}) {
        const FileEntry entry(nullptr, mode);
        EXPECT_EQ(entry.fMode, mode);
        EXPECT_EQ(entry.fCommitted, mode != WriteMode);
        EXPECT_EQ(entry.fCaseState, CaseNone);
        EXPECT_FALSE(entry.fpCaseBuffer);
        EXPECT_FALSE(entry.fpBlankCase);
        EXPECT_TRUE(entry.fNameIndex.empty());
        EXPECT_FALSE(entry.HasSystemFile());
    }
}

TEST(FileEntry, AccessChecksGiveTheirStatusCodes) {
    struct Row {
        OpenMode mode;
        bool committed;
        int any, define, readCases, writeCases;
    };
    const Row rows[] = {
        {ReadMode, true, 0, 8, 0, 8},
        {WriteMode, false, 0, 0, 9, 31},
        {WriteMode, true, 0, 30, 9, 0},
        {AppendMode, true, 0, 30, 9, 0},
    };
    for (const Row& row : rows) {
        FileEntry entry(nullptr, row.mode);
        entry.fCommitted = row.committed;
        SCOPED_TRACE(testing::Message() << "mode " << row.mode << " committed " << row.committed);
        EXPECT_EQ(entry.Check(AccessAny), row.any);
        EXPECT_EQ(entry.Check(AccessDefine), row.define);
        EXPECT_EQ(entry.Check(AccessReadCases), row.readCases);
        EXPECT_EQ(entry.Check(AccessWriteCases), row.writeCases);
    }
}

TEST(HandleTable, RefusesHandlesOutsideTheTableAndEmptySlots) {
    HandleTable table;
    FileEntry other(nullptr, ReadMode);
    for (int handle : {-1, 0, 99, 100, -2147483647 - 1, 2147483647}) {
        FileEntry* entry = &other;
        EXPECT_EQ(table.Lookup(handle, AccessAny, &entry), QORA_STATUS_BAD_FILE_HANDLE);
        EXPECT_EQ(entry, nullptr);
    }
}

TEST(HandleTable, LookupAppliesTheAccessCheck) {
    HandleTable table;
    int handle = -1;
    ASSERT_EQ(table.Insert(NewEntry(ReadMode), &handle), QORA_STATUS_OK);
    FileEntry* entry = nullptr;
    EXPECT_EQ(table.Lookup(handle, AccessDefine, &entry), QORA_STATUS_OPENED_FOR_READING);
    EXPECT_EQ(entry, nullptr);
    EXPECT_EQ(table.Lookup(handle, AccessReadCases, &entry), QORA_STATUS_OK);
    ASSERT_NE(entry, nullptr);
    EXPECT_EQ(entry->fMode, ReadMode);
}

TEST(HandleTable, HandsOutTheLowestFreeSlotAndRefusesTheHundredAndFirst) {
    HandleTable table;
    for (int expected = 0; expected < HandleTable::kSlots; ++expected) {
        int handle = -1;
        ASSERT_EQ(table.Insert(NewEntry(ReadMode), &handle), QORA_STATUS_OK);
        ASSERT_EQ(handle, expected);
    }
    int handle = -1;
    EXPECT_EQ(table.Insert(NewEntry(ReadMode), &handle), QORA_STATUS_TOO_MANY_FILES);
    EXPECT_EQ(handle, -1);

    EXPECT_EQ(table.Close(37), QORA_STATUS_OK);
    EXPECT_EQ(table.Close(5), QORA_STATUS_OK);
    ASSERT_EQ(table.Insert(NewEntry(WriteMode), &handle), QORA_STATUS_OK);
    EXPECT_EQ(handle, 5);
    ASSERT_EQ(table.Insert(NewEntry(WriteMode), &handle), QORA_STATUS_OK);
    EXPECT_EQ(handle, 37);
}

TEST(HandleTable, CloseEmptiesTheSlotOnceForAnyMode) {
    HandleTable table;
    for (OpenMode mode : {ReadMode, WriteMode, AppendMode}) {
        int handle = -1;
        ASSERT_EQ(table.Insert(NewEntry(mode), &handle), QORA_STATUS_OK);
        EXPECT_EQ(table.Close(handle), QORA_STATUS_OK);
        FileEntry* entry;
        EXPECT_EQ(table.Lookup(handle, AccessAny, &entry), QORA_STATUS_BAD_FILE_HANDLE);
        EXPECT_EQ(table.Close(handle), QORA_STATUS_BAD_FILE_HANDLE);
    }
    EXPECT_EQ(table.Close(-1), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(table.Close(100), QORA_STATUS_BAD_FILE_HANDLE);
}

TEST(CallFrame, MapsEveryExceptionToTheCatchAll) {
    EXPECT_EQ(GuardedCall(kCatchHandle, [] { return QORA_WARN_NO_LABEL; }), QORA_WARN_NO_LABEL);
    EXPECT_EQ(GuardedCall(kCatchCaseOut, []() -> int { throw ErrorText("x"); }), 2);
    EXPECT_EQ(GuardedCall(kCatchCaseIn,
                          []() -> int { throw SystemFileException(1204, "x", __FILE__, 1); }),
              3);
    EXPECT_EQ(GuardedCall(kCatchOpen, []() -> int { throw std::bad_alloc(); }), 6);
    EXPECT_EQ(GuardedCall(kCatchFree, []() -> int { throw std::out_of_range("x"); }), 48);
    EXPECT_EQ(GuardedCall(kCatchHandle, []() -> int { throw 42; }), 5);
    EXPECT_EQ(GuardedCall(kCatchOpen,
                          []() -> int {
                              QORA_ASSERT(1 < 0);
                              return 0;
                          }),
              6);
    EXPECT_EQ(GuardedCall(kCatchCaseIn, []() -> int { RaiseError(kErrTooShort, "header"); }), 3);
}

TEST(CallFrame, RunsTheBodyOnlyOnAnEntryThatPassesItsCheck) {
    int handle = -1;
    ASSERT_EQ(TheHandleTable().Insert(NewEntry(WriteMode), &handle), QORA_STATUS_OK);
    int runs = 0;
    auto body = [&](FileEntry& entry) {
        ++runs;
        return entry.fMode == WriteMode ? QORA_STATUS_OK : -100;
    };
    EXPECT_EQ(EntryCall(handle, AccessDefine, kCatchHandle, body), QORA_STATUS_OK);
    EXPECT_EQ(EntryCall(handle, AccessWriteCases, kCatchCaseOut, body), 31);
    EXPECT_EQ(EntryCall(handle, AccessReadCases, kCatchCaseIn, body), 9);
    EXPECT_EQ(EntryCall(100, AccessAny, kCatchCaseIn, body), 5);
    EXPECT_EQ(runs, 1);
    EXPECT_EQ(EntryCall(handle, AccessAny, kCatchCaseIn,
                        [](FileEntry&) -> int { throw std::bad_alloc(); }),
              3);
    EXPECT_EQ(TheHandleTable().Close(handle), QORA_STATUS_OK);
    EXPECT_EQ(EntryCall(handle, AccessAny, kCatchCaseIn, body), 5);
}

}  // namespace
