// Random dictionaries and cases written through the exported calls and read
// back through them, raw and compressed: every property a define call can
// set, long mixed-case names and strings of every width included.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
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

struct Dataset {
    std::string label;  // the file label
    int weight;         // index of the weight variable, or -1
    std::vector<Spec> specs;
    std::vector<std::vector<std::string>> rows;  // "" is system-missing or blank
};

Dataset Generate(Generator& g) {
    Dataset d;
    d.label = g.Text(g.Int(0, 64), "file label ");
    d.label.erase(d.label.find_last_not_of(' ') + 1);
    std::set<std::string> keys;
    for (int i = g.Int(1, 24); i > 0; --i) d.specs.push_back(g.Variable(keys));
    // The first numeric variable weighs the cases, most of the time.
    const auto numeric =
        std::find_if(d.specs.begin(), d.specs.end(), [](const Spec& s) { return s.type == 0; });
    d.weight = numeric != d.specs.end() && g.Int(0, 3) ? int(numeric - d.specs.begin()) : -1;
    d.rows.resize(size_t(g.Int(0, 12)));
    for (auto& row : d.rows) {
        for (const Spec& s : d.specs) {
            // Strings come back blank-padded, so trailing blanks cannot tell.
            std::string text = s.type == 0
                                   ? (g.Int(0, 4) ? NumberKey(g.Int(-1000, 1000) / 8.0) : "")
                                   : g.Text(g.Int(0, std::min(s.type, 3000)), "ab c\xe9");
            text.erase(text.find_last_not_of(' ') + 1);
            row.push_back(text);
        }
    }
    return d;
}

