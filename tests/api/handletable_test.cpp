// The access checks of a file entry, the handle table's refusals and the call
// frame that turns every exception into the call's catch-all status.
#include "handletable.h"

#include <gtest/gtest.h>

#include <new>
#include <stdexcept>

#include "dserror.h"
#include "qoracall.h"

namespace {

TEST(FileEntry, AccessChecksGiveTheirStatusCodes) {
    const struct {
        OpenMode mode;
        bool committed;
        int any, define, readCases, writeCases;
    } rows[] = {
        {ReadMode, true, 0, 8, 0, 8},
        {WriteMode, false, 0, 0, 9, 31},
        {WriteMode, true, 0, 30, 9, 0},
        {AppendMode, true, 0, 30, 9, 0},
    };
    for (const auto& row : rows) {
        FileEntry entry(nullptr, row.mode);
        entry.fCommitted = row.committed;
        SCOPED_TRACE(testing::Message() << "mode " << row.mode << " committed " << row.committed);
        EXPECT_EQ(entry.Check(AccessAny), row.any);
        EXPECT_EQ(entry.Check(AccessDefine), row.define);
        EXPECT_EQ(entry.Check(AccessReadCases), row.readCases);
        EXPECT_EQ(entry.Check(AccessWriteCases), row.writeCases);
    }
}

TEST(HandleTable, RefusesHandlesOutsideTheTableAndClearsTheEntry) {
    HandleTable table;
    FileEntry other(nullptr, ReadMode);
    for (int handle : {-1, 0, 99, 100, -2147483647 - 1, 2147483647}) {
        FileEntry* entry = &other;
        EXPECT_EQ(table.Lookup(handle, AccessAny, &entry), QORA_STATUS_BAD_FILE_HANDLE);
        EXPECT_EQ(entry, nullptr);
        EXPECT_EQ(table.Close(handle), QORA_STATUS_BAD_FILE_HANDLE);
    }
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
    EXPECT_EQ(GuardedCall(kCatchOpen, []() -> int { return QORA_ASSERT(1 < 0), 0; }), 6);
    EXPECT_EQ(GuardedCall(kCatchCaseIn, []() -> int { RaiseError(kErrTooShort, "header"); }), 3);
}

TEST(CallFrame, RunsTheBodyOnlyOnAnEntryThatPassesItsCheck) {
    int handle = -1;
    auto entry = std::make_unique<FileEntry>(nullptr, WriteMode);
    ASSERT_EQ(TheHandleTable().Insert(std::move(entry), &handle), QORA_STATUS_OK);
    int runs = 0;
    auto body = [&](FileEntry& e) { return ++runs, e.fMode == WriteMode ? QORA_STATUS_OK : -100; };
    EXPECT_EQ(EntryCall(handle, AccessDefine, kCatchHandle, body), QORA_STATUS_OK);
    EXPECT_EQ(EntryCall(handle, AccessWriteCases, kCatchCaseOut, body), 31);
    EXPECT_EQ(EntryCall(handle, AccessReadCases, kCatchCaseIn, body), 9);
    EXPECT_EQ(EntryCall(100, AccessAny, kCatchCaseIn, body), 5);
    EXPECT_EQ(runs, 1);
    auto throws = [](FileEntry&) -> int { throw std::bad_alloc(); };
    EXPECT_EQ(EntryCall(handle, AccessAny, kCatchCaseIn, throws), 3);
    EXPECT_EQ(TheHandleTable().Close(handle), QORA_STATUS_OK);
    EXPECT_EQ(EntryCall(handle, AccessAny, kCatchCaseIn, body), 5);
}

}  // namespace
