// velmora-replay --compare end to end: a trace replayed under a configuration and under a changed
// copy of it, checking where the comparison says the runs part (a call, or a timer at its own
// time), what it names when they do not part although the configurations differ, and how the
// changed configuration may be given (a file anywhere, a directory, its xml directory).
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <nlohmann/json.hpp>
#include <string>

#include "tests/host/HostTestSupport.h"
#include "tools/replay/ComparedConfig.h"
#include "tools/replay/ComparisonRun.h"

namespace velmora {
namespace {

const char* const kConfig = hosttest::kAnalysisConfig;

struct CompareRow {
    const char* what;
    const char* trace;
    const char* from;  // text of kConfig that configuration B changes
    const char* to;
    const char* cause;  // first_divergence.cause, "" when the runs never part
    double ms;          // first_divergence.ms
    const char* inB;    // part of first_divergence.b, or of an overriding line
};

void PrintTo(const CompareRow& row, std::ostream* os) {
    *os << row.what;
}

class ComparisonTest : public testing::TestWithParam<CompareRow> {};

TEST_P(ComparisonTest, TellsWhereAndWhyTheRunsPart) {
    const CompareRow& row = GetParam();
    const std::string dirA = hosttest::configDir("compare-a", kConfig);
    hosttest::writeFile(dirA + "/t.trace", row.trace);
    std::string config = kConfig;
    config.replace(config.find(row.from), std::string(row.from).size(), row.to);
    // B as a lone file: the comparison links it where the server looks.
    const std::string fileB = hosttest::makeScratchDir("compare-b") + "/changed.xml";
    hosttest::writeFile(fileB, config);
    ReplayOptions options = hosttest::replayOptions(dirA, dirA + "/t.trace");
    options.summaryJsonPath = dirA + "/comparison.json";
    FILE* out = tmpfile();
    ComparisonRun run(options, fileB, out, stderr);
    run.setCompareOnly(true);
    ASSERT_EQ(ReplaySession::kOk, run.run()) << row.what;
    const std::string text = hosttest::readAndClose(out);
    const auto json = nlohmann::json::parse(hosttest::readFile(dirA + "/comparison.json"));
    const auto& first = json["first_divergence"];
    if (std::string(row.cause).empty()) {
        EXPECT_TRUE(first.is_null()) << row.what;
        ASSERT_FALSE(json["overridden_by"].empty()) << row.what;
        EXPECT_NE(std::string::npos, json["overridden_by"][0].get<std::string>().find(row.inB))
            << row.what << ": " << json["overridden_by"];
        EXPECT_NE(std::string::npos, text.find("override the difference")) << text;
    } else {
        ASSERT_FALSE(first.is_null()) << row.what;
        EXPECT_EQ(row.cause, first["cause"]) << row.what;
        EXPECT_EQ(row.ms, first["ms"].get<double>()) << row.what;
        EXPECT_NE(std::string::npos, first["b"].get<std::string>().find(row.inB))
            << row.what << ": " << first["b"];
    }
    // Only the comparison was asked for: run A's summary is not printed.
    EXPECT_EQ(0u, text.find("comparison: A = ")) << text;
    EXPECT_EQ(std::string::npos, text.find("run A:")) << text;
}

INSTANTIATE_TEST_SUITE_P(
    Rows, ComparisonTest,
    testing::Values(
        CompareRow{"a value set by a call", "@0 setconfig 1 5=2016000\n@100 event 4099 0\n@2000\n",
                   "1804800", "1497600", "call", 100.0, "cpu.big.min=1497600"},
        // The launch ends at 1000 ms in B, at 1600 ms in A; the next call is at 3000 ms.
        CompareRow{"an action expiring earlier", "@100 event 4099 0\n@3000 event 4118 0\n",
                   "<duration>1500</duration><big_min>1804800",
                   "<duration>900</duration><big_min>1804800", "timed", 1000.0,
                   "4099 cold_launch expired after 900.000 ms (applied by"},
        CompareRow{"a launch duration a policy line prescribes",
                   "@0 event 20225 0x40000\n   policy cold 1200\n@100 event 4099 0\n@3000\n",
                   "<duration>1500</duration><big_min>1804800",
                   "<duration>900</duration><big_min>1804800", "", 0,
                   "t.trace:2: policy cold 1200"},
        CompareRow{"a command the trace never calls", "@100 event 4099 0\n@3000\n", "600000000",
                   "500000000", "", 0, "no event line names command 4118"}),
    [](const testing::TestParamInfo<CompareRow>& info) { return std::to_string(info.index); });

// The changed configuration as a directory, as its xml directory, or something else.
struct ConfigPathRow {
    const char* what;
    const char* given;  // relative to a directory holding xml/velmora_config_cust.xml
    bool found;         // the directory found is that one
    const char* error;  // part of the refusal
};

void PrintTo(const ConfigPathRow& row, std::ostream* os) {
    *os << row.what;
}

class ComparedConfigTest : public testing::TestWithParam<ConfigPathRow> {};

TEST_P(ComparedConfigTest, FindsTheConfiguration) {
    const ConfigPathRow& row = GetParam();
    const std::string root = hosttest::configDir("compared-config", kConfig);
    mkdir((root + "/empty").c_str(), 0755);
    const ComparedConfig config(root + row.given);
    if (!row.found) {
        EXPECT_TRUE(config.dir().empty()) << row.what;
        EXPECT_NE(std::string::npos, config.error().find(row.error)) << config.error();
        return;
    }
    EXPECT_EQ("", config.error()) << row.what;
    EXPECT_EQ(root, config.dir()) << row.what;
    EXPECT_EQ(root + "/xml/velmora_config_cust.xml", config.file()) << row.what;
}

INSTANTIATE_TEST_SUITE_P(
    Rows, ComparedConfigTest,
    testing::Values(ConfigPathRow{"the directory", "", true, ""},
                    ConfigPathRow{"the directory with a slash", "/", true, ""},
                    ConfigPathRow{"its xml directory", "/xml", true, ""},
                    ConfigPathRow{"the file itself", "/xml/velmora_config_cust.xml", true, ""},
                    ConfigPathRow{"a directory without one", "/empty", false,
                                  "no configuration in"},
                    ConfigPathRow{"nothing there", "/missing.xml", false, "no such file"}),
    [](const testing::TestParamInfo<ConfigPathRow>& info) { return std::to_string(info.index); });

// A lone file is linked into a scratch directory under $TMPDIR that goes with the object.
TEST(ComparedConfigTest, LinksALoneFileAndRemovesTheLink) {
    const std::string dir = hosttest::makeScratchDir("compared-lone");
    hosttest::writeFile(dir + "/b.xml", kConfig);
    std::string scratch;
    {
        const ComparedConfig config(dir + "/b.xml");
        ASSERT_EQ("", config.error());
        scratch = config.dir();
        EXPECT_NE(std::string::npos,
                  hosttest::readFile(scratch + "/xml/velmora_config_cust.xml").find("cold_launch"));
        EXPECT_EQ(dir + "/b.xml", config.file());
    }
    struct stat st {};
    EXPECT_NE(0, stat(scratch.c_str(), &st)) << scratch << " left behind";
}

}  // namespace
}  // namespace velmora
