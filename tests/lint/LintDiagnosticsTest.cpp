// One broken configuration per finding: the exact lines velmora-lint prints and its exit status.
// Configurations built with withBase() have sound start-up and probe commands on lines 2 and 3,
// so each row shows only the finding it is about, at the line it names.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "tests/lint/LintTestSupport.h"

namespace velmora {
namespace {

using linttest::configFile;
using linttest::runLint;
using linttest::withBase;

struct Row {
    const char* name;
    std::string config;
    std::vector<std::string> expected;  // every line printed, in order
    int status;
};

const Row kRows[] = {
    // --- The document and the command elements, as the loader reads them.
    {"XmlSyntaxError",
     "<policy>\n<cmd id=\"4099\">\n</policy>\n",
     {"F:2: error: not well-formed XML: element <cmd> is not closed (expected </cmd> before the "
      "enclosing element ends); the server loads nothing from this file"},
     2},
    {"NoUsableIdAtAll",
     "<policy>\n<cmd name=\"a\"/>\n</policy>\n",
     {"F:1: error: no command has a usable id: the server loads nothing from this file",
      "F:2: error: command <cmd name=\"a\"> has no \"id\": the loader skips it"},
     2},
    {"DuplicateIdFirstWins",
     withBase("<cmd id=\"4099\" name=\"a\"><a><duration>10</duration></a></cmd>\n"
              "<cmd id=\"4099\" name=\"b\"><a><duration>20</duration></a></cmd>\n"),
     {"F:5: warning: duplicate command id 4099: the first definition wins, this one is ignored",
      "F:4: note: the first definition of command 4099 is here"},
     0},
    {"FourthActionIgnored",
     withBase("<cmd id=\"4099\" name=\"a\">\n<a><duration>10</duration></a>\n"
              "<a><duration>20</duration></a>\n<a><duration>30</duration></a>\n"
              "<a><duration>40</duration></a>\n</cmd>\n"),
     {"F:8: warning: command 4099 has 4 action elements: only the first three are read, this "
      "one and later ones are ignored"},
     0},
    {"ParameterWithoutTextDropsAction",
     withBase("<cmd id=\"4099\" name=\"a\">\n<a><duration>10</duration>\n<big_min/></a>\n"
              "<a><duration>20</duration></a>\n</cmd>\n"),
     {"F:6: error: parameter <big_min> of command 4099 has no text: the loader drops the whole "
      "action"},
     2},

    // --- What the host conversion leaves out.
    {"UnknownParameter",
     withBase("<cmd id=\"4099\" name=\"a\"><a><duration>10</duration>\n"
              "<big_mn>1497600</big_mn></a></cmd>\n"),
     {"F:5: warning: unknown parameter <big_mn> in command 4099: the host conversion leaves it "
      "out; did you mean <big_min>?"},
     0},

    // --- Start-up, probe, scheduling-level, on/off and scene commands.
    {"NoProbeCommand",
     "<policy>\n<cmd id=\"5376\"><a><duration>0</duration><group_hmp>0</group_hmp></a></cmd>\n"
     "</policy>\n",
     {"F:1: error: no probe command 4116: the server's init stops early (status 4), probe events "
      "fail and configured scene priorities are never read"},
     2},

    {"SchedLevelForeignTag",
     withBase("<cmd id=\"4101\"><a><duration>0</duration>\n<big_min>1497600</big_min>"
              "</a></cmd>\n"),
     {"F:5: error: duration-0 command 4101 carries <big_min> (tag 4): scheduling-level events "
      "take only group tags 50..58; every event fails (status 3)"},
     2},
    {"OnOffFloorAboveCap",
     withBase("<cmd id=\"13568\"><a><duration>0</duration><gpu_max>600000000</gpu_max>\n"
              "<gpu_min>700000000</gpu_min></a></cmd>\n"),
     {"F:5: error: on/off command 13568: floor <gpu_min> 700000000 is above the cap <gpu_max> "
      "600000000; switching it on fails (-1)"},
     2},

    // --- Values the example device takes otherwise or refuses.
    {"KhzFigureInAnHzNode",
     withBase("<cmd id=\"4099\"><a><duration>100</duration>\n<gpu_max>600000</gpu_max>"
              "</a></cmd>\n"),
     {"F:5: error: <gpu_max> '600000' of command 4099: 600000 is below the lowest frequency "
      "257000000 Hz of gpu.max, the device refuses the write",
      "F:5: note: 600000 is about 1000 times below the node's range: a kHz figure? gpu.max takes "
      "Hz"},
     2},
    {"GovernorTheDeviceLacks",
     withBase("<cmd id=\"4230\"><a><priority>40</priority>\n"
              "<big_governor>performace</big_governor></a></cmd>\n"),
     {"F:5: error: <big_governor> 'performace' of command 4230: the device has no governor "
      "'performace' of cpu.big.governor, the device refuses the write",
      "F:5: note: did you mean 'performance'? the device offers schedutil, performance, "
      "powersave"},
     2},

};

void PrintTo(const Row& row, std::ostream* os) {
    *os << row.name;
}

class LintDiagnosticsTest : public testing::TestWithParam<Row> {};

TEST_P(LintDiagnosticsTest, PrintsExactlyTheFinding) {
    const Row& row = GetParam();
    const auto result = runLint({}, configFile(row.config));
    EXPECT_EQ(result.outLines(), row.expected) << result.out;
    EXPECT_EQ(result.status, row.status);
    EXPECT_EQ(result.err, "");
}

INSTANTIATE_TEST_SUITE_P(Rows, LintDiagnosticsTest, testing::ValuesIn(kRows),
                         [](const testing::TestParamInfo<Row>& info) { return info.param.name; });

}  // namespace
}  // namespace velmora
