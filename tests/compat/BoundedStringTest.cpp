// The bounds-taking string functions, as the rest of the library relies on them.
#include "compat/BoundedString.h"

#include <gtest/gtest.h>

#include <string>

namespace {

TEST(SnprintfSTest, WritesTextThatFits) {
    char buf[16];
    EXPECT_EQ(snprintf_s(buf, sizeof(buf), sizeof(buf) - 1, "v=%d", 42), 4);
    EXPECT_STREQ(buf, "v=42");
}

TEST(SnprintfSTest, TextLongerThanCountLeavesEmptyString) {
    char buf[16] = "previous";
    EXPECT_EQ(snprintf_s(buf, sizeof(buf), 5, "%s", "abcdef"), -1);
    EXPECT_STREQ(buf, "");
}

TEST(SnprintfSTest, TextFillingExactlyCountFits) {
    char buf[8];
    EXPECT_EQ(snprintf_s(buf, sizeof(buf), 7, "%s", "1234567"), 7);
    EXPECT_STREQ(buf, "1234567");
    EXPECT_EQ(snprintf_s(buf, sizeof(buf), 7, "%s", "12345678"), -1);
    EXPECT_STREQ(buf, "");
}

TEST(SnprintfSTest, CountIsClampedToTheDestination) {
    char buf[4];
    EXPECT_EQ(snprintf_s(buf, sizeof(buf), 100, "%s", "abcd"), -1);
    EXPECT_STREQ(buf, "");
}

TEST(SnprintfSTest, RejectsMissingDestination) {
    EXPECT_EQ(snprintf_s(nullptr, 16, 15, "x"), -1);
    char buf[1] = {'z'};
    EXPECT_EQ(snprintf_s(buf, 0, 0, "x"), -1);
    EXPECT_EQ(buf[0], 'z');
}

TEST(SscanfSTest, ReadsIntegersAndCountsFields) {
    int pid = 0;
    int tid = 0;
    EXPECT_EQ(sscanf_s("pid=12|tid=34", "pid=%d|tid=%d", &pid, &tid), 2);
    EXPECT_EQ(pid, 12);
    EXPECT_EQ(tid, 34);
}

TEST(SscanfSTest, MissingFieldsAreNotCounted) {
    int pid = 0;
    int tid = -7;
    EXPECT_EQ(sscanf_s("pid=12", "pid=%d|tid=%d", &pid, &tid), 1);
    EXPECT_EQ(tid, -7);
    EXPECT_EQ(sscanf_s("pid=x|tid=3", "pid=%d|tid=%d", &pid, &tid), 0);
}

TEST(SscanfSTest, EmptyInputIsEndOfFile) {
    int pid = 0;
    int tid = 0;
    EXPECT_EQ(sscanf_s("", "pid=%d|tid=%d", &pid, &tid), -1);
    EXPECT_EQ(sscanf_s(nullptr, "pid=%d", &pid), -1);
}

// The memory-latency hint reads each ratio into a 512-byte buffer announced as 511 bytes.
class SscanfSRatioTest : public ::testing::TestWithParam<size_t> {};

TEST_P(SscanfSRatioTest, RatioOfThisLength) {
    const size_t length = GetParam();
    const std::string ratio(length, '7');
    const std::string text = "pid=1|tid=2|ratio_b=" + ratio + " ratio_l=0.7";
    char big[512];
    char little[512];
    int pid = 0;
    int tid = 0;
    const int fields = sscanf_s(text.c_str(), "pid=%d|tid=%d|ratio_b=%s ratio_l=%s", &pid, &tid,
                                big, static_cast<size_t>(511), little, static_cast<size_t>(511));
    if (length <= 510) {
        EXPECT_EQ(fields, 4);
        EXPECT_EQ(std::string(big), ratio);
        EXPECT_STREQ(little, "0.7");
    } else {
        EXPECT_EQ(fields, 2);  // the ratio does not fit: it fails, and scanning stops there
        EXPECT_STREQ(big, "");
    }
}

INSTANTIATE_TEST_SUITE_P(Lengths, SscanfSRatioTest, ::testing::Values(1, 509, 510, 511, 600));

TEST(SscanfSTest, StringStopsAtWhiteSpace) {
    char first[8];
    char second[8];
    EXPECT_EQ(sscanf_s("a=0.5 b=0.7", "a=%s b=%s", first, sizeof(first), second, sizeof(second)),
              2);
    EXPECT_STREQ(first, "0.5");
    EXPECT_STREQ(second, "0.7");
}

TEST(SscanfSTest, ZeroSizedBufferFailsTheConversion) {
    char buf[4] = "abc";
    EXPECT_EQ(sscanf_s("xyz", "%s", buf, static_cast<size_t>(0)), 0);
    EXPECT_STREQ(buf, "abc");
}

TEST(SscanfSTest, CharactersAndScanSetsHonourTheSize) {
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
