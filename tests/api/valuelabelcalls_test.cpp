// Value label calls through the public header: setters on a write handle,
// getters and the handed-out arrays on write handles and read files.
#include <gtest/gtest.h>

#include <string>
#include <tuple>
#include <vector>

#include "api_handles.h"
#include "qoraio32.h"
#include "sysfile_builder.h"

namespace {

using fixture::OpenHandle;

class ValueLabels : public ::testing::Test {
  protected:
    void SetUp() override {
        fixture::OpenForWrite(fDir.Path() + "/out.qsf", fHandle);
        for (auto [name, type] : {std::pair{"n1", 0}, {"n2", 0}, {"s8", 8}, {"t8", 8}, {"s10", 10}})
            ASSERT_EQ(qoraSetVarName(h(), name, type), QORA_STATUS_OK);
    }
    int h() const { return fHandle.get(); }
    // The label looked up, after the status of the call.
    std::string NLabel(const char* var, double value) {
        char label[61] = "junk";
        const int status = qoraGetVarNValueLabel(h(), var, value, label);
        return std::to_string(status) + "|" + label;
    }
    std::string CLabel(const char* var, const char* value) {
        char label[61] = "junk";
        const int status = qoraGetVarCValueLabel(h(), var, value, label);
        return std::to_string(status) + "|" + label;
    }
    // The labels of a numeric variable as the array getter hands them out.
    std::string NLabels(const char* var) {
        double* values = nullptr;
        char** labels = nullptr;
        int count = 0;
        std::string listed =
            std::to_string(qoraGetVarNValueLabels(h(), var, &values, &labels, &count));
        for (int i = 0; i < count; ++i)
            listed += "|" + std::to_string(int(values[i])) + "=" + labels[i];
        EXPECT_EQ(qoraFreeVarNValueLabels(values, labels, count), QORA_STATUS_OK);
        return listed;
    }

