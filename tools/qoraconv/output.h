// What a conversion leaves behind: its output files, put in place only when
// complete, and a progress line on a terminal.
#pragma once

#include <chrono>
#include <string>

// An output file written under a temporary name beside it and renamed when
// complete, so a failed conversion leaves no broken file and an earlier file
// of that name untouched.
class PendingOutput {
  public:
    explicit PendingOutput(const std::string& path);
    ~PendingOutput();
    PendingOutput(const PendingOutput&) = delete;
    PendingOutput& operator=(const PendingOutput&) = delete;

    const std::string& Temp() const { return fTemp; }
    // Throws BadInput when the file cannot be put in place.
    void Commit();

  private:
    std::string fPath;
    std::string fTemp;
    bool fCommitted = false;
};

// Cases done and their rate, shown on a terminal only (a pipe gets nothing
// but errors) and only once a conversion has run for a second.
class Progress {
  public:
    Progress();
    ~Progress();
    Progress(const Progress&) = delete;
    Progress& operator=(const Progress&) = delete;

    void CaseDone() {
        if (++fCases % 4096 == 0 && fShown >= 0) Show();
    }

  private:
    void Show();

    using Clock = std::chrono::steady_clock;
    long fCases = 0;
    int fShown;  // lines shown, or -1 when stderr is no terminal
    Clock::time_point fStart;
    Clock::time_point fLast;
};
