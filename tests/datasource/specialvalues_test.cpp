#include "specialvalues.h"

#include <gtest/gtest.h>

#include <cfloat>
#include <cmath>
#include <cstdint>
#include <cstring>

namespace {

uint64_t Bits(double value) {
    uint64_t bits;
    std::memcpy(&bits, &value, sizeof bits);
    return bits;
}

TEST(SpecialValues, AreBitExact) {
    EXPECT_EQ(Bits(SysmisValue()), 0xFFEFFFFFFFFFFFFFull);
    EXPECT_EQ(Bits(LowestValue()), 0xFFEFFFFFFFFFFFFEull);
    EXPECT_EQ(Bits(HighestValue()), 0x7FEFFFFFFFFFFFFFull);
}

TEST(SpecialValues, AreTheExtremeFiniteDoubles) {
    EXPECT_EQ(SysmisValue(), -DBL_MAX);
    EXPECT_EQ(LowestValue(), std::nextafter(-DBL_MAX, 0.0));
    EXPECT_EQ(HighestValue(), DBL_MAX);
}

}  // namespace
