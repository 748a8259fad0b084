// The fixture builder is what every reader test trusts, so its bytes are
// checked here against the file layout by hand-counted offsets.
#include <gtest/gtest.h>

#include <algorithm>

#include "sysfile_builder.h"

using namespace fixture;

namespace {

std::string TextAt(const Bytes& b, size_t at, size_t n) {
    return std::string(b.begin() + at, b.begin() + at + n);
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
    EXPECT_EQ(Slice(f, 84, 8), b.Unit(99.5));
    EXPECT_EQ(TextAt(f, 92, 81), "04 Dec 2617:16:43My file" + std::string(57, ' '));
    EXPECT_EQ(Slice(f, 173, 3), Bytes(3, 0));
    EXPECT_EQ(Slice(f, 176, 4), b.Int32(2));  // first variable record
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

    // The header's numbers, the end record and its filler; the missing value -1,
    // the case's 30 and the fields of both variables but their names.
    std::vector<std::pair<size_t, size_t>> numbers = {{84, 8}, {216, 8}, {272, 8}};
    for (size_t at : {64, 68, 72, 76, 80, 264, 268}) numbers.push_back({at, 4});
    for (size_t at = 176; at < 248; at += 4)
        if (at < 200 || at == 208 || at >= 224) numbers.push_back({at, 4});

    Bytes rest = s;
    for (auto [at, width] : numbers) {
        const Bytes native = Slice(n, at, width);
        EXPECT_EQ(Slice(s, at, width), Bytes(native.rbegin(), native.rend())) << "offset " << at;
        std::copy_n(n.begin() + at, width, rest.begin() + at);
    }
    EXPECT_EQ(rest, n);  // texts, string missing value and string unit unchanged
    EXPECT_EQ(Slice(s, 64, 4), Bytes({0, 0, 0, 2}));  // the other order of this host
    EXPECT_EQ(TextAt(s, 256, 8), "NA      ");
    EXPECT_EQ(TextAt(s, 280, 8), "Ann     ");
}
