// Date variable information: the record read from fixture bytes in both
// byte orders and written back unit for unit, the checks a hostile record
// meets, and the repairs against a changed dictionary.
#include "trendsinfo.h"

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

TEST_P(DateRecord, ReadsAndWritesTheUnitsOfTheLayout) {
    SysFileBuilder b = DateFile(GetParam());
    // Setting 1 (7), 2 date variables, numbers 3 and 4, YEAR_, MONTH_, DATE_.
    const std::vector<int32_t> units = {1, 7, 2, 3, 4, 1, 1, 2, 1, 4, 4, 12, 5, 11, 1};
    b.DateInfo(units);
    auto source = OpenFixture(b.WriteTemp());
    HeaderSettings settings;
    SystemFileExtensionRecord record;
    FindExtensionHandler(kDateInfoExtension)->Export(*source, settings, record);
    ASSERT_EQ(record.UnitSize(), 4);
    ASSERT_EQ(record.NUnits(), int32_t(units.size()));
    for (int32_t k = 0; k < record.NUnits(); ++k)
        EXPECT_EQ(record.Unit<int32_t>(k, false), units[size_t(k)]) << "unit " << k;
}

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

TEST(DateInfo, ValidateFollowsTheDictionary) {
    auto source = OpenFixture(DateFile(fixture::Endian::Native).WriteTemp());
    auto set = [&](int keyIndex) {
        QORA_TrendsInfo info;
        info.SetCount(1);
        info.SetEntry(*source, 0, 0, 2, 1);
        info.SetEntry(*source, 1, keyIndex, QORA_TrendsInfo::e_DATKEY, 1);
        return info;
    };
    QORA_TrendsInfo info = set(3);
    source->DeleteVariables(1, 1);  // indexes move; identities stay
    EXPECT_TRUE(info.Validate(*source));
    source->DeleteVariables(2, 2);  // the key goes: only the key entry is cleared
    EXPECT_FALSE(info.Validate(*source));
    EXPECT_EQ(info.DateVarCount(), 1);
    EXPECT_EQ(info.GetEntry(1).fType, QORA_TrendsInfo::e_NONE);

    info = set(1);  // MONTH_ is no key: the whole information goes
    EXPECT_FALSE(info.Validate(*source));
    EXPECT_EQ(info.DateVarCount(), 0);
}

}  // namespace
