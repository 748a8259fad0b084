// The console report of Google Benchmark, followed by a table of the
// targets: each figure beside its baseline from the same run, and their ratio.
// With repetitions the medians are used.
#pragma once

#include <benchmark/benchmark.h>
#include <unistd.h>

#include <cstdio>
#include <map>
#include <string>
#include <thread>
#include <vector>

#include "bench_files.h"

class TargetReporter : public benchmark::ConsoleReporter {
  public:
    TargetReporter() : ConsoleReporter(isatty(STDOUT_FILENO) ? OO_Color : OO_None) {}

    void ReportRuns(const std::vector<Run>& runs) override {
        ConsoleReporter::ReportRuns(runs);
        for (const Run& run : runs) {
            if (run.run_type == Run::RT_Aggregate && run.aggregate_name != "median") continue;
            std::string name = run.run_name.function_name;
            if (!run.run_name.args.empty()) name += "/" + run.run_name.args;
            Figures& figures = fFigures[name];
            const double unit = benchmark::GetTimeUnitMultiplier(run.time_unit);
            figures.seconds = run.GetAdjustedRealTime() / unit;
            figures.cpuSeconds = run.GetAdjustedCPUTime() / unit;
            for (const auto& [counter, value] : run.counters) figures.counters[counter] = value;
        }
    }

    // Once by elapsed time, once by the CPU time of the benchmark's thread,
    // which other work on the machine disturbs less.
    void PrintTargets() {
        for (bool byCpu : {false, true}) {
            fByCpu = byCpu;
            PrintTable();
        }
    }

  private:
    void PrintTable() const {
        std::printf(
            "\nTargets by %s time (%u cores; other work on the machine makes figures noisy)\n",
            fByCpu ? "CPU" : "real", std::thread::hardware_concurrency());
        std::printf("%-66s %12s %12s %7s %7s\n", "figure / baseline", "figure", "baseline", "ratio",
                    "target");
        Ratio("WholeCaseIn/compressed:0 / ReadFloor", Rate("WholeCaseIn/compressed:0"),
              Rate("ReadFloor"), ">=0.95");
        Ratio("WholeCaseIn/compressed:0 / ReadBaseline", Rate("WholeCaseIn/compressed:0"),
              Rate("ReadBaseline/compressed:0"), "");
        Figure("decoded GB/s: WholeCaseIn/compressed:1", Rate("WholeCaseIn/compressed:1") / 1e9,
               ">=6");
        Figure("ns per value: ReadCaseRecordValues/compressed:0",
               PerValue("ReadCaseRecordValues/compressed:0"), "<=3");
        Figure("ns per value: ReadCaseRecordValues/compressed:1",
               PerValue("ReadCaseRecordValues/compressed:1"), "<=3");
        Ratio("WriteWholeCaseOut/compressed:0 / WriteFloor", Rate("WriteWholeCaseOut/compressed:0"),
              Rate("WriteFloor"), ">=0.95");
        Ratio("WriteWholeCaseOut/compressed:0 / WriteBaseline, 4 KiB writes",
              Rate("WriteWholeCaseOut/compressed:0"), Rate("WriteBaseline/chunk:4096"), ">=0.80");
        Ratio("WriteWholeCaseOut/compressed:0 / WriteBaseline, 128 KiB writes",
              Rate("WriteWholeCaseOut/compressed:0"), Rate("WriteBaseline/chunk:131072"), "");
        Figure("encoded GB/s: WriteWholeCaseOut/compressed:1",
               Rate("WriteWholeCaseOut/compressed:1") / 1e9, ">=3");
        Figure("ns per value: WriteSetValueNumeric", PerValue("WriteSetValueNumeric"), "<=5");
        // The same cases written whole in the same run: what remains is the
        // cost of setting the values one by one.
        const double values = double(kCases) * kVariables;
        Figure("ns per value set, beyond WriteWholeCaseOut/compressed:0",
               (Seconds("WriteSetValueNumeric") - Seconds("WriteWholeCaseOut/compressed:0")) /
                   values * 1e9,
               "<=5");
        Figure("ns per name: GetVarHandle (code-page mode)", PerValue("GetVarHandle"), "");
        if (fByCpu) return;  // the second reader's time is not in the figures
        Ratio("ParallelWholeCaseIn/compressed:0 / WholeCaseIn",
              Rate("ParallelWholeCaseIn/compressed:0"), Rate("WholeCaseIn/compressed:0"), ">=1.8");
        Ratio("ParallelReadFloor / ReadFloor: what the machine gives two readers",
              Rate("ParallelReadFloor"), Rate("ReadFloor"), "");
        Ratio("ParallelWholeCaseIn/compressed:1 / WholeCaseIn",
              Rate("ParallelWholeCaseIn/compressed:1"), Rate("WholeCaseIn/compressed:1"), "");
    }

    struct Figures {
        double seconds = 0;
        double cpuSeconds = 0;
        std::map<std::string, double> counters;
    };

    // 0 for a figure this run did not measure.
    double Counter(const std::string& name, const char* counter) const {
        const auto found = fFigures.find(name);
        if (found == fFigures.end()) return 0;
        const auto value = found->second.counters.find(counter);
        return value == found->second.counters.end() ? 0 : value->second;
    }
    // The counters are measured by real time; CPU time / real time.
    double CpuShare(const std::string& name) const {
        const auto found = fFigures.find(name);
        if (found == fFigures.end() || !fByCpu || found->second.seconds <= 0) return 1;
        return found->second.cpuSeconds / found->second.seconds;
    }
    double Rate(const std::string& name) const {
        return Counter(name, "bytes_per_second") / CpuShare(name);
    }
    double PerValue(const std::string& name) const {
        return Counter(name, "ns_per_value") * 1e9 * CpuShare(name);
    }
    double Seconds(const std::string& name) const {
        const auto found = fFigures.find(name);
        return found == fFigures.end() ? 0 : found->second.seconds * CpuShare(name);
    }

    static void Figure(const char* what, double figure, const char* target) {
        if (!(figure > 0)) return;
        std::printf("%-66s %12.3f %12s %7s %7s\n", what, figure, "", "", target);
    }
    static void Ratio(const char* what, double figure, double baseline, const char* target) {
        if (figure <= 0 || baseline <= 0) return;
        std::printf("%-66s %12.4g %12.4g %7.3f %7s\n", what, figure, baseline, figure / baseline,
                    target);
    }

    std::map<std::string, Figures> fFigures;
    bool fByCpu = false;
};
