// The configuration vocabulary: what the host loader makes of XML parameter elements, as the
// server's parser will see it, and what it logs for anything it does not understand.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <memory>

#include "config/VelmoraLoadXml.h"
#include "config/VelmoraParser.h"
#include "host/platform/HostEnvironment.h"
#include "tests/fakes/LogCapture.h"
#include "tests/host/HostTestSupport.h"

namespace velmora {
namespace {

using fake::LogCapture;

class HostLoadXmlTest : public testing::Test {
protected:
    void SetUp() override {
        HostEnvironment::get().reset();
        HostEnvironment::get().properties().unset("ro.build.version.incremental");
        mDir = hosttest::makeScratchDir("loadxml");
        mkdir((mDir + "/xml").c_str(), 0755);
        HostEnvironment::get().properties().setConfigDirs({mDir + "/missing", mDir});
        LogCapture::start();
    }
    void TearDown() override { VelmoraParser::deleteActionMap(mMap); }

    // Loads `commands` through the library's loader and the host conversion.
    ActionMap* load(const std::string& commands) {
        hosttest::writeFile(mDir + "/xml/velmora_config_cust.xml",
                            "<policy>" + commands + "</policy>");
        std::unique_ptr<VelmoraLoadXml> loader(createVelmoraLoadXml());
        mMap = loader->loadXmlMap();
        return mMap;
    }
    const Action* first(int cmdId) {
        auto it = mMap->find(cmdId);
        return it == mMap->end() ? nullptr : it->second->mNext;
    }

    std::string mDir;
    ActionMap* mMap = nullptr;
};

TEST_F(HostLoadXmlTest, NamedParametersBecomeTagPairs) {
    ASSERT_NE(nullptr, load(R"(<cmd id="4099" name="cold"><act type="1">
        <duration>1500</duration><little_min>1804800</little_min><big_max>2419200</big_max>
        <gpu_min>500</gpu_min><ddr_min>800</ddr_min><ipa_control_temp>80000</ipa_control_temp>
        <fork_on_big>1</fork_on_big><group_key_background>-10</group_key_background>
        <priority>150</priority><tag_33>7</tag_33></act></cmd>)"));
    const Action* action = first(4099);
    ASSERT_NE(nullptr, action);
    EXPECT_EQ(1500, action->mDuration);
    EXPECT_EQ((std::vector<int32_t>{1, 1804800, 5, 2419200, 7, 500, 10, 800, 18, 80000, 20, 1, 57,
                                    -10, 101, 150, 33, 7}),
              action->mTagValues);
    EXPECT_TRUE(action->mParams.empty());
    // The head stands for the command and carries no parameters.
    EXPECT_EQ(0, mMap->at(4099)->mParamNum);
    EXPECT_EQ(-1, mMap->at(4099)->mDuration);
}

// Parameters the vocabulary does not know are left out, each with a log line naming the
// command and the element; the rest of the action survives.
TEST_F(HostLoadXmlTest, NotUnderstoodParametersAreLoggedAndLeftOut) {
    ASSERT_NE(nullptr, load(R"(<cmd id="4101" name="scroll"><act>
        <duration>soon</duration><group_top_app>20</group_top_app><turbo>1</turbo>
        <little_min>1.5GHz</little_min><tag_x>3</tag_x></act></cmd>
        <cmd id="4300" name="gov"><act><warp_drive>on</warp_drive></act></cmd>)"));
    const Action* action = first(4101);
    ASSERT_NE(nullptr, action);
    EXPECT_EQ((std::vector<int32_t>{53, 20}), action->mTagValues);
    EXPECT_EQ(0, action->mDuration);
    EXPECT_TRUE(first(4300)->mParams.empty());
    for (const char* line :
         {"config: cmdId=4101 (scroll): duration 'soon' is not an integer, ignored",
          "config: cmdId=4101 (scroll): unknown parameter <turbo>, ignored",
          "config: cmdId=4101 (scroll): <little_min> value '1.5GHz' is not an integer, ignored",
          "config: cmdId=4101 (scroll): unknown parameter <tag_x>, ignored",
          "config: cmdId=4300 (gov): unknown parameter <warp_drive>, ignored"}) {
        EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, line)) << line;
    }
}

}  // namespace
}  // namespace velmora
