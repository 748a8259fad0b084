// Several threads at once, each writing, appending to and reading back files
// of its own through the exported calls, and using process-wide tables
// meanwhile. Run under ThreadSanitizer by `make tsan`.
#include <gtest/gtest.h>

#include <string>
#include <thread>
#include <vector>

#include "api_handles.h"
#include "sysfile_builder.h"

namespace {

constexpr int kThreads = 4;
constexpr int kRounds = 3;
constexpr int kCases = 150;

std::string Text(int thread, int i) { return std::to_string(thread) + "-" + std::to_string(i); }

// Writes cases [from, from + count) on an open write or append handle.
bool WriteCases(int h, int thread, int from, int count) {
    for (int i = from; i < from + count; ++i) {
        if (qoraSetValueNumeric(h, 1.0, thread * 1000.0 + i) != 0) return false;
        if (qoraSetValueChar(h, 2.0, Text(thread, i).c_str()) != 0) return false;
        if (qoraCommitCaseRecord(h) != 0) return false;
    }
    return true;
}

// The number of cases that read back right, or -1 when the file fails.
int ReadBack(const std::string& path, int thread) {
    int h = -1;
    if (qoraOpenRead(path.c_str(), &h) != 0) return -1;
    // Calls on the process-wide tables and special values.
    double date = 0;
    qoraConvertDate(6, 12, 2026, &date);
    qoraSysmisVal();
    int good = 0;
    for (int i = 0; qoraReadCaseRecord(h) == 0; ++i) {
        double number = 0;
        char text[21] = {};
        qoraGetValueNumeric(h, 1.0, &number);
        qoraGetValueChar(h, 2.0, text, sizeof text);
        const std::string expected = Text(thread, i);
        if (number == thread * 1000.0 + i && std::string(text, expected.size()) == expected) ++good;
    }
    qoraCloseRead(h);
    return good;
}

// One thread's work: for each round a new file, compressed every other
// time, then an append to it, then the read-back. Returns what went wrong.
std::string Work(const std::string& dir, int thread) {
    for (int round = 0; round < kRounds; ++round) {
        const std::string path = dir + "/t" + std::to_string(thread) + ".qsf";
        int h = -1;
        if (qoraOpenWrite(path.c_str(), &h) != 0) return "open write";
        const bool defined = qoraSetVarName(h, "n", 0) == 0 && qoraSetVarName(h, "s", 20) == 0 &&
                             qoraSetCompression(h, round % 2) == 0 && qoraCommitHeader(h) == 0;
        const bool written = defined && WriteCases(h, thread, 0, kCases);
        if (qoraCloseWrite(h) != 0 || !written) return "write";
        if (qoraOpenAppend(path.c_str(), &h) != 0) return "open append";
        const bool appended = WriteCases(h, thread, kCases, kCases);
        if (qoraCloseAppend(h) != 0 || !appended) return "append";
        if (ReadBack(path, thread) != 2 * kCases) return "read back";
    }
    return "";
}

TEST(Threads, EachThreadWritesAppendsAndReadsItsOwnFiles) {
    fixture::TempDir dir;
    std::vector<std::string> results(kThreads);
    std::vector<std::thread> threads;
    for (int t = 0; t < kThreads; ++t)
        threads.emplace_back([&, t] { results[size_t(t)] = Work(dir.Path(), t); });
    for (std::thread& thread : threads) thread.join();
    for (int t = 0; t < kThreads; ++t) EXPECT_EQ(results[size_t(t)], "") << "thread " << t;
}

}  // namespace
