// Variable definition calls through the public header: set on a write
// handle and read back, and read from files made by the fixture builder.
#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "api_handles.h"
#include "qoraio32.h"
#include "sysfile_builder.h"

namespace {

using fixture::Endian;
using fixture::OpenHandle;
using fixture::SysFileBuilder;

// A write handle in a directory of its own.
class WriteHandle : public ::testing::Test {
  protected:
    void SetUp() override { fixture::OpenForWrite(fDir.Path() + "/out.qsf", fHandle); }
    int h() const { return fHandle.get(); }

    fixture::TempDir fDir;
    OpenHandle fHandle;
};

std::string Repeat(const std::string& unit, size_t times) {
    std::string text;
    for (size_t i = 0; i < times; ++i) text += unit;
    return text;
}

TEST(ValidateVarname, AppliesTheNameRulesToTheTrimmedName) {
    EXPECT_EQ(qoraValidateVarname("  age  "), 0);
    EXPECT_EQ(qoraValidateVarname("WITH"), 5);
    EXPECT_EQ(qoraValidateVarname("with"), 5);
    EXPECT_EQ(qoraValidateVarname("WITHIN"), 0);
    EXPECT_EQ(qoraValidateVarname("1abc"), 6);
    EXPECT_EQ(qoraValidateVarname("_abc"), 6);
    EXPECT_EQ(qoraValidateVarname("a b"), 4);
    EXPECT_EQ(qoraValidateVarname("#tmp"), 1);
    EXPECT_EQ(qoraValidateVarname("$sys"), 2);
    EXPECT_EQ(qoraValidateVarname(""), 3);
    EXPECT_EQ(qoraValidateVarname("    "), 3);
    EXPECT_EQ(qoraValidateVarname(nullptr), 3);
    EXPECT_EQ(qoraValidateVarname(std::string(65, 'a').c_str()), 3);
    EXPECT_EQ(qoraValidateVarname(std::string(64, 'a').c_str()), 0);
}

TEST_F(WriteHandle, SetVarNameChecksInOrderAndKeepsTheCallersSpelling) {
    EXPECT_EQ(qoraSetVarName(h(), "#tmp", 0), QORA_STATUS_BAD_VAR_NAME);
    EXPECT_EQ(qoraSetVarName(h(), "$sys", 0), QORA_STATUS_BAD_VAR_NAME);
    EXPECT_EQ(qoraSetVarName(h(), nullptr, 0), QORA_STATUS_BAD_VAR_NAME);
    EXPECT_EQ(qoraSetVarName(h(), "ok", 40000), QORA_STATUS_BAD_VAR_TYPE);
    EXPECT_EQ(qoraSetVarName(h(), "ok", -1), QORA_STATUS_BAD_VAR_TYPE);
    ASSERT_EQ(qoraSetVarName(h(), "  age ", 0), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetVarName(h(), "AGE", 0), QORA_STATUS_DUPLICATE_VAR);
    EXPECT_EQ(qoraSetVarName(h(), "AGE", 40000),
              QORA_STATUS_BAD_VAR_TYPE);  // type before duplicate
    EXPECT_EQ(qoraSetVarName(h(), "1AGE", 40000), QORA_STATUS_BAD_VAR_NAME);  // name first
    ASSERT_EQ(qoraSetVarName(h(), "Name", 32767), QORA_STATUS_OK);

    char name[80] = "junk";
    int type = -1;
    ASSERT_EQ(qoraGetVarInfo(h(), 0, name, &type), QORA_STATUS_OK);
    EXPECT_STREQ(name, "age");
    EXPECT_EQ(type, 0);
    ASSERT_EQ(qoraGetVarInfo(h(), 1, name, &type), QORA_STATUS_OK);
    EXPECT_STREQ(name, "Name");
    EXPECT_EQ(type, 32767);
    EXPECT_EQ(qoraGetVarInfo(h(), 2, name, &type), QORA_STATUS_VAR_NOT_FOUND);
    EXPECT_STREQ(name, "");
    EXPECT_EQ(type, 0);
    EXPECT_EQ(qoraGetVarInfo(h(), -1, name, &type), QORA_STATUS_VAR_NOT_FOUND);
    EXPECT_EQ(qoraGetVarInfo(h(), 0, nullptr, &type), QORA_STATUS_BAD_FILE_HANDLE);

    double varHandle = -1.0;
    EXPECT_EQ(qoraGetVarHandle(h(), " NAME ", &varHandle), QORA_STATUS_OK);
    EXPECT_EQ(varHandle, 2.0);
    EXPECT_EQ(qoraGetVarHandle(h(), "nope", &varHandle), QORA_STATUS_VAR_NOT_FOUND);
    EXPECT_EQ(varHandle, 0.0);
    EXPECT_EQ(qoraGetVarHandle(h(), "age", nullptr), QORA_STATUS_BAD_FILE_HANDLE);
}

TEST_F(WriteHandle, GetVarNamesHandsOutCopiesAndRefusesAnEmptyDictionary) {
    int count = 3;
    char** names = reinterpret_cast<char**>(&count);
    int* types = &count;
    EXPECT_EQ(qoraGetVarNames(h(), &count, &names, &types), QORA_STATUS_BAD_FILE);
    EXPECT_EQ(count, 0);
    EXPECT_EQ(names, nullptr);
    EXPECT_EQ(types, nullptr);
    ASSERT_EQ(qoraSetVarName(h(), "first", 0), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarName(h(), "Second", 12), QORA_STATUS_OK);
    ASSERT_EQ(qoraGetVarNames(h(), &count, &names, &types), QORA_STATUS_OK);
    ASSERT_EQ(count, 2);
    EXPECT_STREQ(names[0], "first");
    EXPECT_STREQ(names[1], "Second");
    EXPECT_EQ(types[0], 0);
    EXPECT_EQ(types[1], 12);
    EXPECT_EQ(qoraFreeVarNames(names, types, count), QORA_STATUS_OK);
    EXPECT_EQ(qoraFreeVarNames(nullptr, nullptr, 4), QORA_STATUS_OK);
    EXPECT_EQ(qoraGetVarNames(h(), nullptr, &names, &types), QORA_STATUS_BAD_FILE_HANDLE);
}

TEST_F(WriteHandle, LabelsAreCutAtWholeCharacters) {
    ASSERT_EQ(qoraSetVarName(h(), "v", 0), QORA_STATUS_OK);
    char buffer[400];
    int length = -1;
    EXPECT_EQ(qoraGetVarLabelLong(h(), "v", buffer, sizeof buffer, &length), QORA_WARN_NO_LABEL);
    EXPECT_EQ(length, 0);
    EXPECT_EQ(qoraSetVarLabel(h(), "v", std::string(300, 'x').c_str()), QORA_WARN_LABEL_TRUNCATED);
    ASSERT_EQ(qoraGetVarLabelLong(h(), "v", buffer, sizeof buffer, &length), QORA_STATUS_OK);
    EXPECT_EQ(length, 256);
    EXPECT_EQ(std::strlen(buffer), 256u);
    EXPECT_EQ(qoraSetVarLabel(h(), "v", std::string(200, 'y').c_str()), QORA_STATUS_OK);
    ASSERT_EQ(qoraGetVarLabel(h(), "v", buffer), QORA_STATUS_OK);
    EXPECT_EQ(std::string(buffer), std::string(120, 'y'));
    ASSERT_EQ(qoraGetVarLabelLong(h(), "v", buffer, 11, nullptr), QORA_STATUS_OK);
    EXPECT_EQ(std::string(buffer), std::string(10, 'y'));
    EXPECT_EQ(qoraSetVarLabel(h(), "v", nullptr), QORA_STATUS_OK);
    ASSERT_EQ(qoraGetVarLabelLong(h(), "v", buffer, sizeof buffer, &length), QORA_STATUS_OK);
    EXPECT_EQ(length, 0);
    EXPECT_EQ(qoraGetVarLabelLong(h(), "v", buffer, 0, &length), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(qoraGetVarLabelLong(h(), "v", nullptr, 10, &length), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(qoraSetVarLabel(h(), "w", "l"), QORA_STATUS_VAR_NOT_FOUND);
}

TEST_F(WriteHandle, LabelsAreCutAtWholeUtf8Characters) {
    fixture::Utf8Mode utf8;
    ASSERT_EQ(qoraSetVarName(h(), "v", 0), QORA_STATUS_OK);
    const std::string euros = Repeat("\xE2\x82\xAC", 100);  // 300 bytes, 3 per character
    EXPECT_EQ(qoraSetVarLabel(h(), "v", euros.c_str()), QORA_WARN_LABEL_TRUNCATED);
    char buffer[400];
    int length = 0;
    ASSERT_EQ(qoraGetVarLabelLong(h(), "v", buffer, sizeof buffer, &length), QORA_STATUS_OK);
    EXPECT_EQ(std::string(buffer), euros.substr(0, 255));
    EXPECT_EQ(length, 255);
    ASSERT_EQ(qoraGetVarLabel(h(), "v", buffer), QORA_STATUS_OK);
    EXPECT_EQ(std::string(buffer), euros.substr(0, 120));
    ASSERT_EQ(qoraSetVarLabel(h(), "v", ("a" + euros).c_str()), QORA_WARN_LABEL_TRUNCATED);
    ASSERT_EQ(qoraGetVarLabel(h(), "v", buffer), QORA_STATUS_OK);
    EXPECT_EQ(std::string(buffer), "a" + euros.substr(0, 117));
}

TEST_F(WriteHandle, FormatsFollowTheRulesOfTheirType) {
    ASSERT_EQ(qoraSetVarName(h(), "n", 0), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarName(h(), "s", 20), QORA_STATUS_OK);
    int type = 0, decimals = 0, width = 0;
    ASSERT_EQ(qoraGetVarPrintFormat(h(), "n", &type, &decimals, &width), QORA_STATUS_OK);
    EXPECT_EQ(type * 10000 + width * 100 + decimals, 50802);
    ASSERT_EQ(qoraGetVarWriteFormat(h(), "s", &type, &decimals, &width), QORA_STATUS_OK);
    EXPECT_EQ(type * 10000 + width * 100 + decimals, 12000);

    EXPECT_EQ(qoraSetVarPrintFormat(h(), "n", 6, 0, 8), QORA_STATUS_BAD_PRINT_FORMAT);
    EXPECT_EQ(qoraSetVarWriteFormat(h(), "n", 6, 0, 8), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetVarWriteFormat(h(), "n", 6, 0, 9), QORA_STATUS_BAD_WRITE_FORMAT);
    EXPECT_EQ(qoraSetVarPrintFormat(h(), "s", 1, 0, 19), QORA_STATUS_BAD_PRINT_FORMAT);
    EXPECT_EQ(qoraSetVarPrintFormat(h(), "s", 1, 0, 20), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetVarPrintFormat(h(), "s", 2, 0, 40), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetVarPrintFormat(h(), "s", 5, 2, 8), QORA_STATUS_BAD_PRINT_FORMAT);
    EXPECT_EQ(qoraSetVarPrintFormat(h(), "n", 5, 17, 40), QORA_STATUS_BAD_PRINT_FORMAT);
    EXPECT_EQ(qoraSetVarPrintFormat(h(), "n", 5, 3, 3), QORA_STATUS_BAD_PRINT_FORMAT);
    EXPECT_EQ(qoraSetVarPrintFormat(h(), "n", 5, 3, 4), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetVarPrintFormat(h(), "n", 22, 1, 21), QORA_STATUS_BAD_PRINT_FORMAT);
    EXPECT_EQ(qoraSetVarPrintFormat(h(), "n", 22, 1, 22), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetVarPrintFormat(h(), "n", 20, 1, 20), QORA_STATUS_BAD_PRINT_FORMAT);
    EXPECT_EQ(qoraSetVarPrintFormat(h(), "n", 7, 0, 5), QORA_STATUS_BAD_PRINT_FORMAT);
    // The code is checked before the name is looked up.
    EXPECT_EQ(qoraSetVarPrintFormat(h(), "absent", 13, 0, 8), QORA_STATUS_BAD_PRINT_FORMAT);
    EXPECT_EQ(qoraSetVarWriteFormat(h(), "absent", 40, 0, 8), QORA_STATUS_BAD_WRITE_FORMAT);
    EXPECT_EQ(qoraSetVarPrintFormat(h(), "absent", 5, 0, 8), QORA_STATUS_VAR_NOT_FOUND);

    ASSERT_EQ(qoraGetVarPrintFormat(h(), "n", &type, &decimals, &width), QORA_STATUS_OK);
    EXPECT_EQ(type * 10000 + width * 100 + decimals, 222201);
    ASSERT_EQ(qoraGetVarWriteFormat(h(), "n", &type, &decimals, &width), QORA_STATUS_OK);
    EXPECT_EQ(type * 10000 + width * 100 + decimals, 60800);
    ASSERT_EQ(qoraGetVarPrintFormat(h(), "s", &type, &decimals, &width), QORA_STATUS_OK);
    EXPECT_EQ(type * 10000 + width * 100 + decimals, 24000);
    type = decimals = width = 0;
    EXPECT_EQ(qoraGetVarPrintFormat(h(), "absent", &type, &decimals, &width),
              QORA_STATUS_VAR_NOT_FOUND);
    EXPECT_EQ(type * 10000 + width * 100 + decimals, 50802);
    EXPECT_EQ(qoraGetVarPrintFormat(h(), "n", nullptr, &decimals, &width),
              QORA_STATUS_BAD_FILE_HANDLE);
}

TEST_F(WriteHandle, NumericMissingValues) {
    ASSERT_EQ(qoraSetVarName(h(), "n", 0), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarName(h(), "s", 4), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarNMissingValues(h(), "n", 2, 9.0, 99.0, 7.0), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetVarNMissingValues(h(), "n", -2, 5.0, 1.0, 0.0), QORA_STATUS_BAD_MISSING_SPEC);
    EXPECT_EQ(qoraSetVarNMissingValues(h(), "n", -1, 1.0, 2.0, 3.0), QORA_STATUS_BAD_MISSING_SPEC);
    EXPECT_EQ(qoraSetVarNMissingValues(h(), "n", 4, 1.0, 2.0, 3.0), QORA_STATUS_BAD_MISSING_SPEC);
    EXPECT_EQ(qoraSetVarNMissingValues(h(), "s", 1, 1.0, 0.0, 0.0), QORA_STATUS_NUMERIC_REQUIRED);
    EXPECT_EQ(qoraSetVarNMissingValues(h(), "s", 4, 1.0, 0.0, 0.0), QORA_STATUS_BAD_MISSING_SPEC);
    EXPECT_EQ(qoraSetVarNMissingValues(h(), "x", 9, 1.0, 0.0, 0.0), QORA_STATUS_VAR_NOT_FOUND);
    // The failed calls changed nothing.
    int count = 0;
    double v[3] = {-1, -1, -1};
    ASSERT_EQ(qoraGetVarNMissingValues(h(), "n", &count, &v[0], &v[1], &v[2]), QORA_STATUS_OK);
    EXPECT_EQ(count, 2);
    EXPECT_EQ(v[0], 9.0);
    EXPECT_EQ(v[1], 99.0);
    EXPECT_EQ(v[2], 0.0);

    EXPECT_EQ(qoraSetVarNMissingValues(h(), "n", -2, 3.0, 3.0, 0.0), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarNMissingValues(h(), "n", -3, 1.0, 5.0, 9.0), QORA_STATUS_OK);
    ASSERT_EQ(qoraGetVarNMissingValues(h(), "n", &count, &v[0], &v[1], &v[2]), QORA_STATUS_OK);
    EXPECT_EQ(count, -3);
    EXPECT_EQ(v[0] * 100 + v[1] * 10 + v[2], 159.0);
    // Only the outputs the caller wants.
    ASSERT_EQ(qoraGetVarNMissingValues(h(), "n", &count, &v[0], nullptr, nullptr), QORA_STATUS_OK);
    EXPECT_EQ(qoraGetVarNMissingValues(h(), "n", nullptr, &v[0], &v[1], &v[2]),
              QORA_STATUS_BAD_FILE_HANDLE);
    count = 5;
    v[0] = 4.0;
    EXPECT_EQ(qoraGetVarNMissingValues(h(), "s", &count, &v[0], &v[1], &v[2]),
              QORA_STATUS_NUMERIC_REQUIRED);
    EXPECT_EQ(count, 0);
    EXPECT_EQ(v[0], 0.0);
}

TEST_F(WriteHandle, StringMissingValues) {
    ASSERT_EQ(qoraSetVarName(h(), "n", 0), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarName(h(), "s3", 3), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarName(h(), "s8", 8), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarName(h(), "s10", 10), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetVarCMissingValues(h(), "s8", 4, "a", "b", "c"), QORA_STATUS_BAD_MISSING_SPEC);
    EXPECT_EQ(qoraSetVarCMissingValues(h(), "s8", -1, "a", "b", "c"), QORA_STATUS_BAD_MISSING_SPEC);
    EXPECT_EQ(qoraSetVarCMissingValues(h(), "n", 1, "a", "", ""), QORA_STATUS_STRING_REQUIRED);
    EXPECT_EQ(qoraSetVarCMissingValues(h(), "s10", 1, "a", "", ""),
              QORA_STATUS_SHORT_STRING_REQUIRED);
    ASSERT_EQ(qoraSetVarCMissingValues(h(), "s8", 3, "0123456789", "ab", nullptr), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarCMissingValues(h(), "s3", 1, "xy", nullptr, nullptr), QORA_STATUS_OK);

    int count = 0;
    char v1[16] = "?", v2[16] = "?", v3[16] = "?";
    ASSERT_EQ(qoraGetVarCMissingValues(h(), "s8", &count, v1, v2, v3), QORA_STATUS_OK);
    EXPECT_EQ(count, 3);
    EXPECT_STREQ(v1, "01234567");
    EXPECT_STREQ(v2, "ab      ");
    EXPECT_STREQ(v3, "        ");
    ASSERT_EQ(qoraGetVarCMissingValues(h(), "s3", &count, v1, v2, v3), QORA_STATUS_OK);
    EXPECT_EQ(count, 1);
    EXPECT_STREQ(v1, "xy ");
    EXPECT_STREQ(v2, "");
    EXPECT_EQ(qoraGetVarCMissingValues(h(), "n", &count, v1, v2, v3), QORA_STATUS_STRING_REQUIRED);
    EXPECT_EQ(count, 0);
    EXPECT_STREQ(v1, "");
    EXPECT_EQ(qoraGetVarCMissingValues(h(), "s10", &count, v1, v2, v3),
              QORA_STATUS_SHORT_STRING_REQUIRED);
    EXPECT_EQ(qoraGetVarCMissingValues(h(), "s3", &count, nullptr, nullptr, nullptr),
              QORA_STATUS_OK);
    EXPECT_EQ(count, 1);
}

TEST_F(WriteHandle, DisplayPropertiesIgnoreValuesOutOfRange) {
    ASSERT_EQ(qoraSetVarName(h(), "n", 0), QORA_STATUS_OK);
    int value = -1;
    ASSERT_EQ(qoraSetVarMeasureLevel(h(), "n", 3), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetVarMeasureLevel(h(), "n", 7), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetVarMeasureLevel(h(), "n", -1), QORA_STATUS_OK);
    ASSERT_EQ(qoraGetVarMeasureLevel(h(), "n", &value), QORA_STATUS_OK);
    EXPECT_EQ(value, 3);
    ASSERT_EQ(qoraSetVarAlignment(h(), "n", 2), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetVarAlignment(h(), "n", 3), QORA_STATUS_OK);
    ASSERT_EQ(qoraGetVarAlignment(h(), "n", &value), QORA_STATUS_OK);
    EXPECT_EQ(value, 2);
    ASSERT_EQ(qoraSetVarColumnWidth(h(), "n", 12), QORA_STATUS_OK);
    EXPECT_EQ(qoraSetVarColumnWidth(h(), "n", 0), QORA_STATUS_OK);
    ASSERT_EQ(qoraGetVarColumnWidth(h(), "n", &value), QORA_STATUS_OK);
    EXPECT_EQ(value, 12);
    // Too wide for 16 bits: the widest width, never a negative one.
    ASSERT_EQ(qoraSetVarColumnWidth(h(), "n", 40000), QORA_STATUS_OK);
    ASSERT_EQ(qoraGetVarColumnWidth(h(), "n", &value), QORA_STATUS_OK);
    EXPECT_EQ(value, 32767);

    value = 9;
    EXPECT_EQ(qoraGetVarMeasureLevel(h(), "x", &value), QORA_STATUS_VAR_NOT_FOUND);
    EXPECT_EQ(value, 0);
    EXPECT_EQ(qoraGetVarAlignment(h(), "x", &value), QORA_STATUS_VAR_NOT_FOUND);
    EXPECT_EQ(value, 1);
    EXPECT_EQ(qoraGetVarColumnWidth(h(), "x", &value), QORA_STATUS_VAR_NOT_FOUND);
    EXPECT_EQ(value, 0);
    EXPECT_EQ(qoraSetVarMeasureLevel(h(), "x", 1), QORA_STATUS_VAR_NOT_FOUND);
    EXPECT_EQ(qoraGetVarMeasureLevel(h(), "n", nullptr), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(qoraGetVarAlignment(h(), "n", nullptr), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(qoraGetVarColumnWidth(h(), "n", nullptr), QORA_STATUS_BAD_FILE_HANDLE);
}

TEST(VariableGetters, ClearOutputsOnABadHandle) {
    char name[8] = "junk";
    int type = 5, count = 5;
    double v = 1.0;
    EXPECT_EQ(qoraGetVarInfo(-1, 0, name, &type), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_STREQ(name, "");
    EXPECT_EQ(type, 0);
    EXPECT_EQ(qoraGetVarHandle(100, "a", &v), QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(v, 0.0);
    v = 1.0;
    EXPECT_EQ(qoraGetVarNMissingValues(99, "a", &count, &v, nullptr, nullptr),
              QORA_STATUS_BAD_FILE_HANDLE);
    EXPECT_EQ(count, 0);
    EXPECT_EQ(v, 0.0);
    EXPECT_EQ(qoraSetVarName(-7, "a", 0), QORA_STATUS_BAD_FILE_HANDLE);
}

// Every property of the variable records, read back from a file.
class VariablesFromFile : public ::testing::TestWithParam<Endian> {};

TEST_P(VariablesFromFile, ReadEveryPropertyBack) {
    SysFileBuilder b(GetParam());
    b.Numeric("AGE").Label("Age in years").Missing({-1.0, 99.0});
    b.Numeric("INCOME")
        .MissingRange(-9.0, -1.0, 999.0)
        .Formats(fixture::FormatWord(5, 10, 2), fixture::FormatWord(17, 12, 0));
    b.String("CODE", 4).MissingStrings({"NA", "XX"});
    b.String("COMMENT", 30).Label("Free text");
    OpenHandle h;
    fixture::OpenForRead(b.WriteTemp(), h);

    char text[300];
    int count = 0, type = 0, decimals = 0, width = 0;
    ASSERT_EQ(qoraGetVarInfo(h.get(), 3, text, &type), QORA_STATUS_OK);
    EXPECT_STREQ(text, "comment");  // without a long names record names read in lower case
    EXPECT_EQ(type, 30);
    ASSERT_EQ(qoraGetVarLabel(h.get(), "Age", text), QORA_STATUS_OK);
    EXPECT_STREQ(text, "Age in years");
    ASSERT_EQ(qoraGetVarLabel(h.get(), "comment", text), QORA_STATUS_OK);
    EXPECT_STREQ(text, "Free text");
    EXPECT_EQ(qoraGetVarLabel(h.get(), "income", text), QORA_WARN_NO_LABEL);

    double v[3];
    ASSERT_EQ(qoraGetVarNMissingValues(h.get(), "age", &count, &v[0], &v[1], &v[2]),
              QORA_STATUS_OK);
    EXPECT_EQ(count, 2);
    EXPECT_EQ(v[0], -1.0);
    EXPECT_EQ(v[1], 99.0);
    ASSERT_EQ(qoraGetVarNMissingValues(h.get(), "income", &count, &v[0], &v[1], &v[2]),
              QORA_STATUS_OK);
    EXPECT_EQ(count, -3);
    EXPECT_EQ(v[0], -9.0);
    EXPECT_EQ(v[1], -1.0);
    EXPECT_EQ(v[2], 999.0);
    char s1[9], s2[9], s3[9];
    ASSERT_EQ(qoraGetVarCMissingValues(h.get(), "code", &count, s1, s2, s3), QORA_STATUS_OK);
    EXPECT_EQ(count, 2);
    EXPECT_STREQ(s1, "NA  ");
    EXPECT_STREQ(s2, "XX  ");

    ASSERT_EQ(qoraGetVarPrintFormat(h.get(), "income", &type, &decimals, &width), QORA_STATUS_OK);
    EXPECT_EQ(type * 10000 + width * 100 + decimals, 51002);
    ASSERT_EQ(qoraGetVarWriteFormat(h.get(), "income", &type, &decimals, &width), QORA_STATUS_OK);
    EXPECT_EQ(type * 10000 + width * 100 + decimals, 171200);
    ASSERT_EQ(qoraGetVarPrintFormat(h.get(), "comment", &type, &decimals, &width), QORA_STATUS_OK);
    EXPECT_EQ(type * 10000 + width * 100 + decimals, 13000);
    int level = -1;
    EXPECT_EQ(qoraGetVarMeasureLevel(h.get(), "age", &level), QORA_STATUS_OK);
    EXPECT_GE(level, 0);
    EXPECT_LE(level, 3);
}

INSTANTIATE_TEST_SUITE_P(Orders, VariablesFromFile,
                         ::testing::Values(Endian::Native, Endian::Swapped), fixture::EndianName);

}  // namespace
