// Date variable information: the checks a hostile record meets, in both byte
// orders.

#include <gtest/gtest.h>

#include <vector>

#include "SystemFileExtensionRecord.h"
#include "extension.h"
#include "reader_support.h"

using fixture::SysFileBuilder;

namespace {

// YEAR_ and MONTH_ numeric, then a string key wide enough to take two units.
SysFileBuilder DateFile(fixture::Endian endian) {
    SysFileBuilder b(endian);
    b.Numeric("YEAR_");
    b.String("NAME", 12);
    b.Numeric("MONTH_");
    b.String("DATE_", 10);
    return b;
}

class DateRecord : public ByteOrders {};

TEST_P(DateRecord, HostileRecordsFailToOpen) {
    const struct {
        std::vector<int32_t> units;
        const char* condition;
    } cases[] = {
        {{0, 1, 11, 1, 1, 1}, "0 <= nDateVars && nDateVars < QORA_TrendsInfo::eMaxDateVars"},
        {{0, 1, 4, 1, 1, 1, 1, 2, 1, 4, 4, 1, 0, 0, 0}, "nElements >= 3*nDateVars+6"},
        {{0, 1, 0, 1, 1, 0, 0, 0, 0, 0, 0, 0}, "nElements <= 3*nDateVars+9"},
        {{0, 1}, "nElements >= kFixedUnits"},
        {{0, 1, 1, 1, 1, 1, 6, 2, 1, 0, 0, 0}, "iVar < nVars"},
        {{0, 1, 1, 1, 1, 1, 1, 2, 1, 4, 4, 1},
         "iDateVar < nDateVars || iType == e_DATKEY || iType == e_NONE"},
    };
    for (const auto& c : cases) {
        SysFileBuilder b = DateFile(GetParam());
        b.DateInfo(c.units);
        const OpenFailure f = FailureOf(b);
        EXPECT_EQ(f.number, kErrBadFormat) << c.condition;
        EXPECT_EQ(f.condition, c.condition);
    }
    SysFileBuilder b = DateFile(GetParam());
    b.Extension(kDateInfoExtension, 8, b.Int32s({0, 1, 0, 1, 1, 0}));
    EXPECT_EQ(FailureOf(b).condition, "rec.UnitSize() == 4");
}

INSTANTIATE_TEST_SUITE_P(Orders, DateRecord,
                         ::testing::Values(fixture::Endian::Native, fixture::Endian::Swapped),
                         fixture::EndianName);

}  // namespace
