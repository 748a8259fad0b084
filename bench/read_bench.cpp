// Reading every case of a ~200 MB file of numeric variables through the
// exported calls, beside the baseline of reading the same bytes with read()
// from the page cache. Figures are bytes of case data per second, so each
// can be given as a ratio to the baseline.
//
// The files are written once per run into a temporary directory by a direct
// writer of the layout (header, one type 2 record per variable, the type 999
// record, the case data): much faster than building them value by value.
#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "bench_files.h"
#include "bench_report.h"
#include "qoraio32.h"

namespace {

constexpr uint64_t kSysmisBits = 0xFFEFFFFFFFFFFFFFull;

class Writer {
  public:
    explicit Writer(const std::string& path) : fFile(std::fopen(path.c_str(), "wb")) {
        if (!fFile) throw std::runtime_error("cannot create " + path);
    }
    ~Writer() { std::fclose(fFile); }
    void Bytes(const void* data, size_t size) {
        if (std::fwrite(data, 1, size, fFile) != size) throw std::runtime_error("write failed");
    }
    void Text(const std::string& text, size_t width) {
        std::string field = text;
        field.resize(width, ' ');
        Bytes(field.data(), width);
    }
    void I32(int32_t value) { Bytes(&value, 4); }
    void F64(double value) { Bytes(&value, 8); }

