// One broken configuration per finding: the exact lines velmora-lint prints and its exit status.
// Configurations built with withBase() have sound start-up and probe commands on lines 2 and 3,
// so each row shows only the finding it is about, at the line it names.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "tests/lint/LintTestSupport.h"

namespace velmora {
namespace {

using linttest::runLint;
using linttest::ScratchDir;
using linttest::withBase;

struct Row {
    const char* name;
    std::string config;
    std::vector<std::string> expected;  // every line printed, in order
    int status;
};

std::string manyPairs(const char* name, int count, const char* value = "1209600") {
    std::string params;
    for (int i = 0; i < count; ++i) {
        params += std::string("<") + name + ">" + value + "</" + name + ">";
    }
    return params;
}

const Row kRows[] = {
    // --- The document and the command elements, as the loader reads them.
    {"XmlSyntaxError",
     "<policy>\n<cmd id=\"4099\">\n</policy>\n",
     {"F:2: error: not well-formed XML: element <cmd> is not closed (expected </cmd> before the "
      "enclosing element ends); the server loads nothing from this file"},
     2},
    {"RootIsNotPolicy",
     "<?xml version=\"1.0\"?>\n<config>\n<cmd id=\"4099\"/>\n</config>\n",
     {"F:2: error: the top-level element is <config>, not <policy>: the server loads nothing "
      "from this file"},
     2},
    {"EmptyPolicy",
     "<policy>\n  <!-- nothing yet -->\n</policy>\n",
     {"F:1: error: <policy> has no command element: the server loads nothing from this file"},
     2},
    {"NoUsableIdAtAll",
     "<policy>\n<cmd name=\"a\"/>\n</policy>\n",
     {"F:1: error: no command has a usable id: the server loads nothing from this file",
      "F:2: error: command <cmd name=\"a\"> has no \"id\": the loader skips it"},
     2},
    {"MissingId",
     withBase("<cmd name=\"boost\"><a><duration>10</duration></a></cmd>\n"),
     {"F:4: error: command <cmd name=\"boost\"> has no \"id\": the loader skips it"},
     2},
    {"HexadecimalId",  // tinyxml2 would read it; the loader takes decimal text only
     withBase("<scene id=\"0x1016\" name=\"game\"><a><duration>10</duration></a></scene>\n"),
     {"F:4: error: command <scene name=\"game\"> has id \"0x1016\", which is not a decimal "
      "integer: the loader skips it"},
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
    {"IdBelowFour",
     withBase("<cmd id=\"3\" name=\"a\"><a><duration>10</duration></a></cmd>\n"),
     {"F:4: warning: command id 3 is below 4: the platform cannot tell it from the client ids "
      "0..3 (feature switch, KX, JN, ZOLA)"},
     0},

    // --- What the host conversion leaves out.
    {"UnknownParameter",
     withBase("<cmd id=\"4099\" name=\"a\"><a><duration>10</duration>\n"
              "<big_mn>1497600</big_mn></a></cmd>\n"),
     {"F:5: warning: unknown parameter <big_mn> in command 4099: the host conversion leaves it "
      "out; did you mean <big_min>?"},
     0},
    {"ValueNotAnInteger",
     withBase("<cmd id=\"4099\" name=\"a\"><a><duration>10</duration>\n"
              "<big_min>1.5GHz</big_min></a></cmd>\n"),
     {"F:5: warning: <big_min> value '1.5GHz' of command 4099 is not an integer: left out"},
     0},
    {"DurationNotAnInteger",  // the command becomes a duration-0 one
     withBase("<cmd id=\"4101\" name=\"a\"><a><duration>1s</duration>\n"
              "<group_top_app>20</group_top_app></a></cmd>\n"),
     {"F:4: warning: duration '1s' of command 4101 is not an integer: ignored, the duration "
      "stays 0"},
     0},

    // --- Start-up and probe commands.
    {"NoStartupCommand",
     "<policy>\n<cmd id=\"4116\"><a><duration>50</duration></a></cmd>\n</policy>\n",
     {"F:1: error: no start-up command 5376: the server's init fails (status 2) and the server "
      "never runs"},
     2},
    {"StartupSinglePairNotHmp",
     "<policy>\n<cmd id=\"5376\"><a><duration>0</duration>\n<group_vip>10</group_vip></a></cmd>\n"
     "<cmd id=\"4116\"><a><duration>50</duration></a></cmd>\n</policy>\n",
     {"F:3: error: start-up command 5376 with a single pair needs <group_hmp>, not <group_vip>: "
      "the server's init fails"},
     2},
    {"StartupTimed",
     "<policy>\n<cmd id=\"5376\"><a><duration>100</duration><group_hmp>0</group_hmp></a></cmd>\n"
     "<cmd id=\"4116\"><a><duration>50</duration></a></cmd>\n</policy>\n",
     {"F:2: error: start-up command 5376 needs duration 0, not 100: it runs as a timed action and "
      "init installs no default group levels"},
     2},
    {"NoProbeCommand",
     "<policy>\n<cmd id=\"5376\"><a><duration>0</duration><group_hmp>0</group_hmp></a></cmd>\n"
     "</policy>\n",
     {"F:1: error: no probe command 4116: the server's init stops early (status 4), probe events "
      "fail and configured scene priorities are never read"},
     2},
    {"ProbeWithTwoActions",
     "<policy>\n<cmd id=\"5376\"><a><duration>0</duration><group_hmp>0</group_hmp></a></cmd>\n"
     "<cmd id=\"4116\">\n<a><duration>50</duration></a>\n<a><duration>80</duration></a>\n</cmd>\n"
     "</policy>\n",
     {"F:5: warning: probe command 4116 has 2 actions: only the first is used"},
     0},
    {"ProbeLongerThanTheCap",
     "<policy>\n<cmd id=\"5376\"><a><duration>0</duration><group_hmp>0</group_hmp></a></cmd>\n"
     "<cmd id=\"4116\"><a>\n<duration>200</duration></a></cmd>\n</policy>\n",
     {"F:4: warning: probe duration 200 ms is capped to 100 at start-up but used as configured "
      "after a reload"},
     0},

    {"GovernorSceneUnderTheGameScene",
     withBase("<cmd id=\"4119\"><a><priority>200</priority></a></cmd>\n"
              "<cmd id=\"4300\"><a><priority>50</priority><gpu_governor>performance"
              "</gpu_governor></a></cmd>\n"),
     {"F:5: note: governor scene 4300 (priority 50) is applied under scene 4119 (priority 200): "
      "switched off while 4119 stays current, it is not withdrawn and its settings stay"},
     0},

    // --- Duration-0 (scheduling-level) commands.
    {"SchedLevelForeignTag",
     withBase("<cmd id=\"4101\"><a><duration>0</duration>\n<big_min>1497600</big_min>"
              "</a></cmd>\n"),
     {"F:5: error: duration-0 command 4101 carries <big_min> (tag 4): scheduling-level events "
      "take only group tags 50..58; every event fails (status 3)"},
     2},
    {"SchedLevelNinePairs",
     withBase("<cmd id=\"4101\"><a>\n<duration>0</duration>" + manyPairs("group_vip", 9, "10") +
              "</a></cmd>\n"),
     {"F:5: error: duration-0 command 4101 has 9 pairs: scheduling-level events take 1..8 group "
      "pairs; every event fails (status 3)"},
     2},

    // --- On/off commands.
    {"OnOffValueBelowOne",
     withBase("<cmd id=\"12288\"><a><duration>0</duration>\n<big_max>0</big_max></a></cmd>\n"),
     {"F:5: error: on/off command 12288: <big_max> value 0 is below 1; every switch fails (-1)"},
     2},
    {"OnOffFloorAboveCap",
     withBase("<cmd id=\"13568\"><a><duration>0</duration><gpu_max>600000000</gpu_max>\n"
              "<gpu_min>700000000</gpu_min></a></cmd>\n"),
     {"F:5: error: on/off command 13568: floor <gpu_min> 700000000 is above the cap <gpu_max> "
      "600000000; switching it on fails (-1)"},
     2},
    {"OnOffMoreThan43Pairs",
     withBase("<cmd id=\"12300\"><a><duration>0</duration>" + manyPairs("little_min", 43) +
              "\n<big_min>1</big_min></a></cmd>\n"),
     {"F:5: warning: command 12300 has more than 43 parameters: <big_min> and every later one "
      "are left out"},
     0},

    // --- Special scenes and their priorities.
    {"SceneWithoutPriority",
     withBase("<cmd id=\"4122\">\n<a><big_max>1804800</big_max></a></cmd>\n"),
     {"F:5: error: special scene 4122 has no priority (tag 101): every switch is refused (-1)"},
     2},
    {"ScenePriorityOutOfRangeKeepsBuiltIn",
     withBase("<cmd id=\"4118\"><a>\n<priority>600</priority></a></cmd>\n"),
     {"F:5: warning: special scene 4118 priority 600 is outside 1..500: ignored, the built-in "
      "priority 100 stays"},
     0},
    {"GovernorSceneWithoutPriority",  // an integer tag 101 does not count for governor scenes
     withBase("<cmd id=\"4300\">\n<a><tag_101>30</tag_101><big_governor>performance"
              "</big_governor></a></cmd>\n"),
     {"F:5: error: governor scene 4300 has no <priority>: every switch is refused (-1)"},
     2},
    {"LastSceneNeverGetsPriority",
     withBase("<cmd id=\"4352\"><a><priority>50</priority></a></cmd>\n"),
     {"F:4: error: governor scene 4352 never gets a configured priority (the server reads them up "
      "to 4351 only): every switch is refused (-1)"},
     2},

    // --- Values the example device takes otherwise or refuses.
    {"LevelOutsideTheDeviceRange",
     withBase("<cmd id=\"4101\"><a><duration>0</duration>\n<group_top_app>300</group_top_app>"
              "</a></cmd>\n"),
     {"F:5: error: <group_top_app> '300' of command 4101: 300 is outside -20..40 of "
      "sched.group.top_app, the device refuses the write"},
     2},
    {"FloorAboveTheTopFrequency",
     withBase("<cmd id=\"4099\"><a><duration>100</duration>\n<little_min>18048000</little_min>"
              "</a></cmd>\n"),
     {"F:5: error: <little_min> '18048000' of command 4099: 18048000 is above the top frequency "
      "1804800 kHz of cpu.little.min, the device refuses the write"},
     2},
    {"KhzFigureInAnHzNode",
     withBase("<cmd id=\"4099\"><a><duration>100</duration>\n<gpu_max>600000</gpu_max>"
              "</a></cmd>\n"),
     {"F:5: error: <gpu_max> '600000' of command 4099: 600000 is below the lowest frequency "
      "257000000 Hz of gpu.max, the device refuses the write",
      "F:5: note: 600000 is about 1000 times below the node's range: a kHz figure? gpu.max takes "
      "Hz"},
     2},
    {"FrequencyBetweenSteps",
     withBase("<cmd id=\"4099\"><a><duration>100</duration>\n<big_min>1500000</big_min>"
              "</a></cmd>\n"),
     {"F:5: note: <big_min> '1500000' of command 4099 lies between available frequencies of "
      "cpu.big.min: the kernel uses 1612800"},
     0},
    {"GovernorTheDeviceLacks",
     withBase("<cmd id=\"4230\"><a><priority>40</priority>\n"
              "<big_governor>performace</big_governor></a></cmd>\n"),
     {"F:5: error: <big_governor> 'performace' of command 4230: the device has no governor "
      "'performace' of cpu.big.governor, the device refuses the write",
      "F:5: note: did you mean 'performance'? the device offers schedutil, performance, "
      "powersave"},
     2},
    {"FloorAboveCapOfAnotherLimit",
     withBase(
         "<cmd id=\"12288\"><a><duration>0</duration>\n<big_max>1804800</big_max></a></cmd>\n"
         "<cmd id=\"4118\"><a><priority>100</priority>\n<big_min>2419200</big_min></a></cmd>\n"),
     {"F:7: warning: floor <big_min> 2419200 of command 4118 is above the cap <big_max> 1804800 "
      "of command 12288 (line 5), and both can be on at once: the cap wins"},
     0},

    // --- Commands that do nothing.
    {"DisabledCommandIsANote",
     withBase("<cmd id=\"4099\"><a>\n<duration>-1</duration></a></cmd>\n"),
     {"F:5: note: command 4099 is disabled (duration -1): its events do nothing"},
     0},
    {"CommandWithoutAction",
     withBase("<cmd id=\"4099\" name=\"cold\"/>\n"),
     {"F:4: warning: command 4099 has no usable action: its events do nothing"},
     0},
    {"IdNeverRead",
     withBase("<cmd id=\"20300\"><a><duration>10</duration></a></cmd>\n"),
     {"F:4: warning: command 20300 is never read: events with this id never read the "
      "configuration"},
     0},
};

void PrintTo(const Row& row, std::ostream* os) {
    *os << row.name;
}

class LintDiagnosticsTest : public testing::TestWithParam<Row> {};

TEST_P(LintDiagnosticsTest, PrintsExactlyTheFinding) {
    const Row& row = GetParam();
    ScratchDir dir;
    const auto result = runLint({}, dir.write("config.xml", row.config));
    EXPECT_EQ(result.outLines(), row.expected) << result.out;
    EXPECT_EQ(result.status, row.status);
    EXPECT_EQ(result.err, "");
}

INSTANTIATE_TEST_SUITE_P(Rows, LintDiagnosticsTest, testing::ValuesIn(kRows),
                         [](const testing::TestParamInfo<Row>& info) { return info.param.name; });

}  // namespace
}  // namespace velmora
