// Appending to a compressed file against the fixture builder's bytes, and the
// movers that cut very long strings into segments at whole characters.
#include <gtest/gtest.h>

#include <cstring>
#include <fstream>
#include <iterator>
#include <string>

#include "SaveDS.h"
#include "api_handles.h"
#include "reader_support.h"

using namespace fixture;

namespace {

Bytes ReadBytes(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    return Bytes(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

// Appending continues the last, half-filled block: the new code overwrites
// the first padding code and the block is written again whole.
TEST(Writer, AppendContinuesTheLastCompressedBlock) {
    SysFileBuilder b;
    b.Compressed().Numeric("N");
    for (double v : {1.0, 2.0, 0.25}) b.Case({v});
    const std::string path = b.WriteTemp();
    {
        SystemFileDataSource source(path.c_str());
        const double value = 4.0;
        source.WriteCase(&value);
        source.FinishWriting();
        EXPECT_EQ(source.CaseCount(), 4);
    }
    SysFileBuilder all;
    all.Compressed().Numeric("N");
    for (double v : {1.0, 2.0, 0.25, 4.0}) all.Case({v});
    EXPECT_EQ(ReadBytes(path), all.Build());
}

TEST(Movers, CutVeryLongStringsIntoSegments) {
    using SaveDS = SystemFileDataSource::SaveDS;
    Utf8Mode utf8;
    struct Cut {
        const char* name;
        int width;
        std::string text;
        std::vector<std::string> segments;  // each as written, padding included
    };
    const std::string e = "\xc3\xa9";  // two bytes
    const Cut cuts[] = {
        {"width600",
         600,
         std::string(600, 'a'),
         {std::string(255, 'a') + ' ', std::string(255, 'a') + ' ',
          std::string(90, 'a') + std::string(6, ' ')}},
        {"multipleOf252",
         504,
         std::string(504, 'b'),
         {std::string(255, 'b') + ' ', std::string(249, 'b') + std::string(7, ' ')}},
        {"blankAt254",
         300,
         std::string(254, 'c') + ' ' + e + std::string(43, 'c'),
         {std::string(254, 'c') + "  ", e + std::string(43, 'c') + "   "}},
        {"characterAcross255",
         300,
         std::string(254, 'd') + e + std::string(44, 'd'),
         {std::string(254, 'd') + '\0' + ' ', e + std::string(44, 'd') + "  "}},
    };
    for (const Cut& cut : cuts) {
        SCOPED_TRACE(cut.name);
        std::string source =
            cut.text + std::string(8 * size_t(ValueUnits(cut.width)) - cut.width, ' ');
        std::string expected;
        for (const std::string& segment : cut.segments) expected += segment;
        std::string output(expected.size(), '?');
        SaveDS::EStringMover mover(reinterpret_cast<unsigned char*>(&output[0]), cut.width);
        const auto* begin = reinterpret_cast<const unsigned char*>(source.data());
        EXPECT_EQ(mover.Move(begin), begin + source.size());
        EXPECT_EQ(output, expected);
    }
    unsigned char units[16] = {1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 16};
    unsigned char out[16] = {};
    SaveDS::OrdinaryMover ordinary(out, 2);
    EXPECT_EQ(ordinary.Move(units), units + 16);
    EXPECT_EQ(0, std::memcmp(out, units, 16));
}

}  // namespace
