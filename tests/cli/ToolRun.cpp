#include "tests/cli/ToolRun.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <stdlib.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <thread>

namespace velmora {
namespace clitest {

int ToolResult::errLines() const {
    int lines = static_cast<int>(std::count(err.begin(), err.end(), '\n'));
    return !err.empty() && err.back() != '\n' ? lines + 1 : lines;
}

ToolResult ToolRun::run(const std::vector<std::string>& argv, const std::string& cwd,
                        const std::vector<std::string>& env, int limitSeconds,
                        int interruptAfterMs) {
    // The output goes to files outside `cwd`, which the tests expect to stay as the tool left it.
    const std::string capture = scratchDir("capture");
    const std::string outPath = capture + "/out";
    const std::string errPath = capture + "/err";
    ToolResult result;
    fflush(stdout);
    fflush(stderr);
    const pid_t pid = fork();
    if (pid == 0) {
        const int in = open("/dev/null", O_RDONLY);
        const int out = open(outPath.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0644);
        const int err = open(errPath.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0644);
        if (in < 0 || out < 0 || err < 0 || dup2(in, 0) < 0 || dup2(out, 1) < 0 ||
            dup2(err, 2) < 0 || chdir(cwd.c_str()) != 0)
            _exit(127);
        for (const std::string& variable : env)
            putenv(strdup(variable.c_str()));
        std::vector<char*> args;
        for (const std::string& arg : argv)
            args.push_back(const_cast<char*>(arg.c_str()));
        args.push_back(nullptr);
        execv(args[0], args.data());
        _exit(127);
    }
    if (pid < 0) {
        ADD_FAILURE() << "fork failed";
        return result;
    }
    const auto started = std::chrono::steady_clock::now();
    const auto deadline = started + std::chrono::seconds(limitSeconds);
    bool interrupted = interruptAfterMs <= 0;
    int status = 0;
    while (waitpid(pid, &status, WNOHANG) == 0) {
        if (!interrupted && std::chrono::steady_clock::now() >
                                started + std::chrono::milliseconds(interruptAfterMs)) {
            kill(pid, SIGINT);
            interrupted = true;
        }
        if (std::chrono::steady_clock::now() > deadline) {
            ADD_FAILURE() << argv[0] << " ran longer than " << limitSeconds << " s";
            kill(pid, SIGKILL);
            waitpid(pid, &status, 0);
            break;
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    result.status = WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
    result.out = readFile(outPath);
    result.err = readFile(errPath);
    std::filesystem::remove_all(capture);
    return result;
}

std::string scratchDir(const std::string& name) {
    std::string pattern = testing::TempDir() + "/velmora-cli-" + name + "-XXXXXX";
    if (mkdtemp(&pattern[0]) == nullptr)
        ADD_FAILURE() << "mkdtemp failed for " << pattern;
    return pattern;
}

std::vector<std::string> entries(const std::string& dir) {
    std::vector<std::string> names;
    for (const auto& entry : std::filesystem::recursive_directory_iterator(dir))
        names.push_back(std::filesystem::relative(entry.path(), dir).string());
    std::sort(names.begin(), names.end());
    return names;
}

void writeFile(const std::string& path, const std::string& text) {
    std::ofstream file(path, std::ios::binary | std::ios::trunc);
    file << text;
}

std::string readFile(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    std::stringstream text;
    text << file.rdbuf();
    return text.str();
}

std::string replayTool() {
    return VELMORA_REPLAY_TOOL;
}

std::string lintTool() {
    return VELMORA_LINT_TOOL;
}

std::string logcatTool() {
    return VELMORA_LOGCAT_TOOL;
}

std::string tracegenTool() {
    return VELMORA_TRACEGEN_TOOL;
}

std::string synthTool() {
    return VELMORA_SYNTH_TOOL;
}

std::string fleetTool() {
    return VELMORA_FLEET_TOOL;
}

std::string examplesDir() {
    return std::string(VELMORA_SOURCE_DIR) + "/examples";
}

}  // namespace clitest
}  // namespace velmora
