// The access checks of a file entry and the call frame that turns every exception into the call's
// catch-all status.
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

}  // namespace
