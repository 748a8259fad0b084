// Whole write, append, copy and read sessions through the exported calls,
// with the Nth call to the device failing, for every N the session reaches:
// the failure is reported, nothing crashes or leaks, an append that failed
// keeps the cases that were there, and no file claims cases it lacks. Then
// the same sessions in several threads at once (run under ThreadSanitizer by
// `make tsan`).
#include <gtest/gtest.h>

#include <cerrno>
#include <cstring>
#include <functional>
#include <string>
#include <thread>
#include <vector>

#include "api_handles.h"
#include "qorafile.h"
#include "sysfile_builder.h"

namespace {

// Cases of the file an append extends: 41 of 6 units leave the last
// compressed block partly filled (six of its eight codes).
constexpr int kBefore = 41;
constexpr int kAdded = 300;  // cases a session writes: several buffers' worth

// Values of their own in every thread, so that no case can pass for another's.
thread_local int tThread = 0;
double Number(int i) { return tThread * 1000 + i * 0.25; }
std::string Text(int i) {
    return std::to_string(tThread) + " case " + std::to_string(i) +
           std::string(size_t(i % 20), '*');
}

// Defines the dictionary unless it came from another file; false on any failure.
bool Define(int h, bool compressed) {
    return qoraSetVarName(h, "n", 0) == 0 && qoraSetVarName(h, "s", 40) == 0 &&
           qoraSetVarLabel(h, "n", "A number") == 0 &&
           qoraSetCompression(h, compressed ? 1 : 0) == 0;
}

// Even cases value by value, odd ones as whole cases. A caller may go on
// after a failure; no case may then land out of its place.
bool WriteCases(int h, int from, int count) {
    bool ok = true;
    for (int i = from; i < from + count; ++i) {
        char record[48];
        const double number = Number(i);
        std::memcpy(record, &number, 8);
        std::memcpy(record + 8, (Text(i) + std::string(40, ' ')).data(), 40);
        ok = (i % 2 ? qoraWholeCaseOut(h, record) == 0
                    : qoraSetValueNumeric(h, 1.0, number) == 0 &&
                          qoraSetValueChar(h, 2.0, Text(i).c_str()) == 0 &&
                          qoraCommitCaseRecord(h) == 0) &&
             ok;
    }
    return ok;
}

// Opens the file and reads every case it gives, each checked against what
// was written. Returns the cases read, or -1 when the file does not open;
// claimed is the count the file states.
int ReadBack(const std::string& path, int& claimed) {
    claimed = -1;
    int h = -1;
    if (qoraOpenRead(path.c_str(), &h) != 0) return -1;
    qoraGetNumberofCases(h, &claimed);
    int read = 0;
    for (; qoraReadCaseRecord(h) == 0; ++read) {
        double number = 0;
        char text[41] = {};
        EXPECT_EQ(qoraGetValueNumeric(h, 1.0, &number), 0);
        EXPECT_EQ(qoraGetValueChar(h, 2.0, text, sizeof text), 0);
        EXPECT_EQ(number, Number(read)) << path << " case " << read;
        EXPECT_EQ(std::string(text).substr(0, Text(read).size()), Text(read)) << read;
    }
    qoraCloseRead(h);
    return read;
}

struct Session {
    const char* name;
    // Run before the fault is armed: the files the session starts from.
    std::function<void(const std::string& dir)> prepare;
    // True when every call succeeded.
    std::function<bool(const std::string& dir)> run;
    int keptCases;  // cases that must survive a failure (-1: the file may be lost)
    int allCases;   // cases the file holds when every call succeeded
};

void WriteGoodFile(const std::string& path, bool compressed, int cases) {
    int h = -1;
    ASSERT_EQ(qoraOpenWrite(path.c_str(), &h), 0);
    ASSERT_TRUE(Define(h, compressed));
    ASSERT_EQ(qoraCommitHeader(h), 0);
    ASSERT_TRUE(WriteCases(h, 0, cases));
    ASSERT_EQ(qoraCloseWrite(h), 0);
}

// A session writes the file "out.qsf" in dir; closing counts as a call.
std::vector<Session> Sessions(bool compressed) {
    auto write = [compressed](const std::string& dir) {
        int h = -1;
        if (qoraOpenWrite((dir + "/out.qsf").c_str(), &h) != 0) return false;
        const bool ok =
            Define(h, compressed) && qoraCommitHeader(h) == 0 && WriteCases(h, 0, kAdded);
        return qoraCloseWrite(h) == 0 && ok;
    };
    auto source = [compressed](const std::string& dir) {
        WriteGoodFile(dir + "/out.qsf", compressed, kBefore);
    };
    auto append = [](const std::string& dir) {
        int h = -1;
        if (qoraOpenAppend((dir + "/out.qsf").c_str(), &h) != 0) return false;
        const bool ok = WriteCases(h, kBefore, kAdded);
        return qoraCloseAppend(h) == 0 && ok;
    };
    auto dictionary = [compressed](const std::string& dir) {
        WriteGoodFile(dir + "/dict.qsf", compressed, 1);
    };
    auto copy = [](const std::string& dir) {
        int h = -1;
        const std::string dict = dir + "/dict.qsf";
        if (qoraOpenWriteCopy((dir + "/out.qsf").c_str(), dict.c_str(), &h) != 0) return false;
        const bool ok = qoraCommitHeader(h) == 0 && WriteCases(h, 0, kAdded);
        return qoraCloseWrite(h) == 0 && ok;
    };
    auto read = [](const std::string& dir) {
        int h = -1;
        if (qoraOpenRead((dir + "/out.qsf").c_str(), &h) != 0) return false;
        int cases = 0;
        while (qoraReadCaseRecord(h) == 0) ++cases;
        return qoraCloseRead(h) == 0 && cases == kBefore;
    };
    return {{"write", [](const std::string&) {}, write, -1, kAdded},
            {"append", source, append, kBefore, kBefore + kAdded},
            {"copy", dictionary, copy, -1, kAdded},
            {"read", source, read, kBefore, kBefore}};
}

void Sweep(const Session& session, const qora::FileFault& kind) {
    for (int64_t n = 1;; ++n) {
        fixture::TempDir dir;
        session.prepare(dir.Path());
        qora::FileFault fault = kind;
        fault.failAt = n;
        qora::InjectFileFault(fault);
        const bool ok = session.run(dir.Path());
        const bool fired = qora::CountedFileCalls() >= n;
        qora::InjectFileFault({});
        const std::string where = std::string(session.name) + " call " + std::to_string(n);
        EXPECT_TRUE(ok || fired) << where;
        // A failure the library can work around (a probe that meets no file)
        // may leave the session whole; then the file must be too.
        int claimed = -1;
        const int read = ReadBack(dir.Path() + "/out.qsf", claimed);
        if (ok) {
            EXPECT_EQ(read, session.allCases) << where;
            EXPECT_EQ(claimed, session.allCases) << where;
        } else {
            EXPECT_GE(read, session.keptCases) << where;
            if (read >= 0) {
                EXPECT_LE(claimed, read) << where;
            }
        }
        if (!fired || ::testing::Test::HasFailure()) return;
    }
}

TEST(FaultSweep, EveryFailingDeviceCallIsReportedAndLosesNothingWritten) {
    const qora::FileFault kinds[] = {
        {qora::kFileOpen | qora::kFileRead | qora::kFileWrite | qora::kFileSeek, 0, EIO, false},
        {qora::kFileWrite, 0, ENOSPC, true},
    };
    for (bool compressed : {false, true}) {
        for (const Session& session : Sessions(compressed)) {
            for (const qora::FileFault& kind : kinds) {
                SCOPED_TRACE(std::string(session.name) + (compressed ? " compressed" : " raw") +
                             (kind.shortWrite ? " short write" : " I/O error"));
                Sweep(session, kind);
            }
        }
    }
}

// Each thread appends to a file of its own and reads it back, while the
// process-wide tables serve every thread.
TEST(Threads, EachThreadWritesAppendsAndReadsItsOwnFiles) {
    std::vector<std::thread> threads;
    for (int t = 1; t <= 4; ++t) {
        threads.emplace_back([t] {
            tThread = t;
            for (bool compressed : {false, true, false}) {
                const fixture::TempDir dir;
                const Session append = Sessions(compressed)[1];  // "append"
                append.prepare(dir.Path());
                EXPECT_TRUE(append.run(dir.Path())) << "thread " << t;
                int claimed = -1;
                EXPECT_EQ(ReadBack(dir.Path() + "/out.qsf", claimed), append.allCases);
                EXPECT_EQ(claimed, append.allCases);
                double date = 0;
                EXPECT_EQ(qoraConvertDate(6, 12, 2026, &date), QORA_STATUS_OK);
            }
        });
    }
    for (std::thread& thread : threads) thread.join();
}

}  // namespace
