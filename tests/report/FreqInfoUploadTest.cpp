// The frequency statistics reporter: limiting rules, report sequence and the exact line format.
#include "report/FreqInfoUpload.h"

#include <gtest/gtest.h>

#include <limits>

#include "tests/fakes/FakeEnv.h"
#include "tests/fakes/LogCapture.h"
#include "tests/freq/FreqReportLines.h"

namespace velmora {
namespace fake {
namespace {

using Strings = std::vector<std::string>;

constexpr int kLittleMax = 1804800;
constexpr int kBigMax = 2419200;
constexpr int kGpuMax = 2841600;

struct tm makeTime(int year, int month, int day, int hour, int minute, int second) {
    struct tm when = {};
    when.tm_year = year - 1900;
    when.tm_mon = month - 1;
    when.tm_mday = day;
    when.tm_hour = hour;
    when.tm_min = minute;
    when.tm_sec = second;
    return when;
}

class FreqInfoUploadTest : public ::testing::Test {
protected:
    void SetUp() override {
        FakeEnv::get().reset();
        LogCapture::start();
        mUpload.updateMaxFreqData(kLittleMax, kBigMax, kGpuMax);
    }
    void TearDown() override { FakeEnv::get().reset(); }

    // One accepted client request as the manager feeds it: origin, then the merged values.
    void request(int clientId, std::vector<int> tags, std::vector<int> origin,
                 std::vector<int> final) {
        const int n = static_cast<int>(tags.size());
        mUpload.updateOriginFreqData(clientId, n, tags.data(), origin.data());
        mUpload.updateFinalFreqData(clientId, n, tags.data(), final.data());
    }

    FreqInfoUpload mUpload;
};

// The documented example line; date fields padded to two digits; a time that cannot be
// represented falls back to a fixed date.
TEST_F(FreqInfoUploadTest, FormatsTheLine) {
    EXPECT_EQ(mUpload.formatFreqInfo(makeTime(2027, 1, 2, 3, 4, 5), 2, 0, 0, 0),
              "#ARG1:<20270102030405,2,-1,-1,-1,0>");
    mUpload.updateFreqClient(1, 5, 1209600);
    mUpload.updateReason(1);
    EXPECT_EQ(
        mUpload.formatFreqInfo(makeTime(2026, 11, 15, 12, 14, 56), 1, kLittleMax, 1209600, -1),
        "#ARG1:<20261115121456,1,-1,1209,,4>");
    const struct tm when = FreqInfoUpload::getReportTime(std::numeric_limits<time_t>::max());
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "get local time failed!"));
    EXPECT_EQ(mUpload.formatFreqInfo(when, 3, -1, -1, -1).substr(0, 21), "#ARG1:<19000101000001");
}

struct NormalizeRow {
    int value;
    int max;
    int expected;
};

class NormalizedFreqTest : public ::testing::TestWithParam<NormalizeRow> {};

TEST_P(NormalizedFreqTest, MapsValueAgainstMaximum) {
    FreqInfoUpload upload;
    EXPECT_EQ(upload.getNormalizedFreq(GetParam().value, GetParam().max), GetParam().expected);
}

INSTANTIATE_TEST_SUITE_P(
    Rows, NormalizedFreqTest,
    ::testing::Values(NormalizeRow{0, kLittleMax, -1},  // no limit
                      NormalizeRow{-1, -1, -1},         // unset against unset
                      NormalizeRow{-1, kLittleMax, FreqInfoUpload::kEmptyField},  // not sent
                      NormalizeRow{1209600, kBigMax, 1209},                       // MHz, truncated
                      NormalizeRow{999, kBigMax, 0},                              // below 1 MHz
                      NormalizeRow{kLittleMax, kLittleMax, -1},  // at the top: free
                      NormalizeRow{kGpuMax + 1, kGpuMax, FreqInfoUpload::kEmptyField},
                      NormalizeRow{1000000, -1, FreqInfoUpload::kEmptyField}));  // max unknown

TEST_F(FreqInfoUploadTest, ReportsStartContinueAndEndOfLimiting) {
    request(2, {2}, {kLittleMax}, {kLittleMax});  // nothing limits: silence
    EXPECT_TRUE(reportBodies().empty());

    request(1, {5}, {1209600}, {1209600});
    request(3, {8, 2}, {2000000, 0}, {2000000, 1804800});
    request(1, {5}, {0}, {0});
    request(3, {8}, {0}, {0});
    request(2, {2}, {0}, {0});  // quiet again
    EXPECT_EQ(reportBodies(),
              (Strings{",1,,1209,,4>", ",3,-1,,2000,5>", ",3,,-1,,1>", ",2,,,-1,0>"}));
    EXPECT_EQ(mUpload.mReported, 0);
}

TEST_F(FreqInfoUploadTest, FinalDataWithoutTrackedValuesWritesNothing) {
    request(1, {5}, {1209600}, {1209600});
    ASSERT_EQ(reportBodies().size(), 1u);
    request(1, {17, 20}, {50, 1}, {50, 1});
    request(1, {2, 5, 8}, {-1, -1, -1}, {-1, -1, -1});
    EXPECT_EQ(reportBodies().size(), 1u);
}

TEST_F(FreqInfoUploadTest, FinalValueAboveMaximumLeavesItsFieldEmpty) {
    request(2, {2, 5, 8}, {1000000, 3000000, 0}, {1000000, 3000000, 0});
    EXPECT_EQ(reportBodies(), (Strings{",1,1000,,-1,2>"}));
}

TEST_F(FreqInfoUploadTest, UnknownClientStillTriggersAReport) {
    request(1, {2}, {1000000}, {1000000});
    request(-5, {2}, {500000}, {500000});  // origin ignored, state unchanged
    EXPECT_EQ(reportBodies(), (Strings{",1,1000,,,4>", ",3,500,,,4>"}));
}

TEST_F(FreqInfoUploadTest, UnsetMaximaNeverReport) {
    FreqInfoUpload upload;
    std::vector<int> tags = {2, 5, 8};
    std::vector<int> values = {500000, 500000, 500000};
    upload.updateOriginFreqData(1, 3, tags.data(), values.data());
    upload.updateFinalFreqData(1, 3, tags.data(), values.data());
    EXPECT_EQ(upload.mLimitedClients, 0u);
    EXPECT_TRUE(FakeEnv::get().jankLines().empty());
}

}  // namespace
}  // namespace fake
}  // namespace velmora
