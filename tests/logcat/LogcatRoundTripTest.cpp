// Round trip: replay the example minute with debug logging on, write the server's log lines as
// `adb logcat` would (threadtime), import them, replay the imported trace, and compare what the
// device nodes went through. Only the nodes of calls whose text the log lacks differ.
#include <android/log.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdio>
#include <map>
#include <mutex>
#include <sstream>
#include <string>

#include "host/platform/HostEnvironment.h"
#include "tests/host/HostTestSupport.h"
#include "tools/logcat/LogcatImportCommand.h"
#include "tools/replay/ReplaySession.h"

namespace velmora {
namespace {

std::mutex gLogLock;  // guards gLogcat
std::string gLogcat;

// liblog's lines as `adb logcat -v threadtime` prints them, stamped with the replay's clock
// from 18:00 on.
void threadtimeLogger(const struct __android_logger_data* data, const char* message) {
    const long long ms = HostEnvironment::get().clock().nowUs() / 1000;
    const long long s = ms / 1000;
    std::string text = message != nullptr ? message : "";
    while (!text.empty() && text.back() == '\n')
        text.pop_back();
    const char priority =
        data->priority >= 2 && data->priority <= 8 ? "VDIWEFS"[data->priority - 2] : '?';
    char line[1024];
    snprintf(line, sizeof(line), "11-23 %02lld:%02lld:%02lld.%03lld %5d %5d %c %s: %s\n",
             18 + s / 3600, s / 60 % 60, s % 60, ms % 1000, getpid(), gettid(), priority,
             data->tag != nullptr ? data->tag : "", text.c_str());
    std::lock_guard<std::mutex> lock(gLogLock);
    gLogcat += line;
}

void quietLogger(const struct __android_logger_data*, const char*) {}

// Replays `trace` on a fresh device; the node summary, one line per node key.
std::map<std::string, std::string> replay(const std::string& trace, const std::string& name) {
    const std::string dir = hosttest::makeScratchDir(name);
    ReplayOptions options = hosttest::replayOptions(dir, trace);
    options.configDirs = {hosttest::examplesDir()};
    FILE* out = fopen((dir + "/stdout.txt").c_str(), "w");
    ReplaySession session(options, out, stderr);
    EXPECT_EQ(ReplaySession::kOk, session.run()) << trace;
    fclose(out);
    std::map<std::string, std::string> nodes;
    std::istringstream summary(session.summaryText());
    for (std::string line; std::getline(summary, line);)
        nodes[line.substr(0, line.find(' '))] = line;
    return nodes;
}

TEST(LogcatRoundTripTest, ImportedMinuteReplaysLikeTheOriginal) {
    const std::string dir = hosttest::makeScratchDir("roundtrip");
    hosttest::writeFile(
        dir + "/original.trace",
        "@0 dump --logon\n" + hosttest::readFile(hosttest::examplesDir() + "/minute.trace") + "\n");

    __android_log_set_minimum_priority(ANDROID_LOG_VERBOSE);
    __android_log_set_logger(threadtimeLogger);
    const auto original = replay(dir + "/original.trace", "original");
    __android_log_set_logger(quietLogger);
    hosttest::writeFile(dir + "/device.log", gLogcat);

    std::ostringstream out, err;
    ASSERT_EQ(
        0, LogcatImportCommand::run({dir + "/device.log", "-o", dir + "/imported.trace"}, out, err))
        << err.str();
    EXPECT_NE(std::string::npos, out.str().find("0 requests not joined")) << out.str();
    const auto imported = replay(dir + "/imported.trace", "imported");

    // The calls whose text the log lacks, and the nodes they leave different: a probe without
    // its thread boosts nothing, so neither are the probe command's floors applied; the
    // memory-latency event has no ratios. The launch-policy answer and the dumps
    // "--easgrouplist" and "--freqlist" are missing too but leave no trace on the nodes.
    const std::map<std::string, std::string> differ = {
        {"probe.tid", "event 4116: the log lacks the thread (msg)"},
        {"probe.threads", "event 4116"},
        {"cpu.little.min", "event 4116: the probe command's floor"},
        {"cpu.big.min", "event 4116: the probe command's floor"},
        {"memlat.ratio_b", "event 20480: the log lacks the ratios (msg)"},
        {"memlat.ratio_l", "event 20480"},
    };
    for (const auto& node : original) {
        const bool same = node.second == imported.at(node.first);
        EXPECT_EQ(differ.count(node.first) == 0, same)
            << "original: " << node.second << "\nimported: " << imported.at(node.first);
    }
}

}  // namespace
}  // namespace velmora
