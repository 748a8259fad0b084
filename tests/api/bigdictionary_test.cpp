// A file with 1,000 variables of mixed types, labels, missing values and
// value labels reads back exactly through the exported calls.
#include <gtest/gtest.h>

#include <cstdio>
#include <string>

#include "api_handles.h"
#include "qoraio32.h"
#include "sysfile_builder.h"

namespace {

using fixture::Endian;
using fixture::OpenHandle;
using fixture::SysFileBuilder;

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

class BigDictionary : public ::testing::TestWithParam<Endian> {};

TEST_P(BigDictionary, ReadsBackExactly) {
    SysFileBuilder b(GetParam());
    for (int i = 0; i < kVariables; ++i) {
        std::string upper = NameOf(i);
        upper[0] = 'V';
        const int width = WidthOf(i);
        fixture::Var& var = width == 0 ? b.Numeric(upper) : b.String(upper, width);
        if (i % 2 == 0) var.Label(LabelOf(i));
        if (width == 0 && i % 4 == 0) var.Missing({double(i), -double(i)});
        if (width == 0 && i % 4 != 0) var.MissingRange(double(i), double(i) + 0.5);
        if (width > 0 && width <= 8) var.MissingStrings({std::string(size_t(width), 'm')});
    }
    for (int i = 0; i < kVariables; i += 30) {
        std::string upper = NameOf(i);
        upper[0] = 'V';
        b.ValueLabels({{1.0, "one " + std::to_string(i)}, {double(i), "self"}}, {b.Slot(upper)});
    }
    OpenHandle h;
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
        const int width = WidthOf(i);
        EXPECT_EQ(names[i], name);
        EXPECT_EQ(types[i], width);
        double varHandle = 0;
        ASSERT_EQ(qoraGetVarHandle(h.get(), name.c_str(), &varHandle), QORA_STATUS_OK);
        EXPECT_EQ(varHandle, i + 1.0);

        char label[121];
        const int labelStatus = qoraGetVarLabel(h.get(), name.c_str(), label);
        if (i % 2 == 0) {
            EXPECT_EQ(labelStatus, QORA_STATUS_OK);
            EXPECT_EQ(label, LabelOf(i));
        } else {
            EXPECT_EQ(labelStatus, QORA_WARN_NO_LABEL);
        }

        int missing = 0;
        if (width == 0) {
            double v[3];
            ASSERT_EQ(
                qoraGetVarNMissingValues(h.get(), name.c_str(), &missing, &v[0], &v[1], &v[2]),
                QORA_STATUS_OK);
            EXPECT_EQ(missing, i % 4 == 0 ? 2 : -2);
            EXPECT_EQ(v[0], double(i));
            EXPECT_EQ(v[1], i % 4 == 0 ? -double(i) : double(i) + 0.5);
            int type = 0, decimals = 0, fieldWidth = 0;
            ASSERT_EQ(qoraGetVarPrintFormat(h.get(), name.c_str(), &type, &decimals, &fieldWidth),
                      QORA_STATUS_OK);
            EXPECT_EQ(type, 5);
        } else if (width <= 8) {
            char v1[9], v2[9], v3[9];
            ASSERT_EQ(qoraGetVarCMissingValues(h.get(), name.c_str(), &missing, v1, v2, v3),
                      QORA_STATUS_OK);
            EXPECT_EQ(missing, 1);
            EXPECT_EQ(v1, std::string(size_t(width), 'm'));
        } else {
            char v1[9], v2[9], v3[9];
            EXPECT_EQ(qoraGetVarCMissingValues(h.get(), name.c_str(), &missing, v1, v2, v3),
                      QORA_STATUS_SHORT_STRING_REQUIRED);
        }

        double* values = nullptr;
        char** labels = nullptr;
        int numLabels = 0;
        const int vlStatus =
            width == 0 ? qoraGetVarNValueLabels(h.get(), name.c_str(), &values, &labels, &numLabels)
                       : QORA_STATUS_NUMERIC_REQUIRED;
        if (width == 0 && i % 30 == 0) {
            ASSERT_EQ(vlStatus, QORA_STATUS_OK);
            ASSERT_EQ(numLabels, 2);
            EXPECT_EQ(values[0], i == 0 ? 0.0 : 1.0);
            char label60[61];
            ASSERT_EQ(qoraGetVarNValueLabel(h.get(), name.c_str(), double(i), label60),
                      QORA_STATUS_OK);
            EXPECT_STREQ(label60, "self");
            qoraFreeVarNValueLabels(values, labels, numLabels);
        } else if (width == 0) {
            EXPECT_EQ(vlStatus, QORA_WARN_NO_LABELS);
        }
    }
    EXPECT_EQ(qoraFreeVarNames(names, types, count), QORA_STATUS_OK);
}

INSTANTIATE_TEST_SUITE_P(Orders, BigDictionary, ::testing::Values(Endian::Native, Endian::Swapped),
                         fixture::EndianName);

}  // namespace
