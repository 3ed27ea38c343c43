// The device event log: each line reaches its file as it is written (while the log keeps the
// file open), a report stamp becomes the trace time, setting a path starts the file afresh, and
// every line is marked on the timeline.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "host/record/EventLog.h"
#include "host/record/Timeline.h"
#include "host/time/HostClock.h"
#include "tests/host/HostTestSupport.h"

namespace velmora {
namespace {

class EventLogTest : public testing::Test {
protected:
    void SetUp() override {
        mClock.setVirtual();
        mPath = hosttest::makeScratchDir("eventlog") + "/events.log";
    }

    HostClock mClock;
    Timeline mTimeline{mClock};
    EventLog mLog{mClock, mTimeline};
    std::string mPath;
};

TEST_F(EventLogTest, LinesReachTheFileAsTheyAreWrittenWithTheTraceTime) {
    hosttest::writeFile(mPath, "left from an earlier run\n");
    ASSERT_TRUE(mLog.setPath(mPath));
    EXPECT_EQ("", hosttest::readFile(mPath));
    mClock.advanceTo(61500);
    mLog.write(4, 3, "#ARG1:<20261124031500,limit>");
    EXPECT_EQ("61.500 prio=4 tag=3 #ARG1:<20000101000101,limit>", hosttest::readFile(mPath));
    mClock.advanceTo(61507);
    mLog.write(6, 0, "plain line");
    EXPECT_EQ(
        "61.500 prio=4 tag=3 #ARG1:<20000101000101,limit>\n"
        "61.507 prio=6 tag=0 plain line",
        hosttest::readFile(mPath));
    EXPECT_EQ((std::vector<std::string>{"#ARG1:<20000101000101,limit>", "plain line"}),
              mLog.lines());
    EXPECT_EQ(2u, mTimeline.instants("report").size());
}

TEST_F(EventLogTest, ANewPathStartsAfreshAndNoPathKeepsLinesInMemoryOnly) {
    ASSERT_TRUE(mLog.setPath(mPath));
    mLog.write(4, 0, "first");
    const std::string other = mPath + ".2";
    ASSERT_TRUE(mLog.setPath(other));
    mLog.write(4, 0, "second");
    ASSERT_TRUE(mLog.setPath(""));
    mLog.write(4, 0, "third");
    EXPECT_EQ("0.000 prio=4 tag=0 first", hosttest::readFile(mPath));
    EXPECT_EQ("0.000 prio=4 tag=0 second", hosttest::readFile(other));
    EXPECT_EQ(3u, mLog.lines().size());
    EXPECT_FALSE(mLog.setPath("/nonexistent/dir/events.log"));
    mLog.write(4, 0, "fourth");  // nowhere to go but memory
    EXPECT_EQ(4u, mLog.lines().size());
}

}  // namespace
}  // namespace velmora
