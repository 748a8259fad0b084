// Opening dictionaries of growing size through qoraOpenRead: shapes that
// once opened in quadratic time or took far more memory than the file, and
// a plain dictionary, each at sizes ten times apart so that the growth of
// the time (and of the heap the open data source holds) shows.
//
// The files are written once per size by a direct writer of the layout, the
// same way the reading benchmark writes its files.
#include <benchmark/benchmark.h>
#include <malloc.h>

#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <functional>
#include <map>
#include <stdexcept>
#include <string>

#include "bench_files.h"
#include "qoraio32.h"

namespace {

// The dictionary bytes, little-endian as the host.
class Dictionary {
  public:
    Dictionary() {
        Text("$FL2", 4);
        Text("@(#) QORA DATA FILE open benchmark", 60);
        I32(2);
        fUnitsAt = fBytes.size();
        I32(0);  // value units, known at the end
        for (int32_t field : {0, 0, 0}) I32(field);
        F64(100.0);
        Text("06 Dec 26", 9);
        Text("12:00:00", 8);
        Text("", 64);
        Text("", 3);
    }

    // A type 2 record, with continuations for a string wider than 8.
    void Variable(const std::string& name, int width, const std::string& label = "") {
        const int32_t format = width == 0 ? 0x00050802 : (1 << 16) | ((width & 0xFF) << 8);
        for (int32_t field : {2, width, label.empty() ? 0 : 1, 0, format, format}) I32(field);
        Text(name, 8);
        if (!label.empty()) {
            I32(int32_t(label.size()));
            Text(label, (label.size() + 3) / 4 * 4);
        }
        const int units = width <= 8 ? 1 : (width + 7) / 8;
        for (int u = 1; u < units; ++u) {
            for (int32_t field : {2, -1, 0, 0, 0, 0}) I32(field);
            Text("", 8);
        }
        fUnits += units;
    }
    // A type 3 record of numeric labels with its type 4 record.
    void ValueLabels(const std::map<double, std::string, std::greater<double>>& labels,
                     int32_t slot) {
        I32(3);
        I32(int32_t(labels.size()));
        for (const auto& [value, label] : labels) {
            F64(value);
            const std::string text = label.substr(0, 255);
            fBytes += char(text.size());
            Text(text, (text.size() + 8) / 8 * 8 - 1);
        }
        I32(4);
        I32(1);
        I32(slot);
    }
    void Extension(int32_t subtype, const std::string& contents) {
        for (int32_t field : {7, subtype, 1, int32_t(contents.size())}) I32(field);
        fBytes += contents;
    }
    void Counted(std::string& to, const std::string& text) {
        const int32_t size = int32_t(text.size());
        to.append(reinterpret_cast<const char*>(&size), 4);
        to += text;
    }

    // The file, closed by the end-of-dictionary record and holding no cases.
    std::string Write(const std::string& name) {
        I32(999);
        I32(0);
        const int32_t units = fUnits;
        fBytes.replace(fUnitsAt, 4, reinterpret_cast<const char*>(&units), 4);
        const std::string path = gBenchDirectory + "/" + name + ".qsf";
        std::FILE* file = std::fopen(path.c_str(), "wb");
        if (!file) throw std::runtime_error("cannot create " + path);
        const bool written = std::fwrite(fBytes.data(), 1, fBytes.size(), file) == fBytes.size();
        std::fclose(file);
        if (!written) throw std::runtime_error("write failed: " + path);
        return path;
    }

  private:
    void I32(int32_t value) { fBytes.append(reinterpret_cast<const char*>(&value), 4); }
    void F64(double value) { fBytes.append(reinterpret_cast<const char*>(&value), 8); }
    void Text(const std::string& text, size_t width) {
        std::string field = text.substr(0, width);
        field.resize(width, ' ');
        fBytes += field;
    }

