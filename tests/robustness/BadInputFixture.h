// Fixture of the bad-input tests: a running server with a client cap accepted and scene 4118
// applied before each bad call, and the check that all of it is still in force afterwards (the
// cap in the "--freqlist" dump, the current scene, a configured timed action).
// docs/bad-input.md lists the rows of these tests.
#pragma once

#include <string>
#include <vector>

#include "tests/server/SceneTestSupport.h"

namespace velmora {
namespace fake {

inline constexpr int kScene = 4118;
inline constexpr int kTimed = 4098;
inline constexpr int kKxCap = 1200000;

inline const char* const kCommands =
    "<cmd id=\"4098\" name=\"winswitch\"><act><duration>500</duration><t1>1000000</t1></act></cmd>"
    "<cmd id=\"4118\" name=\"scene\"><act><duration>0</duration><t1>1500</t1></act></cmd>"
    "<cmd id=\"12288\" name=\"little_cap\"><act><duration>0</duration><t2>1500000</t2></act>"
    "</cmd>";

// The prefix of the "--freqlist" dump that shows client KX's accepted little-cluster cap.
inline const std::string kKxCapLine = "KX set freq is:\ntag=little cpu max,        value=1200000\n";

class BadInputTest : public ServerTest {
public:
    using ServerTest::dumpArgs;
    VelmoraServer& server() { return *mServer; }

protected:
    void SetUp() override {
        ServerTest::SetUp();
        ASSERT_EQ(startServer(kCommands), 0);
        // Accepted before the bad call; must survive it.
        const int tag = 2;
        ASSERT_EQ(mServer->velmoraSetConfig(1, 1, &tag, &kKxCap), 0);
        ASSERT_EQ(mServer->velmoraEvent(kScene, "", 1, &kOn), 0);
        executor().clear();
        LogCapture::clear();
    }

    // What was accepted before is still in force: the client cap is listed, the scene is still
    // current, and the configured timed action still runs.
    void expectNothingLost() {
        EXPECT_EQ(dump("--freqlist").compare(0, kKxCapLine.size(), kKxCapLine), 0)
            << "client cap lost";
        {
            android::Mutex::Autolock lock(mServer->mMutex);
            EXPECT_EQ(mServer->mCurSpecialCmdId, kScene);
        }
        executor().clear();
        EXPECT_EQ(mServer->velmoraEvent(kTimed, "", 1, &kOn), 0);
        const auto calls = executor().calls(Op::DoAction);
        ASSERT_EQ(calls.size(), 1u);
        EXPECT_EQ(calls[0].tagValues, (std::vector<int>{1, 1000000}));
    }

    // Exactly one line `log` at `prio` was logged; an empty `log`: nothing was logged.
    void expectLog(const std::string& log, int prio) {
        if (log.empty()) {
            EXPECT_TRUE(LogCapture::lines().empty()) << LogCapture::lines()[0].msg;
        } else {
            EXPECT_EQ(LogCapture::count(prio, log), 1) << "missing log line: " << log;
        }
    }
};

}  // namespace fake
}  // namespace velmora
