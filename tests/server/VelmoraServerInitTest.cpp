// Start-up and tear-down of the server: every init status and what is left behind.
#include "config/VelmoraParser.h"
#include "platform/VelmoraPlat.h"
#include "tests/fakes/ServerTest.h"

namespace velmora {
namespace fake {
namespace {

class VelmoraServerInitTest : public ServerTest {};

TEST_F(VelmoraServerInitTest, StartsOnMinimalConfiguration) {
    EXPECT_EQ(startServer(), 0);
    EXPECT_TRUE(mServer->mInitialized);
    EXPECT_EQ(env().initializeCalls, 1);
    ASSERT_NE(env().lastPlat, nullptr);
    EXPECT_EQ(env().lastPlat->mServerPtr, mServer.get());
    ASSERT_NE(env().lastPlat->mParserPtr, nullptr);
    EXPECT_EQ(env().lastPlat->mParserPtr->mServerPtr, mServer.get());
    EXPECT_EQ(dump("--help"),
              "--help: print debug usage\n"
              "--logon: open debug log\n"
              "--logoff: close debug log\n"
              "--freqlist: print set freq list\n"
              "--easgrouplist: print set eas group list\n\n");
}

TEST_F(VelmoraServerInitTest, MissingPlatformFails) {
    env().failGetPlat = true;
    EXPECT_EQ(startServer(), -1);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "get platform ptr failed!"));
    EXPECT_EQ(mServer->mFreqClientPtr, nullptr);
    EXPECT_EQ(mServer->velmoraEvent(4400, "", 0, nullptr), 1);
}

TEST_F(VelmoraServerInitTest, InitializeResultIsReturnedAndComponentsReleased) {
    env().initializeResult = 7;
    EXPECT_EQ(startServer(), 7);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "initialize failed!"));
    EXPECT_EQ(mServer->mPlatPtr, nullptr);
    EXPECT_EQ(mServer->mFreqClientPtr, nullptr);
    EXPECT_EQ(mServer->mSchedLevelPtr, nullptr);
    EXPECT_EQ(mServer->mProbeHandler, nullptr);
    EXPECT_EQ(env().platformsDeleted, 1);
    EXPECT_FALSE(mServer->mInitialized);
}

TEST_F(VelmoraServerInitTest, MissingLoaderFailsParserCreation) {
    env().failLoader = true;
    EXPECT_EQ(startServer(), -1);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "server get loader failed!"));
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "createParser failed!"));
    EXPECT_EQ(mServer->mPlatPtr, nullptr);
    EXPECT_EQ(env().initializeCalls, 0);
}

TEST_F(VelmoraServerInitTest, EmptyConfigurationFailsParserCreation) {
    writeCustConfig(policyXml("<cmd name=\"no id\"><act><duration>1</duration></act></cmd>"));
    mServer = std::make_unique<VelmoraServer>();
    EXPECT_EQ(mServer->init(), -1);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "empty rawXmlDataMap!!"));
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "load xml map failed!"));
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "createParser failed!"));
}

TEST_F(VelmoraServerInitTest, MissingProbeCommandKeepsServerRunning) {
    writeCustConfig(
        policyXml("<cmd id=\"5376\"><act><duration>0</duration><t50>0</t50></act></cmd>"
                  "<cmd id=\"4400\"><act><duration>100</duration><t1>1000</t1></act></cmd>"));
    mServer = std::make_unique<VelmoraServer>();
    EXPECT_EQ(mServer->init(), 4);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "doParse probe event failed!"));
    EXPECT_TRUE(mServer->mInitialized);
    EXPECT_EQ(mServer->mProbeHandler, nullptr);
    const int on = 0;
    EXPECT_EQ(mServer->velmoraEvent(4400, "", 1, &on), 0);
    EXPECT_EQ(mServer->velmoraEvent(4116, "pid=1|tid=2", 1, &on), 4);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "init mProbeHandler failed!"));
}

TEST_F(VelmoraServerInitTest, DeleteActionPtrWalksTheChain) {
    VelmoraServer server;
    auto* head = new Action();
    head->mNext = new Action();
    head->mNext->mNext = new Action();
    server.deleteActionPtr(head);  // the sanitizer build catches a leak or a double free
    server.deleteActionPtr(nullptr);
}

}  // namespace
}  // namespace fake
}  // namespace velmora
