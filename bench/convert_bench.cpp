// Converting a 1 GB CSV of mixed columns to a compressed system file and
// back with qoraconv, beside `cat` of the same CSV (the floor of reading it).
// Figures are bytes of CSV per second and the converter's peak memory, which
// must not grow with the file.
#include <benchmark/benchmark.h>
#include <spawn.h>
#include <sys/resource.h>
#include <sys/wait.h>

#include <cstdio>
#include <string>
#include <vector>

#include "bench_files.h"

extern char** environ;

namespace {

constexpr int64_t kCsvBytes = int64_t(1) << 30;
constexpr int kColumns = 50;

std::string CsvPath() { return gBenchDirectory + "/mixed.csv"; }
std::string SystemFilePath() { return gBenchDirectory + "/mixed.qsf"; }

// One cell of column `column`: whole numbers, decimals, words (some quoted),
// dates and numbers with gaps, in turn.
void AppendCell(std::string& row, int column, Random& random) {
    static const char* const kWords[] = {"London", "Paris", "\"New York, NY\"", "Rome", ""};
    const uint32_t r = random.Next();
    char cell[32];
    switch (column % 5) {
        case 0:
            std::snprintf(cell, sizeof cell, "%u", 1 + r % 150);
            break;
        case 1:
            std::snprintf(cell, sizeof cell, "%u.%03u", r % 100000, r / 7 % 1000);
            break;
        case 2:
            std::snprintf(cell, sizeof cell, "%s", kWords[r % 5]);
            break;
        case 3:
            std::snprintf(cell, sizeof cell, "%u-%02u-%02u", 1950 + r % 70, 1 + r / 70 % 12,
                          1 + r / 840 % 28);
            break;
        default:
            std::snprintf(cell, sizeof cell, r % 10 ? "%d" : "", int(r % 11) - 5);
    }
    row += cell;
}

// The CSV, made once for all benchmarks.
int64_t CsvBytes() {
    static const int64_t bytes = [] {
        std::FILE* file = std::fopen(CsvPath().c_str(), "wb");
        std::string row;
        for (int c = 0; c < kColumns; ++c) row += (c ? ",v" : "v") + std::to_string(c);
        Random random;
        int64_t written = 0;
        while (written < kCsvBytes) {
            row += '\n';
            written += int64_t(std::fwrite(row.data(), 1, row.size(), file));
            row.clear();
            for (int c = 0; c < kColumns; ++c) {
                if (c) row += ',';
                AppendCell(row, c, random);
            }
        }
        std::fclose(file);
        return written;
    }();
    return bytes;
}

// Runs a command; false when it fails. `peakKb` gets its peak memory.
bool Run(const std::vector<std::string>& arguments, long& peakKb) {
    std::vector<char*> argv;
    for (const std::string& argument : arguments)
        argv.push_back(const_cast<char*>(argument.c_str()));
    argv.push_back(nullptr);
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, 1, "/dev/null", 1, 0);  // O_WRONLY
    pid_t pid = 0;
    const bool spawned = posix_spawnp(&pid, argv[0], &actions, nullptr, argv.data(), environ) == 0;
    posix_spawn_file_actions_destroy(&actions);
    int status = 0;
    rusage usage{};
    if (!spawned || wait4(pid, &status, 0, &usage) != pid) return false;
    peakKb = usage.ru_maxrss;
    return WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

void RunEach(benchmark::State& state, const std::vector<std::string>& arguments) {
    const int64_t bytes = CsvBytes();
    long peakKb = 0;
    for (auto _ : state) {
        if (!Run(arguments, peakKb)) state.SkipWithError("the command failed");
    }
    state.SetBytesProcessed(state.iterations() * bytes);
    state.counters["peak_MB"] = double(peakKb) / 1024;
}

void CatCsv(benchmark::State& state) { RunEach(state, {"cat", CsvPath()}); }

void CsvToCompressedFile(benchmark::State& state) {
    RunEach(state, {QORACONV_PATH, "--compress", CsvPath(), SystemFilePath()});
}

void CompressedFileToCsv(benchmark::State& state) {
    long peakKb = 0;
    CsvBytes();
    if (!Run({QORACONV_PATH, "--compress", CsvPath(), SystemFilePath()}, peakKb))
        state.SkipWithError("the system file cannot be made");
    RunEach(state, {QORACONV_PATH, SystemFilePath(), gBenchDirectory + "/back.csv"});
}

}  // namespace

BENCHMARK(CatCsv)->Unit(benchmark::kSecond)->UseRealTime()->Iterations(1);
BENCHMARK(CsvToCompressedFile)->Unit(benchmark::kSecond)->UseRealTime()->Iterations(1);
BENCHMARK(CompressedFileToCsv)->Unit(benchmark::kSecond)->UseRealTime()->Iterations(1);
