#include "output.h"

#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>

#include "status.h"

PendingOutput::PendingOutput(const std::string& path) : fPath(path), fTemp(path + ".part") {}

PendingOutput::~PendingOutput() {
    if (!fCommitted) std::remove(fTemp.c_str());
}

void PendingOutput::Commit() {
    if (std::rename(fTemp.c_str(), fPath.c_str()) != 0)
        throw BadInput{fPath + ": the finished file cannot be put in place (" +
                       std::strerror(errno) + ")."};
    fCommitted = true;
}

Progress::Progress()
    : fShown(isatty(STDERR_FILENO) ? 0 : -1), fStart(Clock::now()), fLast(fStart) {}

Progress::~Progress() {
    if (fShown > 0) std::fprintf(stderr, "\r%ld cases\033[K\n", fCases);
}

void Progress::Show() {
    const Clock::time_point now = Clock::now();
    if (now - fStart < std::chrono::seconds(1) || now - fLast < std::chrono::milliseconds(500))
        return;
    fLast = now;
    const double seconds = std::chrono::duration<double>(now - fStart).count();
    std::fprintf(stderr, "\r%ld cases, %.0f a second\033[K", fCases, fCases / seconds);
    ++fShown;
}
