// velmora-replay: replays an event trace against the server on the host platform layer.
// See docs/replay.md for the trace format.
#include <signal.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include "host/platform/HostEnvironment.h"
#include "tools/replay/ComparisonRun.h"
#include "tools/replay/InstalledExample.h"
#include "tools/replay/ReplaySession.h"
#include "tools/replay/ServerLog.h"

namespace {

void usage(FILE* to) {
    fputs(
        "usage: velmora-replay [options] TRACE\n"
        "       velmora-replay [options] --interactive\n"
        "  --config-dir DIR     where xml/velmora_config_cust.xml is looked up (repeatable;\n"
        "                       default: the trace's directory, then the installed example\n"
        "                       in <prefix>/share/velmora/examples)\n"
        "  --root DIR           device root: a fresh simulated device is created there\n"
        "                       and kept (default $TMPDIR/velmora-sim-<pid>, removed at\n"
        "                       the end); \"/\" writes the real nodes\n"
        "  --keep-root          keep the default simulated device after the replay\n"
        "  --device FILE        device profile (default: the example device,\n"
        "                       examples/device/example-device.xml)\n"
        "  --nodes FILE         node map overrides\n"
        "  --speed X            pace the replay at X times real time (default 1)\n"
        "  --fast               no pacing: same results, no waiting at all\n"
        "  --timeline FILE      write a Chrome JSON timeline\n"
        "  --event-log FILE     write the device event log lines (frequency-limit reports)\n"
        "  --property KEY=VAL   system property seen by the server (repeatable)\n"
        "  --summary-json FILE  what the analysis found, as JSON (docs/replay-insight.md)\n"
        "  --report FILE.html   self-contained HTML report (plots, holders, warnings)\n"
        "  --compare CONFIG_B   replay twice in virtual time, under the configuration and\n"
        "                       under CONFIG_B (an XML file, or a directory holding\n"
        "                       xml/velmora_config_cust.xml), and report the differences\n"
        "                       first, then run A's summary\n"
        "  --compare-only       with --compare: print only the differences\n"
        "  --quiet              no line per call\n"
        "  --server-log FILE    write the server's own log to FILE (default: dropped)\n"
        "  --verbose            show the server's own log on stderr\n"
        "  --interactive        read calls from stdin\n"
        "  --version            print the version and exit\n"
        "Nothing is written but what an option names. Exit status: 0 the trace ran, 1 bad\n"
        "input, 2 a usage error or the set-up failed, 130 interrupted.\n",
        to);
}

// Ctrl-C (or a polite kill) during a replay: the clock stops pacing and the replay stops after
// the call in progress, then reports what ran so far and cleans up. A second one ends the
// process at once.
velmora::HostClock* gClock = nullptr;

void onInterrupt(int) {
    if (gClock != nullptr) {
        gClock->interrupt();
    }
}

void catchInterrupts() {
    gClock = &velmora::HostEnvironment::get().clock();
    struct sigaction action = {};
    action.sa_handler = onInterrupt;
    action.sa_flags = SA_RESETHAND;  // no SA_RESTART: a read of stdin ends with EINTR
    sigemptyset(&action.sa_mask);
    sigaction(SIGINT, &action, nullptr);
    sigaction(SIGTERM, &action, nullptr);
}

// Exit status after an interrupt, as a shell reports a process ended by SIGINT.
constexpr int kInterrupted = 130;
// Exit status of a command line that cannot be run (the same for every velmora tool).
constexpr int kUsageError = 2;

}  // namespace

