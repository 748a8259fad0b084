// The movers that cut very long strings into segments at whole characters.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "SaveDS.h"
#include "api_handles.h"

using namespace fixture;

namespace {

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
    const std::string a(255, 'a');
    // clang-format off
    const Cut cuts[] = {
        {"width600", 600, std::string(600, 'a'),
         {a + ' ', a + ' ', std::string(90, 'a') + "      "}},
        {"multipleOf252", 504, std::string(504, 'b'),
         {std::string(255, 'b') + ' ', std::string(249, 'b') + std::string(7, ' ')}},
        {"blankAt254", 300, std::string(254, 'c') + ' ' + e + std::string(43, 'c'),
         {std::string(254, 'c') + "  ", e + std::string(43, 'c') + "   "}},
        {"characterAcross255", 300, std::string(254, 'd') + e + std::string(44, 'd'),
         {std::string(254, 'd') + '\0' + ' ', e + std::string(44, 'd') + "  "}},
    };
    // clang-format on
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
}

}  // namespace
