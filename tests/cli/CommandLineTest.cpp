// The tools as command-line programs: what a replay leaves on disk and on the terminal, where the
// server's log goes, --version and the status of a usage error.
#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "tests/cli/ToolRun.h"

namespace velmora {
namespace clitest {
namespace {

std::string minuteTrace() {
    return examplesDir() + "/minute.trace";
}

// A --fast replay of the example minute in an empty directory, with TMPDIR another empty one.
struct CleanRun {
    std::string cwd = scratchDir("cwd");
    std::string tmp = scratchDir("tmp");
    ToolResult result;

    explicit CleanRun(std::vector<std::string> options) {
        std::vector<std::string> argv = {replayTool(), "--fast"};
        argv.insert(argv.end(), options.begin(), options.end());
        argv.push_back(minuteTrace());
        result = ToolRun::run(argv, cwd, {"TMPDIR=" + tmp});
    }
};

TEST(ReplayLeavesNothingBehindTest, PlainReplayWritesNoFileAndRemovesItsDevice) {
    CleanRun run({"--quiet"});
    EXPECT_EQ(0, run.result.status) << run.result.err;
    EXPECT_NE(std::string::npos, run.result.out.find("cpu.big.max"));  // the summary still comes
    EXPECT_EQ(std::vector<std::string>{}, entries(run.cwd));
    EXPECT_EQ(std::vector<std::string>{}, entries(run.tmp));
    // The device was made under TMPDIR, not /tmp.
    EXPECT_NE(std::string::npos, run.result.out.find("(device " + run.tmp + "/velmora-sim-"))
        << run.result.out.substr(0, 200);
}

TEST(ReplayLeavesNothingBehindTest, WritesOnlyTheFilesItsOptionsName) {
    CleanRun run({"--quiet", "--timeline", "t.json", "--event-log", "e.log"});
    EXPECT_EQ(0, run.result.status) << run.result.err;
    EXPECT_EQ((std::vector<std::string>{"e.log", "t.json"}), entries(run.cwd));
    EXPECT_EQ(std::vector<std::string>{}, entries(run.tmp));
    EXPECT_NE(std::string::npos, run.result.out.find("timeline: t.json"));
    EXPECT_NE(std::string::npos, readFile(run.cwd + "/e.log").find("#ARG1:"));
}

TEST(ReplayLeavesNothingBehindTest, KeepRootKeepsTheDefaultDeviceAndSaysWhere) {
    CleanRun run({"--quiet", "--keep-root"});
    EXPECT_EQ(0, run.result.status) << run.result.err;
    const std::vector<std::string> kept = entries(run.tmp);
    ASSERT_FALSE(kept.empty());
    const std::string device = kept.front();
    EXPECT_EQ(0u, device.rfind("velmora-sim-", 0)) << device;
    EXPECT_NE(std::string::npos, run.result.out.find("device kept: " + run.tmp + "/" + device));
    EXPECT_NE(kept.end(), std::find(kept.begin(), kept.end(), device + "/.velmora-simulated"));
    EXPECT_EQ(std::vector<std::string>{}, entries(run.cwd));
}

TEST(ReplayTerminalTest, PlainReplayKeepsTheServerLogOffTheTerminal) {
    CleanRun run({});
    EXPECT_EQ(0, run.result.status) << run.result.err;
    EXPECT_LE(run.result.errLines(), 3) << run.result.err;
    EXPECT_EQ(std::string::npos, run.result.err.find("velmora server")) << run.result.err;
}

TEST(ReplayTerminalTest, ServerLogGoesToTheFileNamed) {
    CleanRun run({"--quiet", "--server-log", "server.log"});
    EXPECT_EQ(0, run.result.status) << run.result.err;
    const std::string log = readFile(run.cwd + "/server.log");
    // A fresh host has no cloud copy: the server says so and loads the device copy.
    EXPECT_NE(std::string::npos, log.find("E velmora server: LoadFile error")) << log;
    EXPECT_NE(std::string::npos,
              log.find("E velmora server: get cloud velmora_config_cust.xml failed!"))
        << log;
    EXPECT_EQ(std::string::npos, run.result.err.find("LoadFile error"));
}

TEST(ReplayTerminalTest, VerboseShowsTheServerLogOnStderr) {
    CleanRun run({"--quiet", "--verbose"});
    EXPECT_EQ(0, run.result.status) << run.result.err;
    EXPECT_NE(std::string::npos, run.result.err.find("LoadFile error")) << run.result.err;
}

// Ctrl-C during a paced replay of the minute: it stops after the call in progress, reports what
// ran, removes its device and exits 130, long before the minute is over.
TEST(ReplayTerminalTest, CtrlCStopsAPacedReplayAndCleansUp) {
    const std::string cwd = scratchDir("cwd");
    const std::string tmp = scratchDir("tmp");
    const auto started = std::chrono::steady_clock::now();
    const ToolResult result =
        ToolRun::run({replayTool(), "--quiet", minuteTrace()}, cwd, {"TMPDIR=" + tmp}, 60, 1500);
    EXPECT_LT(std::chrono::steady_clock::now() - started, std::chrono::seconds(30));
    EXPECT_EQ(130, result.status) << result.err;
    EXPECT_NE(std::string::npos, result.out.find("interrupted at ")) << result.out;
    EXPECT_NE(std::string::npos, result.out.find("cpu.big.max")) << result.out;
    EXPECT_EQ(std::vector<std::string>{}, entries(tmp));
    EXPECT_EQ(std::vector<std::string>{}, entries(cwd));
}

TEST(ReplayTerminalTest, ServerLogThatCannotBeWrittenIsASetUpFailure) {
    const std::string cwd = scratchDir("cwd");
    const ToolResult result = ToolRun::run(
        {replayTool(), "--fast", "--server-log", cwd + "/none/server.log", minuteTrace()}, cwd);
    EXPECT_EQ(2, result.status);
    EXPECT_EQ("velmora-replay: cannot write " + cwd + "/none/server.log\n", result.err);
}

// Placeholders an import left unedited: one warning each, with its line and what to fill in;
// past ten, one line counting the rest. The replay still runs.
TEST(ReplayPlaceholderTest, WarnsOncePerUneditedPlaceholder) {
    const std::string cwd = scratchDir("placeholders");
    std::string trace =
        "@100 event 4116 0 msg=\"pid=0|tid=0\"  # EDIT\n"
        "@200 event 20480 0 msg=\"pid=0|tid=0\"  # EDIT\n"
        "@300 event 4116 0 msg=\"pid=2100|tid=2100\"\n";
    for (int i = 0; i < 10; ++i)
        trace += "@400 event 4116 0 msg=\"pid=0|tid=0\"\n";
    std::ofstream(cwd + "/t.trace") << trace;
    const ToolResult result = ToolRun::run(
        {replayTool(), "--fast", "--quiet", "--config-dir", examplesDir(), cwd + "/t.trace"}, cwd,
        {"TMPDIR=" + cwd});
    EXPECT_EQ(0, result.status) << result.err;
    const std::string prefix = "velmora-replay: " + cwd + "/t.trace:";
    EXPECT_NE(std::string::npos,
              result.err.find(prefix + "1: warning: unedited placeholder from the import, "
                                       "msg=\"pid=0|tid=0\": the probe boosts no thread; fill in "
                                       "the pid and tid of the thread to probe\n"))
        << result.err;
    EXPECT_NE(std::string::npos,
              result.err.find(prefix + "2: warning: unedited placeholder from the import, "
                                       "msg=\"pid=0|tid=0\": the memory-latency event fails "
                                       "(status 3)"))
        << result.err;
    EXPECT_EQ(std::string::npos, result.err.find(prefix + "3:")) << "an edited probe is fine";
    EXPECT_NE(std::string::npos,
              result.err.find("velmora-replay: " + cwd +
                              "/t.trace: warning: 2 more unedited placeholders\n"))
        << result.err;
}

// The conventions every tool keeps: --help is the usage on stdout, --version "<tool> <version>",
// an unknown option, a missing value or conflicting options one line on stderr naming it and a
// hint, status 2, nothing on stdout. velmora-fleet (Python's argparse) keeps the statuses and
// says "velmora-fleet: error: ..." last, after its usage.
struct ConventionRow {
    std::string name;
    std::string tool;
    std::string program;
    std::vector<std::string> args;
    int status;
    std::string out;      // what stdout starts with
    std::string errLine;  // the first line on stderr (the last for velmora-fleet), "" for none
};

void PrintTo(const ConventionRow& row, std::ostream* os) {
    *os << row.name;
}

class ToolConventionTest : public ::testing::TestWithParam<ConventionRow> {};

TEST_P(ToolConventionTest, StatusOutputAndMessage) {
    const ConventionRow& row = GetParam();
    const std::string cwd = scratchDir("convention");
    std::vector<std::string> argv = {row.tool};
    argv.insert(argv.end(), row.args.begin(), row.args.end());
    const ToolResult result = ToolRun::run(argv, cwd);
    EXPECT_EQ(row.status, result.status) << result.err;
    EXPECT_EQ(row.out, result.out.substr(0, row.out.size()));
    if (row.status == 2) {
        EXPECT_EQ("", result.out);
    }
    std::vector<std::string> lines;
    std::istringstream err(result.err);
    for (std::string line; std::getline(err, line);) {
        lines.push_back(line);
    }
    if (row.errLine.empty()) {
        EXPECT_EQ("", result.err);
    } else if (row.program == "velmora-fleet") {
        ASSERT_FALSE(lines.empty());
        EXPECT_EQ(0u, lines.back().rfind(row.errLine, 0)) << result.err;
    } else {
        ASSERT_EQ(2u, lines.size()) << result.err;
        EXPECT_EQ(row.program + ": " + row.errLine, lines[0]);
        EXPECT_EQ("Try '" + row.program + " --help'.", lines[1]);
    }
    EXPECT_EQ(std::vector<std::string>{}, entries(cwd));
}

std::vector<ConventionRow> conventionRows() {
    struct Tool {
        std::string path;
        std::string program;
        std::string valued;  // an option that takes a value
        std::vector<std::string> conflicting;
        std::string conflict;
    };
    const Tool tools[] = {
        {replayTool(),
         "velmora-replay",
         "--timeline",
         {"--speed=2", "--fast", "t.trace"},
         "--fast and --speed exclude each other: --fast does not pace at all"},
        {lintTool(), "velmora-lint", "--device", {}, ""},
        {logcatTool(), "velmora-import-logcat", "-o", {}, ""},
        {tracegenTool(),
         "velmora-gen-trace",
         "--seed",
         {"--no-probes", "--probe-share=0.5"},
         "--no-probes and --probe-share exclude each other"},
        {synthTool(),
         "velmora-synth",
         "--count",
         {"--no-load", "--load-period-ms", "5", "-o", "d"},
         "--no-load and --load-period-ms exclude each other"},
    };
    const std::string version = VELMORA_PROJECT_VERSION;
    std::vector<ConventionRow> rows;
    for (const Tool& tool : tools) {
        // "import-logcat" shows as "ImportLogcat".
        std::string name;
        for (size_t i = std::string("velmora-").size(); i < tool.program.size(); ++i) {
            const bool starts = name.empty() || tool.program[i - 1] == '-';
            if (tool.program[i] != '-') {
                name += starts ? static_cast<char>(toupper(tool.program[i])) : tool.program[i];
            }
        }
        rows.push_back(
            {name + "Help", tool.path, tool.program, {"--help"}, 0, "usage: " + tool.program, ""});
        rows.push_back({name + "Version",
                        tool.path,
                        tool.program,
                        {"--version"},
                        0,
                        tool.program + " " + version + "\n",
                        ""});
        rows.push_back({name + "UnknownOption",
                        tool.path,
                        tool.program,
                        {"x", "--bogus"},
                        2,
                        "",
                        "unknown option --bogus"});
        rows.push_back({name + "MissingValue",
                        tool.path,
                        tool.program,
                        {"x", tool.valued},
                        2,
                        "",
                        tool.valued + " needs a value"});
        if (!tool.conflicting.empty()) {
            rows.push_back({name + "Conflict", tool.path, tool.program, tool.conflicting, 2, "",
                            tool.conflict});
        }
    }
    rows.push_back(
        {"FleetHelp", fleetTool(), "velmora-fleet", {"--help"}, 0, "usage: velmora-fleet", ""});
    rows.push_back({"FleetVersion",
                    fleetTool(),
                    "velmora-fleet",
                    {"--version"},
                    0,
                    "velmora-fleet " + version + "\n",
                    ""});
    rows.push_back({"FleetUnknownOption",
                    fleetTool(),
                    "velmora-fleet",
                    {"--config-dir", "a", "-o", "o", "s", "--bogus"},
                    2,
                    "",
                    "velmora-fleet: error: unrecognized arguments: --bogus"});
    rows.push_back({"FleetMissingValue",
                    fleetTool(),
                    "velmora-fleet",
                    {"--config-dir", "a", "s", "-o"},
                    2,
                    "",
                    "velmora-fleet: error: argument -o/--out: expected one argument"});
    return rows;
}

INSTANTIATE_TEST_SUITE_P(Rows, ToolConventionTest, ::testing::ValuesIn(conventionRows()),
                         [](const ::testing::TestParamInfo<ConventionRow>& info) {
                             std::string name = info.param.name;
                             name.erase(std::remove(name.begin(), name.end(), '-'), name.end());
                             return name;
                         });

struct UsageRow {
    const char* name;
    std::string tool;
    std::vector<std::string> args;
    std::string message;  // a part of what is said on stderr
};

void PrintTo(const UsageRow& row, std::ostream* os) {
    *os << row.name;
}

class UsageErrorTest : public ::testing::TestWithParam<UsageRow> {};

// A command line that cannot be run: status 2 for every tool, said on stderr, nothing on stdout
// and nothing written.
TEST_P(UsageErrorTest, ExitsTwoAndSaysWhy) {
    const UsageRow& row = GetParam();
    const std::string cwd = scratchDir("usage");
    std::vector<std::string> argv = {row.tool};
    argv.insert(argv.end(), row.args.begin(), row.args.end());
    const ToolResult result = ToolRun::run(argv, cwd);
    EXPECT_EQ(2, result.status) << result.err;
    EXPECT_NE(std::string::npos, result.err.find(row.message)) << result.err;
    EXPECT_EQ("", result.out);
    EXPECT_EQ(std::vector<std::string>{}, entries(cwd));
}

INSTANTIATE_TEST_SUITE_P(
    Rows, UsageErrorTest,
    ::testing::Values(
        UsageRow{
            "ReplayUnknownOption", replayTool(), {"--fsat", "t.trace"}, "unknown option --fsat"},
        UsageRow{"ReplayNoTrace", replayTool(), {"--fast"}, "usage: velmora-replay"},
        UsageRow{"ReplayTwoTraces", replayTool(), {"a.trace", "b.trace"}, "more than one trace"},
        UsageRow{"ReplayOptionWithoutValue",
                 replayTool(),
                 {"t.trace", "--timeline"},
                 "--timeline needs a value"},
        UsageRow{"ReplayMalformedSpeed",
                 replayTool(),
                 {"--speed", "fast", "t.trace"},
                 "malformed speed 'fast'"},
        UsageRow{"ReplayFastWithSpeed",
                 replayTool(),
                 {"--fast", "--speed", "4", "t.trace"},
                 "--fast and --speed exclude each other"},
        UsageRow{"ReplayKeepRootWithRoot",
                 replayTool(),
                 {"--keep-root", "--root", "d", "t.trace"},
                 "--keep-root is for the default device"},
        UsageRow{"ReplayPropertyWithoutValue",
                 replayTool(),
                 {"--property", "k", "t.trace"},
                 "--property wants KEY=VALUE"},
        UsageRow{"LintUnknownOption", lintTool(), {"--explian", "c.xml"}, "unknown option"},
        UsageRow{"LintNoConfiguration", lintTool(), {}, "no configuration file given"},
        UsageRow{"LogcatUnknownOption",
                 logcatTool(),
                 {"--in", "a.log", "-o", "t.trace"},
                 "unknown option --in"},
        UsageRow{"LogcatNoOutput", logcatTool(), {"a.log"}, "no trace to write (-o TRACE)"},
        UsageRow{"LogcatTwoLogs",
                 logcatTool(),
                 {"a.log", "b.log", "-o", "t.trace"},
                 "more than one log given (a.log, b.log)"},
        UsageRow{"ReplayCompareOnlyAlone",
                 replayTool(),
                 {"--compare-only", "t.trace"},
                 "--compare-only needs --compare"},
        UsageRow{
            "TracegenUnknownOption", tracegenTool(), {"--seeed", "4"}, "unknown option --seeed"},
        UsageRow{"TracegenNotANumber", tracegenTool(), {"--seed", "x"}, "not a number: 'x'"},
        UsageRow{"TracegenNoValue", tracegenTool(), {"--seed"}, "--seed needs a value"},
        UsageRow{"TracegenGapBelowOne",
                 tracegenTool(),
                 {"--mean-gap-ms", "0"},
                 "--mean-gap-ms is at least 1"}),
    [](const ::testing::TestParamInfo<UsageRow>& info) { return std::string(info.param.name); });

}  // namespace
}  // namespace clitest
}  // namespace velmora
