// Whole-file reading and writing of the host layer and the tools: what a parser is handed, and
// the one-line messages that name the file when it cannot be read or written.
#include "host/text/TextFile.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdlib>
#include <string>

namespace velmora {
namespace {

class TextFileTest : public ::testing::Test {
protected:
    void SetUp() override {
        char dir[] = "/tmp/velmora-textfile-XXXXXX";
        ASSERT_NE(mkdtemp(dir), nullptr);
        mDir = dir;
    }
    void TearDown() override { ASSERT_EQ(system(("rm -rf " + mDir).c_str()), 0); }

    std::string mDir;
};

TEST_F(TextFileTest, WrittenTextIsWhatTheParserIsHanded) {
    const std::string path = mDir + "/map.txt";
    std::string error;
    ASSERT_TRUE(TextFile::write(
        path, [](std::ostream& out) { out << "a 1\nb 2\n"; }, &error));
    std::string seen;
    EXPECT_EQ(TextFile::parseFile(
                  path, "node map",
                  [&](const std::string& text) {
                      seen = text;
                      return 7;
                  },
                  &error),
              7);
    EXPECT_EQ(seen, "a 1\nb 2\n");
}

struct WriteFailureRow {
    const char* name;
    std::string path;  // relative: under the scratch directory
    std::string error;
};

class TextFileWriteFailureTest : public TextFileTest,
                                 public ::testing::WithParamInterface<WriteFailureRow> {};

TEST_P(TextFileWriteFailureTest, NamesTheFile) {
    const WriteFailureRow& row = GetParam();
    const std::string path = row.path[0] == '/' ? row.path : mDir + "/" + row.path;
    std::string error;
    EXPECT_FALSE(TextFile::write(
        path, [](std::ostream& out) { out << "x"; }, &error));
    EXPECT_EQ(error, row.error + path);
}

INSTANTIATE_TEST_SUITE_P(
    Rows, TextFileWriteFailureTest,
    ::testing::Values(WriteFailureRow{"MissingDirectory", "none/file.txt", "cannot write "},
                      // Opens, but every write fails: the close reports it.
                      WriteFailureRow{"DeviceFull", "/dev/full", "write failed: "}),
    [](const ::testing::TestParamInfo<WriteFailureRow>& info) { return info.param.name; });

TEST_F(TextFileTest, UnreadableFileIsNeverParsed) {
    const std::string path = mDir + "/none.xml";
    std::string error;
    bool parsed = false;
    EXPECT_EQ(TextFile::parseFile(
                  path, "device profile",
                  [&](const std::string&) {
                      parsed = true;
                      return 0;
                  },
                  &error),
              -1);
    EXPECT_FALSE(parsed);
    EXPECT_EQ(error, path + ": cannot open device profile");
}

}  // namespace
}  // namespace velmora
