// Malformed and truncated files: every check fails the open with its internal
// error number and condition, never a crash, a hang or a huge allocation.
#include <gtest/gtest.h>

#include <string>

#include "reader_support.h"

using namespace fixture;

namespace {

class MalformedReader : public ByteOrders {
  protected:
    // A file with one of each kind of dictionary record.
    SysFileBuilder Full() const {
        SysFileBuilder b(GetParam());
        b.Numeric("AGE").Label("Age").Missing({-1.0});
        b.String("NAME", 20).Label("Name").MissingStrings({"x"});
        b.Numeric("W").MissingRange(0.0, 1.0, 9.0);
        b.ValueLabels({{1.0, "One"}, {2.0, "Two two two"}}, {1, 5});
        b.Documents({"doc"});
        b.IntegerInfo();
        b.Extension(12, 4, {1, 2, 3, 4});
        b.Case({1.0, "Ann", 2.0});
        return b;
    }
};
INSTANTIATE_TEST_SUITE_P(Orders, MalformedReader,
                         ::testing::Values(Endian::Native, Endian::Swapped), EndianName);

#define EXPECT_FAILS(source, num, cond)           \
    do {                                          \
        const OpenFailure f = FailureOf(source);  \
        EXPECT_EQ(f.number, (num)) << f.text;     \
        EXPECT_EQ(f.condition, (cond)) << f.text; \
    } while (0)

}  // namespace

TEST_P(MalformedReader, HeaderFaults) {
    SysFileBuilder b(GetParam());
    EXPECT_FAILS(b.WriteTemp(Bytes{}, "empty.qsf"), kErrTooShort, "nRead == 4");
    EXPECT_FAILS(b.WriteTemp(Bytes{'$', 'F', 'L'}, "three.qsf"), kErrTooShort, "nRead == 4");
    EXPECT_FAILS(b.WriteTemp(Truncated(b.Build(), 100), "short.qsf"), kErrTooShort,
                 "nRead == len1");
    b.header().magic = "$FL3";
    const OpenFailure f = FailureOf(b);
    EXPECT_EQ(f.number, kErrBadFormat);
    EXPECT_EQ(f.condition, "std::string(magic) == \"$FL2\"");
    EXPECT_NE(f.text.find("1204"), std::string::npos);
}

TEST_P(MalformedReader, RecordSequenceFaults) {
    SysFileBuilder b(GetParam());
    b.Numeric("X");
    b.EndRecord(false);
    EXPECT_FAILS(b, kErrTooShort, "len == sizeof(recType)");
    b.EndRecord(true);
    const Bytes whole = b.Build();
    EXPECT_FAILS(b.WriteTemp(Truncated(whole, whole.size() - 2), "f.qsf"), kErrTooShort,
                 "len == sizeof(padding)");
    for (int32_t type : {4, 5, 8, 1, 0, -1, 1000}) {
        SysFileBuilder c(GetParam());
        c.Numeric("X");
        c.RawRecord(c.Int32s({type, 0, 0}));
        EXPECT_FAILS(c, kErrBadFormat, "false");
    }
}

TEST_P(MalformedReader, VariableRecordFaults) {
    auto fails = [&](auto configure, long number, const char* condition) {
        SysFileBuilder b(GetParam());
        configure(b.Numeric("X"));
        EXPECT_FAILS(b, number, condition);
    };
    for (int32_t type : {256, 32767, -2, INT32_MIN})
        fails([&](Var& v) { v.TypeField(type); }, kErrBadFormat, "type >= -1 && type <= 255");
    for (int32_t code : {4, -4, -1, 1000, INT32_MIN})
        fails(
            [&](Var& v) {
                v.MissingRaw(code, {1.0, 2.0, 3.0});
            },
            kErrBadFormat, "QORA_Variable::IsValidMissingCode(code)");
    fails([](Var& v) { v.Label("abc").LabelLengthField(-4); }, kErrBadFormat, "labelLen >= 0");
    fails([](Var& v) { v.Label("abc").LabelLengthField(0x7FFFFFF0); }, kErrTooShort,
          "len == paddedLen");
    fails([](Var& v) { v.MissingRaw(3, {1.0}); }, kErrTooShort, "len == 8*abs(code)");

    SysFileBuilder b(GetParam());
    b.Numeric("X");
    b.Extension(12, 1, {0});
    b.Numeric("LATE");
    EXPECT_FAILS(b, kErrBadFormat, "!variablesClosed");
}

