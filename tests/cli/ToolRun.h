// Runs one of the built tools as a user would: a process of its own in a given directory with
// given environment variables, its output captured, its exit status returned. The tool tests
// check what it printed, returned and left on disk.
#pragma once

#include <string>
#include <vector>

namespace velmora {
namespace clitest {

struct ToolResult {
    int status = -1;  // exit status; 128 + the signal when killed
    std::string out;
    std::string err;
    // Lines of `err` (a last line without a newline counts).
    int errLines() const;
};

class ToolRun {
public:
    // `argv[0]` is the program's path. Runs it in `cwd` with `env` ("NAME=VALUE") added to this
    // process's environment, stdin from /dev/null; killed after `limitSeconds`. With
    // `interruptAfterMs` it gets a SIGINT (a Ctrl-C) that long after it started.
    static ToolResult run(const std::vector<std::string>& argv, const std::string& cwd,
                          const std::vector<std::string>& env = {}, int limitSeconds = 60,
                          int interruptAfterMs = 0);
};

// A fresh empty directory of its own for each call.
std::string scratchDir(const std::string& name);
// Names in `dir` (recursively, relative to it), sorted; empty for an empty directory.
std::vector<std::string> entries(const std::string& dir);
void writeFile(const std::string& path, const std::string& text);
std::string readFile(const std::string& path);
// The built programs and the source tree's example directory.
std::string replayTool();
std::string lintTool();
std::string logcatTool();
std::string tracegenTool();
std::string synthTool();
std::string fleetTool();  // a Python program beside the others
std::string examplesDir();

}  // namespace clitest
}  // namespace velmora