    fixture::TempDir fDir;
    OpenHandle fHandle;
};

TEST_F(ValueLabels, SingleLabelsMergeAndLookupsTellNoLabelsFromNoLabel) {
    EXPECT_EQ(NLabel("n1", 1.0), "-8|");
    ASSERT_EQ(qoraSetVarNValueLabel(h(), "n1", 1.0, "male"), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarNValueLabel(h(), "N1", 2.0, "female"), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarNValueLabel(h(), "n1", 1.0, "man"), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarNValueLabel(h(), "n1", 4.0, nullptr), QORA_STATUS_OK);
    for (auto [value, expected] :
         {std::pair{1.0, "0|man"}, {2.0, "0|female"}, {3.0, "-9|"}, {4.0, "0|"}})
        EXPECT_EQ(NLabel("n1", value), expected) << value;
    EXPECT_EQ(NLabel("n2", 1.0), "-8|");
}

// Failed calls name the fault, clear their outputs and change nothing.
TEST_F(ValueLabels, Statuses) {
    double* values = reinterpret_cast<double*>(this);
    char** labels = reinterpret_cast<char**>(this);
    char** strings = labels;
    int count = 7;
    char label[8];
    const struct {
        int status, expected;
    } rows[] = {
        {qoraSetVarNValueLabel(h(), "s8", 1.0, "x"), QORA_STATUS_NUMERIC_REQUIRED},
        {qoraSetVarCValueLabel(h(), "n1", "a", "x"), QORA_STATUS_STRING_REQUIRED},
        {qoraSetVarNValueLabel(h(), "zz", 1.0, "x"), QORA_STATUS_VAR_NOT_FOUND},
        {qoraSetVarCValueLabel(h(), nullptr, "a", "x"), QORA_STATUS_VAR_NOT_FOUND},
        {qoraGetVarNValueLabelLong(h(), "n1", 1.0, label, 0, nullptr), QORA_STATUS_BAD_FILE_HANDLE},
        {qoraGetVarNValueLabel(h(), "n1", 1.0, nullptr), QORA_STATUS_BAD_FILE_HANDLE},
        {qoraGetVarNValueLabel(-1, "n1", 1.0, label), QORA_STATUS_BAD_FILE_HANDLE},
        {qoraGetVarNValueLabels(h(), "n1", &values, &labels, &count), QORA_WARN_NO_LABELS},
        {values == nullptr && labels == nullptr && count == 0, 1},
        {qoraGetVarCValueLabels(h(), "n1", &strings, &labels, &count), QORA_STATUS_STRING_REQUIRED},
        {qoraGetVarNValueLabels(h(), "n1", nullptr, &labels, &count), QORA_STATUS_BAD_FILE_HANDLE},
        {qoraFreeVarNValueLabels(nullptr, nullptr, 5), QORA_STATUS_OK},
        {qoraFreeVarCValueLabels(nullptr, nullptr, 5), QORA_STATUS_OK},
    };
    for (size_t i = 0; i < std::size(rows); ++i)
        EXPECT_EQ(rows[i].status, rows[i].expected) << "row " << i;
    EXPECT_EQ(NLabel("s8", 1.0) + CLabel("n1", "a") + CLabel("zz", "a"), "14|15|12|");
}

// Stored labels keep 120 bytes, the short getters hand out 60, cut at whole
// characters in UTF-8 mode.
TEST_F(ValueLabels, LongLabelsAreStoredCutWithAWarning) {
    EXPECT_EQ(qoraSetVarNValueLabel(h(), "n1", 1.0, std::string(130, 'x').c_str()),
              QORA_WARN_VALUE_LABEL_TRUNCATED);
    EXPECT_EQ(NLabels("n1"), "0|1=" + std::string(120, 'x'));
    EXPECT_EQ(NLabel("n1", 1.0), "0|" + std::string(60, 'x'));
    ASSERT_EQ(qoraSetVarCValueLabel(h(), "s8", "a", std::string(100, 'y').c_str()), QORA_STATUS_OK);
    EXPECT_EQ(CLabel("s8", "a"), "0|" + std::string(60, 'y'));
    char label[200];
    int length = 0;
    ASSERT_EQ(qoraGetVarCValueLabelLong(h(), "s8", "a", label, 6, &length), QORA_STATUS_OK);
    EXPECT_EQ(label + std::to_string(length), "yyyyy5");

    fixture::Utf8Mode utf8;
    std::string euros = "a";
    for (int i = 0; i < 43; ++i) euros += "\xE2\x82\xAC";  // 130 bytes
    EXPECT_EQ(qoraSetVarNValueLabel(h(), "n1", 1.0, euros.c_str()),
              QORA_WARN_VALUE_LABEL_TRUNCATED);
    ASSERT_EQ(qoraGetVarNValueLabelLong(h(), "n1", 1.0, label, sizeof label, &length),
              QORA_STATUS_OK);
    EXPECT_EQ(label + std::to_string(length), euros.substr(0, 118) + "118");
    EXPECT_EQ(NLabel("n1", 1.0), "0|" + euros.substr(0, 58));
    // A 9-byte string value cut at the width of 8 keeps whole characters too.
    ASSERT_EQ(qoraSetVarCValueLabel(h(), "s8", "abc\xE2\x82\xAC\xE2\x82\xAC", "cut"),
              QORA_STATUS_OK);
    EXPECT_EQ(CLabel("s8", "abc\xE2\x82\xAC"), "0|cut");
}

TEST_F(ValueLabels, StringValuesArePaddedAndCutAtTheWidth) {
    ASSERT_EQ(qoraSetVarCValueLabel(h(), "s8", "abc", "three"), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarCValueLabel(h(), "s10", "0123456789XYZW", "ten"), QORA_STATUS_OK);
    for (auto [var, value, expected] : {std::tuple{"s8", "abc", "0|three"},
                                        {"s8", "abc   ", "0|three"},
                                        {"s10", "0123456789", "0|ten"},
                                        {"s10", "0123456789Q", "0|ten"}})
        EXPECT_EQ(CLabel(var, value), expected) << value;
    for (auto [var, padded] : {std::pair{"s8", "abc     "}, {"s10", "0123456789      "}}) {
        char** values = nullptr;
        char** labels = nullptr;
        int count = 0;
        ASSERT_EQ(qoraGetVarCValueLabels(h(), var, &values, &labels, &count), QORA_STATUS_OK);
        ASSERT_EQ(count, 1);
        EXPECT_STREQ(values[0], padded);  // whole value units
        EXPECT_EQ(qoraFreeVarCValueLabels(values, labels, count), QORA_STATUS_OK);
    }
}

// The set forms replace every named variable's labels; the first failing
// variable stops the call before anything changes; strings need one width.
TEST_F(ValueLabels, SetFormsReplaceEveryNamedVariablesLabels) {
    ASSERT_EQ(qoraSetVarNValueLabel(h(), "n1", 9.0, "old"), QORA_STATUS_OK);
    const char* vars[] = {"n1", "N2"};
    const double values[] = {1.0, 2.0};
    const char* labels[] = {"one", "two"};
    ASSERT_EQ(qoraSetVarNValueLabels(h(), vars, 2, values, labels, 2), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarNValueLabel(h(), "n1", 3.0, "three"), QORA_STATUS_OK);
    EXPECT_EQ(NLabels("n1") + " " + NLabels("n2"), "0|1=one|2=two|3=three 0|1=one|2=two");

    const char* bad[] = {"n1", "s8"};
    const char* absent[] = {"n1", "zz"};
    const std::string longLabel(121, 'z');
    const char* cut[] = {"one", longLabel.c_str()};
    const char* mixed[] = {"s8", "s10"};
    const char* numeric[] = {"s8", "n1"};
    const char* same[] = {"s8", "t8"};
    const char* letters[] = {"a", "b"};
    const char* capitals[] = {"A", "B"};
    ASSERT_EQ(qoraSetVarCValueLabel(h(), "s10", "q", "Q"), QORA_STATUS_OK);
    const struct {
        int status, expected;
    } rows[] = {
        {qoraSetVarNValueLabels(h(), bad, 2, values, labels, 2), QORA_STATUS_NUMERIC_REQUIRED},
        {qoraSetVarNValueLabels(h(), absent, 2, values, labels, 2), QORA_STATUS_VAR_NOT_FOUND},
        {qoraSetVarNValueLabels(h(), vars, 2, nullptr, labels, 2), QORA_STATUS_BAD_FILE_HANDLE},
        {qoraSetVarNValueLabels(h(), nullptr, 2, values, labels, 2), QORA_STATUS_BAD_FILE_HANDLE},
        {qoraSetVarCValueLabels(h(), mixed, 2, letters, capitals, 2), QORA_STATUS_WIDTH_MISMATCH},
        {qoraSetVarCValueLabels(h(), numeric, 2, letters, capitals, 2),
         QORA_STATUS_STRING_REQUIRED},
    };
    for (size_t i = 0; i < std::size(rows); ++i)
        EXPECT_EQ(rows[i].status, rows[i].expected) << "row " << i;
    EXPECT_EQ(NLabel("n1", 3.0) + " " + CLabel("s8", "a") + " " + CLabel("s10", "q"),
              "0|three -8| 0|Q");
    EXPECT_EQ(qoraSetVarNValueLabels(h(), vars, 2, values, cut, 2),
              QORA_WARN_VALUE_LABEL_TRUNCATED);
    ASSERT_EQ(qoraSetVarCValueLabels(h(), same, 2, letters, capitals, 2), QORA_STATUS_OK);
    EXPECT_EQ(CLabel("t8", "b") + " " + CLabel("s8", "a"), "0|B 0|A");
}

}  // namespace
