#include <gtest/gtest.h>

#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "SystemFileDechunker.h"
#include "dserror.h"

namespace {

using Entry = SystemFileDechunker::Entry;

// A file case of the given units, blank, with text placed at a byte offset.
struct Units {
    explicit Units(size_t units) : bytes(units * 8, ' ') {}
    void Put(size_t at, const std::string& text) { bytes.replace(at, text.size(), text); }
    void PutNumber(size_t unit, double value) { std::memcpy(&bytes[unit * 8], &value, 8); }
    double Number(size_t unit) const {
        double value;
        std::memcpy(&value, &bytes[unit * 8], 8);
        return value;
    }
    unsigned char* Data() { return reinterpret_cast<unsigned char*>(&bytes[0]); }
    std::string bytes;
};

std::string Rebuilt(const SystemFileDechunker& plan, Units& raw, size_t caseUnits) {
    plan.Validate(uint32_t(raw.bytes.size() / 8), uint32_t(caseUnits));
    Units out(caseUnits);
    out.bytes.assign(caseUnits * 8, '?');
    plan.Rebuild(raw.Data(), out.Data());
    return out.bytes;
}

}  // namespace

TEST(DechunkerTest, UnitArithmeticOfVeryLongStrings) {
    EXPECT_EQ(SystemFileDechunker::FileUnits(300), 38u);
    EXPECT_EQ(SystemFileDechunker::CaseUnits(300), 38u);
    EXPECT_EQ(SystemFileDechunker::FileUnits(504), 64u);
    EXPECT_EQ(SystemFileDechunker::CaseUnits(504), 63u);
    EXPECT_EQ(SystemFileDechunker::CaseUnits(8), 1u);
    EXPECT_EQ(SystemFileDechunker::CaseUnits(9), 2u);
    const Entry e = SystemFileDechunker::StringEntry(1, 600, 2, 3);
    EXPECT_EQ(e.sourceUnitAfter, 1u + 32 + 32 + 12);
    EXPECT_EQ(e.targetUnitAfter, 2u + 75);
}

// A writer that would cut a character fills bytes 252 to 254 with NULs: they
// are not part of the string.
TEST(DechunkerTest, NulsAtTheEndOfAFullSegmentAreDropped) {
    Units raw(38);
    raw.Put(0, std::string(253, 'a'));
    raw.Put(253, std::string(2, '\0'));
    raw.Put(256, std::string(47, 'b'));
    SystemFileDechunker plan;
    plan.Add(SystemFileDechunker::StringEntry(0, 300, 0, 0));
    EXPECT_EQ(Rebuilt(plan, raw, 38), std::string(253, 'a') + std::string(47, 'b') + "    ");
}

TEST(DechunkerTest, FullSegmentsGive255BytesWhenNoneIsNul) {
    Units raw(38);
    raw.Put(0, std::string(255, 'a'));
    raw.Put(256, std::string(45, 'b'));
    SystemFileDechunker plan;
    plan.Add(SystemFileDechunker::StringEntry(0, 300, 0, 0));
    EXPECT_EQ(Rebuilt(plan, raw, 38), std::string(255, 'a') + std::string(45, 'b') + "    ");
}

TEST(DechunkerTest, AWidthOfTwoFullSegmentsHasNoShortLastSegment) {
    Units raw(64);
    raw.Put(0, std::string(255, 'a'));
    raw.Put(256, std::string(249, 'b'));
    SystemFileDechunker plan;
    plan.Add(SystemFileDechunker::StringEntry(0, 504, 0, 0));
    EXPECT_EQ(Rebuilt(plan, raw, 63), std::string(255, 'a') + std::string(249, 'b'));
}

// A (numeric), S (width 300), B (numeric): the leading entry copies A, the
// entry of S copies B after the string.
TEST(DechunkerTest, LeadingAndOrdinaryUnitsAreCopiedUnchanged) {
    Units raw(40);
    raw.PutNumber(0, 1.5);
    raw.Put(8, std::string(255, 's'));
    raw.Put(8 + 256, std::string(45, 't'));
    raw.PutNumber(39, -2.0);
    SystemFileDechunker plan;
    plan.Add(SystemFileDechunker::LeadingEntry(1));
    plan.Add(SystemFileDechunker::StringEntry(1, 300, 1, 1));
    Units out(40);
    out.bytes = Rebuilt(plan, raw, 40);
    EXPECT_EQ(out.Number(0), 1.5);
    EXPECT_EQ(out.bytes.substr(8, 304), std::string(255, 's') + std::string(45, 't') + "    ");
    EXPECT_EQ(out.Number(39), -2.0);
}

