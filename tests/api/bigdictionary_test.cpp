// A file with 1,000 variables of mixed types, labels, formats, missing values
// and value labels reads back exactly through the exported calls.
#include <gtest/gtest.h>

#include <cstdio>
#include <string>
#include <vector>

#include "api_handles.h"
#include "qoraio32.h"
#include "sysfile_builder.h"

namespace {

using fixture::Endian;

enum { kVariables = 1000 };

// Names read back in lower case: the file has no long names record.
std::string NameOf(int i) {
    char name[16];
    std::snprintf(name, sizeof name, "v%04d", i);
    return name;
}

// Variable i: numeric when i % 3 == 0, a short string when 1, a long one when 2.
int WidthOf(int i) { return i % 3 == 0 ? 0 : i % 3 == 1 ? 1 + i % 8 : 9 + i % 40; }
std::string LabelOf(int i) { return "Label of variable " + std::to_string(i); }
// Numeric missing values: discrete (2), a range (-2) or a range and one value (-3).
int MissingOf(int i) { return i % 4 == 0 ? 2 : i % 4 == 1 ? -2 : -3; }

class BigDictionary : public ::testing::TestWithParam<Endian> {};

TEST_P(BigDictionary, ReadsBackExactly) {
    fixture::SysFileBuilder b(GetParam());
    for (int i = 0; i < kVariables; ++i) {
        std::string upper = NameOf(i);
        upper[0] = 'V';
        const int width = WidthOf(i);
        fixture::Var& var = width == 0 ? b.Numeric(upper) : b.String(upper, width);
        if (i % 2 == 0) var.Label(LabelOf(i));
        if (width == 0 && i % 5 == 0)
            var.Formats(fixture::FormatWord(5, 10, 2), fixture::FormatWord(17, 12, 0));
        if (width == 0 && MissingOf(i) == 2) var.Missing({double(i), -double(i)});
        if (width == 0 && MissingOf(i) == -2) var.MissingRange(double(i), double(i) + 0.5);
        if (width == 0 && MissingOf(i) == -3) var.MissingRange(-9.0, -1.0, double(i));
        if (width > 0 && width <= 8)
            var.MissingStrings({std::string(size_t(width), 'm'), std::string(1, 'n')});
    }
    for (int i = 0; i < kVariables; i += 30)
        b.ValueLabels({{1.0, "one " + std::to_string(i)}, {double(i), "self"}},
                      {b.Variable("V" + NameOf(i).substr(1)).Slot()});
    fixture::OpenHandle h;
    fixture::OpenForRead(b.WriteTemp(), h);

    int count = 0;
    ASSERT_EQ(qoraGetNumberofVariables(h.get(), &count), QORA_STATUS_OK);
    ASSERT_EQ(count, kVariables);
    char** names = nullptr;
    int* types = nullptr;
    ASSERT_EQ(qoraGetVarNames(h.get(), &count, &names, &types), QORA_STATUS_OK);
    for (int i = 0; i < kVariables; ++i) {
        SCOPED_TRACE(i);
        const std::string name = NameOf(i);
        const char* var = name.c_str();
        const int width = WidthOf(i);
        EXPECT_EQ(names[i], name);
        EXPECT_EQ(types[i], width);
        double varHandle = 0;
        ASSERT_EQ(qoraGetVarHandle(h.get(), var, &varHandle), QORA_STATUS_OK);
        EXPECT_EQ(varHandle, i + 1.0);

        char label[121];
        if (i % 2 == 0) {
            ASSERT_EQ(qoraGetVarLabel(h.get(), var, label), QORA_STATUS_OK);
            EXPECT_EQ(label, LabelOf(i));
        } else {
            EXPECT_EQ(qoraGetVarLabel(h.get(), var, label), QORA_WARN_NO_LABEL);
        }

        int missing = 0, type = 0, decimals = 0, fieldWidth = 0;
        ASSERT_EQ(qoraGetVarPrintFormat(h.get(), var, &type, &decimals, &fieldWidth),
                  QORA_STATUS_OK);
        char v1[9] = "", v2[9] = "", v3[9] = "";
        if (width == 0) {
            double v[3] = {0, 0, 0};
            ASSERT_EQ(qoraGetVarNMissingValues(h.get(), var, &missing, &v[0], &v[1], &v[2]),
                      QORA_STATUS_OK);
            EXPECT_EQ(missing, MissingOf(i));
            const std::vector<std::vector<double>> expected = {
                {double(i), -double(i), 0}, {double(i), double(i) + 0.5, 0}, {-9, -1, double(i)}};
            EXPECT_EQ(std::vector<double>(v, v + 3), expected[i % 4 == 0 ? 0 : i % 4 == 1 ? 1 : 2]);
            EXPECT_EQ(type, 5);
            if (i % 5 == 0) {
                EXPECT_EQ(fieldWidth * 100 + decimals, 1002);
                ASSERT_EQ(qoraGetVarWriteFormat(h.get(), var, &type, &decimals, &fieldWidth),
                          QORA_STATUS_OK);
                EXPECT_EQ(type * 10000 + fieldWidth * 100 + decimals, 171200);
            }
        } else if (width <= 8) {
            ASSERT_EQ(qoraGetVarCMissingValues(h.get(), var, &missing, v1, v2, v3), QORA_STATUS_OK);
            EXPECT_EQ(missing, 2);
            EXPECT_EQ(v1, std::string(size_t(width), 'm'));
            EXPECT_EQ(v2, "n" + std::string(size_t(width) - 1, ' '));
        } else {
            EXPECT_EQ(qoraGetVarCMissingValues(h.get(), var, &missing, v1, v2, v3),
                      QORA_STATUS_SHORT_STRING_REQUIRED);
            EXPECT_EQ(type * 10000 + fieldWidth * 100 + decimals, 10000 + width * 100);
        }

        double* values = nullptr;
        char** labels = nullptr;
        int numLabels = 0;
        if (width != 0) continue;
        const int status = qoraGetVarNValueLabels(h.get(), var, &values, &labels, &numLabels);
        if (i % 30 != 0) {
            EXPECT_EQ(status, QORA_WARN_NO_LABELS);
            continue;
        }
        ASSERT_EQ(status, QORA_STATUS_OK);
        ASSERT_EQ(numLabels, 2);
        EXPECT_EQ(values[0], i == 0 ? 0.0 : 1.0);  // in key order
        char label60[61];
        ASSERT_EQ(qoraGetVarNValueLabel(h.get(), var, double(i), label60), QORA_STATUS_OK);
        EXPECT_STREQ(label60, "self");
        qoraFreeVarNValueLabels(values, labels, numLabels);
    }
    EXPECT_EQ(qoraFreeVarNames(names, types, count), QORA_STATUS_OK);
}

INSTANTIATE_TEST_SUITE_P(Orders, BigDictionary, ::testing::Values(Endian::Native, Endian::Swapped),
                         fixture::EndianName);

}  // namespace
