// The export table against the public header and against what the built
// shared library really exports.
#include <gtest/gtest.h>

#include <cstdio>
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

std::string DecoratedName(const Call& call) { return call.name + "@" + std::to_string(call.bytes); }

std::string RunCommand(const std::string& command) {
    std::unique_ptr<FILE, int (*)(FILE*)> pipe(popen(command.c_str(), "r"), pclose);
    if (!pipe) return "";
    std::string output;
    char buffer[512];
    while (std::fgets(buffer, sizeof buffer, pipe.get())) output += buffer;
    return output;
}

// Defined dynamic symbols of the built library, by name, with their nm type.
std::vector<std::pair<std::string, char>> ExportedSymbols() {
    std::vector<std::pair<std::string, char>> symbols;
    std::istringstream lines(RunCommand("nm -D --defined-only '" QORA_LIBRARY_PATH "'"));
    std::string line;
    while (std::getline(lines, line)) {
        std::istringstream fields(line);
        std::string address, type, name;
        if (fields >> address >> type >> name) symbols.emplace_back(name, type[0]);
    }
    return symbols;
}

TEST(ExportTable, HasEveryCallOnceWithTheHeadersArgumentBytes) {
    ASSERT_EQ(kCalls.size(), 116u);
    std::set<std::string> names, plains;
    for (const Call& call : kCalls) {
        EXPECT_TRUE(names.insert(call.name).second) << call.name;
        EXPECT_TRUE(plains.insert(call.plain).second) << call.plain;
        EXPECT_EQ(call.bytes, call.headerBytes) << call.name;
        if (call.name != "qoraIsCompatibleEncoding") {
            EXPECT_EQ(call.name, call.plain);
        }
    }
}

TEST(ExportTable, KeepsTheIrregularAlias) {
    int aliases = 0;
    for (const Call& call : kCalls) {
        EXPECT_NE(call.plain, "qoraIsCompatibleEncoding");
        if (call.plain == "qoraIsCompatibleEndoding") {
            ++aliases;
            EXPECT_EQ(DecoratedName(call), "qoraIsCompatibleEncoding@8");
        }
    }
    EXPECT_EQ(aliases, 1);
}

TEST(ExportTable, GivesTheDecoratedWindowsNames) {
    std::set<std::string> decorated;
    for (const Call& call : kCalls) decorated.insert(DecoratedName(call));
    EXPECT_EQ(decorated.size(), 116u);
    for (const char* name :
         {"qoraOpenRead@8", "qoraSysmisVal@0", "qoraConvertTime@24", "qoraSetVarNMissingValues@36",
          "qoraGetVarNValueLabelLong@28", "qoraAddMultRespDefN@28", "qoraGetInterfaceEncoding@0"})
        EXPECT_EQ(decorated.count(name), 1u) << name;
}

TEST(ExportTable, LibraryExportsExactlyTheBuiltPlainNames) {
    std::set<std::string> built;
    for (const Call& call : kCalls)
        if (call.built) built.insert(call.plain);
    const auto symbols = ExportedSymbols();
    ASSERT_FALSE(symbols.empty()) << "nm found nothing in " QORA_LIBRARY_PATH;
    std::set<std::string> exported;
    for (const auto& [name, type] : symbols) {
        EXPECT_EQ(built.count(name), 1u) << "exported but not a built call: " << name;
        EXPECT_TRUE(type == 'T' || type == 'W') << name << " is not a function";
        exported.insert(name);
    }
    for (const std::string& name : built)
        EXPECT_EQ(exported.count(name), 1u) << "built but not exported: " << name;
}

}  // namespace
