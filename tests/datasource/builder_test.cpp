// The fixture builder is what every reader test trusts, so its bytes are
// checked here against the file layout by hand-counted offsets.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>

#include "sysfile_builder.h"

using namespace fixture;

namespace {

int32_t I32At(const Bytes& b, size_t at) {
    int32_t v;
    std::memcpy(&v, b.data() + at, 4);
    return v;
}

double F64At(const Bytes& b, size_t at) {
    double v;
    std::memcpy(&v, b.data() + at, 8);
    return v;
}

std::string TextAt(const Bytes& b, size_t at, size_t n) {
    return std::string(b.begin() + at, b.begin() + at + n);
}

Bytes Reversed(const Bytes& b, size_t at, size_t n) {
    Bytes part(b.begin() + at, b.begin() + at + n);
    std::reverse(part.begin(), part.end());
    return part;
}

Bytes Slice(const Bytes& b, size_t at, size_t n) {
    return Bytes(b.begin() + at, b.begin() + at + n);
}

}  // namespace

TEST(SysFileBuilder, HeaderFieldsSitAtTheirOffsets) {
    SysFileBuilder b;
    b.Numeric("A");
    b.String("S", 20);
    b.header().label = "My file";
    b.header().weightIndex = 1;
    b.header().bias = 99.5;
    b.Case({1.0, "x"});
    const Bytes f = b.Build();

    EXPECT_EQ(TextAt(f, 0, 4), "$FL2");
    EXPECT_EQ(TextAt(f, 4, 60), "@(#) QORA DATA FILE test fixture" + std::string(28, ' '));
    // Layout code, case size (1 + 3 units), compression, weight, case count.
    EXPECT_EQ(Slice(f, 64, 20), b.Int32s({2, 4, 0, 1, 1}));
    EXPECT_EQ(F64At(f, 84), 99.5);
    EXPECT_EQ(TextAt(f, 92, 81), "04 Dec 2617:16:43My file" + std::string(57, ' '));
    EXPECT_EQ(Slice(f, 173, 3), Bytes(3, 0));
    EXPECT_EQ(I32At(f, 176), 2);  // first variable record

    b.header().caseCount = -1;
    b.header().caseSize = 77;
    b.Compressed();
    const Bytes g = b.Build();
    EXPECT_EQ(Slice(g, 64, 20), b.Int32s({2, 77, 1, 1, -1}));
}

// Every number reversed, every text and string value identical.
TEST(SysFileBuilder, ByteOrdersMirrorEachOther) {
    auto build = [](Endian e) {
        SysFileBuilder b(e);
        b.Numeric("AGE").Label("Age").Missing({-1.0});
        b.String("NAME", 8).MissingStrings({"NA"});
        b.Case({30.0, "Ann"});
        return b.Build();
    };
    const Bytes n = build(Endian::Native), s = build(Endian::Swapped);
    ASSERT_EQ(n.size(), 288u);
    ASSERT_EQ(s.size(), n.size());

    std::vector<std::pair<size_t, size_t>> numbers = {{64, 4}, {68, 4}, {72, 4},
                                                      {76, 4}, {80, 4}, {84, 8}};
    for (size_t at = 176; at < 200; at += 4) numbers.push_back({at, 4});  // AGE fields
    numbers.push_back({208, 4});                                          // label length
    numbers.push_back({216, 8});                                          // missing -1
    for (size_t at = 224; at < 248; at += 4) numbers.push_back({at, 4});  // NAME fields
    numbers.push_back({264, 4});                                          // 999
    numbers.push_back({268, 4});
    numbers.push_back({272, 8});  // 30.0

    Bytes rest = s;
    for (auto [at, width] : numbers) {
        EXPECT_EQ(Slice(s, at, width), Reversed(n, at, width)) << "offset " << at;
        std::copy_n(n.begin() + at, width, rest.begin() + at);
    }
    EXPECT_EQ(rest, n);  // texts, string missing value and string unit unchanged
    EXPECT_EQ(I32At(s, 64), 0x02000000);
    EXPECT_EQ(TextAt(s, 256, 8), "NA      ");
    EXPECT_EQ(TextAt(s, 280, 8), "Ann     ");
}

TEST(SysFileBuilder, VariableRecordsAndContinuations) {
    SysFileBuilder b;
    b.String("S", 20).Label("Hello");  // 5 label bytes, 3 padding
    const Bytes f = b.Build();
    // 32-byte record + label length + 8 label bytes, then 2 continuations.
    ASSERT_EQ(f.size(), 176u + 44 + 2 * 32 + 8);
    EXPECT_EQ(I32At(f, 180), 20);
    EXPECT_EQ(I32At(f, 184), 1);
    EXPECT_EQ(I32At(f, 192), int32_t(0x011400));  // A20
    EXPECT_EQ(TextAt(f, 200, 8), "S       ");
    EXPECT_EQ(I32At(f, 208), 5);
    EXPECT_EQ(TextAt(f, 212, 8), "Hello   ");
    for (size_t at : {220u, 252u}) {
        EXPECT_EQ(Slice(f, at, 24), b.Int32s({2, -1, 0, 0, 0x00011D01, 0x00011D01}));
        EXPECT_EQ(TextAt(f, at + 24, 8), std::string(8, ' '));
    }

    for (auto [width, continuations] : {std::pair{8, 0}, {9, 1}, {255, 31}}) {
        SysFileBuilder one;
        one.String("S", width);
        EXPECT_EQ(one.DataStart(), 176u + 32 * (1 + continuations) + 8) << width;
    }

    SysFileBuilder broken;
    broken.Numeric("X").MissingRaw(5, {1.0}).TypeField(-7).Continuations(2);
    const Bytes m = broken.Build();
    EXPECT_EQ(I32At(m, 180), -7);
    EXPECT_EQ(I32At(m, 188), 5);
    EXPECT_EQ(m.size(), 176u + 32 + 8 + 2 * 32 + 8);
}