TEST_P(MalformedReader, ValueLabelRecordFaults) {
    auto fails = [&](auto configure, long number, const char* condition) {
        SysFileBuilder b(GetParam());
        b.String("S", 20);
        b.Numeric("N");
        ValueLabelSet set;
        set.labels = {{1.0, "One"}};
        set.slots = {4};
        configure(set);
        b.ValueLabels(set);
        EXPECT_FAILS(b, number, condition);
    };
    fails([](ValueLabelSet& s) { s.labelCount = 0x7FFFFFFF; }, kErrTooShort,
          "len == header.size()");
    fails([](ValueLabelSet& s) { s.omitSecond = true; }, kErrBadFormat, "h[0] == 4");
    fails([](ValueLabelSet& s) { s.secondType = 3; }, kErrBadFormat, "h[0] == 4");
    fails([](ValueLabelSet& s) { s.variableCount = 0; }, kErrBadFormat, "h[1] > 0");
    fails([](ValueLabelSet& s) { s.variableCount = -3; }, kErrBadFormat, "h[1] > 0");
    fails([](ValueLabelSet& s) { s.variableCount = 0x7FFFFFFF; }, kErrTooShort,
          "len == nVars*sizeof(int32)");
    for (int32_t slot : {0, -1, 2, 3, 5, 99, INT32_MIN})  // 2, 3: units of S after its first
        fails(
            [&](ValueLabelSet& s) {
                s.slots = {4, slot};
            },
            kErrBadFormat, "slots.IsValidSlot(slot)");
}

TEST_P(MalformedReader, DocumentAndExtensionFaults) {
    SysFileBuilder d(GetParam());
    d.Documents({"a"}, 0x7FFFFFFF);
    EXPECT_FAILS(d, kErrTooShort, "len == nLines*80");
    SysFileBuilder n(GetParam());
    n.Documents({}, -1);
    EXPECT_FAILS(n, kErrBadFormat, "nLines >= 0");

    auto fails = [&](int32_t size, int32_t count, Bytes contents, long number,
                     const char* condition) {
        SysFileBuilder b(GetParam());
        b.Extension(12, size, count, contents);
        EXPECT_FAILS(b, number, condition);
    };
    fails(0, 4, {1, 2, 3, 4}, kErrBadFormat, "h[1] > 0 && h[2] > 0");
    fails(4, 0, {}, kErrBadFormat, "h[1] > 0 && h[2] > 0");
    fails(-4, -4, {}, kErrBadFormat, "h[1] > 0 && h[2] > 0");
    fails(1, 1000, {1, 2, 3}, kErrTooShort, "len == h[2]*h[1]");
    fails(0x7FFFFFFF, 0x7FFFFFFF, {}, kErrTooShort, "len == h[2]*h[1]");
    fails(65536, 65536, {}, kErrTooShort, "len == h[2]*h[1]");

    SysFileBuilder frame(GetParam());
    frame.RawRecord(frame.Int32s({7, 12}));
    frame.EndRecord(false);
    EXPECT_FAILS(frame, kErrTooShort, "len == 3*sizeof(int32)");
}

// Every cut inside the dictionary fails cleanly; after it the open succeeds.
TEST_P(MalformedReader, EveryTruncationFailsCleanly) {
    const SysFileBuilder b = Full();
    const Bytes whole = b.Build();
    const size_t dataStart = b.DataStart();
    for (size_t size = 0; size < whole.size(); ++size) {
        const OpenFailure f = FailureOf(b.WriteTemp(Truncated(whole, size), "cut.qsf"));
        if (size < dataStart)
            EXPECT_TRUE(f.number == kErrTooShort || f.number == kErrBadFormat) << size << f.text;
        else
            EXPECT_EQ(f.number, 0) << size << ": " << f.text;
    }
}

// Any single corrupted byte opens or fails with a format error; nothing else.
TEST_P(MalformedReader, CorruptedBytesNeverEscapeTheChecks) {
    const SysFileBuilder b = Full();
    const Bytes whole = b.Build();
    for (size_t at = 0; at < b.DataStart(); ++at) {
        Bytes bytes = whole;
        bytes[at] = at % 2 ? 0x80 : 0xFF;  // a sign bit or a huge count
        const OpenFailure f = FailureOf(b.WriteTemp(bytes, "bad.qsf"));
        EXPECT_TRUE(f.number == 0 || f.number == kErrTooShort || f.number == kErrBadFormat)
            << at << ": " << f.text;
    }
}
