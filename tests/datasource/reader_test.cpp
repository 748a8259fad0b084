// Opening files built byte by byte, in both byte orders: what the reader makes
// of dictionaries that other writers get wrong (labels, missing values,
// weights, continuations, names, sets); the records with handlers of their
// own, their bytes written and read back; and malformed and truncated files,
// which fail the open with their internal error number and condition, never
// with a crash, a hang or a huge allocation.
#include <gtest/gtest.h>

#include <array>
#include <cstring>
#include <exception>
#include <functional>
#include <memory>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include "HeaderSettings.h"
#include "SystemFileDataSource.h"
#include "SystemFileExtensionRecord.h"
#include "dictionary_source.h"
#include "dserror.h"
#include "encoding_scope.h"
#include "sysfile_builder.h"

using namespace fixture;
using namespace std::string_literals;

namespace {

// How an open failed: the internal error number and the failed condition.
struct OpenFailure {
    long number = 0;  // 0: the open succeeded
    std::string condition;
    std::string text;
};

std::unique_ptr<SystemFileDataSource> OpenFixture(const SysFileBuilder& b) {
    return std::make_unique<SystemFileDataSource>(b.WriteTemp().c_str());
}

OpenFailure FailureOf(const std::string& path) {
    OpenFailure failure;
    try {
        SystemFileDataSource source(path.c_str());
    } catch (const ErrorText& e) {
        failure.text = e.Text();
        try {
            std::rethrow_if_nested(e);
            failure.number = -1;  // not a format error
        } catch (const SystemFileException& inner) {
            failure.number = inner.Number();
            failure.condition = inner.Condition();
        }
    }
    return failure;
}

OpenFailure FailureOf(const fixture::SysFileBuilder& b) { return FailureOf(b.WriteTemp()); }

#define EXPECT_FAILS(source, num, cond)           \
    do {                                          \
        const OpenFailure f = FailureOf(source);  \
        EXPECT_EQ(f.number, (num)) << f.text;     \
        EXPECT_EQ(f.condition, (cond)) << f.text; \
    } while (0)

// The contents of the only record of a builder without variables.
std::string Contents(const SysFileBuilder& b) {
    const fixture::Bytes file = b.Build();
    return std::string(file.begin() + 176 + 16, file.end() - 8);
}

// A value that fills the width, different at every position a segment may end.
std::string Sample(int width) {
    std::string text;
    while (int(text.size()) < width) text += std::to_string(text.size()) + "|";
    return text.substr(0, size_t(width));
}

// A value with the separators of the variable attributes record in it.
const std::string kUnit = SysFileBuilder::AttributeText({{"Unit", {"km/h:"}}});

struct Warnings : WarningSink {
    std::vector<long> numbers;
    void Warning(long number, const std::string&) override { numbers.push_back(number); }
};

std::string Repeat(const std::string& text, int n) {
    std::string out;
    while (n-- > 0) out += text;
    return out;
}

class Reader : public ::testing::TestWithParam<Endian> {
  protected:
    // The file `build` makes in this byte order fails to open so.
    void Fails(long number, const std::string& condition,
               const std::function<void(SysFileBuilder&)>& build) const {
        SCOPED_TRACE(condition);
        SysFileBuilder b(GetParam());
        build(b);
        EXPECT_FAILS(b, number, condition);
    }
};
INSTANTIATE_TEST_SUITE_P(Orders, Reader, ::testing::Values(Endian::Native, Endian::Swapped),
                         EndianName);

}  // namespace