TEST(SysFileBuilder, ValueLabelsFillWholeUnits) {
    SysFileBuilder b;
    b.Numeric("X");
    const size_t start = b.DataStart() - 8;
    b.ValueLabels({{1.0, "seven77"}, {2.0, "eight888"}, {3.0, ""}}, {b.Slot("X")});
    const Bytes f = b.Build();
    EXPECT_EQ(Slice(f, start, 8), b.Int32s({3, 3}));
    EXPECT_EQ(F64At(f, start + 8), 1.0);
    EXPECT_EQ(f[start + 16], 7);
    const size_t second = start + 8 + 16, third = second + 24, type4 = third + 16;
    EXPECT_EQ(F64At(f, second), 2.0);
    EXPECT_EQ(TextAt(f, second + 9, 15), "eight888       ");
    EXPECT_EQ(F64At(f, third), 3.0);
    EXPECT_EQ(f[third + 8], 0);
    EXPECT_EQ(Slice(f, type4, 16), b.Int32s({4, 1, 1, 999}));
}

TEST(SysFileBuilder, VeryLongStringSegments) {
    SysFileBuilder b;
    b.Numeric("N");
    Var& text = b.String("REMARKS", 300);
    EXPECT_EQ(text.Units(), 38);
    EXPECT_EQ(text.Slot(), 2);
    b.Case({1.0, std::string(300, 'x')});
    const Bytes f = b.Build();
    // Segment 0: width 255 and 31 continuations; segment 1: width 48 and 5.
    const size_t seg0 = 176 + 32, seg1 = seg0 + 32 * 32;
    EXPECT_EQ(I32At(f, seg0 + 4), 255);
    EXPECT_EQ(TextAt(f, seg0 + 24, 8), "REMARKS ");
    EXPECT_EQ(I32At(f, seg1 + 4), 48);
    EXPECT_EQ(TextAt(f, seg1 + 24, 8), "REMAR0  ");
    const size_t data = b.DataStart();
    EXPECT_EQ(data, seg1 + 6 * 32 + 8);
    ASSERT_EQ(f.size(), data + 39 * 8);
    EXPECT_EQ(TextAt(f, data + 8, 256), std::string(255, 'x') + " ");
    EXPECT_EQ(TextAt(f, data + 8 + 256, 48), std::string(45, 'x') + std::string(3, ' '));

    SysFileBuilder wide;
    EXPECT_EQ(wide.String("W", 504).Units(), 64);
}

TEST(SysFileBuilder, ExtensionRecordsAndTheirTexts) {
    SysFileBuilder b(Endian::Swapped);
    b.Numeric("AGE").LongName("age");
    b.String("INCOME", 600).LongName("Income");
    const size_t start = b.DataStart() - 8;
    b.LongNames().VeryLongStrings().CaseCount64(5);
    const Bytes f = b.Build();

    const std::string names = "AGE=age\tINCOME=Income";
    EXPECT_EQ(Slice(f, start, 16), b.Int32s({7, 13, 1, int32_t(names.size())}));
    EXPECT_EQ(TextAt(f, start + 16, names.size()), names);
    const size_t vls = start + 16 + names.size();
    const std::string widths("INCOME=600\0\t", 12);
    EXPECT_EQ(Slice(f, vls, 16), b.Int32s({7, 14, 1, 12}));
    EXPECT_EQ(TextAt(f, vls + 16, 12), widths);
    const size_t count = vls + 28;
    EXPECT_EQ(Slice(f, count, 16), b.Int32s({7, 16, 8, 2}));
    Bytes counts = b.Int64(1), five = b.Int64(5);
    counts.insert(counts.end(), five.begin(), five.end());
    EXPECT_EQ(Slice(f, count + 16, 16), counts);
    EXPECT_EQ(I32At(f, count + 32), I32At(b.Int32(999), 0));

    EXPECT_EQ(SysFileBuilder::AttributeText({{"Size", {"1", "2"}}, {"Empty", {}}}),
              "Size('1'\n'2'\n)");
    EXPECT_EQ(SysFileBuilder::DichotomySetLine("$drinks", "1", "Drinks", {"tea", "coffee"}),
              "$drinks=D1 1 6 Drinks tea coffee");
}
