// Byte reversal of the numbers of a file written in the opposite byte order.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>

inline void SwapBytes(void* bytes, size_t size) {
    auto* p = static_cast<unsigned char*>(bytes);
    std::reverse(p, p + size);
}

inline int32_t SwapInt32(int32_t value) { return int32_t(__builtin_bswap32(uint32_t(value))); }

inline double SwapDouble(double value) {
    SwapBytes(&value, sizeof value);
    return value;
}

// One 8-byte value unit of a case, reversed in place (on the case read path).
inline void ReverseUnit(unsigned char* unit) {
    uint64_t bits;
    std::memcpy(&bits, unit, sizeof bits);
    bits = __builtin_bswap64(bits);
    std::memcpy(unit, &bits, sizeof bits);
}
