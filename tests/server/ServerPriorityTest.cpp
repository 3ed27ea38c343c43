// Special-scene priorities: built-in values, configured values that override them, the ranges
// that are read, the rebuild on reload, and the selection rules with their tie-breaks.
#include <string>

#include "config/Action.h"
#include "tests/server/SceneTestSupport.h"

namespace velmora {
namespace fake {
namespace {

using PriorityMap = std::map<int32_t, int32_t>;
const std::string kBuiltinScenes = scene(4118) + scene(4119) + scene(4120) + scene(4121);
const PriorityMap kBuiltins = {{4118, 100}, {4119, 200}, {4120, 20}, {4121, 70}};

// One configured scene per row: the priority it ends up with (0: none, the scene is refused).
struct PriorityRow {
    const char* what;
    int cmdId;
    std::string body;
    int expected;
};

class ServerPriorityRowTest : public ServerSceneTest,
                              public ::testing::WithParamInterface<PriorityRow> {};

TEST_P(ServerPriorityRowTest, ConfiguredPriorityDecidesWhetherTheSceneRuns) {
    const PriorityRow& row = GetParam();
    start(scene(row.cmdId, row.body));
    const PriorityMap map = state().prio;
    const auto it = map.find(row.cmdId);
    EXPECT_EQ(it == map.end() ? 0 : it->second, row.expected);

    if (row.expected > 0) {
        EXPECT_EQ(on(row.cmdId), 0);
        EXPECT_EQ(steps(), Steps({apply(row.cmdId)}));
    } else {
        EXPECT_EQ(on(row.cmdId), -1);
        EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "invalid special scene priority, cmdId is " +
                                                           std::to_string(row.cmdId)));
        EXPECT_EQ(steps(), Steps());
    }
}

INSTANTIATE_TEST_SUITE_P(
    Rows, ServerPriorityRowTest,
    ::testing::Values(
        // Tag 101 overrides a built-in when it lies in 1..500; otherwise the built-in stays.
        PriorityRow{"builtin_overridden", 4118, "<t1>5</t1><t101>150</t101>", 150},
        PriorityRow{"upper_bound", 4118, "<t101>500</t101>", 500},
        PriorityRow{"lower_bound", 4120, "<t101>1</t101>", 1},
        PriorityRow{"just_above_range_keeps_builtin", 4121, "<t101>501</t101>", 70},
        PriorityRow{"zero_keeps_builtin", 4118, "<t101>0</t101>", 100},
        // Several tag-101 pairs: the last one wins, even when it is out of range.
        PriorityRow{"last_tag_wins", 4118, "<t101>30</t101><t2>1</t2><t101>40</t101>", 40},
        PriorityRow{"invalid_last_tag_wins", 4118, "<t101>150</t101><t101>600</t101>", 100},
        // Ordinary scenes read integer pairs only.
        PriorityRow{"ordinary_scene_configured", 4200, "<t101>90</t101>", 90},
        PriorityRow{"ordinary_scene_string_pair_ignored", 4223, "<s_priority>90</s_priority>", 0},
        PriorityRow{"ordinary_scene_without_pairs", 4200, "", 0},
        // Governor scenes read the string pair "priority" only, the last one winning.
        PriorityRow{"governor_last_string_wins", 4300,
                    "<s_priority>30</s_priority><s_priority>40</s_priority><t101>300</t101>", 40},
        PriorityRow{"governor_first_id", 4224, "<s_priority>10</s_priority>", 10},
        PriorityRow{"governor_last_id_read", 4351, "<s_priority>60</s_priority>", 60},
        PriorityRow{"governor_tag_101_ignored", 4224, "<t101>10</t101>", 0},
        PriorityRow{"governor_out_of_range", 4300, "<s_priority>501</s_priority>", 0},
        PriorityRow{"governor_not_a_number", 4300, "<s_priority>high</s_priority>", 0},
        PriorityRow{"governor_number_prefix", 4300, "<s_priority>45ms</s_priority>", 45},
        PriorityRow{"governor_key_must_match_exactly", 4300,
                    "<s_priority2>40</s_priority2><s_Priority>40</s_Priority>", 0},
        // The table is read up to 4351: scene 4352 never gets a configured priority.
        PriorityRow{"scene_4352_never_configured", 4352, "<s_priority>60</s_priority>", 0}),
    [](const ::testing::TestParamInfo<PriorityRow>& info) { return std::string(info.param.what); });

TEST_F(ServerSceneTest, ReloadRebuildsTheTableFromScratch) {
    start(scene(4118, "<t101>150</t101>") + scene(4119) + scene(4120) + scene(4121) +
          scene(4130, "<t101>300</t101>") + scene(4131) +
          scene(4300, "<s_priority>40</s_priority>"));
    ASSERT_EQ(on(4118), 0);
    ASSERT_EQ(on(4131), -1);  // leaves a 0 entry behind

    ASSERT_EQ(reload(kBuiltinScenes + scene(4130, "<t101>60</t101>") + scene(4131) +
                     scene(4122, "<t101>90</t101>") + scene(4300)),
              0);
    PriorityMap expected = kBuiltins;
    expected[4130] = 60;
    expected[4122] = 90;
    EXPECT_EQ(state().prio, expected);

    // The scene state survives: 4118 stays current and now outranks 4130.
    steps();
    EXPECT_EQ(on(4130), 0);
    EXPECT_EQ(steps(), Steps());
    EXPECT_EQ(on(4300), -1);
    EXPECT_EQ(off(4118), 0);
    EXPECT_EQ(steps(), Steps({withdraw(4118), apply(4130)}));
}

TEST_F(ServerSceneTest, FailedReloadKeepsThePriorities) {
    start(kBuiltinScenes + scene(4130, "<t101>300</t101>"));
    const PriorityMap before = state().prio;
    writeCustConfig(policyXml("<cmd name=\"no id\"><act><duration>1</duration></act></cmd>"));
    EXPECT_EQ(mServer->velmoraEvent(20230, "", 0, nullptr), 0);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "load xml map failed!"));
    EXPECT_EQ(state().prio, before);
    EXPECT_EQ(on(4130), 0);
    EXPECT_EQ(steps(), Steps({apply(4130)}));
}

// The integer reader on a hand-made record: only the announced pairs are read.
TEST_F(ServerSceneTest, PriorityReaderStopsAtTheAnnouncedPairs) {
    VelmoraServer server;
    Action plain;
    plain.mTagValues = {101, 30, 7, 8, 101, 45};
    plain.mParamNum = 2;
    EXPECT_EQ(server.getPriority(&plain), 30);
    plain.mParamNum = 0;
    EXPECT_EQ(server.getPriority(&plain), 0);
}

}  // namespace
}  // namespace fake
}  // namespace velmora
