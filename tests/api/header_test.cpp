// The public header as callers see it: the fixed layout of the one structure
// that crosses the interface, and a plain C compiler's view of the header.
#include <gtest/gtest.h>

#include <cstddef>
#include <cstdlib>
#include <string>

#include "qoraio32.h"

namespace {

TEST(PublicHeader, MultipleResponseDefinitionLayout) {
    EXPECT_EQ(offsetof(qoraMultRespDef, label), 65u);
    EXPECT_EQ(offsetof(qoraMultRespDef, isDichotomy), 324u);
    EXPECT_EQ(offsetof(qoraMultRespDef, isNumeric), 328u);
    EXPECT_EQ(offsetof(qoraMultRespDef, useCategoryLabels), 332u);
    EXPECT_EQ(offsetof(qoraMultRespDef, useFirstVarLabel), 336u);
    EXPECT_EQ(offsetof(qoraMultRespDef, reserved), 340u);
    EXPECT_EQ(offsetof(qoraMultRespDef, numericCountedValue), 396u);
    EXPECT_EQ(offsetof(qoraMultRespDef, countedValue), 400u);
    EXPECT_EQ(offsetof(qoraMultRespDef, varNames), 400u + sizeof(char*));
    EXPECT_EQ(offsetof(qoraMultRespDef, numVars), 400u + 2 * sizeof(char*));
    // 412 bytes where pointers take 4.
    const size_t end = 400 + 2 * sizeof(char*) + sizeof(int);
    EXPECT_EQ(sizeof(qoraMultRespDef),
              (end + alignof(char*) - 1) / alignof(char*) * alignof(char*));
}

TEST(PublicHeader, CompilesAsStrictC) {
    const std::string data = QORA_TEST_DATA_DIR;  // <source>/tests/data
    const std::string header = data.substr(0, data.rfind("/tests/")) + "/api/qoraio32.h";
    if (std::system("command -v cc >/dev/null 2>&1") != 0) GTEST_SKIP() << "no C compiler";
    const std::string command =
        "cc -std=c99 -pedantic -Wall -Wextra -Werror -fsyntax-only -x c '" + header + "'";
    EXPECT_EQ(std::system(command.c_str()), 0) << command;
}

}  // namespace