// One record listing variables of both kinds and several widths: each
// variable gets labels of its own kind and width, found by their own values.
TEST_P(Reader, ValueLabelsServeOnlyVariablesOfTheirKindAndWidth) {
    SysFileBuilder b(GetParam());
    const int s20 = b.String("S20", 20).Slot();
    const int n = b.Numeric("N").Slot();
    const int s3 = b.String("S3", 3).Slot();
    const int t20 = b.String("T20", 20).Slot();
    const int s255 = b.String("S255", 255).Slot();
    b.ValueLabels({{"ABCDEFGH", "long"}, {"AB", "short"}}, {s20, n, s3, t20, s255});
    auto source = OpenFixture(b);

    EXPECT_FALSE(source->GetVariable(1).GetValueLabels().IsValid());
    const QORA_VLMap wide = source->GetVariable(0).GetValueLabels();
    EXPECT_TRUE(wide.SameObject(source->GetVariable(3).GetValueLabels()));
    const QORA_VLMap narrow = source->GetVariable(2).GetValueLabels();
    const QORA_VLMap widest = source->GetVariable(4).GetValueLabels();
    ASSERT_EQ(wide.KeyType(), 20);
    ASSERT_EQ(narrow.KeyType(), 3);
    ASSERT_EQ(widest.KeyType(), 255);
    // Widths that cut the values alike hold one copy of the labels.
    EXPECT_EQ(&wide.Impl()->Pairs(), &widest.Impl()->Pairs());
    for (QORA_VLMap map : {wide, narrow, widest}) {
        std::string text, label;
        int count = 0;
        for (map.Reset(); map.NextText(text, label); ++count) {
            ASSERT_EQ(int(text.size()), map.KeyType());
            ASSERT_NE(map.Lookup(text.data(), int(text.size())), nullptr) << text;
            EXPECT_EQ(*map.Lookup(text.data(), int(text.size())), label);
        }
        EXPECT_EQ(count, 2);
    }
}

// A string has no range of missing values: a file that codes one keeps the
// values as discrete ones.
TEST_P(Reader, StringMissingRangesBecomeDiscreteValues) {
    SysFileBuilder b(GetParam());
    b.String("S", 8).MissingRaw(-3, {"lo", "hi", "x"});
    b.String("T", 8).MissingRaw(-2, {"a", "b"});
    auto source = OpenFixture(b);
    char values[3][8];
    EXPECT_EQ(source->GetVariable(0).GetMissingValues(values[0], values[1], values[2]), 3);
    EXPECT_EQ(std::string(values[0], 24), "lo      hi      x       ");
    EXPECT_EQ(source->GetVariable(1).GetMissingCode(), 2);
}

// The creation stamp counts seconds from the Gregorian start; a field that
// does not parse is refused whole.
TEST(Reader, CreationStampOfTheHeaderFields) {
    const std::tuple<const char*, const char*, double> rows[] = {
        // clang-format off
        {"04 Dec 26", "17:16:43", 14015783803.0},
        {"04 DEC 69", "17:16:43", 15372782203.0},  // 00-69: 2000s
        {"04 dec 70", "17:16:43", 12248558203.0},  // 70-99: 1900s
        {"29 Feb 00", "00:00:00", 13171161600.0},
        {" 4 Dec 26", "17:16:43", -1.0},  // a blank is no digit
        {"04 Xyz 26", "17:16:43", -1.0}, {"00 Dec 26", "17:16:43", -1.0},
        {"32 Dec 26", "17:16:43", -1.0}, {"04 Dec 26", "24:00:00", -1.0},
        {"04 Dec 26", "23:60:00", -1.0}, {"04 Dec 26", "23:59:60", -1.0},
        {"\0\0\0\0\0\0\0\0\0", "\0\0\0\0\0\0\0\0", -1.0},
        // clang-format on
    };
    for (const auto& [date, time, stamp] : rows) {
        double parsed = -1.0;
        EXPECT_EQ(ParseCreationStamp(date, time, &parsed) ? parsed : -1.0, stamp) << date;
    }
}

// Continuation records are not counted (two would be right for S, one for T);
// the weight names the first unit of a numeric variable among the records as
// they stand, or nothing.
TEST_P(Reader, ContinuationsAreNotCountedAndTheWeightNamesAVariable) {
    SysFileBuilder b(GetParam());
    b.String("S", 20).Continuations(5);
    b.String("T", 9).Continuations(0);
    b.Weight(b.Numeric("W"));
    auto source = OpenFixture(b);
    ASSERT_EQ(source->ColumnCount(), 3);
    EXPECT_EQ(source->ValueCount(), 3 + 2 + 1);
    EXPECT_EQ(source->GetCaseWeight(), 2);
    for (int32_t index : {2, 7, 0, -5, 9, 99}) {  // continuation, string, none, out of range
        b.header().weightIndex = index;
        EXPECT_EQ(OpenFixture(b)->GetCaseWeight(), -1) << index;
    }
}

