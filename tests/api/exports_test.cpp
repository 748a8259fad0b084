// The public interface: the export table against the header and against what
// the built shared library really exports, and the header as callers see it.
#include <gtest/gtest.h>

#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <set>
#include <sstream>
#include <string>
#include <type_traits>
#include <vector>

#include "qoraio32.h"

namespace {

// Argument bytes of a call as 32-bit stdcall counts them.
template <typename F>
struct ArgBytes;
template <typename R, typename... A>
struct ArgBytes<R(A...)> {
    static constexpr int value = (0 + ... + (std::is_same_v<A, double> ? 8 : 4));
};

struct Call {
    std::string name;
    int bytes;
    std::string plain;
    bool built;
    int headerBytes;  // from the declaration of the plain name
};

const std::vector<Call> kCalls = {
#define QORA_CALL(name, bytes, plain, state) \
    {#name, bytes, #plain, std::string(#state) == "BUILT", ArgBytes<decltype(plain)>::value},
#include "qoraexports.def"
#undef QORA_CALL
};

TEST(ExportTable, HasEveryCallBuiltOnceUnderItsDecoratedNameAndTheIrregularAlias) {
    ASSERT_EQ(kCalls.size(), 116u);
    std::set<std::string> names, plains, decorated;
    for (const Call& call : kCalls) {
        EXPECT_TRUE(names.insert(call.name).second) << call.name;
        EXPECT_TRUE(plains.insert(call.plain).second) << call.plain;
        decorated.insert(call.name + "@" + std::to_string(call.bytes));
        EXPECT_EQ(call.bytes, call.headerBytes) << call.name;
        EXPECT_TRUE(call.built) << call.name << " is not built";
        // The one call exported under a name that is not its plain name.
        const bool alias = call.name == "qoraIsCompatibleEncoding";
        EXPECT_EQ(call.plain, alias ? "qoraIsCompatibleEndoding" : call.name);
    }
    for (const char* name :
         {"qoraIsCompatibleEncoding@8", "qoraOpenRead@8", "qoraSysmisVal@0", "qoraConvertTime@24",
          "qoraSetVarNMissingValues@36", "qoraGetVarNValueLabelLong@28", "qoraAddMultRespDefN@28",
          "qoraGetInterfaceEncoding@0"})
        EXPECT_EQ(decorated.count(name), 1u) << name;
}

TEST(ExportTable, LibraryExportsExactlyTheBuiltPlainNames) {
    std::set<std::string> built, exported;
    for (const Call& call : kCalls)
        if (call.built) built.insert(call.plain);
    std::unique_ptr<FILE, int (*)(FILE*)> nm(
        popen("nm -D --defined-only '" QORA_LIBRARY_PATH "'", "r"), pclose);
    ASSERT_TRUE(nm);
    char line[512];
    while (std::fgets(line, sizeof line, nm.get())) {
        std::istringstream fields(line);
        std::string address, type, name;
        if (!(fields >> address >> type >> name)) continue;
        EXPECT_EQ(built.count(name), 1u) << "exported but not a built call: " << name;
        EXPECT_TRUE(type == "T" || type == "W") << name << " is not a function";
        exported.insert(name);
    }
    ASSERT_FALSE(exported.empty()) << "nm found nothing in " QORA_LIBRARY_PATH;
    for (const std::string& name : built)
        EXPECT_EQ(exported.count(name), 1u) << "built but not exported: " << name;
}

// The definition's layout on this build (412 bytes where pointers take 4).
constexpr size_t kPointer = sizeof(char*);
static_assert(offsetof(qoraMultRespDef, label) == 65);
static_assert(offsetof(qoraMultRespDef, isDichotomy) == 324);
static_assert(offsetof(qoraMultRespDef, isNumeric) == 328);
static_assert(offsetof(qoraMultRespDef, useCategoryLabels) == 332);
static_assert(offsetof(qoraMultRespDef, useFirstVarLabel) == 336);
static_assert(offsetof(qoraMultRespDef, reserved) == 340);
static_assert(offsetof(qoraMultRespDef, numericCountedValue) == 396);
static_assert(offsetof(qoraMultRespDef, countedValue) == 400);
static_assert(offsetof(qoraMultRespDef, varNames) == 400 + kPointer);
static_assert(offsetof(qoraMultRespDef, numVars) == 400 + 2 * kPointer);
static_assert(sizeof(qoraMultRespDef) ==
              (400 + 3 * kPointer + sizeof(int) - 1) / kPointer * kPointer);
static_assert(kPointer != 4 || sizeof(qoraMultRespDef) == 412);

TEST(PublicHeader, CompilesAsStrictC) {
    const std::string data = QORA_TEST_DATA_DIR;  // <source>/tests/data
    const std::string header = data.substr(0, data.rfind("/tests/")) + "/api/qoraio32.h";
    if (std::system("command -v cc >/dev/null 2>&1") != 0) GTEST_SKIP() << "no C compiler";
    const std::string command =
        "cc -std=c99 -pedantic -Wall -Wextra -Werror -fsyntax-only -x c '" + header + "'";
    EXPECT_EQ(std::system(command.c_str()), 0) << command;
}

}  // namespace
