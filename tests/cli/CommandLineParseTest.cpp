// CommandLine, the parser every tool reads its arguments with: values given apart, with '=' or
// joined to a short option, prefixes, repeats, operands and "--", and each usage error with its
// one line and hint. All rows go through one CommandLine: each parse starts afresh.
#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <vector>

#include "tools/common/CommandLine.h"

namespace velmora {
namespace {

constexpr int kGoOn = -1;

struct ParseRow {
    const char* name;
    std::vector<std::string> args;
    int status;        // kGoOn when parse() says go on
    std::string seen;  // what was parsed, as shown(); or the first line on stderr
};

void PrintTo(const ParseRow& row, std::ostream* os) {
    *os << row.name;
}

const char* const kOptions[] = {"--speed", "--fast",    "--config-dir",
                                "-o",      "--compare", "--compare-only"};

CommandLine& sampleLine() {
    static CommandLine line = [] {
        CommandLine made("velmora-x", "usage: velmora-x [options] TRACE\n");
        made.value("--speed")
            .flag("--fast")
            .repeatable("--config-dir")
            .value("-o")
            .value("--compare")
            .flag("--compare-only", 'c')
            .excludes("--fast", "--speed")
            .needs("--compare-only", "--compare", "--compare-only needs --compare B");
        return made;
    }();
    return line;
}

// "--speed=4 --config-dir=a,b | t" for what `line` holds.
std::string shown(const CommandLine& line) {
    std::string text;
    for (const char* name : kOptions) {
        if (!line.has(name)) {
            continue;
        }
        text += std::string(text.empty() ? "" : " ") + name;
        const std::vector<std::string>& values = line.values(name);
        for (size_t i = 0; i < values.size(); ++i) {
            text += (i == 0 ? "=" : ",") + values[i];
        }
    }
    text += text.empty() ? "|" : " |";
    for (const std::string& operand : line.operands()) {
        text += " " + operand;
    }
    return text;
}

class CommandLineParseTest : public ::testing::TestWithParam<ParseRow> {};

TEST_P(CommandLineParseTest, ReadsTheLineOrSaysWhatIsWrong) {
    const ParseRow& row = GetParam();
    CommandLine& line = sampleLine();
    std::ostringstream out;
    std::ostringstream err;
    const bool goOn = line.parse(row.args, out, err);
    EXPECT_EQ(row.status, goOn ? kGoOn : line.status());
    if (row.status == kGoOn) {
        EXPECT_EQ(row.seen, shown(line));
        EXPECT_EQ("", out.str() + err.str());
    } else if (row.status == CommandLine::kUsageError) {
        EXPECT_EQ("velmora-x: " + row.seen + "\nTry 'velmora-x --help'.\n", err.str());
        EXPECT_EQ("", out.str());
    } else {
        EXPECT_EQ(row.seen, out.str());
        EXPECT_EQ("", err.str());
    }
}

INSTANTIATE_TEST_SUITE_P(
    Rows, CommandLineParseTest,
    ::testing::Values(
        ParseRow{"ValueApart", {"--speed", "4", "t"}, kGoOn, "--speed=4 | t"},
        ParseRow{"ValueAfterEquals", {"--speed=4", "t"}, kGoOn, "--speed=4 | t"},
        ParseRow{"EmptyValueAfterEquals", {"--speed=", "t"}, kGoOn, "--speed= | t"},
        ParseRow{"ShortValueApart", {"-o", "f"}, kGoOn, "-o=f |"},
        ParseRow{"ShortValueJoined", {"-of"}, kGoOn, "-o=f |"},
        ParseRow{"ShortAliasOfALongFlag",
                 {"-c", "--compare", "b"},
                 kGoOn,
                 "--compare=b --compare-only |"},
        ParseRow{"UniquePrefix", {"--spe", "4"}, kGoOn, "--speed=4 |"},
        ParseRow{"ExactNameBeforeLongerOne", {"--compare", "b"}, kGoOn, "--compare=b |"},
        ParseRow{"RepeatableKeepsOrder",
                 {"--config-dir", "a", "--config-dir=b"},
                 kGoOn,
                 "--config-dir=a,b |"},
        ParseRow{"FlagTwiceIsStillGiven", {"--fast", "--fast"}, kGoOn, "--fast |"},
        ParseRow{"OptionsAndOperandsMixed", {"a", "--fast", "b"}, kGoOn, "--fast | a b"},
        ParseRow{"DashIsAnOperand", {"-"}, kGoOn, "| -"},
        ParseRow{"DoubleDashEndsOptions", {"--", "--fast", "-o"}, kGoOn, "| --fast -o"},
        ParseRow{"ValueMayLookLikeAnOption", {"--speed", "--fast"}, kGoOn, "--speed=--fast |"},
        ParseRow{"Nothing", {}, kGoOn, "|"},
        ParseRow{"UnknownLong", {"--fsat", "t"}, 2, "unknown option --fsat"},
        ParseRow{"UnknownLongWithValue", {"--fsat=1"}, 2, "unknown option --fsat"},
        ParseRow{"UnknownShort", {"-z"}, 2, "unknown option -z"},
        ParseRow{"AmbiguousPrefix",
                 {"--comp", "b"},
                 2,
                 "ambiguous option --comp (--compare, --compare-only)"},
        ParseRow{"MissingValueAtTheEnd", {"t", "--speed"}, 2, "--speed needs a value"},
        ParseRow{"MissingShortValue", {"-o"}, 2, "-o needs a value"},
        ParseRow{"ValueGivenToAFlag", {"--fast=yes"}, 2, "--fast takes no value"},
        ParseRow{"SingleValueGivenTwice",
                 {"--speed", "1", "--speed=2"},
                 2,
                 "--speed given twice ('1', '2')"},
        ParseRow{
            "Conflicting", {"--speed", "2", "--fast"}, 2, "--fast and --speed exclude each other"},
        ParseRow{"NeedsItsPartner", {"--compare-only", "t"}, 2, "--compare-only needs --compare B"},
        ParseRow{"ErrorBeforeHelpWins", {"--bogus", "--help"}, 2, "unknown option --bogus"},
        ParseRow{"HelpToStdout", {"--help", "--bogus"}, 0, "usage: velmora-x [options] TRACE\n"},
        ParseRow{"ShortHelp", {"-h"}, 0, "usage: velmora-x [options] TRACE\n"},
        ParseRow{
            "Version", {"t", "--version"}, 0, std::string("velmora-x ") + VELMORA_VERSION + "\n"}),
    [](const ::testing::TestParamInfo<ParseRow>& info) { return std::string(info.param.name); });

// What the tool finds wrong itself is said the same way.
TEST(CommandLineProblemTest, ToolsOwnUsageErrorHasTheHint) {
    EXPECT_EQ("velmora-x: malformed speed 'q'\nTry 'velmora-x --help'.\n",
              sampleLine().problem("malformed speed 'q'"));
}

}  // namespace
}  // namespace velmora
