// Random dictionaries and cases written through the exported calls and read
// back through them, raw and compressed: every property a define call can
// set, long mixed-case names and strings of every width included.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <map>
#include <random>
#include <set>
#include <string>
#include <vector>

#include "api_handles.h"
#include "qoraio32.h"
#include "sysfile_builder.h"

namespace {

using fixture::OpenHandle;

struct Spec {
    std::string name;
    int type;
    std::string label;
    int level, alignment, columns;
    int missingCount;
    double missing[3];
    std::map<std::string, std::string> labels;  // value as text (%.17g for numbers)
};

std::string NumberKey(double v) {
    char text[32];
    std::snprintf(text, sizeof text, "%.17g", v);
    return text;
}

class Generator {
  public:
    explicit Generator(unsigned seed) : fRandom(seed) {}
    int Int(int low, int high) { return std::uniform_int_distribution<int>(low, high)(fRandom); }
    std::string Text(int length, const char* alphabet) {
        std::string text;
        for (int i = 0; i < length; ++i) text += alphabet[Int(0, int(std::strlen(alphabet)) - 1)];
        return text;
    }
    // Unique by upper case, never a reserved word (they are shorter than 5
    // bytes and the name always starts with two letters and a digit).
    std::string Name(std::set<std::string>& keys) {
        for (;;) {
            std::string name = Text(2, "AbCdEfGhXyZ") + std::to_string(Int(0, 9)) +
                               Text(Int(0, 61), "abcdefghijKLMNOPQRST0123456789_");
            std::string key = name;
            std::transform(key.begin(), key.end(), key.begin(), ::toupper);
            if (keys.insert(key).second) return name;
        }
    }
    Spec Variable(std::set<std::string>& keys) {
        static const int kTypes[] = {0, 0, 0, 1, 8, 9, 20, 255, 256, 600, 2000, 32767};
        Spec s{Name(keys), kTypes[Int(0, 11)], Int(0, 1) ? Text(Int(1, 200), "label text ") : "",
               Int(1, 3),  Int(0, 2),          Int(1, 80),
               0,          {0, 0, 0},          {}};
        if (s.type == 0) {
            s.missingCount = Int(-3, 3);
            if (s.missingCount == -1) s.missingCount = 0;
            for (double& v : s.missing) v = Int(-50, 50);
            if (s.missingCount < 0 && s.missing[0] > s.missing[1])
                std::swap(s.missing[0], s.missing[1]);
            for (int i = Int(0, 3); i > 0; --i) s.labels[NumberKey(Int(-5, 5))] = Text(20, "xyz ");
        } else {
            for (int i = Int(0, 3); i > 0; --i)
                s.labels[Text(std::min(s.type, Int(1, 12)), "ABC")] = Text(Int(0, 60), "pq ");
        }
        return s;
    }

