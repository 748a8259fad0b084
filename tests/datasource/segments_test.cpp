// The segments of very long strings: the movers cut them at whole characters,
// filling with NULs where one would be cut, and plans join them again; plans
// from a file that would leave the case are refused.
#include <gtest/gtest.h>

#include <random>
#include <string>
#include <tuple>
#include <vector>

#include "SaveDS.h"
#include "SystemFileDechunker.h"
#include "api_handles.h"
#include "dserror.h"

using namespace fixture;
using Entry = SystemFileDechunker::Entry;

TEST(Movers, CutVeryLongStringsIntoSegments) {
    using SaveDS = SystemFileDataSource::SaveDS;
    Utf8Mode utf8;
    struct Cut {
        const char* name;
        int width;
        std::string text;
        std::string segments;  // as written, padding included
    };
    const std::string e = "\xc3\xa9", zhong = "\xe4\xb8\xad";  // two bytes, three
    // clang-format off
    const Cut cuts[] = {
        {"multipleOf252", 504, std::string(504, 'b'),
         std::string(255, 'b') + ' ' + std::string(249, 'b') + std::string(7, ' ')},
        {"blankAt254", 300, std::string(254, 'c') + ' ' + e + std::string(43, 'c'),
         std::string(254, 'c') + "  " + e + std::string(43, 'c') + "   "},
        {"characterAcross255", 300, std::string(254, 'd') + e + std::string(44, 'd'),
         std::string(254, 'd') + '\0' + ' ' + e + std::string(44, 'd') + "  "},
        {"threeBytesAcross255", 300, std::string(253, 'f') + zhong + std::string(44, 'f'),
         std::string(253, 'f') + std::string(2, '\0') + ' ' + zhong + std::string(44, 'f') + ' '},
    };
    // clang-format on
    for (const Cut& cut : cuts) {
        SCOPED_TRACE(cut.name);
        std::string source =
            cut.text + std::string(8 * size_t(ValueUnits(cut.width)) - cut.width, ' ');
        std::string output(cut.segments.size(), '?');
        SaveDS::EStringMover mover(reinterpret_cast<unsigned char*>(&output[0]), cut.width);
        const auto* begin = reinterpret_cast<const unsigned char*>(source.data());
        EXPECT_EQ(mover.Move(begin), begin + source.size());
        EXPECT_EQ(output, cut.segments);
        // Joined again, the NULs that stand for a cut character are dropped.
        SystemFileDechunker plan;
        plan.Add(SystemFileDechunker::StringEntry(0, uint32_t(cut.width), 0, 0));
        plan.Validate(uint32_t(output.size() / 8), uint32_t(ValueUnits(cut.width)));
        std::string joined(source.size(), '?');
        plan.Rebuild(reinterpret_cast<unsigned char*>(&output[0]),
                     reinterpret_cast<unsigned char*>(&joined[0]));
        EXPECT_EQ(joined, source);
    }
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
    Entry shortSegments = good, longTarget = good, wide = good;
    Entry skipping = SystemFileDechunker::LeadingEntry(1);
    shortSegments.sourceUnitAfter -= 1;  // segments shorter than the width needs
    longTarget.targetUnitAfter += 1;
    wide.width = 0xFFFFFFFFu;
    skipping.sourceUnit = 3;  // no string, yet units skipped
    // The entry, the units of the file's case and of the dictionary's, refused or not.
    const Entry wraps = SystemFileDechunker::StringEntry(0xFFFFFFF0u, 300, 0, 0);
    const Entry leadsFar = SystemFileDechunker::LeadingEntry(0xFFFFFFFFu);
    // clang-format off
    const std::tuple<Entry, uint32_t, uint32_t, bool> rows[] = {{good, 40, 40, false},
        {good, 39, 40, true}, {good, 40, 39, true}, {shortSegments, 40, 40, true},
        {longTarget, 40, 40, true}, {wide, 40, 40, true}, {wraps, 40, 40, true},
        {leadsFar, 40, 40, true}, {skipping, 40, 40, true}};
    // clang-format on
    for (const auto& [entry, rawUnits, caseUnits, expected] : rows)
        EXPECT_EQ(refused(entry, rawUnits, caseUnits), expected) << entry.sourceUnit;
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
