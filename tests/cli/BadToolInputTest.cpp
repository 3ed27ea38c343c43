// The tools on a file they must not read: a directory, binary content, a file over the size a
// tool reads. Each is refused before it is read, with one line that names the file and never
// quotes its bytes, a nonzero status, and nothing written. docs/bad-input.md lists the rows.
#include <gtest/gtest.h>
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <functional>
#include <string>
#include <vector>

#include "tests/cli/ToolRun.h"
#include "tools/common/InputFile.h"

namespace velmora {
namespace clitest {
namespace {

enum class Tool { Replay, Compare, Logcat, Lint };

struct BadFileRow {
    const char* name;
    Tool tool;
    // Makes the bad input in `dir` and returns its path.
    std::function<std::string(const std::string& dir)> make;
    int status;
    std::string message;    // what the one line says after the file's name
    bool onStdout = false;  // velmora-lint reports findings on stdout
};

// Rows print as their name: ctest lists the cases by it.
void PrintTo(const BadFileRow& row, std::ostream* os) {
    *os << row.name;
}

std::string withContent(const std::string& dir, const std::string& content) {
    writeFile(dir + "/input", content);
    return dir + "/input";
}

// A file of `bytes` that takes no disk space: refused by its size, it is never read.
std::string sparse(const std::string& dir, long long bytes) {
    const std::string path = dir + "/input";
    writeFile(path, "");
    EXPECT_EQ(0, truncate(path.c_str(), bytes));
    return path;
}

std::string subdirectory(const std::string& dir) {
    const std::string path = dir + "/input.d";
    EXPECT_TRUE(std::filesystem::create_directory(path));
    return path;
}

const std::string kTraceText = "@100 event 4099 0\n";
const std::string kLogText =
    "01-02 03:04:05.678  1000  1001 D velmora server: velmoraEvent cmdId=4099, payload=0\n";
const long long kOverCap = InputFile::kMaxBytes + 1;

class BadToolInputTest : public ::testing::TestWithParam<BadFileRow> {};

TEST_P(BadToolInputTest, RefusedWithOneLineNamingTheFile) {
    const BadFileRow& row = GetParam();
    const std::string dir = scratchDir("bad-input");
    const std::string input = row.make(dir);
    const std::string trace = dir + "/out.trace";
    std::vector<std::string> argv;
    switch (row.tool) {
        case Tool::Replay:
            argv = {replayTool(), "--fast", "--quiet", "--config-dir", examplesDir(), input};
            break;
        case Tool::Compare:
            argv = {replayTool(),  "--fast",    "--quiet", "--config-dir",
                    examplesDir(), "--compare", input,     examplesDir() + "/minute.trace"};
            break;
        case Tool::Logcat:
            argv = {logcatTool(), input, "-o", trace};
            break;
        case Tool::Lint:
            argv = {lintTool(), input};
            break;
    }
    const std::vector<std::string> before = entries(dir);
    const ToolResult result = ToolRun::run(argv, dir, {"TMPDIR=" + dir});
    EXPECT_EQ(row.status, result.status) << result.out << result.err;
    const std::string& said = row.onStdout ? result.out : result.err;
    EXPECT_EQ(1, std::count(said.begin(), said.end(), '\n')) << said;
    EXPECT_NE(std::string::npos, said.find(input)) << said;
    EXPECT_NE(std::string::npos, said.find(row.message)) << said;
    for (const char c : result.out + result.err)
        EXPECT_TRUE(c == '\n' || (c >= 0x20 && c < 0x7f)) << "a raw byte echoed: " << said;
    EXPECT_EQ(before, entries(dir));  // no trace, no device, no scratch file left
}

INSTANTIATE_TEST_SUITE_P(
    Rows, BadToolInputTest,
    ::testing::Values(
        BadFileRow{"ReplayDirectory", Tool::Replay, subdirectory, 1, " is a directory, not a file"},
        BadFileRow{"ReplayNulByte", Tool::Replay,
                   [](const std::string& d) {
                       return withContent(d, kTraceText + std::string("\0\x01\x02 event", 9));
                   },
                   1, " is binary, not text (a NUL byte at offset 18)"},
        BadFileRow{"ReplayNotUtf8", Tool::Replay,
                   [](const std::string& d) { return withContent(d, "\xff\xfe@1 reload\n"); }, 1,
                   " is binary, not text (a byte that is not UTF-8 at offset 0)"},
        BadFileRow{"ReplayOverTheCap", Tool::Replay,
                   [](const std::string& d) { return sparse(d, kOverCap); }, 1,
                   " is 268435457 bytes, more than the 268435456 (256 MiB) a file may have here"},
        BadFileRow{"CompareDirectoryWithoutConfiguration", Tool::Compare, subdirectory, 2,
                   " does not load: no configuration in"},
        BadFileRow{"CompareNothingThere", Tool::Compare,
                   [](const std::string& d) { return d + "/none.xml"; }, 2,
                   " does not load: no such file or directory"},
        BadFileRow{"LogcatDirectory", Tool::Logcat, subdirectory, 1, " is a directory, not a file"},
        BadFileRow{"LogcatNulByte", Tool::Logcat,
                   [](const std::string& d) { return withContent(d, kLogText + '\0' + kLogText); },
                   1, " is binary, not text (a NUL byte at offset"},
        BadFileRow{"LogcatNotUtf8", Tool::Logcat,
                   [](const std::string& d) {
                       return withContent(d, kLogText + "\xc3\x28 velmora server\n");
                   },
                   1, " is binary, not text (a byte that is not UTF-8 at offset"},
        BadFileRow{"LogcatOverTheCap", Tool::Logcat,
                   [](const std::string& d) { return sparse(d, kOverCap); }, 1,
                   " more than the 268435456 (256 MiB) a file may have here"},
        BadFileRow{"LintOverSixteenMiB", Tool::Lint,
                   [](const std::string& d) { return sparse(d, 16LL * 1024 * 1024 + 1); }, 2,
                   ":1: error: the file is 16777217 bytes, more than the 16777216 (16 MiB) a "
                   "configuration may have: the server refuses it without reading it",
                   true}),
    [](const ::testing::TestParamInfo<BadFileRow>& info) { return std::string(info.param.name); });

// A text file is judged by its start only: a UTF-8 sequence cut by the end of what is looked at
// is text, a byte-order mark is text, overlong forms and surrogates are not.
TEST(InputFileTest, FirstBinaryByteKnowsUtf8) {
    bool nul = false;
    EXPECT_EQ(-1, InputFile::firstBinaryByte("\xef\xbb\xbf@1 reload\n", &nul));
    EXPECT_EQ(-1, InputFile::firstBinaryByte("caf\xc3\xa9 \xe2\x82", &nul));  // cut short
    EXPECT_EQ(3, InputFile::firstBinaryByte("abc\xc0\xaf", &nul));            // overlong '/'
    EXPECT_EQ(1, InputFile::firstBinaryByte("a\xed\xa0\x80", &nul));          // a surrogate
    EXPECT_EQ(0, InputFile::firstBinaryByte("\xf4\x90\x80\x80", &nul));       // above U+10FFFF
    EXPECT_FALSE(nul);
    EXPECT_EQ(2, InputFile::firstBinaryByte(std::string("ab\0c", 4), &nul));
    EXPECT_TRUE(nul);
}

TEST(InputFileTest, OnlyTheFirstKibibyteIsLookedAt) {
    const std::string dir = scratchDir("sniff");
    writeFile(dir + "/late", std::string(InputFile::kSniffBytes, 'a') + '\0');
    EXPECT_EQ("", InputFile::refusal(dir + "/late"));
    writeFile(dir + "/early", std::string(InputFile::kSniffBytes - 1, 'a') + '\0');
    EXPECT_EQ("is binary, not text (a NUL byte at offset 1023)",
              InputFile::refusal(dir + "/early"));
    EXPECT_EQ("is 1024 bytes, more than the 1000 a file may have here",
              InputFile::refusal(dir + "/early", 1000));
}

}  // namespace
}  // namespace clitest
}  // namespace velmora
