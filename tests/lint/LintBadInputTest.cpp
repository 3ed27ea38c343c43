// velmora-lint on files that are unusual rather than wrong: empty, a byte-order mark, CRLF line
// ends, XML nested deeper than the parser goes, and a configuration of 50,000 commands. The
// check of a file and of the same text given in memory (ConfigLinter::runText, what the fuzz
// target feeds) print the same findings.
#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <functional>
#include <sstream>
#include <ostream>
#include <string>

#include "tests/lint/LintTestSupport.h"
#include "tools/lint/ConfigLinter.h"

namespace velmora {
namespace {

using linttest::configFile;
using linttest::runLint;
using linttest::withBase;

std::string manyCommands(int count) {
    std::string body;
    for (int i = 0; i < count; ++i) {
        body += "<cmd id=\"" + std::to_string(30000 + i) +
                "\" name=\"c\"><a><duration>100</duration><big_min>1497600</big_min></a></cmd>\n";
    }
    return withBase(body);
}

std::string nested(int depth) {
    std::string text;
    for (int i = 0; i < depth; ++i)
        text += "<a>";
    for (int i = 0; i < depth; ++i)
        text += "</a>";
    return text;
}

struct BadConfigRow {
    const char* name;
    std::function<std::string()> text;
    int status;
    size_t lines;           // lines printed
    std::string firstLine;  // "" when nothing is printed
};

// Rows print as their name.
void PrintTo(const BadConfigRow& row, std::ostream* out) {
    *out << row.name;
}

class LintBadInputTest : public testing::TestWithParam<BadConfigRow> {};

TEST_P(LintBadInputTest, FileAndTextGiveTheSameFindings) {
    const BadConfigRow& row = GetParam();
    const std::string text = row.text();
    const auto fromFile = runLint({}, configFile(text));
    EXPECT_EQ(row.status, fromFile.status);
    const auto lines = fromFile.outLines();
    ASSERT_EQ(row.lines, lines.size()) << fromFile.out;
    if (!lines.empty()) {
        EXPECT_EQ(row.firstLine, lines.front());
    }

    LintOptions options;
    ConfigLinter linter("F", options);
    std::ostringstream out;
    EXPECT_EQ(row.status, linter.runText(text, out));
    EXPECT_EQ(fromFile.out, out.str());
}

INSTANTIATE_TEST_SUITE_P(
    Rows, LintBadInputTest,
    testing::Values(
        BadConfigRow{"EmptyFile", [] { return std::string(); }, 2, 1,
                     "F: error: not well-formed XML: the file holds no XML element (expected a "
                     "top-level element); the server loads nothing from this file"},
        BadConfigRow{"ByteOrderMark", [] { return "\xEF\xBB\xBF" + withBase(""); }, 0, 0, ""},
        BadConfigRow{"CrlfLineEnds",
                     [] {
                         std::string text = withBase(
                             "<cmd id=\"4099\" name=\"cold\"><a><duration>1500</duration>"
                             "<big_min>1497600</big_min></a></cmd>\n");
                         for (size_t at = text.find('\n'); at != std::string::npos;
                              at = text.find('\n', at + 2))
                             text.insert(at, "\r");
                         return text;
                     },
                     0, 0, ""},
        BadConfigRow{"DeepNesting", [] { return withBase(nested(100000)); }, 2, 1,
                     "F:4: error: not well-formed XML: the document is not well-formed XML; the "
                     "server loads nothing from this file"},
        // Every command was looked up by id in a list of all of them: a minute of checking for
        // a file the server loads at once.
        BadConfigRow{"FiftyThousandCommands", [] { return manyCommands(50000); }, 0, 50000,
                     "F:4: warning: command 30000 is never read: events with this id never "
                     "read the configuration"}),
    [](const testing::TestParamInfo<BadConfigRow>& info) { return std::string(info.param.name); });

// Seconds of the check of `text` given in memory; the best of `tries`.
double checkSeconds(const std::string& text, int tries) {
    double best = 1e9;
    for (int i = 0; i < tries; ++i) {
        const auto start = std::chrono::steady_clock::now();
        LintOptions options;
        ConfigLinter linter("F", options);
        std::ostringstream out;
        linter.runText(text, out);
        best = std::min(best, std::chrono::duration<double>(std::chrono::steady_clock::now() -
                                                            start).count());
    }
    return best;
}

// Eight times the commands may take eight times as long, not sixty-four (a lookup of every
// command in a list of all, the FiftyThousandCommands row).
TEST(LintBadInputTest, ACheckTakesTimeInProportionToTheCommands) {
    const double small = checkSeconds(manyCommands(10000), 3);
    const double large = checkSeconds(manyCommands(80000), 1);
    EXPECT_LT(large, 25 * small) << small << " s for 10,000 commands, " << large
                                 << " s for 80,000";
}

}  // namespace
}  // namespace velmora
