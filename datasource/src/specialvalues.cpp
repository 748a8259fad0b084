#include "specialvalues.h"

#include <cstdint>
#include <cstring>

namespace {

constexpr uint64_t kSysmisBits = 0xFFEFFFFFFFFFFFFFull;
constexpr uint64_t kHighestBits = 0x7FEFFFFFFFFFFFFFull;

double FromBits(uint64_t bits) {
    double value;
    std::memcpy(&value, &bits, sizeof value);
    return value;
}

}  // namespace

// Lowest is system-missing with its low 32 bits decremented by one.
SpecialValues::SpecialValues()
    : fSysmis(FromBits(kSysmisBits)),
      fLowest(FromBits((kSysmisBits & 0xFFFFFFFF00000000ull) |
                       static_cast<uint32_t>(static_cast<uint32_t>(kSysmisBits) - 1u))),
      fHighest(FromBits(kHighestBits)) {}
