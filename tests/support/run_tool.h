// Runs a command-line tool as a user would and collects what it says.
#pragma once

#include <sys/wait.h>

#include <cstdio>
#include <string>

namespace fixture {

struct ToolRun {
    int exitCode;
    std::string output;  // stdout and stderr
};

inline ToolRun RunTool(const std::string& command) {
    ToolRun run{-1, {}};
    std::FILE* pipe = popen((command + " 2>&1").c_str(), "r");
    if (!pipe) return run;
    char buffer[4096];
    for (size_t n; (n = std::fread(buffer, 1, sizeof buffer, pipe)) > 0;)
        run.output.append(buffer, n);
    const int status = pclose(pipe);
    run.exitCode = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
    return run;
}

}  // namespace fixture