TEST_P(Reader, RepeatedAndInvalidNamesAreRenamed) {
    SysFileBuilder b(GetParam());
    // Age differs from AGE only in case: no lookup could tell them apart.
    for (const char* name : {"AGE", "AGE", "V1", "#X", "Age", "A-B", "\xC3\xA9T\xC3\xA9"})
        b.Numeric(name);
    auto source = OpenFixture(b);
    ASSERT_EQ(source->ColumnCount(), 7);
    std::string names;  // but the multibyte one, not checked here
    for (int i = 0; i < 6; ++i) names += source->GetVariable(i).GetName() + " ";
    EXPECT_EQ(names, "age v2 v1 v3 v4 v5 ");  // V1 taken
}

// Lines without their "$", blank, malformed or without a final newline; a set
// of the extended record replaces its namesake; members the file lacks go, and
// so do sets left empty.
TEST_P(Reader, SetsLoseMembersTheFileDoesNotHave) {
    SysFileBuilder b(GetParam());
    b.Numeric("A");
    b.Numeric("B");
    b.TextExtension(kMultRespExtension,
                    "$ab=C 3 Set a GONE B\nb=D1 1 0  A\n\nx\n$bad=Q junk\n"
                    "$none=C 1 X GONE\n$c=C 0  B");
    b.ExtendedMultipleResponseSets({"$C=E 1 2 10 2 CC A B"});
    b.VariableSets({SysFileBuilder::VariableSetLine("Group", {"A", "B"})});
    auto source = OpenFixture(b);
    std::string found;
    for (auto family : {QORA_SetFamily::kMultipleResponse, QORA_SetFamily::kVariableSets})
        for (const QORA_VariableSet& set : LoadVariableSets(*source, family))
            found += Describe(set) + "; ";
    EXPECT_EQ(found, "1|$ab||Set|0|a B ; 2|$b|1||0|A ; 2|$C|10|CC|1|A B ; 0|Group|||0|A B ; ");
}

