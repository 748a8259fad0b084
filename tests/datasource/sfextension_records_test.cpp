// The records with handlers of their own, read from files of both byte
// orders: values out of range, texts that do not parse, malformed records
// (the date variable information among them).
#include <gtest/gtest.h>

#include <array>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include "SystemFileExtensionRecord.h"
#include "reader_support.h"

using namespace fixture;

namespace {

// A value with the separators of the variable attributes record in it.
const std::string kUnit = SysFileBuilder::AttributeText({{"Unit", {"km/h:"}}});

class ExtensionRecordFiles : public ByteOrders {};
INSTANTIATE_TEST_SUITE_P(Orders, ExtensionRecordFiles,
                         ::testing::Values(Endian::Native, Endian::Swapped), EndianName);

}  // namespace

TEST_P(ExtensionRecordFiles, SettingsDisplayAndAttributesAreRead) {
    SysFileBuilder b(GetParam());
    b.Numeric("A");
    b.Numeric("B");
    b.String("C", 12);
    b.IntegerInfo({21, 1, 2, 730, 3, 4, 1, 65001}).FloatInfo(-1.5, 2.5, -1.25);
    b.DisplayParams({{3, 12, 1}, {1, 0, 2}, {5, 70000, 7}});
    const std::string encoding = "x-unknown " + std::string(300, 'e');
    b.Encoding(encoding);
    b.FileAttributes(kUnit).FileAttributes("Note('x");  // the second does not parse
    b.TextExtension(kVariableAttributesExtension, ":" + kUnit + "/A:" + kUnit);  // no first name
    // An unknown variable is skipped; the first item that does not parse ends the record.
    b.VariableAttributes({{"nobody", kUnit}, {"b", kUnit}, {"C", "Unit(x)\n"}, {"A", kUnit}});
    auto source = OpenFixture(b.WriteTemp());

    const HeaderSettings& s = source->Settings();
    EXPECT_EQ(std::tie(s.fReleaseMajor, s.fReleaseMinor, s.fReleaseRevision, s.fMachineCode,
                       s.fFloatCode, s.fCompressionCode, s.fCharacterCode),
              std::make_tuple(21, 1, 2, 730, 3, 4, 65001));
    EXPECT_EQ(std::tie(s.fSysmis, s.fHighest, s.fLowest), std::make_tuple(-1.5, 2.5, -1.25));
    EXPECT_EQ(s.fEncodingName, encoding);
    EXPECT_EQ(source->FileAttributes().ValuesOf("Unit"), Attributes::Values{"km/h:"});
    // Width 0 keeps the variable's own; level and alignment keep 2 bits, width 16.
    const std::array<int, 4> expected[3] = {
        {3, 12, 1, 0}, {1, QORA_Variable(0).GetColumnWidth(), 2, 1}, {1, 70000 & 0xFFFF, 3, 0}};
    for (int k = 0; k < 3; ++k) {
        const QORA_Variable& v = source->GetVariable(k);
        EXPECT_EQ((std::array<int, 4>{v.GetMeasureLevel(), v.GetColumnWidth(), v.GetAlignment(),
                                      v.GetAttributes().Size()}),
                  expected[k]);
    }
}

TEST_P(ExtensionRecordFiles, CaseCountFollowsItsMarkerAndOnlyRises) {
    auto reversed = [](int64_t v) { return int64_t(__builtin_bswap64(uint64_t(v))); };
    // header count, record count, marker (0: a record of one unit), result
    const std::array<int64_t, 4> rows[] = {
        {-1, reversed(9), reversed(1), 9}, {7, 5, 1, 7}, {7, 9, 1, 9}, {-1, 9, 0, 9}};
    for (const auto& [header, count, marker, expected] : rows) {
        SysFileBuilder b(GetParam());
        b.header().caseCount = int32_t(header);
        if (marker == 0)
            b.Extension(kCaseCountExtension, 8, b.Int64(count));
        else
            b.CaseCount64(count, marker);
        EXPECT_EQ(OpenFixture(b.WriteTemp())->Settings().fCaseCount, expected) << count;
    }
}

// Every file has YEAR_, NAME (two units), MONTH_ and DATE_, for the date
// variable information.
TEST_P(ExtensionRecordFiles, MalformedRecordsFailTheOpen) {
    auto file = [&] {
        SysFileBuilder b(GetParam());
        b.Numeric("YEAR_");
        b.String("NAME", 12);
        b.Numeric("MONTH_");
        b.String("DATE_", 10);
        return b;
    };
    const std::tuple<int32_t, int32_t, int32_t, std::string> rows[] = {
        {kIntegerInfoExtension, 4, 7, "rec.NUnits() == 8"},
        {kIntegerInfoExtension, 8, 8, "rec.UnitSize() == 4"},
        {kFloatInfoExtension, 4, 3, "rec.UnitSize() == sizeof(double)"},
        {kFloatInfoExtension, 8, 4, "rec.NUnits() == 3"},
        {kDisplayExtension, 8, 6, "rec.UnitSize() == sizeof(int32)"},
        {kDisplayExtension, 4, 3, "rec.NUnits()== src.ColumnCount()*3"},
        {kCaseCountExtension, 4, 4, "rec.UnitSize() == sizeof(int64)"},
        {kCaseCountExtension, 8, 3, "rec.NUnits() == 1 || rec.NUnits() == 2"},
        {kFileAttributesExtension, 2, 4, "rec.UnitSize() == sizeof(char)"},
        {kEncodingExtension, 2, 3, "rec.UnitSize() == sizeof(char)"},
        {kDateInfoExtension, 8, 6, "rec.UnitSize() == 4"},
    };
    for (const auto& [subtype, unitSize, nUnits, condition] : rows) {
        SysFileBuilder b = file();
        b.Extension(subtype, unitSize, Bytes(size_t(unitSize * nUnits), 1));
        const OpenFailure f = FailureOf(b);
        EXPECT_EQ(std::tie(f.number, f.condition), std::make_tuple(kErrBadFormat, condition));
    }
    const std::pair<std::vector<int32_t>, std::string> dates[] = {
        {{0, 1, 11, 1, 1, 1}, "0 <= nDateVars && nDateVars < QORA_TrendsInfo::eMaxDateVars"},
        {{0, 1, 4, 1, 1, 1, 1, 2, 1, 4, 4, 1, 0, 0, 0}, "nElements >= 3*nDateVars+6"},
        {{0, 1, 0, 1, 1, 0, 0, 0, 0, 0, 0, 0}, "nElements <= 3*nDateVars+9"},
        {{0, 1}, "nElements >= kFixedUnits"},
        {{0, 1, 1, 1, 1, 1, 6, 2, 1, 0, 0, 0}, "iVar < nVars"},
        {{0, 1, 1, 1, 1, 1, 1, 2, 1, 4, 4, 1},
         "iDateVar < nDateVars || iType == e_DATKEY || iType == e_NONE"},
    };
    for (const auto& [units, condition] : dates) {
        SysFileBuilder b = file();
        b.DateInfo(units);
        const OpenFailure f = FailureOf(b);
        EXPECT_EQ(std::tie(f.number, f.condition), std::make_tuple(kErrBadFormat, condition));
    }
    // A frame without units, which the reader refuses before any handler sees it.
    SystemFileDataSource source;
    EXPECT_THROW(ImportExtension(kEncodingExtension, source, source.Settings(), {1, 0}),
                 SystemFileException);
}