  private:
    std::FILE* fFile;
};

void WriteDictionary(Writer& out, bool compressed) {
    out.Text("$FL2", 4);
    out.Text("@(#) QORA DATA FILE benchmark", 60);
    out.I32(2);
    out.I32(kVariables);
    out.I32(compressed ? 1 : 0);
    out.I32(0);
    out.I32(int32_t(kCases));
    out.F64(100.0);
    out.Text("06 Dec 25", 9);
    out.Text("12:00:00", 8);
    out.Text("", 64);
    out.Bytes("\0\0\0", 3);
    for (int v = 0; v < kVariables; ++v) {
        for (int32_t field : {2, 0, 0, 0, 0x00050802, 0x00050802}) out.I32(field);
        out.Text("V" + std::to_string(v + 1), 8);
    }
    out.I32(999);
    out.I32(0);
}

// Raw value units: measurements with fractions.
void WriteRawCases(Writer& out) {
    Random random;
    std::vector<double> chunk(size_t(kVariables) * 1024);
    for (int64_t done = 0; done < kCases; done += 1024) {
        for (double& value : chunk) value = random.Next() * 1e-3;
        out.Bytes(chunk.data(), chunk.size() * 8);
    }
}

// Compressed blocks of small whole numbers, now and then system-missing:
// almost every unit fits its control byte.
void WriteCompressedCases(Writer& out) {
    Random random;
    std::vector<uint8_t> data;
    const int64_t units = kCases * kVariables;
    for (int64_t unit = 0; unit < units; unit += 8) {
        for (int i = 0; i < 8; ++i) {
            const uint32_t r = random.Next();
            data.push_back(r % 100 == 0 ? 255 : uint8_t(100 + 1 + r % 100));
        }
        if (data.size() >= (1u << 20)) {
            out.Bytes(data.data(), data.size());
            data.clear();
        }
    }
    out.Bytes(data.data(), data.size());
}

std::string gRawPath, gCompressedPath;
int64_t gRawDataStart = 0;  // where the raw file's cases begin

std::string WriteFile(const std::string& dir, bool compressed) {
    const std::string path = dir + (compressed ? "/compressed.qsf" : "/raw.qsf");
    Writer out(path);
    WriteDictionary(out, compressed);
    if (compressed)
        WriteCompressedCases(out);
    else
        WriteRawCases(out);
    return path;
}

const std::string& PathOf(const benchmark::State& state) {
    return state.range(0) ? gCompressedPath : gRawPath;
}

void ReadBaseline(benchmark::State& state) {
    const std::string& path = PathOf(state);
    std::vector<char> buffer(1 << 20);
    int64_t bytes = 0;
    for (auto _ : state) {
        const int fd = open(path.c_str(), O_RDONLY);
        for (ssize_t n; (n = read(fd, buffer.data(), buffer.size())) > 0;) bytes += n;
        benchmark::DoNotOptimize(buffer.data());
        close(fd);
    }
    state.SetBytesProcessed(bytes);
}

// The floor of a call that hands out one case at a time: read() into a
// read-ahead buffer of the library's size, then one copy per case into the
// caller's record. Reads the cases from first up to the end of the file or
// count of them; returns the bytes copied.
int64_t FloorRead(int64_t first, int64_t count) {
    constexpr size_t kReadAhead = 256 * 1024;  // the case iterator's read-ahead
    constexpr size_t kRecordBytes = kVariables * 8;
    std::vector<char> ahead(kReadAhead);
    std::vector<double> record(kVariables);
    const int fd = open(gRawPath.c_str(), O_RDONLY);
    lseek(fd, gRawDataStart + first * int64_t{kRecordBytes}, SEEK_SET);
    int64_t bytes = 0;
    size_t begin = 0, end = 0;
    for (int64_t c = 0; c < count;) {
        if (end - begin < kRecordBytes) {
            std::memmove(ahead.data(), ahead.data() + begin, end - begin);
            end -= begin;
            begin = 0;
            const ssize_t n = read(fd, ahead.data() + end, kReadAhead - end);
            if (n <= 0) break;
            end += size_t(n);
            continue;
        }
        std::memcpy(record.data(), ahead.data() + begin, kRecordBytes);
        benchmark::DoNotOptimize(record.data());
        begin += kRecordBytes;
        bytes += kRecordBytes;
        ++c;
    }
    close(fd);
    return bytes;
}

void ReadFloor(benchmark::State& state) {
    int64_t bytes = 0;
    for (auto _ : state) bytes += FloorRead(0, kCases);
    state.SetBytesProcessed(bytes);
}

// The floor of two readers: each half of the cases in a thread of its own.
void ParallelReadFloor(benchmark::State& state) {
    int64_t bytes = 0;
    for (auto _ : state) {
        int64_t otherBytes = 0;
        std::thread other([&otherBytes] { otherBytes = FloorRead(kCases / 2, kCases); });
        bytes += FloorRead(0, kCases / 2);
        other.join();
        bytes += otherBytes;
    }
    state.SetBytesProcessed(bytes);
}

int OpenOrSkip(benchmark::State& state) {
    int handle = -1;
    const int status = qoraOpenRead(PathOf(state).c_str(), &handle);
    if (status != QORA_STATUS_OK)
        state.SkipWithError(("qoraOpenRead: " + std::to_string(status)).c_str());
    return handle;
}

void WholeCaseIn(benchmark::State& state) {
    std::vector<double> record(kVariables);
    int64_t cases = 0;
    for (auto _ : state) {
        const int handle = OpenOrSkip(state);
        if (handle < 0) break;
        while (qoraWholeCaseIn(handle, record.data()) == QORA_STATUS_OK) ++cases;
        benchmark::DoNotOptimize(record.data());
        qoraCloseRead(handle);
    }
    state.SetBytesProcessed(cases * kVariables * 8);
    state.counters["cases_read"] = double(cases) / double(state.iterations());
}

// Reads count cases through the handle into a record of its own.
void ReadCases(int handle, int64_t count) {
    std::vector<double> record(kVariables);
    for (int64_t c = 0; c < count && qoraWholeCaseIn(handle, record.data()) == QORA_STATUS_OK; ++c)
        benchmark::DoNotOptimize(record.data());
}

// Two handles on one file, opened and closed in turn, each reading half of
// the cases in a thread of its own.
void ParallelWholeCaseIn(benchmark::State& state) {
    for (auto _ : state) {
        const int first = OpenOrSkip(state);
        const int second = OpenOrSkip(state);
        if (first < 0 || second < 0) break;
        qoraSeekNextCase(second, int(kCases / 2));
        std::thread other(ReadCases, second, kCases - kCases / 2);
        ReadCases(first, kCases / 2);
        other.join();
        qoraCloseRead(second);
        qoraCloseRead(first);
    }
    state.SetBytesProcessed(state.iterations() * kCaseBytes);
}

// The values of a case are fetched into an array and summed after the case:
// a running sum kept across the calls would live in memory (no register
// survives a call) and chain every value to the one before it.
void ReadCaseRecordValues(benchmark::State& state) {
    int64_t values = 0;
    double sum = 0;
    std::vector<double> record(kVariables);
    for (auto _ : state) {
        const int handle = OpenOrSkip(state);
        if (handle < 0) break;
        while (qoraReadCaseRecord(handle) == QORA_STATUS_OK) {
            for (int v = 1; v <= kVariables; ++v) qoraGetValueNumeric(handle, v, &record[v - 1]);
            for (double value : record) sum += value;
            values += kVariables;
        }
        qoraCloseRead(handle);
    }
    benchmark::DoNotOptimize(sum);
    state.SetBytesProcessed(values * 8);
    state.SetItemsProcessed(values);
    state.counters["ns_per_value"] = benchmark::Counter(
        double(values), benchmark::Counter::kIsRate | benchmark::Counter::kInvert);
}

void FileArgs(benchmark::internal::Benchmark* b) {
    b->ArgName("compressed")->Arg(0)->Arg(1)->Unit(benchmark::kMillisecond)->UseRealTime();
}

BENCHMARK(ReadBaseline)->Apply(FileArgs);
BENCHMARK(ReadFloor)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK(ParallelReadFloor)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK(WholeCaseIn)->Apply(FileArgs);
BENCHMARK(ParallelWholeCaseIn)->Apply(FileArgs);
BENCHMARK(ReadCaseRecordValues)->Apply(FileArgs);

}  // namespace

int main(int argc, char** argv) {
    benchmark::Initialize(&argc, argv);
    char dirTemplate[] = "/tmp/qora-bench-XXXXXX";
    if (!mkdtemp(dirTemplate)) return 1;
    const std::string dir = dirTemplate;
    gBenchDirectory = dir;
    int result = 0;
    try {
        gRawPath = WriteFile(dir, false);
        gRawDataStart = std::filesystem::file_size(gRawPath) - kCaseBytes;
        gCompressedPath = WriteFile(dir, true);
        std::fprintf(stderr, "case data: %lld bytes per file (%d variables, %lld cases)\n",
                     static_cast<long long>(kCaseBytes), kVariables,
                     static_cast<long long>(kCases));
        TargetReporter reporter;
        benchmark::RunSpecifiedBenchmarks(&reporter);
        reporter.PrintTargets();
    } catch (const std::exception& e) {
        std::fprintf(stderr, "qora_bench: %s\n", e.what());
        result = 1;
    }
    std::filesystem::remove_all(dir);
    benchmark::Shutdown();
    return result;
}
