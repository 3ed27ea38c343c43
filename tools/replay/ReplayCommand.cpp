#include "tools/replay/ReplayCommand.h"

#include <signal.h>

#include <cstdlib>
#include <sstream>

#include "host/platform/HostEnvironment.h"
#include "tools/common/CommandLine.h"
#include "tools/replay/ComparisonRun.h"
#include "tools/replay/InstalledExample.h"
#include "tools/replay/ServerLog.h"

namespace velmora {

namespace {

constexpr const char* kProgram = "velmora-replay";

constexpr const char* kUsage =
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
    "  --help               print this help and exit\n"
    "  --version            print the version and exit\n"
    "An option's value follows it (--speed 4) or is joined by '=' (--speed=4).\n"
    "Nothing is written but what an option names. Exit status: 0 the trace ran, 1 bad\n"
    "input, 2 a usage error or the set-up failed, 130 interrupted.\n";

// Ctrl-C (or a polite kill) during a replay: the clock stops pacing and the replay stops after
// the call in progress, then reports what ran so far and cleans up. A second one ends the
// process at once.
HostClock* gClock = nullptr;

void onInterrupt(int) {
    if (gClock != nullptr) {
        gClock->interrupt();
    }
}

void catchInterrupts() {
    gClock = &HostEnvironment::get().clock();
    struct sigaction action = {};
    action.sa_handler = onInterrupt;
    action.sa_flags = SA_RESETHAND;  // no SA_RESTART: a read of stdin ends with EINTR
    sigemptyset(&action.sa_mask);
    sigaction(SIGINT, &action, nullptr);
    sigaction(SIGTERM, &action, nullptr);
}

CommandLine replayLine() {
    CommandLine line(kProgram, kUsage);
    line.repeatable("--config-dir")
        .value("--root")
        .flag("--keep-root")
        .value("--device")
        .value("--nodes")
        .value("--speed")
        .flag("--fast")
        .value("--timeline")
        .value("--event-log")
        .repeatable("--property")
        .value("--summary-json")
        .value("--report")
        .value("--compare")
        .flag("--compare-only")
        .flag("--quiet")
        .value("--server-log")
        .flag("--verbose")
        .flag("--interactive");
    line.excludes("--fast", "--speed",
                  "--fast and --speed exclude each other: --fast does not pace at all")
        .excludes("--keep-root", "--root",
                  "--keep-root is for the default device: a --root is always kept")
        .needs("--compare-only", "--compare", "--compare-only needs --compare CONFIG_B");
    return line;
}

}  // namespace

int ReplayCommand::parse(const std::vector<std::string>& args, ReplayRequest* request,
                         std::ostream& out, std::ostream& err) {
    CommandLine line = replayLine();
    if (!line.parse(args, out, err)) {
        return line.status();
    }
    ReplayOptions& options = request->options;
    if (line.operands().size() > 1) {
        err << line.problem("more than one trace given");
        return kUsageError;
    }
    const bool traceGiven = !line.operands().empty() && !line.operands().front().empty();
    if (!traceGiven && !line.has("--interactive")) {
        err << kProgram << ": no trace given (TRACE or --interactive)\n" << kUsage;
        return kUsageError;
    }
    if (traceGiven) {
        options.tracePath = line.operands().front();
    }
    if (line.has("--speed")) {
        const std::string text = line.get("--speed");
        char* end = nullptr;
        options.speed = strtod(text.c_str(), &end);
        if (text.empty() || *end != '\0' || !(options.speed > 0)) {
            err << line.problem("malformed speed '" + text + "'");
            return kUsageError;
        }
    }
    for (const std::string& kv : line.values("--property")) {
        const size_t eq = kv.find('=');
        if (eq == std::string::npos || eq == 0) {
            err << line.problem("--property wants KEY=VALUE, got '" + kv + "'");
            return kUsageError;
        }
        options.properties.emplace_back(kv.substr(0, eq), kv.substr(eq + 1));
    }
    options.configDirs = line.values("--config-dir");
    options.deviceRoot = line.get("--root");
    options.keepRoot = line.has("--keep-root");
    options.devicePath = line.get("--device");
    options.nodeMapPath = line.get("--nodes");
    options.fast = line.has("--fast");
    options.timelinePath = line.get("--timeline");
    options.eventLogPath = line.get("--event-log");
    options.summaryJsonPath = line.get("--summary-json");
    options.reportPath = line.get("--report");
    options.quiet = line.has("--quiet");
    options.interactive = line.has("--interactive");
    request->compareDir = line.get("--compare");
    request->compareOnly = line.has("--compare-only");
    request->serverLogPath = line.get("--server-log");
    request->verbose = line.has("--verbose");
    return kGoOn;
}

int ReplayCommand::run(const std::vector<std::string>& args, FILE* out, FILE* err) {
    ReplayRequest request;
    std::ostringstream said;
    std::ostringstream refused;
    const int parsed = parse(args, &request, said, refused);
    fputs(said.str().c_str(), out);
    fputs(refused.str().c_str(), err);
    if (parsed != kGoOn) {
        return parsed;
    }
    ReplayOptions& options = request.options;
    std::string logError;
    if (!ServerLog::route(request.serverLogPath, request.verbose, &logError)) {
        fprintf(err, "%s: %s\n", kProgram, logError.c_str());
        return ReplaySession::kSetupFailed;
    }
    if (options.configDirs.empty()) {
        options.configDirs = defaultConfigDirs(options.tracePath, options.interactive);
    }
    if (!request.compareDir.empty()) {
        ComparisonRun comparison(options, request.compareDir, out, err);
        comparison.setCompareOnly(request.compareOnly);
        return comparison.run();
    }
    catchInterrupts();
    ReplaySession session(options, out, err);
    const int status = session.run();
    return gClock->interrupted() ? kInterrupted : status;
}

}  // namespace velmora