int main(int argc, char** argv) {
    velmora::ReplayOptions options;
    std::string compareDir;
    std::string serverLogPath;  // --server-log
    bool verbose = false;       // the server's log on stderr
    bool speedGiven = false;
    bool compareOnly = false;
    for (int i = 1; i < argc; ++i) {
        const std::string arg = argv[i];
        auto value = [&](const char* name) -> const char* {
            if (i + 1 >= argc) {
                fprintf(stderr, "velmora-replay: %s needs a value\n", name);
                exit(kUsageError);
            }
            return argv[++i];
        };
        if (arg == "--config-dir") {
            options.configDirs.push_back(value("--config-dir"));
        } else if (arg == "--root") {
            options.deviceRoot = value("--root");
        } else if (arg == "--device") {
            options.devicePath = value("--device");
        } else if (arg == "--nodes") {
            options.nodeMapPath = value("--nodes");
        } else if (arg == "--speed") {
            const char* text = value("--speed");
            char* end = nullptr;
            options.speed = strtod(text, &end);
            if (*end != '\0' || !(options.speed > 0)) {
                fprintf(stderr, "velmora-replay: malformed speed '%s'\n", text);
                return kUsageError;
            }
            speedGiven = true;
        } else if (arg == "--fast") {
            options.fast = true;
        } else if (arg == "--timeline") {
            options.timelinePath = value("--timeline");
        } else if (arg == "--event-log") {
            options.eventLogPath = value("--event-log");
        } else if (arg == "--property") {
            const std::string kv = value("--property");
            const size_t eq = kv.find('=');
            if (eq == std::string::npos || eq == 0) {
                fprintf(stderr, "velmora-replay: --property wants KEY=VALUE, got '%s'\n",
                        kv.c_str());
                return kUsageError;
            }
            options.properties.emplace_back(kv.substr(0, eq), kv.substr(eq + 1));
        } else if (arg == "--summary-json") {
            options.summaryJsonPath = value("--summary-json");
        } else if (arg == "--report") {
            options.reportPath = value("--report");
        } else if (arg == "--compare") {
            compareDir = value("--compare");
        } else if (arg == "--compare-only") {
            compareOnly = true;
        } else if (arg == "--quiet") {
            options.quiet = true;
        } else if (arg == "--keep-root") {
            options.keepRoot = true;
        } else if (arg == "--server-log") {
            serverLogPath = value("--server-log");
        } else if (arg == "--verbose") {
            verbose = true;
        } else if (arg == "--version") {
            printf("velmora-replay %s\n", VELMORA_VERSION);
            return 0;
        } else if (arg == "--interactive") {
            options.interactive = true;
        } else if (arg == "--help" || arg == "-h") {
            usage(stdout);
            return 0;
        } else if (!arg.empty() && arg[0] == '-') {
            fprintf(stderr, "velmora-replay: unknown option %s\n", arg.c_str());
            usage(stderr);
            return kUsageError;
        } else if (options.tracePath.empty()) {
            options.tracePath = arg;
        } else {
            fprintf(stderr, "velmora-replay: more than one trace given\n");
            return kUsageError;
        }
    }
    if (options.tracePath.empty() && !options.interactive) {
        usage(stderr);
        return kUsageError;
    }
    if (options.fast && speedGiven) {
        fprintf(stderr,
                "velmora-replay: --fast and --speed exclude each other: --fast does not "
                "pace at all\n");
        return kUsageError;
    }
    if (options.keepRoot && !options.deviceRoot.empty()) {
        fprintf(stderr,
                "velmora-replay: --keep-root is for the default device: a --root is "
                "always kept\n");
        return kUsageError;
    }
    if (compareOnly && compareDir.empty()) {
        fprintf(stderr, "velmora-replay: --compare-only needs --compare CONFIG_B\n");
        return kUsageError;
    }
    std::string logError;
    if (!velmora::ServerLog::route(serverLogPath, verbose, &logError)) {
        fprintf(stderr, "velmora-replay: %s\n", logError.c_str());
        return velmora::ReplaySession::kSetupFailed;
    }
    if (options.configDirs.empty()) {
        options.configDirs = velmora::defaultConfigDirs(options.tracePath, options.interactive);
    }
    if (!compareDir.empty()) {
        velmora::ComparisonRun comparison(options, compareDir, stdout, stderr);
        comparison.setCompareOnly(compareOnly);
        return comparison.run();
    }
    catchInterrupts();
    velmora::ReplaySession session(options, stdout, stderr);
    const int status = session.run();
    return gClock->interrupted() ? kInterrupted : status;
}
