// Variable definition calls through the public header: set on a write
// handle and read back (files read back in bigdictionary_test.cpp).
#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <tuple>
#include <vector>

#include "api_handles.h"
#include "qoraio32.h"
#include "sysfile_builder.h"

namespace {

using fixture::OpenHandle;

// A write handle in a directory of its own, with the variables a test names.
class WriteHandle : public ::testing::Test {
  protected:
    void SetUp() override { fixture::OpenForWrite(fDir.Path() + "/out.qsf", fHandle); }
    int h() const { return fHandle.get(); }
    void Define(std::initializer_list<std::pair<const char*, int>> vars) {
        for (auto [name, type] : vars) ASSERT_EQ(qoraSetVarName(h(), name, type), QORA_STATUS_OK);
    }

    fixture::TempDir fDir;
    OpenHandle fHandle;
};

// A format as one number: type, width, decimals.
int Format(int (*get)(int, const char*, int*, int*, int*), int h, const char* var) {
    int type = 0, decimals = 0, width = 0;
    const int status = get(h, var, &type, &decimals, &width);
    return status ? -status : type * 10000 + width * 100 + decimals;
}

TEST(ValidateVarname, AppliesTheNameRulesToTheTrimmedName) {
    const std::string longest(64, 'a'), tooLong(65, 'a');
    for (auto [name, expected] : {std::pair<const char*, int>{"  age  ", 0},
                                  {"WITH", 5},
                                  {"with", 5},
                                  {"WITHIN", 0},
                                  {"1abc", 6},
                                  {"_abc", 6},
                                  {"a b", 4},
                                  {"#tmp", 1},
                                  {"$sys", 2},
                                  {"", 3},
                                  {"    ", 3},
                                  {nullptr, 3},
                                  {tooLong.c_str(), 3},
                                  {longest.c_str(), 0}})
        EXPECT_EQ(qoraValidateVarname(name), expected) << (name ? name : "null");
}

TEST_F(WriteHandle, SetVarNameChecksInOrderAndKeepsTheCallersSpelling) {
    for (auto [name, type, status] : {std::tuple<const char*, int, int>{"#tmp", 0, 10},
                                      {"$sys", 0, 10},
                                      {nullptr, 0, 10},
                                      {"ok", 40000, 17},
                                      {"ok", -1, 17},
                                      {"  age ", 0, 0},
                                      {"AGE", 0, 13},
                                      {"AGE", 40000, 17},   // type before duplicate
                                      {"1AGE", 40000, 10},  // name first
                                      {"Name", 32767, 0}})
        EXPECT_EQ(qoraSetVarName(h(), name, type), status) << (name ? name : "null") << type;

    char name[80] = "junk";
    int type = -1;
    ASSERT_EQ(qoraGetVarInfo(h(), 0, name, &type), QORA_STATUS_OK);
    EXPECT_EQ(name + std::string("|") + std::to_string(type), "age|0");
    ASSERT_EQ(qoraGetVarInfo(h(), 1, name, &type), QORA_STATUS_OK);
    EXPECT_EQ(name + std::string("|") + std::to_string(type), "Name|32767");
    EXPECT_EQ(qoraGetVarInfo(h(), 2, name, &type), QORA_STATUS_VAR_NOT_FOUND);
    EXPECT_EQ(name + std::string("|") + std::to_string(type), "|0");
    EXPECT_EQ(qoraGetVarInfo(h(), -1, name, &type), QORA_STATUS_VAR_NOT_FOUND);
    EXPECT_EQ(qoraGetVarInfo(h(), 0, nullptr, &type), QORA_STATUS_BAD_FILE_HANDLE);

    double varHandle = -1.0;
    EXPECT_EQ(qoraGetVarHandle(h(), " NAME ", &varHandle), QORA_STATUS_OK);
    EXPECT_EQ(varHandle, 2.0);
    EXPECT_EQ(qoraGetVarHandle(h(), "nope", &varHandle), QORA_STATUS_VAR_NOT_FOUND);
    EXPECT_EQ(varHandle, 0.0);
    EXPECT_EQ(qoraGetVarHandle(h(), "age", nullptr), QORA_STATUS_BAD_FILE_HANDLE);
}

// Stored labels keep 256 bytes, the short getter hands out 120, cut at whole
// characters in UTF-8 mode.
TEST_F(WriteHandle, LabelsAreCutAtWholeCharacters) {
    Define({{"v", 0}});
    char buffer[400];
    int length = -1;
    EXPECT_EQ(qoraGetVarLabelLong(h(), "v", buffer, sizeof buffer, &length), QORA_WARN_NO_LABEL);
    EXPECT_EQ(length, 0);
    std::string euros;
    for (int i = 0; i < 100; ++i) euros += "\xE2\x82\xAC";  // 300 bytes, 3 per character
    const struct {
        bool utf8;
        std::string label;
        int status;
        size_t stored, shown;  // the leading bytes of label kept
    } rows[] = {
        {false, std::string(300, 'x'), QORA_WARN_LABEL_TRUNCATED, 256, 120},
        {false, std::string(200, 'y'), QORA_STATUS_OK, 200, 120},
        {true, euros, QORA_WARN_LABEL_TRUNCATED, 255, 120},
        {true, "a" + euros, QORA_WARN_LABEL_TRUNCATED, 256, 118},
    };
    for (const auto& r : rows) {
        SCOPED_TRACE(r.label);
        std::unique_ptr<fixture::Utf8Mode> mode(r.utf8 ? new fixture::Utf8Mode : nullptr);
        EXPECT_EQ(qoraSetVarLabel(h(), "v", r.label.c_str()), r.status);
        ASSERT_EQ(qoraGetVarLabelLong(h(), "v", buffer, sizeof buffer, &length), QORA_STATUS_OK);
        EXPECT_EQ(buffer, r.label.substr(0, r.stored));
        EXPECT_EQ(length, int(r.stored));
        ASSERT_EQ(qoraGetVarLabel(h(), "v", buffer), QORA_STATUS_OK);
        EXPECT_EQ(buffer, r.label.substr(0, r.shown));
    }
    ASSERT_EQ(qoraGetVarLabelLong(h(), "v", buffer, 11, nullptr), QORA_STATUS_OK);
    EXPECT_EQ(std::string(buffer), std::string(1, 'a') + euros.substr(0, 9));
    EXPECT_EQ(qoraSetVarLabel(h(), "v", nullptr), QORA_STATUS_OK);
    ASSERT_EQ(qoraGetVarLabelLong(h(), "v", buffer, sizeof buffer, &length), QORA_STATUS_OK);
    EXPECT_EQ(length, 0);
    EXPECT_EQ(qoraGetVarLabelLong(h(), "v", buffer, 0, &length), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(qoraGetVarLabelLong(h(), "v", nullptr, 10, &length), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(qoraSetVarLabel(h(), "w", "l"), QORA_STATUS_VAR_NOT_FOUND);
}

TEST_F(WriteHandle, FormatsFollowTheRulesOfTheirType) {
    Define({{"n", 0}, {"s", 20}});
    EXPECT_EQ(Format(qoraGetVarPrintFormat, h(), "n"), 50802);  // the defaults
    EXPECT_EQ(Format(qoraGetVarWriteFormat, h(), "s"), 12000);
    const int kPrint = QORA_STATUS_BAD_PRINT_FORMAT, kWrite = QORA_STATUS_BAD_WRITE_FORMAT;
    const struct {
        bool print;
        const char* var;
        int type, decimals, width, status;
    } rows[] = {
        {true, "n", 6, 0, 8, kPrint},
        {false, "n", 6, 0, 8, 0},
        {false, "n", 6, 0, 9, kWrite},
        {true, "s", 1, 0, 19, kPrint},
        {true, "s", 1, 0, 20, 0},
        {true, "s", 2, 0, 40, 0},
        {true, "s", 5, 2, 8, kPrint},
        {true, "n", 5, 17, 40, kPrint},
        {true, "n", 5, 3, 3, kPrint},
        {true, "n", 5, 3, 4, 0},
        {true, "n", 22, 1, 21, kPrint},
        {true, "n", 22, 1, 22, 0},
        {true, "n", 20, 1, 20, kPrint},
        {true, "n", 7, 0, 5, kPrint},
        // The code is checked before the name is looked up.
        {true, "absent", 13, 0, 8, kPrint},
        {false, "absent", 40, 0, 8, kWrite},
        {true, "absent", 5, 0, 8, QORA_STATUS_VAR_NOT_FOUND},
    };
    for (const auto& r : rows) {
        auto set = r.print ? qoraSetVarPrintFormat : qoraSetVarWriteFormat;
        EXPECT_EQ(set(h(), r.var, r.type, r.decimals, r.width), r.status)
            << r.print << r.var << " " << r.type << "." << r.decimals << "." << r.width;
    }
    EXPECT_EQ(Format(qoraGetVarPrintFormat, h(), "n"), 222201);
    EXPECT_EQ(Format(qoraGetVarWriteFormat, h(), "n"), 60800);
    EXPECT_EQ(Format(qoraGetVarPrintFormat, h(), "s"), 24000);
    int type = 5, decimals = 5, width = 5;
    EXPECT_EQ(qoraGetVarPrintFormat(h(), "absent", &type, &decimals, &width),
              QORA_STATUS_VAR_NOT_FOUND);
    EXPECT_EQ(type * 10000 + width * 100 + decimals, 50802);
    EXPECT_EQ(qoraGetVarPrintFormat(h(), "n", nullptr, &decimals, &width),
              QORA_STATUS_BAD_FILE_HANDLE);
}

TEST_F(WriteHandle, MissingValues) {
    Define({{"n", 0}, {"s", 4}, {"s3", 3}, {"s8", 8}, {"s10", 10}});
    const int kSpec = QORA_STATUS_BAD_MISSING_SPEC;
    ASSERT_EQ(qoraSetVarNMissingValues(h(), "n", 2, 9.0, 99.0, 7.0), QORA_STATUS_OK);
    for (auto [var, count, status] : {std::tuple<const char*, int, int>{"n", -1, kSpec},
                                      {"n", 4, kSpec},
                                      {"s", 1, QORA_STATUS_NUMERIC_REQUIRED},
                                      {"s", 4, kSpec},
                                      {"x", 9, QORA_STATUS_VAR_NOT_FOUND}})
        EXPECT_EQ(qoraSetVarNMissingValues(h(), var, count, 1.0, 2.0, 3.0), status) << var << count;
    EXPECT_EQ(qoraSetVarNMissingValues(h(), "n", -2, 5.0, 1.0, 0.0), kSpec);  // low above high
    // The failed calls changed nothing.
    int count = 0;
    double v[3] = {-1, -1, -1};
    ASSERT_EQ(qoraGetVarNMissingValues(h(), "n", &count, &v[0], &v[1], &v[2]), QORA_STATUS_OK);
    EXPECT_EQ(count, 2);
    EXPECT_EQ(std::vector<double>(v, v + 3), (std::vector<double>{9.0, 99.0, 0.0}));
    EXPECT_EQ(qoraSetVarNMissingValues(h(), "n", -2, 3.0, 3.0, 0.0), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarNMissingValues(h(), "n", -3, 1.0, 5.0, 9.0), QORA_STATUS_OK);
    ASSERT_EQ(qoraGetVarNMissingValues(h(), "n", &count, &v[0], nullptr, nullptr), QORA_STATUS_OK);
    ASSERT_EQ(qoraGetVarNMissingValues(h(), "n", &count, &v[0], &v[1], &v[2]), QORA_STATUS_OK);
    EXPECT_EQ(count, -3);
    EXPECT_EQ(std::vector<double>(v, v + 3), (std::vector<double>{1.0, 5.0, 9.0}));
    EXPECT_EQ(qoraGetVarNMissingValues(h(), "n", nullptr, &v[0], &v[1], &v[2]),
              QORA_STATUS_BAD_FILE_HANDLE);
    count = 5;
    EXPECT_EQ(qoraGetVarNMissingValues(h(), "s", &count, &v[0], &v[1], &v[2]),
              QORA_STATUS_NUMERIC_REQUIRED);
    EXPECT_EQ(count, 0);
    EXPECT_EQ(v[0], 0.0);

    // String values are cut or blank-padded to the width; only short strings have them.
    for (auto [var, count, status] : {std::tuple<const char*, int, int>{"s8", 4, kSpec},
                                      {"s8", -1, kSpec},
                                      {"n", 1, QORA_STATUS_STRING_REQUIRED},
                                      {"s10", 1, QORA_STATUS_SHORT_STRING_REQUIRED}})
        EXPECT_EQ(qoraSetVarCMissingValues(h(), var, count, "a", "b", "c"), status) << var << count;
    ASSERT_EQ(qoraSetVarCMissingValues(h(), "s8", 3, "0123456789", "ab", nullptr), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarCMissingValues(h(), "s3", 1, "xy", nullptr, nullptr), QORA_STATUS_OK);
    char v1[16] = "?", v2[16] = "?", v3[16] = "?";
    ASSERT_EQ(qoraGetVarCMissingValues(h(), "s8", &count, v1, v2, v3), QORA_STATUS_OK);
    EXPECT_EQ(std::to_string(count) + "|" + v1 + "|" + v2 + "|" + v3,
              "3|01234567|ab      |        ");
    ASSERT_EQ(qoraGetVarCMissingValues(h(), "s3", &count, v1, v2, v3), QORA_STATUS_OK);
    EXPECT_EQ(std::to_string(count) + "|" + v1 + "|" + v2, "1|xy |");
    EXPECT_EQ(qoraGetVarCMissingValues(h(), "n", &count, v1, v2, v3), QORA_STATUS_STRING_REQUIRED);
    EXPECT_EQ(std::to_string(count) + "|" + v1, "0|");
    EXPECT_EQ(qoraGetVarCMissingValues(h(), "s10", &count, v1, v2, v3),
              QORA_STATUS_SHORT_STRING_REQUIRED);
    EXPECT_EQ(qoraGetVarCMissingValues(h(), "s3", &count, nullptr, nullptr, nullptr),
              QORA_STATUS_OK);
    EXPECT_EQ(count, 1);
}

TEST_F(WriteHandle, DisplayPropertiesIgnoreValuesOutOfRange) {
    Define({{"n", 0}});
    const struct {
        int (*set)(int, const char*, int);
        int (*get)(int, const char*, int*);
        int good, bad, kept, cleared;  // cleared: the output for an unknown name
    } rows[] = {
        {qoraSetVarMeasureLevel, qoraGetVarMeasureLevel, 3, 7, 3, 0},
        {qoraSetVarMeasureLevel, qoraGetVarMeasureLevel, 3, -1, 3, 0},
        {qoraSetVarAlignment, qoraGetVarAlignment, 2, 3, 2, 1},
        {qoraSetVarColumnWidth, qoraGetVarColumnWidth, 12, 0, 12, 0},
        // Too wide for 16 bits: the widest width, never a negative one.
        {qoraSetVarColumnWidth, qoraGetVarColumnWidth, 12, 40000, 32767, 0},
    };
    for (const auto& r : rows) {
        SCOPED_TRACE(r.bad);
        int value = -1;
        ASSERT_EQ(r.set(h(), "n", r.good), QORA_STATUS_OK);
        EXPECT_EQ(r.set(h(), "n", r.bad), QORA_STATUS_OK);
        ASSERT_EQ(r.get(h(), "n", &value), QORA_STATUS_OK);
        EXPECT_EQ(value, r.kept);
        value = 9;
        EXPECT_EQ(r.get(h(), "x", &value), QORA_STATUS_VAR_NOT_FOUND);
        EXPECT_EQ(value, r.cleared);
        EXPECT_EQ(r.set(h(), "x", 1), QORA_STATUS_VAR_NOT_FOUND);
        EXPECT_EQ(r.get(h(), "n", nullptr), QORA_STATUS_BAD_FILE_HANDLE);
    }
}

}  // namespace
