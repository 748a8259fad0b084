#include "specialvalues.h"

#include <gtest/gtest.h>

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

}  // namespace