    std::string fBytes;
    size_t fUnitsAt = 0;
    int32_t fUnits = 0;
};

// One numeric variable with n value labels, written in descending order.
std::string DescendingLabels(int n) {
    Dictionary d;
    d.Variable("V", 0);
    std::map<double, std::string, std::greater<double>> labels;
    for (int i = 0; i < n; ++i) labels[double(i)] = "L" + std::to_string(i);
    d.ValueLabels(labels, 1);
    return d.Write("descending" + std::to_string(n));
}

// One multiple response set line of n members, none of them a variable.
std::string WideMultipleResponseSet(int n) {
    Dictionary d;
    d.Variable("V", 0);
    std::string line = "$set=C 5 label";
    for (int i = 0; i < n; ++i) line += " m" + std::to_string(i);
    d.Extension(7, line + "\n");
    return d.Write("mrset" + std::to_string(n));
}

// n variable set lines, each naming the one variable.
std::string ManyVariableSets(int n) {
    Dictionary d;
    d.Variable("V", 0);
    std::string lines;
    for (int i = 0; i < n; ++i) lines += "set" + std::to_string(i) + "= V\n";
    d.Extension(5, lines);
    return d.Write("varsets" + std::to_string(n));
}

// One 255-byte string variable with n labels of short values.
std::string WideStringLabels(int n) {
    Dictionary d;
    d.Variable("S", 255);
    std::string entry;
    d.Counted(entry, "S");
    const int32_t head[] = {255, n};
    entry.append(reinterpret_cast<const char*>(head), sizeof head);
    for (int i = 0; i < n; ++i) {
        d.Counted(entry, std::to_string(i));
        d.Counted(entry, "");
    }
    d.Extension(21, entry);
    return d.Write("widelabels" + std::to_string(n));
}

// n variables with labels, three value labels each and long names.
std::string PlainDictionary(int n) {
    Dictionary d;
    std::string longNames;
    for (int i = 0; i < n; ++i) {
        const std::string name = "V" + std::to_string(i);
        d.Variable(name, 0, "The label of variable number " + std::to_string(i));
        if (i > 0) longNames += '\t';
        longNames += name + "=Variable_with_a_long_name_" + std::to_string(i);
    }
    for (int i = 0; i < n; ++i)
        d.ValueLabels({{1.0, "Agree"}, {2.0, "Neutral"}, {3.0, "Disagree"}}, i + 1);
    d.Extension(13, longNames);
    return d.Write("plain" + std::to_string(n));
}

// Bytes the heap holds now: what an open file keeps is the difference.
int64_t HeapInUse() {
    const struct mallinfo2 info = mallinfo2();
    return int64_t(info.uordblks + info.hblkhd);
}

void OpenShape(benchmark::State& state, const std::function<std::string(int)>& write) {
    const int n = int(state.range(0));
    const std::string path = write(n);
    const double fileBytes = double(std::filesystem::file_size(path));
    int64_t held = 0;
    for (auto _ : state) {
        const int64_t before = HeapInUse();
        int handle = -1;
        if (qoraOpenRead(path.c_str(), &handle) != QORA_STATUS_OK) {
            state.SkipWithError("qoraOpenRead failed");
            break;
        }
        held = HeapInUse() - before;
        qoraCloseRead(handle);
    }
    std::filesystem::remove(path);
    state.counters["file_MB"] = fileBytes / 1e6;
    state.counters["heap_per_file_byte"] = double(held) / fileBytes;
    state.SetComplexityN(n);
}

void Sizes(benchmark::internal::Benchmark* b) {
    b->RangeMultiplier(10)->Range(10000, 1000000)->Unit(benchmark::kMillisecond);
    b->UseRealTime()->Complexity(benchmark::oNLogN);
}

BENCHMARK_CAPTURE(OpenShape, DescendingLabels, DescendingLabels)->Apply(Sizes);
BENCHMARK_CAPTURE(OpenShape, WideMultipleResponseSet, WideMultipleResponseSet)->Apply(Sizes);
BENCHMARK_CAPTURE(OpenShape, ManyVariableSets, ManyVariableSets)->Apply(Sizes);
BENCHMARK_CAPTURE(OpenShape, WideStringLabels, WideStringLabels)->Apply(Sizes);
BENCHMARK_CAPTURE(OpenShape, PlainDictionary, PlainDictionary)
    ->RangeMultiplier(10)
    ->Range(10000, 100000)
    ->Unit(benchmark::kMillisecond)
    ->UseRealTime()
    ->Complexity(benchmark::oNLogN);

}  // namespace
