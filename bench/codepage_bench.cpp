// The cost of a call that looks a variable up by name in the interface's
// code-page mode (the library's mode when it is loaded), where names are
// upper-cased through the code-page converter.
#include <benchmark/benchmark.h>

#include <string>
#include <vector>

#include "bench_files.h"
#include "qoraio32.h"

namespace {

void GetVarHandle(benchmark::State& state) {
    int handle = -1;
    int status = qoraOpenWrite((gBenchDirectory + "/names.qsf").c_str(), &handle);
    std::vector<std::string> names;
    for (int v = 1; v <= kVariables && status == QORA_STATUS_OK; ++v) {
        names.push_back("Variable" + std::to_string(v));
        status = qoraSetVarName(handle, names.back().c_str(), 0);
    }
    if (status != QORA_STATUS_OK) state.SkipWithError("defining the names");
    int64_t calls = 0;
    for (auto _ : state) {
        for (const std::string& name : names) {
            double varHandle;
            qoraGetVarHandle(handle, name.c_str(), &varHandle);
            benchmark::DoNotOptimize(varHandle);
        }
        calls += int64_t(names.size());
    }
    if (handle >= 0) qoraCloseWrite(handle);
    state.counters["ns_per_value"] = benchmark::Counter(
        double(calls), benchmark::Counter::kIsRate | benchmark::Counter::kInvert);
}

BENCHMARK(GetVarHandle)->UseRealTime();

}  // namespace