TEST(DechunkerTest, TwoStringsCloseUpTheUnitsTheSegmentsSaved) {
    // Width 504 takes 64 units in the file, 63 in the case; the numeric
    // after it moves one unit down.
    Units raw(64 + 1 + 38);
    raw.Put(0, std::string(255, 'a'));
    raw.Put(256, std::string(249, 'b'));
    raw.PutNumber(64, 7.0);
    raw.Put(65 * 8, std::string(255, 'c'));
    raw.Put(65 * 8 + 256, std::string(45, 'd'));
    SystemFileDechunker plan;
    plan.Add(SystemFileDechunker::StringEntry(0, 504, 0, 1));
    plan.Add(SystemFileDechunker::StringEntry(65, 300, 64, 0));
    Units out(63 + 1 + 38);
    out.bytes = Rebuilt(plan, raw, 102);
    EXPECT_EQ(out.bytes.substr(0, 504), std::string(255, 'a') + std::string(249, 'b'));
    EXPECT_EQ(out.Number(63), 7.0);
    EXPECT_EQ(out.bytes.substr(64 * 8), std::string(255, 'c') + std::string(45, 'd') + "    ");
}

TEST(DechunkerTest, ValidationRefusesEntriesThatLeaveTheCases) {
    auto refused = [](Entry e, uint32_t rawUnits, uint32_t caseUnits) {
        SystemFileDechunker plan;
        plan.Add(e);
        try {
            plan.Validate(rawUnits, caseUnits);
        } catch (const SystemFileException& x) {
            return x.Number() == kErrBadFormat;
        }
        return false;
    };
    const Entry good = SystemFileDechunker::StringEntry(1, 300, 1, 1);
    EXPECT_FALSE(refused(good, 40, 40));
    EXPECT_TRUE(refused(good, 39, 40));  // ordinary units beyond the file case
    EXPECT_TRUE(refused(good, 40, 39));  // beyond the dictionary's case
    Entry e = good;
    e.sourceUnitAfter -= 1;  // segments shorter than the width needs
    EXPECT_TRUE(refused(e, 40, 40));
    e = good;
    e.targetUnitAfter += 1;
    EXPECT_TRUE(refused(e, 40, 40));
    e = good;
    e.width = 0xFFFFFFFFu;
    EXPECT_TRUE(refused(e, 40, 40));
    e = SystemFileDechunker::StringEntry(0xFFFFFFF0u, 300, 0, 0);  // wraps around
    EXPECT_TRUE(refused(e, 40, 40));
    e = SystemFileDechunker::LeadingEntry(0xFFFFFFFFu);
    EXPECT_TRUE(refused(e, 40, 40));
    e = SystemFileDechunker::LeadingEntry(1);
    e.sourceUnit = 3;  // no string, yet units skipped
    EXPECT_TRUE(refused(e, 40, 40));
}

// Plans from a file may say anything: whatever passes validation rebuilds
// within the two buffers (the sanitizer build checks every byte touched).
TEST(DechunkerTest, RandomPlansThatPassValidationStayInsideTheBuffers) {
    std::mt19937 random(12345);
    auto pick = [&](uint32_t bound) { return uint32_t(random() % bound); };
    int accepted = 0;
    for (int round = 0; round < 3000; ++round) {
        const uint32_t rawUnits = 1 + pick(140), caseUnits = 1 + pick(140);
        SystemFileDechunker plan;
        for (uint32_t n = 1 + pick(3); n > 0; --n) {
            Entry e = SystemFileDechunker::StringEntry(pick(rawUnits), 1 + pick(1100),
                                                       pick(caseUnits), pick(4));
            if (pick(4) == 0) e.sourceUnitAfter = pick(rawUnits + 1);
            plan.Add(e);
        }
        std::vector<unsigned char> raw(rawUnits * 8);
        for (auto& b : raw) b = pick(3) == 0 ? 0 : 'x';
        std::vector<unsigned char> out(caseUnits * 8);
        try {
            plan.Validate(rawUnits, caseUnits);
        } catch (const SystemFileException&) {
            continue;
        }
        ++accepted;
        plan.Rebuild(raw.data(), out.data());
    }
    EXPECT_GT(accepted, 50);
}