void WriteThroughCalls(const std::string& path, const Dataset& d, bool compressed) {
    OpenHandle h;
    fixture::OpenForWrite(path, h);
    for (const Spec& s : d.specs) Define(h.get(), s);
    // Any nonzero compression code means compressed.
    ASSERT_EQ(qoraSetCompression(h.get(), compressed ? 5 : 0), QORA_STATUS_OK);
    ASSERT_EQ(qoraSetIdString(h.get(), d.label.c_str()), QORA_STATUS_OK);
    if (d.weight >= 0) {
        ASSERT_EQ(qoraSetCaseWeightVar(h.get(), d.specs[size_t(d.weight)].name.c_str()),
                  QORA_STATUS_OK);
    }
    ASSERT_EQ(qoraCommitHeader(h.get()), QORA_STATUS_OK);
    for (const auto& row : d.rows) {
        for (size_t i = 0; i < d.specs.size(); ++i) {
            const double var = double(i + 1);
            const int status =
                d.specs[i].type == 0
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

// The same dataset laid out by the fixture builder, as another writer could:
// short names of its own, long names, segments, display triples, value
// labels of numbers and short strings in type 3 records, of longer strings
// in the long value labels record.
void Describe(fixture::SysFileBuilder& b, const Dataset& d) {
    std::vector<std::array<int32_t, 3>> display;
    std::vector<fixture::LongValueLabels> longLabels;
    // Type 3 records may only follow the last variable.
    std::vector<std::pair<std::vector<std::pair<fixture::Value, std::string>>, int>> shortLabels;
    for (size_t i = 0; i < d.specs.size(); ++i) {
        const Spec& s = d.specs[i];
        const std::string shortName = "V" + std::to_string(i);
        fixture::Var& v = s.type == 0 ? b.Numeric(shortName) : b.String(shortName, s.type);
        if (int(i) == d.weight) b.Weight(v);
        v.LongName(s.name);
        if (!s.label.empty()) v.Label(s.label);
        if (s.missingCount > 0) v.Missing({s.missing, s.missing + s.missingCount});
        if (s.missingCount == -2) v.MissingRange(s.missing[0], s.missing[1]);
        if (s.missingCount == -3) v.MissingRange(s.missing[0], s.missing[1], s.missing[2]);
        for (int seg = s.type > 255 ? (s.type + 251) / 252 : 1; seg > 0; --seg)
            display.push_back({s.level, s.columns, s.alignment});
        if (s.labels.empty()) continue;
        std::vector<std::pair<fixture::Value, std::string>> pairs;
        fixture::LongValueLabels wide{s.name, s.type, {}};
        for (const auto& [value, label] : s.labels) {
            if (s.type == 0) pairs.emplace_back(std::stod(value), label);
            if (s.type > 0) pairs.emplace_back(value, label);
            if (s.type > 8)
                wide.labels.emplace_back(value + std::string(size_t(s.type) - value.size(), ' '),
                                         label);
        }
        if (s.type <= 8) shortLabels.emplace_back(pairs, v.Slot());
        if (s.type > 8) longLabels.push_back(wide);
    }
    for (const auto& [pairs, slot] : shortLabels) b.ValueLabels(pairs, {slot});
    b.IntegerInfo();
    b.FloatInfo();
    b.DisplayParams(display);
    b.LongNames();
    // An empty record would be malformed.
    if (std::any_of(d.specs.begin(), d.specs.end(), [](const Spec& s) { return s.type > 255; }))
        b.VeryLongStrings();
    if (!longLabels.empty()) b.LongValueLabelsRecord(longLabels);
    for (const auto& row : d.rows) {
        std::vector<fixture::Value> values;
        for (size_t i = 0; i < d.specs.size(); ++i) {
            if (d.specs[i].type > 0) values.emplace_back(row[i]);
            if (d.specs[i].type == 0)
                values.emplace_back(row[i].empty() ? fixture::kSysmis : std::stod(row[i]));
        }
        b.Case(values);
    }
}

void ExpectReadsBack(const std::string& path, const Dataset& d, bool compressed) {
    OpenHandle h;
    fixture::OpenForRead(path, h);
    char text[65];
    ASSERT_EQ(qoraGetIdString(h.get(), text), QORA_STATUS_OK);
    std::string label = text;
    EXPECT_EQ(label.erase(label.find_last_not_of(' ') + 1), d.label);
    EXPECT_EQ(qoraGetCaseWeightVar(h.get(), text), d.weight < 0 ? QORA_WARN_NO_WEIGHT : 0);
    EXPECT_EQ(text, d.weight < 0 ? "" : d.specs[size_t(d.weight)].name);
    int count = -1;
    ASSERT_EQ(qoraGetCompression(h.get(), &count), QORA_STATUS_OK);
    EXPECT_EQ(count, compressed ? 1 : 0);
    ASSERT_EQ(qoraGetNumberofVariables(h.get(), &count), QORA_STATUS_OK);
    ASSERT_EQ(count, int(d.specs.size()));
    ASSERT_EQ(qoraGetNumberofCases(h.get(), &count), QORA_STATUS_OK);
    EXPECT_EQ(count, int(d.rows.size()));
    for (const Spec& s : d.specs) EXPECT_EQ(Described(h.get(), s), Expected(s));
    std::vector<char> value(32768);
    for (const auto& row : d.rows) {
        ASSERT_EQ(qoraReadCaseRecord(h.get()), QORA_STATUS_OK);
        for (size_t i = 0; i < d.specs.size(); ++i) {
            std::string got;
            if (d.specs[i].type == 0) {
                double value = 0;
                ASSERT_EQ(qoraGetValueNumeric(h.get(), double(i + 1), &value), QORA_STATUS_OK);
                got = value == qoraSysmisVal() ? "" : NumberKey(value);
            } else {
                ASSERT_EQ(qoraGetValueChar(h.get(), double(i + 1), value.data(), int(value.size())),
                          QORA_STATUS_OK);
                got = value.data();
                got.erase(got.find_last_not_of(' ') + 1);
            }
            EXPECT_EQ(got, row[i]) << d.specs[i].name;
        }
    }
    EXPECT_EQ(qoraReadCaseRecord(h.get()), QORA_WARN_END_OF_FILE);
}

// A long name whose two-byte character would end at byte 65 is cut before it.
TEST(LongNames, AreCutAtAWholeCharacter) {
    fixture::Utf8Mode utf8;
    fixture::SysFileBuilder b(fixture::Endian::Swapped);
    b.Numeric("M").LongName(std::string(63, 'm') + "\xC3\xA9o");
    b.LongNames();
    OpenHandle h;
    fixture::OpenForRead(b.WriteTemp(), h);
    char name[65];
    int type = -1;
    ASSERT_EQ(qoraGetVarInfo(h.get(), 0, name, &type), QORA_STATUS_OK);
    EXPECT_EQ(name, std::string(63, 'm'));
}

// Each seed writes its dataset through the calls and through the fixture
// builder; the seeds between them cover both forms and both byte orders.
class RoundTrip : public ::testing::TestWithParam<unsigned> {};
INSTANTIATE_TEST_SUITE_P(Seeds, RoundTrip, ::testing::Range(1u, 9u));

TEST_P(RoundTrip, DictionaryAndCasesComeBackExactly) {
    Generator g(GetParam());
    const bool compressed = GetParam() % 2 == 0;
    const Dataset d = Generate(g);
    fixture::TempDir dir;
    const std::string path = dir.Path() + "/rt.qsf";
    WriteThroughCalls(path, d, compressed);
    ExpectReadsBack(path, d, compressed);

    fixture::SysFileBuilder b(GetParam() % 4 < 2 ? fixture::Endian::Native
                                                 : fixture::Endian::Swapped);
    b.Compressed(compressed);
    Describe(b, d);
    if (GetParam() % 3 == 0) {  // the count only in the 64-bit record
        b.header().caseCount = -1;
        b.CaseCount64(int64_t(d.rows.size()));
    }
    b.header().label = d.label;
    ExpectReadsBack(b.WriteTemp(), d, compressed);
}

}  // namespace
