// The command parser: what a parse copies, and reloads swapping the configuration.
#include "config/VelmoraParser.h"

#include <vector>

#include "platform/VelmoraPlat.h"
#include "tests/fakes/ServerTest.h"

namespace velmora {
namespace fake {
namespace {

class VelmoraParserTest : public ::testing::Test {
protected:
    void SetUp() override {
        LogCapture::start();
        mParser.mActionMap = new ActionMap();
    }

    // Adds a chain head -> records for `cmdId`; returns the head.
    Action* addChain(int cmdId, int records) {
        auto* head = new Action();
        head->mCmdId = cmdId;
        Action* tail = head;
        for (int i = 0; i < records; ++i) {
            tail->mNext = new Action();
            tail = tail->mNext;
            tail->mCmdId = cmdId;
            tail->mName = "rec" + std::to_string(i);
            tail->mDuration = 10 * (i + 1);
            tail->mParamNum = 1;
            tail->mTagValues = {1, 1000 + i};
            tail->mParams = {"k", "v" + std::to_string(i)};
        }
        (*mParser.mActionMap)[cmdId] = head;
        return head;
    }

    VelmoraParser mParser;
};

TEST_F(VelmoraParserTest, CopiesTheRecordAfterTheHead) {
    Action* head = addChain(4400, 2);
    Action target;
    EXPECT_EQ(mParser.doParseLocked(4400, &target), 0);
    EXPECT_EQ(target.mCmdId, 4400);
    EXPECT_EQ(target.mName, "rec0");
    EXPECT_EQ(target.mDuration, 10);
    EXPECT_EQ(target.mParamNum, 1);
    EXPECT_EQ(target.mTagValues, (std::vector<int32_t>{1, 1000}));
    EXPECT_EQ(target.mParams, (std::vector<std::string>{"k", "v0"}));
    // The rest of the chain is borrowed from the parser, not copied.
    EXPECT_EQ(target.mNext, head->mNext->mNext);
}

TEST_F(VelmoraParserTest, MissingTargetOrMapIsAnError) {
    EXPECT_EQ(mParser.doParseLocked(4400, nullptr), 2);
    VelmoraParser empty;
    Action target;
    EXPECT_EQ(empty.doParseLocked(4400, &target), 2);
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_ERROR, "doParse failed, nullptr!"), 2);
}

class VelmoraParserReloadTest : public ServerTest {};

TEST_F(VelmoraParserReloadTest, ReloadWithoutParserIsRefused) {
    ASSERT_EQ(startServer(), 0);
    VelmoraPlat* plat = mServer->mPlatPtr;
    VelmoraParser* parser = plat->mParserPtr;
    plat->mParserPtr = nullptr;
    EXPECT_EQ(mServer->velmoraEvent(20230, "", 0, nullptr), -1);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "failed to update parser: mParserPtr is NULL!"));
    plat->mParserPtr = parser;
}

}  // namespace
}  // namespace fake
}  // namespace velmora