// Display values out of range, attributes that do not parse or name nobody.
TEST_P(Reader, DisplayAndAttributesAreReadWithinTheirRanges) {
    SysFileBuilder b(GetParam());
    b.Numeric("A");
    b.Numeric("B");
    b.String("C", 12);
    b.DisplayParams({{3, 12, 1}, {1, 0, 2}, {5, 70000, 7}});
    b.FileAttributes(kUnit).FileAttributes("Note('x");  // the second does not parse
    b.TextExtension(kVariableAttributesExtension, ":" + kUnit + "/A:" + kUnit);  // no first name
    // An unknown variable is skipped; the first item that does not parse ends the record.
    b.VariableAttributes({{"nobody", kUnit}, {"b", kUnit}, {"C", "Unit(x)\n"}, {"A", kUnit}});
    auto source = OpenFixture(b);

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

TEST_P(Reader, CaseCountFollowsItsMarkerAndOnlyRises) {
    auto reversed = [](int64_t v) { return int64_t(__builtin_bswap64(uint64_t(v))); };
    // header count, record count, marker (0: a record of one unit), result
    const std::array<int64_t, 4> rows[] = {
        {-1, reversed(9), reversed(1), 9}, {7, 5, 1, 7}, {7, 9, 1, 9}, {-1, 9, 0, 9}};
    for (const auto& [header, count, marker, expected] : rows) {
        SysFileBuilder b(GetParam());
        b.header().caseCount = int32_t(header);
        marker ? b.CaseCount64(count, marker) : b.Extension(kCaseCountExtension, 8, b.Int64(count));
        EXPECT_EQ(OpenFixture(b)->Settings().fCaseCount, expected) << count;
    }
}

// Every file has YEAR_, NAME (two units), MONTH_ and DATE_, for the date
// variable information.
TEST_P(Reader, MalformedRecordsFailTheOpen) {
    const SysFileBuilder e(GetParam());  // encodes the date information's numbers
    auto ones = [](int32_t size, int32_t count) { return Bytes(size_t(size * count), 1); };
    const std::tuple<int32_t, int32_t, Bytes, std::string> rows[] = {
        {kIntegerInfoExtension, 4, ones(4, 7), "rec.NUnits() == 8"},
        {kIntegerInfoExtension, 8, ones(8, 8), "rec.UnitSize() == 4"},
        {kFloatInfoExtension, 4, ones(4, 3), "rec.UnitSize() == sizeof(double)"},
        {kFloatInfoExtension, 8, ones(8, 4), "rec.NUnits() == 3"},
        {kDisplayExtension, 8, ones(8, 6), "rec.UnitSize() == sizeof(int32)"},
        {kDisplayExtension, 4, ones(4, 3), "rec.NUnits()== src.ColumnCount()*3"},
        {kCaseCountExtension, 4, ones(4, 4), "rec.UnitSize() == sizeof(int64)"},
        {kCaseCountExtension, 8, ones(8, 3), "rec.NUnits() == 1 || rec.NUnits() == 2"},
        {kFileAttributesExtension, 2, ones(2, 4), "rec.UnitSize() == sizeof(char)"},
        {kEncodingExtension, 2, ones(2, 3), "rec.UnitSize() == sizeof(char)"},
        {kDateInfoExtension, 8, ones(8, 6), "rec.UnitSize() == 4"},
        {kDateInfoExtension, 4, e.Int32s({0, 1, 11, 1, 1, 1}),
         "0 <= nDateVars && nDateVars < QORA_TrendsInfo::eMaxDateVars"},
        {kDateInfoExtension, 4, e.Int32s({0, 1, 4, 1, 1, 1, 1, 2, 1, 4, 4, 1, 0, 0, 0}),
         "nElements >= 3*nDateVars+6"},
        {kDateInfoExtension, 4, e.Int32s({0, 1, 0, 1, 1, 0, 0, 0, 0, 0, 0, 0}),
         "nElements <= 3*nDateVars+9"},
        {kDateInfoExtension, 4, e.Int32s({0, 1}), "nElements >= kFixedUnits"},
        {kDateInfoExtension, 4, e.Int32s({0, 1, 1, 1, 1, 1, 6, 2, 1, 0, 0, 0}), "iVar < nVars"},
        {kDateInfoExtension, 4, e.Int32s({0, 1, 1, 1, 1, 1, 1, 2, 1, 4, 4, 1}),
         "iDateVar < nDateVars || iType == e_DATKEY || iType == e_NONE"},
    };
    for (const auto& [subtype, unitSize, contents, condition] : rows) {
        SysFileBuilder b(GetParam());
        b.Numeric("YEAR_");
        b.String("NAME", 12);
        b.Numeric("MONTH_");
        b.String("DATE_", 10);
        EXPECT_FAILS(b.Extension(subtype, unitSize, contents), kErrBadFormat, condition);
    }
    // A frame without units, which the reader refuses before any handler sees it.
    SystemFileDataSource source;
    EXPECT_THROW(ImportExtension(kEncodingExtension, source, source.Settings(), {1, 0}),
                 SystemFileException);
}

// The header and each kind of record malformed or cut short, and records out
// of place.
TEST_P(Reader, RecordFaults) {
    using B = SysFileBuilder;
    SysFileBuilder h(GetParam());
    EXPECT_FAILS(h.WriteTemp(Bytes{}, "empty.qsf"), kErrTooShort, "nRead == 4");
    EXPECT_FAILS(h.WriteTemp(Bytes{'$', 'F', 'L'}, "three.qsf"), kErrTooShort, "nRead == 4");
    EXPECT_FAILS(h.WriteTemp(Truncated(h.Build(), 100), "short.qsf"), kErrTooShort,
                 "nRead == len1");
    h.header().magic = "$FL3";
    EXPECT_FAILS(h, kErrBadFormat, "std::string(magic) == \"$FL2\"");
    EXPECT_NE(FailureOf(h).text.find("1204"), std::string::npos);

    SysFileBuilder b(GetParam());
    b.Numeric("X");
    b.EndRecord(false);
    EXPECT_FAILS(b, kErrTooShort, "len == sizeof(recType)");
    b.EndRecord(true);
    const Bytes whole = b.Build();
    EXPECT_FAILS(b.WriteTemp(Truncated(whole, whole.size() - 2), "f.qsf"), kErrTooShort,
                 "len == sizeof(padding)");
    b.Extension(12, 1, {0});
    b.Numeric("LATE");
    EXPECT_FAILS(b, kErrBadFormat, "!variablesClosed");
    for (int32_t type : {4, 5, 8, 1, 0, -1, 1000}) {
        SysFileBuilder c(GetParam());
        c.Numeric("X");
        EXPECT_FAILS(c.RawRecord(c.Int32s({type, 0, 0})), kErrBadFormat, "false");
    }

    for (int32_t type : {256, 32767, -2, INT32_MIN})
        Fails(kErrBadFormat, "type >= -1 && type <= 255",
              [&](B& c) { c.Numeric("X").TypeField(type); });
    for (int32_t code : {4, -4, -1, 1000, INT32_MIN})
        Fails(kErrBadFormat, "QORA_Variable::IsValidMissingCode(code)", [&](B& c) {
            c.Numeric("X").MissingRaw(code, {1.0, 2.0, 3.0});
        });
    Fails(kErrBadFormat, "labelLen >= 0",
          [](B& c) { c.Numeric("X").Label("abc").LabelLengthField(-4); });
    Fails(kErrTooShort, "len == paddedLen",
          [](B& c) { c.Numeric("X").Label("abc").LabelLengthField(0x7FFFFFF0); });
    Fails(kErrTooShort, "len == 8*abs(code)", [](B& c) { c.Numeric("X").MissingRaw(3, {1.0}); });

    auto labels = [&](long number, const char* condition, auto change) {
        ValueLabelSet set;
        set.labels = {{1.0, "One"}};
        set.slots = {4};
        change(set);
        SysFileBuilder c(GetParam());
        c.String("S", 20);
        c.Numeric("N");
        EXPECT_FAILS(c.ValueLabels(set), number, condition);
    };
    labels(kErrTooShort, "len == header.size()",
           [](ValueLabelSet& s) { s.labelCount = 0x7FFFFFFF; });
    labels(kErrBadFormat, "h[0] == 4", [](ValueLabelSet& s) { s.omitSecond = true; });
    labels(kErrBadFormat, "h[0] == 4", [](ValueLabelSet& s) { s.secondType = 3; });
    labels(kErrBadFormat, "h[1] > 0", [](ValueLabelSet& s) { s.variableCount = 0; });
    labels(kErrBadFormat, "h[1] > 0", [](ValueLabelSet& s) { s.variableCount = -3; });
    labels(kErrTooShort, "len == nVars*sizeof(int32)",
           [](ValueLabelSet& s) { s.variableCount = 0x7FFFFFFF; });
    for (int32_t slot : {0, -1, 2, 3, 5, 99, INT32_MIN})  // 2, 3: units of S after its first
        labels(kErrBadFormat, "slots.IsValidSlot(slot)", [&](ValueLabelSet& s) {
            s.slots = {4, slot};
        });

    Fails(kErrTooShort, "len == nLines*80", [](B& c) { c.Documents({"a"}, 0x7FFFFFFF); });
    Fails(kErrBadFormat, "nLines >= 0", [](B& c) { c.Documents({}, -1); });
    Fails(kErrTooShort, "len == 3*sizeof(int32)", [](B& c) {
        c.RawRecord(c.Int32s({7, 12})).EndRecord(false);
    });
    auto frame = [&](int32_t size, int32_t count, Bytes contents, long number,
                     const char* condition) {
        Fails(number, condition, [&](B& c) { c.Extension(12, size, count, contents); });
    };
    frame(0, 4, {1, 2, 3, 4}, kErrBadFormat, "h[1] > 0 && h[2] > 0");
    frame(4, 0, {}, kErrBadFormat, "h[1] > 0 && h[2] > 0");
    frame(-4, -4, {}, kErrBadFormat, "h[1] > 0 && h[2] > 0");
    frame(1, 1000, {1, 2, 3}, kErrTooShort, "len == h[2]*h[1]");
    frame(0x7FFFFFFF, 0x7FFFFFFF, {}, kErrTooShort, "len == h[2]*h[1]");
    frame(65536, 65536, {}, kErrTooShort, "len == h[2]*h[1]");
}

// Every cut inside the dictionary fails cleanly, after it the open succeeds;
// any single corrupted byte opens or fails with a format error, nothing else.
TEST_P(Reader, EveryTruncationAndCorruptionStaysWithinTheChecks) {
    SysFileBuilder b(GetParam());  // one of each kind of dictionary record
    b.Numeric("AGE").Label("Age").Missing({-1.0});
    b.String("NAME", 20).Label("Name").MissingStrings({"x"});
    b.Numeric("W").MissingRange(0.0, 1.0, 9.0);
    b.ValueLabels({{1.0, "One"}, {2.0, "Two two two"}}, {1, 5});
    b.Documents({"doc"});
    b.IntegerInfo();
    b.Extension(12, 4, {1, 2, 3, 4});
    b.Case({1.0, "Ann", 2.0});
    const Bytes whole = b.Build();
    for (size_t at = 0; at < whole.size(); ++at) {
        SCOPED_TRACE(at);
        const OpenFailure cut = FailureOf(b.WriteTemp(Truncated(whole, at), "cut.qsf"));
        if (at >= b.DataStart()) {
            EXPECT_EQ(cut.number, 0) << cut.text;
            continue;
        }
        EXPECT_TRUE(cut.number == kErrTooShort || cut.number == kErrBadFormat) << cut.text;
        Bytes bytes = whole;
        bytes[at] = at % 2 ? 0x80 : 0xFF;  // a sign bit or a huge count
        const OpenFailure f = FailureOf(b.WriteTemp(bytes, "bad.qsf"));
        EXPECT_TRUE(f.number == 0 || f.number == kErrTooShort || f.number == kErrBadFormat)
            << f.text;
    }
}

// Exported as a writer does (14, 13), then imported as a reader does (13, 14)
// into the dictionary the file holds: names, segments and sets come back whole.
TEST(LongNamesRecords, ExportedBytesMatchTheFixtureAndReadBackWhole) {
    DictionaryOnly original;
    original.Add(0, "age");
    original.Add(0, "Income");
    original.GetVariable(original.Add(600, "Remarks")).SetLabel("Free text");
    const std::string set = "things= Income Remarks\n";
    original.SetExtensionContent(kVariableSetExtension, 1, int32_t(set.size()), set.data());

    DictionaryOnly written(original);
    HeaderSettings out;
    SystemFileExtensionRecord strings, names;
    FindExtensionHandler(kVeryLongStringsExtension)->Export(written, out, strings);
    FindExtensionHandler(kLongNamesExtension)->Export(written, out, names);
    EXPECT_EQ(strings.Text(), std::string("REMARKS=600\0\t", 13));
    EXPECT_EQ(names.Text(), Contents(SysFileBuilder().LongNames(
                                {{"AGE", "age"}, {"INCOME", "Income"}, {"REMARKS", "Remarks"}})));
    EXPECT_EQ(out.fVeryLongStrings, (std::vector<std::pair<int, int>>{{2, 600}}));
    EXPECT_EQ(written.GetExtension(kVariableSetExtension).Impl()->Content(),
              "things= INCOME REMARKS\n");

    DictionaryOnly read(written);
    HeaderSettings in;
    FindExtensionHandler(kLongNamesExtension)->Import(read, in, names);
    FindExtensionHandler(kVeryLongStringsExtension)->Import(read, in, strings);
    ASSERT_EQ(read.ColumnCount(), original.ColumnCount());
    for (int i = 0; i < read.ColumnCount(); ++i)
        EXPECT_TRUE(read.GetVariable(i) == original.GetVariable(i))
            << read.GetVariable(i).GetName();
    EXPECT_EQ(read.GetExtension(kVariableSetExtension).Impl()->Content(), set);
}

// Each file fails to open with the condition, or opens with the number of
// variables (6 while both strings are in segments) and reads its case.
TEST_P(Reader, MalformedAndIgnoredRecords) {
    const std::string names = "S600=Remarks\tT300=Other";
    // The contents of a long value labels record for Remarks, and of one whose
    // name length is negative.
    auto remarks = [&](const std::string& value) {
        return Contents(
            SysFileBuilder(GetParam()).LongValueLabelsRecord({{"Remarks", 600, {{value, "Nil"}}}}));
    };
    const Bytes minus7 = SysFileBuilder(GetParam()).Int32(-7);
    const std::string negative =
        std::string(minus7.begin(), minus7.end()) + remarks("none").substr(4);
    const std::tuple<std::string, std::string, std::string, const char*, int> rows[] = {
        {"A=alpha\tB", "", "", "i != notFound && extString[i] == '='", 0},
        {"A=al=pha", "", "", "j == len || extString[j] == '\\t'", 0},
        {names, "S600=600\0\tT300=300\0\t"s, "", "", 3},
        {"", "S600=600\0\t"s, "", "", 6},
        {names + "\tABCDEFGHIJKLMNO=Remarks", "ABCDEFGHIJKLMNO=600\0\t"s, "", "", 4},
        {names + "\tABCDEFGHIJKLMNOP=Remarks", "ABCDEFGHIJKLMNOP=600\0\t"s, "", "", 6},
        {names, "S600=100600\0\tT300=300\0\t"s, "", "", 6},
        {names, "S600=700\0\tT300=300\0\t"s, "", "", 5},
        {names, "T300=0\0\tS600=100\0\t"s, "", "", 6},
        // R1 names the last two segments of Remarks as a string of width 348.
        {names + "\tR1=REMAR1", "S600=600\0\tR1=348\0\t"s, "", "", 4},
        {names, "", remarks("none"), "", 6},  // Remarks is still in segments: skipped
        {names, "", remarks("none") + "0123456789", "r+13 < endr", 0},
        {names, "", remarks(std::string(601, 'v')), "valLen <= varType", 0},
        {names, "", negative, "nameLength >= 0", 0},
    };
    for (const auto& [longNames, strings, labels, condition, columns] : rows) {
        SCOPED_TRACE(longNames + " " + strings);
        SysFileBuilder b(GetParam());
        b.String("S600", 600).LongName("Remarks");
        b.String("T300", 300).LongName("Other");
        b.Numeric("N");
        b.Case({Sample(600), Sample(300), 1.0});
        if (!longNames.empty()) b.TextExtension(kLongNamesExtension, longNames);
        if (!strings.empty()) b.TextExtension(kVeryLongStringsExtension, strings);
        if (!labels.empty()) b.TextExtension(kLongValueLabelsExtension, labels);
        const OpenFailure f = FailureOf(b);
        EXPECT_EQ(f.condition, condition) << f.text;
        if (f.number != 0) continue;
        auto source = OpenFixture(b);
        EXPECT_EQ(source->ColumnCount(), columns);
        std::unique_ptr<QORA_InputCaseIterator> it(source->NewIterator(nullptr));
        EXPECT_TRUE(it->ReadCase());
    }
}

// The view the opening factory puts over a file in another encoding than the
// interface's: widths, numbers bit for bit, cuts at whole characters, repaired
// names and the warning.
TEST(Transcoding, CodePageFileSeenInUtf8) {
    EncodingScope scope(kUtf8);
    const std::string zhong = "\xD6\xD0", zhongUtf8 = "\xE4\xB8\xAD";  // one character
    SysFileBuilder b;
    b.String("S10", 10).LongName(Repeat(zhong, 32));
    b.String("T10", 10).LongName(Repeat(zhong, 31) + "ab");  // the same once cut to 64 bytes
    b.String("HUGE", 20000);
    b.Numeric("N");
    b.String("BAD", 4).LongName("A\x81\x7F");  // no character in GBK
    b.LongNames().VeryLongStrings().Encoding("GBK");
    const double odd = FromBits(0x7FF8000000000001);
    b.Case({Repeat(zhong, 5), Repeat(zhong, 4) + "\xD6", "h", odd, zhong + "\xD6"});
    Warnings warnings;
    const auto source = OpenForReading(b.WriteTemp().c_str(), &warnings);
    EXPECT_EQ(warnings.numbers, std::vector<long>{kWarnNotUtf8});
    std::string names;
    for (int i = 0; i < source->ColumnCount(); ++i)
        names += source->GetVariable(i).GetName() + "/" +
                 std::to_string(source->GetVariable(i).GetType()) + " ";
    // The malformed name is renamed as the file is read, the repeated one
    // after the conversion.
    EXPECT_EQ(names, Repeat(zhongUtf8, 21) + "/30 v2/30 HUGE/32767 N/0 v1/12 ");

    const std::unique_ptr<QORA_InputCaseIterator> it(source->NewIterator(nullptr));
    ASSERT_TRUE(it->ReadCase());
    auto Value = [&](int index, size_t bytes) {
        return std::string(static_cast<const char*>(it->ValuePointer(index)), bytes);
    };
    EXPECT_EQ(Value(0, 32), Repeat(zhongUtf8, 5) + std::string(17, ' '));
    // A malformed byte is shown as "?"; a value never passes its units.
    EXPECT_EQ(Value(1, 32), Repeat(zhongUtf8, 4) + "?" + std::string(19, ' '));
    EXPECT_EQ(std::memcmp(it->ValuePointer(3), &odd, 8), 0);
    EXPECT_EQ(Value(4, 16), zhongUtf8 + "?" + std::string(12, ' '));
}
