// One broken configuration per finding, read from tests/lint/findings.txt (its head says how a
// row is written): the exact lines velmora-lint prints and its exit status.
#include <gtest/gtest.h>

#include <fstream>
#include <string>
#include <vector>

#include "tests/lint/LintTestSupport.h"

namespace velmora {
namespace {

using linttest::configFile;
using linttest::runLint;
using linttest::withBase;

struct Row {
    std::string name;
    std::string config;
    std::vector<std::string> expected;  // every line printed, in order
    int status = -1;
};

std::vector<Row> readRows() {
    std::vector<Row> rows;
    std::ifstream in(VELMORA_SOURCE_DIR "/tests/lint/findings.txt");
    bool inConfig = false;
    for (std::string line; std::getline(in, line);) {
        if (line.empty() || line[0] == '#') {
            continue;
        }
        if (line.compare(0, 3, "== ") == 0) {
            const size_t space = line.rfind(' ');
            rows.push_back({line.substr(3, space - 3), "", {}, std::stoi(line.substr(space))});
            inConfig = true;
        } else if (rows.empty()) {
            ADD_FAILURE() << "findings.txt: a line before the first row: " << line;
        } else if (inConfig && line == "--") {
            inConfig = false;
        } else if (inConfig) {
            rows.back().config += line + "\n";
        } else {
            rows.back().expected.push_back(line);
        }
    }
    for (Row& row : rows) {
        if (row.config.compare(0, 6, "@base\n") == 0) {
            row.config = withBase(row.config.substr(6));
        }
    }
    return rows;
}

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

// A lost or mangled findings file would otherwise just leave the table empty.
TEST(LintFindingsFile, HoldsEveryRow) {
    EXPECT_GE(readRows().size(), 38u);
}

INSTANTIATE_TEST_SUITE_P(Rows, LintDiagnosticsTest, testing::ValuesIn(readRows()),
                         [](const testing::TestParamInfo<Row>& info) { return info.param.name; });

}  // namespace
}  // namespace velmora
