// Writing ~200 MB of numeric cases through the exported calls, beside the
// baseline of writing the same bytes with write() to the same directory, in
// chunks of the stream's buffer (4 KiB) and of the library's writes of case
// data (128 KiB). Figures are bytes of case data per
// second, so each can be given as a ratio to the baseline. Each iteration
// writes a new file; removing it is left out of the timing.
#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cstring>
#include <string>
#include <vector>

#include "bench_files.h"
#include "qoraio32.h"

namespace {

constexpr int64_t kPoolCases = 4096;
constexpr size_t kChunk = 128 * 1024;  // WriteBehind::kSize, the writes of case data

// Cases cycled through by every benchmark: mostly whole numbers 1 to 150,
// which compress to a code byte (the code is the number plus 100 and must
// stay below 252), some system-missing, some measurements that stay raw.
const std::vector<double>& Pool() {
    static const std::vector<double> pool = [] {
        Random random;
        std::vector<double> values(size_t(kPoolCases) * kVariables);
        for (double& value : values) {
            const uint32_t r = random.Next();
            if (r % 100 < 80)
                value = 1 + r / 100 % 150;
            else if (r % 100 < 85)
                value = qoraSysmisVal();
            else
                value = r * 1e-3;
        }
        return values;
    }();
    return pool;
}

const double* CaseAt(int64_t c) { return Pool().data() + (c % kPoolCases) * kVariables; }

std::string OutputPath() { return gBenchDirectory + "/written.qsf"; }

void RemoveOutput(benchmark::State& state) {
    state.PauseTiming();
    unlink(OutputPath().c_str());
    state.ResumeTiming();
}

void WriteBaseline(benchmark::State& state) {
    const char* bytes = reinterpret_cast<const char*>(Pool().data());
    const size_t poolBytes = Pool().size() * sizeof(double);
    const size_t chunk = size_t(state.range(0));
    for (auto _ : state) {
        const int fd = open(OutputPath().c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0644);
        for (int64_t done = 0; done < kCaseBytes; done += chunk) {
            if (write(fd, bytes + done % poolBytes, chunk) != ssize_t(chunk)) {
                state.SkipWithError("write failed");
                break;
            }
        }
        close(fd);
        RemoveOutput(state);
    }
    state.SetBytesProcessed(state.iterations() * kCaseBytes);
}

// The floor of a call that takes one case at a time: each case copied into a
// write buffer of the library's size, written with write() when full.
void WriteFloor(benchmark::State& state) {
    constexpr size_t kCaseRecord = kVariables * 8;
    std::vector<char> buffer(kChunk);
    for (auto _ : state) {
        const int fd = open(OutputPath().c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0644);
        size_t filled = 0;
        bool failed = false;
        for (int64_t c = 0; c < kCases && !failed; ++c) {
            const char* record = reinterpret_cast<const char*>(CaseAt(c));
            for (size_t done = 0; done < kCaseRecord;) {
                const size_t n = std::min(kCaseRecord - done, kChunk - filled);
                std::memcpy(buffer.data() + filled, record + done, n);
                filled += n;
                done += n;
                if (filled < kChunk) continue;
                failed = write(fd, buffer.data(), kChunk) != ssize_t(kChunk);
                filled = 0;
            }
        }
        if (failed || write(fd, buffer.data(), filled) != ssize_t(filled))
            state.SkipWithError("write failed");
        close(fd);
        RemoveOutput(state);
    }
    state.SetBytesProcessed(state.iterations() * kCaseBytes);
}

// A new file with one numeric variable per value of a case; -1 when it
// cannot be made.
int OpenDictionary(benchmark::State& state, bool compressed) {
    int handle = -1;
    int status = qoraOpenWrite(OutputPath().c_str(), &handle);
    if (status == QORA_STATUS_OK && compressed) status = qoraSetCompression(handle, 1);
    for (int v = 1; v <= kVariables && status == QORA_STATUS_OK; ++v)
        status = qoraSetVarName(handle, ("V" + std::to_string(v)).c_str(), 0);
    if (status == QORA_STATUS_OK) status = qoraCommitHeader(handle);
    if (status == QORA_STATUS_OK) return handle;
    state.SkipWithError(("defining the file: " + std::to_string(status)).c_str());
    if (handle >= 0) qoraCloseWrite(handle);
    return -1;
}

void CloseOutput(benchmark::State& state, int handle) {
    if (const int status = qoraCloseWrite(handle))
        state.SkipWithError(("qoraCloseWrite: " + std::to_string(status)).c_str());
    RemoveOutput(state);
}

void WriteWholeCaseOut(benchmark::State& state) {
    for (auto _ : state) {
        const int handle = OpenDictionary(state, state.range(0) != 0);
        if (handle < 0) break;
        for (int64_t c = 0; c < kCases; ++c) {
            if (const int status = qoraWholeCaseOut(handle, CaseAt(c))) {
                state.SkipWithError(("qoraWholeCaseOut: " + std::to_string(status)).c_str());
                break;
            }
        }
        CloseOutput(state, handle);
    }
    state.SetBytesProcessed(state.iterations() * kCaseBytes);
}

void WriteSetValueNumeric(benchmark::State& state) {
    for (auto _ : state) {
        const int handle = OpenDictionary(state, false);
        if (handle < 0) break;
        std::vector<double> varHandles(kVariables);
        for (int v = 0; v < kVariables; ++v)
            qoraGetVarHandle(handle, ("V" + std::to_string(v + 1)).c_str(), &varHandles[v]);
        for (int64_t c = 0; c < kCases; ++c) {
            const double* values = CaseAt(c);
            int status = 0;
            for (int v = 0; v < kVariables; ++v)
                status |= qoraSetValueNumeric(handle, varHandles[v], values[v]);
            if (status == QORA_STATUS_OK) status = qoraCommitCaseRecord(handle);
            if (status != QORA_STATUS_OK) {
                state.SkipWithError(("setting a case: " + std::to_string(status)).c_str());
                break;
            }
        }
        CloseOutput(state, handle);
    }
    const int64_t values = state.iterations() * kCases * kVariables;
    state.SetBytesProcessed(values * 8);
    state.SetItemsProcessed(values);
    state.counters["ns_per_value"] = benchmark::Counter(
        double(values), benchmark::Counter::kIsRate | benchmark::Counter::kInvert);
}

BENCHMARK(WriteBaseline)
    ->ArgName("chunk")
    ->Arg(4096)
    ->Arg(kChunk)
    ->Unit(benchmark::kMillisecond)
    ->UseRealTime();
BENCHMARK(WriteFloor)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK(WriteWholeCaseOut)
    ->ArgName("compressed")
    ->Arg(0)
    ->Arg(1)
    ->Unit(benchmark::kMillisecond)
    ->UseRealTime();
BENCHMARK(WriteSetValueNumeric)->Unit(benchmark::kMillisecond)->UseRealTime();

}  // namespace
