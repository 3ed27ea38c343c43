// The bounds-taking string functions, as the rest of the library relies on them.
#include "compat/BoundedString.h"

#include <gtest/gtest.h>

#include <string>

namespace {

// One formatted write per row: the destination's size, the count allowed, the text, and what
// comes back. Text that does not fit leaves an empty string, never a truncated one.
struct SnprintfRow {
    size_t size;
    size_t count;
    const char* text;
    int result;
    const char* written;
};

class SnprintfSTest : public ::testing::TestWithParam<SnprintfRow> {};

TEST_P(SnprintfSTest, WritesWholeTextOrNothing) {
    const SnprintfRow& row = GetParam();
    char buf[16] = "previous";
    EXPECT_EQ(snprintf_s(buf, row.size, row.count, "%s", row.text), row.result);
    EXPECT_STREQ(buf, row.written);
}

INSTANTIATE_TEST_SUITE_P(
    Rows, SnprintfSTest,
    ::testing::Values(SnprintfRow{16, 15, "v=42", 4, "v=42"},
                      SnprintfRow{16, 5, "abcdef", -1, ""},        // longer than the count
                      SnprintfRow{8, 7, "1234567", 7, "1234567"},  // exactly the count
                      SnprintfRow{8, 7, "12345678", -1, ""},
                      SnprintfRow{4, 100, "abcd", -1, ""}));  // count clamped to the size

TEST(SnprintfSMissingTest, RejectsMissingDestination) {
    EXPECT_EQ(snprintf_s(nullptr, 16, 15, "x"), -1);
    char buf[1] = {'z'};
    EXPECT_EQ(snprintf_s(buf, 0, 0, "x"), -1);
    EXPECT_EQ(buf[0], 'z');
}

// Integers: the fields read are counted, a missing field stays as it was, and empty input is
// the end of the input.
TEST(SscanfSTest, ReadsIntegersAndCountsFields) {
    int pid = 0;
    int tid = 0;
    EXPECT_EQ(sscanf_s("pid=12|tid=34", "pid=%d|tid=%d", &pid, &tid), 2);
    EXPECT_EQ(pid, 12);
    EXPECT_EQ(tid, 34);
    tid = -7;
    EXPECT_EQ(sscanf_s("pid=12", "pid=%d|tid=%d", &pid, &tid), 1);
    EXPECT_EQ(tid, -7);
    EXPECT_EQ(sscanf_s("pid=x|tid=3", "pid=%d|tid=%d", &pid, &tid), 0);
    EXPECT_EQ(sscanf_s("", "pid=%d|tid=%d", &pid, &tid), -1);
    EXPECT_EQ(sscanf_s(nullptr, "pid=%d", &pid), -1);
}

// Strings stop at white space; strings, characters and scan sets honour the buffer size, and
// a zero-sized buffer fails the conversion.
TEST(SscanfSTest, BufferConversionsHonourTheSize) {
    char first[8];
    char second[8];
    EXPECT_EQ(sscanf_s("a=0.5 b=0.7", "a=%s b=%s", first, sizeof(first), second, sizeof(second)),
              2);
    EXPECT_STREQ(first, "0.5");
    EXPECT_STREQ(second, "0.7");
    char buf[4] = "abc";
    EXPECT_EQ(sscanf_s("xyz", "%s", buf, static_cast<size_t>(0)), 0);
    EXPECT_STREQ(buf, "abc");
    char two[2];
    EXPECT_EQ(sscanf_s("ab", "%2c", two, sizeof(two)), 1);
    EXPECT_EQ(two[0], 'a');
    EXPECT_EQ(sscanf_s("abc", "%3c", two, sizeof(two)), 0);
    char digits[4];
    EXPECT_EQ(sscanf_s("123x", "%[0-9]", digits, sizeof(digits)), 1);
    EXPECT_STREQ(digits, "123");
    EXPECT_EQ(sscanf_s("1234x", "%[0-9]", digits, sizeof(digits)), 0);
}

}  // namespace
