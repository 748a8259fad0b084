// Files of known cases for the case reading tests, in every byte order and
// with raw or compressed data.
#pragma once

#include <gtest/gtest.h>

#include <string>
#include <tuple>

#include "sysfile_builder.h"

namespace fixture {

// Byte order and whether the data are compressed.
using DataForm = std::tuple<Endian, bool>;

inline std::string DataFormName(const ::testing::TestParamInfo<DataForm>& info) {
    return std::string(std::get<0>(info.param) == Endian::Native ? "Native" : "Swapped") +
           (std::get<1>(info.param) ? "Compressed" : "Raw");
}

inline auto AllDataForms() {
    return ::testing::Combine(::testing::Values(Endian::Native, Endian::Swapped),
                              ::testing::Bool());
}

// The standard cases: X whole numbers (coded when compressed), S a string
// of width 12 (blank in case 3), Y fractions (raw), system-missing in case 2.
inline double ExpectedX(int i) { return i; }
inline std::string ExpectedS(int i) {
    return i == 3
               ? std::string(12, ' ')
               : "case " + std::to_string(i) + std::string(12 - 5 - std::to_string(i).size(), ' ');
}
inline double ExpectedY(int i) { return i == 2 ? kSysmis : i * 1e10 + 0.25; }

inline SysFileBuilder& StandardCases(SysFileBuilder& b, int count) {
    b.Numeric("X");
    b.String("S", 12);
    b.Numeric("Y");
    for (int i = 0; i < count; ++i)
        b.Case({ExpectedX(i), i == 3 ? std::string() : "case " + std::to_string(i), ExpectedY(i)});
    return b;
}

}  // namespace fixture
