// What the reading and the writing benchmarks share: the shape of the case
// data, the pseudo-random numbers that fill it, and the temporary directory
// the files live in for one run.
#pragma once

#include <cstdint>
#include <string>

constexpr int kVariables = 100;
constexpr int64_t kCases = 262144;  // 100 numbers of 8 bytes: 200 MiB of case data
constexpr int64_t kCaseBytes = kCases * kVariables * 8;

// A cheap, fixed sequence of pseudo-random numbers.
struct Random {
    uint64_t state = 0x9E3779B97F4A7C15ull;
    uint32_t Next() {
        state = state * 6364136223846793005ull + 1442695040888963407ull;
        return uint32_t(state >> 33);
    }
};

// Made by main before the benchmarks run and removed, with all in it, after.
inline std::string gBenchDirectory;
