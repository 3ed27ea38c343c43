// velmora-lint as a program: the example configuration, the --explain listing, --werror,
// findings in line order, and usage errors.
#include <gtest/gtest.h>

#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "tests/lint/LintTestSupport.h"
#include "tools/lint/LintCommand.h"

namespace velmora {
namespace {

using linttest::configFile;
using linttest::runLint;
using linttest::withBase;

const std::string kExample = VELMORA_SOURCE_DIR "/examples/xml/velmora_config_cust.xml";

// The dispatch of every command, then the findings, each with the server rule behind it.
TEST(LintCommandTest, ExplainListsEveryCommandsDispatchAndTheRulesBehindFindings) {
    const std::string config =
        "<policy>\n<cmd id=\"5376\" name=\"defaults\"><a><duration>0</duration>"
        "<group_hmp>10</group_hmp></a></cmd>\n<cmd id=\"4116\" name=\"probe\"><a>"
        "<duration>200</duration><big_min>1497600</big_min></a></cmd>\n"
        "<cmd id=\"4099\" name=\"cold\"><a><duration>1500</duration><big_min>2419200</big_min>"
        "</a><a><duration>10</duration></a></cmd>\n"
        "<cmd id=\"4118\" name=\"video\"><a><big_max>1804800</big_max></a></cmd>\n"
        "<cmd id=\"4224\" name=\"gov\"><a><priority>50</priority>"
        "<big_governor>performance</big_governor></a></cmd>\n"
        "<cmd id=\"12300\" name=\"floor\"><a><duration>0</duration><big_min>1209600</big_min>"
        "<ddr_min>800000000</ddr_min></a></cmd>\n"
        "<cmd id=\"4100\" name=\"off\"><a><duration>-1</duration></a></cmd>\n</policy>\n";
    const auto result = runLint({"--explain"}, configFile(config));
    const std::vector<std::string> expected = {
        "5376 defaults (line 2): start-up levels, duration 0, 1 pair",
        "    group_hmp(50)=10",
        "    -> sent at start-up: records the default group levels",
        "4116 probe (line 3): probe boost, duration 200, 1 pair",
        "    big_min(4)=1497600",
        "    -> probed threads get the pairs for 200 ms; a message that does not begin "
        "\"pid=<n>\" is answered with 0, as if it had worked, and boosts nothing",
        "4099 cold (line 4): timed action, duration 1500, 1 pair",
        "    big_min(4)=2419200",
        "    + 1 further action(s) passed along with it, never dispatched on their own",
        "    -> the platform applies the pairs and reverts them after 1500 ms; the launch policy "
        "\"cold\" may replace the duration",
        "4118 video (line 5): special scene, priority 100, duration 0, 1 pair",
        "    big_max(5)=1804800",
        "    -> payload 0/-1 switches the scene on/off; the highest priority on is applied",
        "4224 gov (line 6): governor scene, priority 50, duration 0, 2 pairs",
        "    priority=\"50\" big_governor=\"performance\"",
        "    -> payload 0/-1 switches the scene on/off; the highest priority on is applied",
        "12300 floor (line 7): on/off, duration 0, 2 pairs",
        "    big_min(4)=1209600 ddr_min(10)=800000000",
        "    -> payload 0/-1 sets/clears frequency limits as client 12300; tag 10 goes to the "
        "platform's own action",
        "4100 off (line 8): disabled, duration -1, 0 pairs",
        "    -> events do nothing and return 0",
        "F:3: warning: probe duration 200 ms is capped to 100 at start-up but used as "
        "configured after a reload",
        "    the probe worker clamps the duration of the probe action it is built with to 100 ms; "
        "a reload hands it the newly parsed action unchanged, so the same configuration boosts "
        "probed threads longer after a reload than after start-up.",
        "F:8: note: command 4100 is disabled (duration -1): its events do nothing",
    };
    EXPECT_EQ(result.outLines(), expected) << result.out;
}

// Exit status by the worst finding, and --werror turning warnings (not notes) into status 1. A
// clean configuration: lint.example_config_is_clean.
TEST(LintCommandTest, ExitStatusFollowsTheWorstFinding) {
    struct Row {
        const char* name;
        std::string body;
        int plain;
        int werror;
    };
    const Row rows[] = {
        {"NoteOnly", "<cmd id=\"4099\"><a><duration>-5</duration></a></cmd>\n", 0, 0},
        {"Warning", "<cmd id=\"4099\"><a><duration>5</duration><bogus>1</bogus></a></cmd>\n", 0, 1},
        {"ErrorBeatsWarning",
         "<cmd id=\"4099\"><a><duration>5</duration><bogus>1</bogus></a></cmd>\n<cmd/>\n", 2, 2},
    };
    for (const Row& row : rows) {
        const std::string path = configFile(withBase(row.body));
        EXPECT_EQ(runLint({}, path).status, row.plain) << row.name;
        EXPECT_EQ(runLint({"--werror"}, path).status, row.werror) << row.name;
    }
}

TEST(LintCommandTest, FindingsComeInLineOrder) {
    // The missing start-up command is found last but concerns line 1; the duplicate's note
    // stays with its warning although it names an earlier line.
    const std::string config =
        "<policy>\n"
        "<cmd id=\"4116\"><a><duration>50</duration></a></cmd>\n"
        "<cmd id=\"4099\"><a><duration>5</duration><bogus>1</bogus></a></cmd>\n"
        "<cmd id=\"4116\"><a><duration>60</duration></a></cmd>\n"
        "</policy>\n";
    const auto result = runLint({}, configFile(config));
    const std::vector<std::string> expected = {
        "F:1: error: no start-up command 5376: the server's init fails (status 2) and the server "
        "never runs",
        "F:3: warning: unknown parameter <bogus> in command 4099: the host conversion leaves it "
        "out",
        "F:4: warning: duplicate command id 4116: the first definition wins, this one is ignored",
        "F:2: note: the first definition of command 4116 is here",
    };
    EXPECT_EQ(result.outLines(), expected) << result.out;
}

// Usage errors: a message on stderr naming the problem, nothing on stdout, status 2.
TEST(LintCommandTest, UsageErrorsFailWithAMessage) {
    const std::string config = configFile(withBase(""));
    const std::string dir = config.substr(0, config.rfind('/'));
    const std::pair<std::vector<std::string>, std::string> rows[] = {
        {{}, "velmora-lint: no configuration file given"},
        {{dir + "/none.xml"}, "velmora-lint: " + dir + "/none.xml: No such file or directory"},
        // A configuration given as the device profile.
        {{"--device", config, config},
         "velmora-lint: " + config + ":1: the top-level element must be <device>"},
        // A profile whose energy table lists an OPP twice.
        {{"--device", dir + "/twin-opp.xml", config},
         "velmora-lint: " + dir +
             "/twin-opp.xml:4: OPP 200 of energy table 'cpu' is listed twice (first on line 3)"},
    };
    std::ofstream(dir + "/twin-opp.xml")
        << "<device>\n<frequencies id=\"cpu\">100 200</frequencies>\n"
           "<energy id=\"cpu\" cpus=\"1\"><opp freq=\"100\" mw=\"1\"/><opp freq=\"200\" "
           "mw=\"2\"/>\n<opp freq=\"200\" mw=\"2\"/></energy>\n"
           "<node key=\"cpu.min\" kind=\"floor\" path=\"x\"/>\n</device>\n";
    for (const auto& row : rows) {
        std::ostringstream out;
        std::ostringstream err;
        EXPECT_EQ(LintCommand::run(row.first, out, err), LintCommand::kUsageError) << row.second;
        EXPECT_EQ(out.str(), "");
        EXPECT_EQ(err.str().substr(0, err.str().find('\n')), row.second);
    }
}

TEST(LintCommandTest, HelpGoesToStdoutWithStatusZero) {
    const auto result = runLint({"--help"}, "unread.xml");
    EXPECT_EQ(result.status, 0);
    EXPECT_EQ(result.out.rfind("usage: velmora-lint", 0), 0u);
    EXPECT_EQ(result.err, "");
}

}  // namespace
}  // namespace velmora