  private:
    std::mt19937 fRandom;
};

void Define(int h, const Spec& s) {
    const char* n = s.name.c_str();
    ASSERT_EQ(qoraSetVarName(h, n, s.type), QORA_STATUS_OK) << n;
    if (!s.label.empty()) {
        ASSERT_EQ(qoraSetVarLabel(h, n, s.label.c_str()), QORA_STATUS_OK);
    }
    ASSERT_EQ(qoraSetVarMeasureLevel(h, n, s.level), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarAlignment(h, n, s.alignment), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetVarColumnWidth(h, n, s.columns), QORA_STATUS_OK);
    if (s.type == 0) {
        ASSERT_EQ(qoraSetVarNMissingValues(h, n, s.missingCount, s.missing[0], s.missing[1],
                                           s.missing[2]),
                  QORA_STATUS_OK);
    }
    for (const auto& [value, label] : s.labels) {
        const int status = s.type == 0
                               ? qoraSetVarNValueLabel(h, n, std::stod(value), label.c_str())
                               : qoraSetVarCValueLabel(h, n, value.c_str(), label.c_str());
        ASSERT_EQ(status, QORA_STATUS_OK);
    }
}

// The dictionary as the calls report it, in one comparable text per variable.
std::string Described(int h, const Spec& s) {
    const char* n = s.name.c_str();
    std::string out = s.name + "|" + std::to_string(s.type);
    std::vector<char> label(1024);
    qoraGetVarLabelLong(h, n, label.data(), int(label.size()), nullptr);
    int level = -1, alignment = -1, columns = -1;
    qoraGetVarMeasureLevel(h, n, &level);
    qoraGetVarAlignment(h, n, &alignment);
    qoraGetVarColumnWidth(h, n, &columns);
    out += "|" + std::string(label.data()) + "|" + std::to_string(level) +
           std::to_string(alignment) + "|" + std::to_string(columns);
    std::map<std::string, std::string> labels;
    char** texts = nullptr;
    int count = 0;
    if (s.type == 0) {
        int code = 0;
        double v[3] = {0, 0, 0};
        qoraGetVarNMissingValues(h, n, &code, &v[0], &v[1], &v[2]);
        out += "|" + std::to_string(code);
        for (int i = 0; i < std::abs(code); ++i) out += " " + NumberKey(v[i]);
        double* values = nullptr;
        if (qoraGetVarNValueLabels(h, n, &values, &texts, &count) == QORA_STATUS_OK) {
            for (int i = 0; i < count; ++i) labels[NumberKey(values[i])] = texts[i];
            qoraFreeVarNValueLabels(values, texts, count);
        }
    } else {
        char** values = nullptr;
        if (qoraGetVarCValueLabels(h, n, &values, &texts, &count) == QORA_STATUS_OK) {
            for (int i = 0; i < count; ++i) {
                std::string value = values[i];
                value.erase(value.find_last_not_of(' ') + 1);
                labels[value] = texts[i];
            }
            qoraFreeVarCValueLabels(values, texts, count);
        }
    }
    for (const auto& [value, text] : labels) out += "|" + value + "=" + text;
    return out;
}

std::string Expected(const Spec& s) {
    std::string out = s.name + "|" + std::to_string(s.type) + "|" + s.label + "|" +
                      std::to_string(s.level) + std::to_string(s.alignment) + "|" +
                      std::to_string(s.columns);
    if (s.type == 0) {
        out += "|" + std::to_string(s.missingCount);
        for (int i = 0; i < std::abs(s.missingCount); ++i) out += " " + NumberKey(s.missing[i]);
    }
    for (const auto& [value, text] : s.labels) out += "|" + value + "=" + text;
    return out;
}

class RoundTrip : public ::testing::TestWithParam<unsigned> {};
INSTANTIATE_TEST_SUITE_P(Seeds, RoundTrip, ::testing::Range(1u, 9u));

TEST_P(RoundTrip, DictionaryAndCasesComeBackExactly) {
    Generator g(GetParam());
    const bool compressed = GetParam() % 2 == 0;
    std::set<std::string> keys;
    std::vector<Spec> specs;
    for (int i = g.Int(1, 24); i > 0; --i) specs.push_back(g.Variable(keys));
    std::vector<std::vector<std::string>> rows(size_t(g.Int(0, 12)));
    for (auto& row : rows) {
        for (const Spec& s : specs) {
            // Strings come back blank-padded, so trailing blanks cannot tell.
            std::string text = s.type == 0
                                   ? (g.Int(0, 4) ? NumberKey(g.Int(-1000, 1000) / 8.0) : "")
                                   : g.Text(g.Int(0, std::min(s.type, 3000)), "ab c\xe9");
            text.erase(text.find_last_not_of(' ') + 1);
            row.push_back(text);
        }
    }

    fixture::TempDir dir;
    const std::string path = dir.Path() + "/rt.qsf";
    {
        OpenHandle h;
        fixture::OpenForWrite(path, h);
        for (const Spec& s : specs) Define(h.get(), s);
        ASSERT_EQ(qoraSetCompression(h.get(), compressed), QORA_STATUS_OK);
        ASSERT_EQ(qoraCommitHeader(h.get()), QORA_STATUS_OK);
        for (const auto& row : rows) {
            for (size_t i = 0; i < specs.size(); ++i) {
                const double var = double(i + 1);
                const int status =
                    specs[i].type == 0
                        ? qoraSetValueNumeric(h.get(), var,
                                              row[i].empty() ? qoraSysmisVal() : std::stod(row[i]))
                        : qoraSetValueChar(h.get(), var, row[i].c_str());
                ASSERT_EQ(status, QORA_STATUS_OK);
            }
            ASSERT_EQ(qoraCommitCaseRecord(h.get()), QORA_STATUS_OK);
        }
        ASSERT_EQ(qoraCloseWrite(h.get()), QORA_STATUS_OK);
        h.Forget();
    }

    OpenHandle h;
    fixture::OpenForRead(path, h);
    int count = -1;
    ASSERT_EQ(qoraGetNumberofVariables(h.get(), &count), QORA_STATUS_OK);
    ASSERT_EQ(count, int(specs.size()));
    ASSERT_EQ(qoraGetNumberofCases(h.get(), &count), QORA_STATUS_OK);
    EXPECT_EQ(count, int(rows.size()));
    for (const Spec& s : specs) EXPECT_EQ(Described(h.get(), s), Expected(s));
    std::vector<char> text(32768);
    for (const auto& row : rows) {
        ASSERT_EQ(qoraReadCaseRecord(h.get()), QORA_STATUS_OK);
        for (size_t i = 0; i < specs.size(); ++i) {
            std::string got;
            if (specs[i].type == 0) {
                double value = 0;
                ASSERT_EQ(qoraGetValueNumeric(h.get(), double(i + 1), &value), QORA_STATUS_OK);
                got = value == qoraSysmisVal() ? "" : NumberKey(value);
            } else {
                ASSERT_EQ(qoraGetValueChar(h.get(), double(i + 1), text.data(), int(text.size())),
                          QORA_STATUS_OK);
                got = text.data();
                got.erase(got.find_last_not_of(' ') + 1);
            }
            EXPECT_EQ(got, row[i]) << specs[i].name;
        }
    }
    EXPECT_EQ(qoraReadCaseRecord(h.get()), QORA_WARN_END_OF_FILE);
}

}  // namespace
