// Loading the command configuration: which file wins, what the raw records look like and what
// is logged for each kind of broken file.
#include "config/VelmoraLoadXml.h"

#include <fcntl.h>
#include <signal.h>
#include <sys/stat.h>
#include <unistd.h>

#include <functional>
#include <string>
#include <thread>
#include <vector>

#include "tests/fakes/ServerTest.h"

namespace velmora {
namespace fake {
namespace {

struct RawRecord {
    int cmdId;
    int type;
    std::string name;
    std::vector<std::string> names;
    std::vector<std::string> values;
};

// Loader whose conversion snapshots the raw chains it is handed.
class CapturingLoader : public VelmoraLoadXml {
public:
    ActionMap* createActionMap(RawXmlDataMap& rawMap) override {
        ++conversions;
        for (const auto& entry : rawMap) {
            std::vector<RawRecord> chain;
            for (const RawXmlData* rec = entry.second; rec != nullptr; rec = rec->next) {
                chain.push_back({rec->cmdId, rec->type, rec->name, rec->names, rec->values});
            }
            chains[entry.first] = chain;
        }
        return new ActionMap();
    }

    int conversions = 0;
    std::map<int, std::vector<RawRecord>> chains;
};

class VelmoraLoadXmlTest : public ServerTest {
protected:
    // Loads and returns whether a map came back; the map itself is empty by construction.
    bool load() {
        ActionMap* map = mLoader.loadXmlMap();
        const bool loaded = map != nullptr;
        delete map;
        return loaded;
    }

    CapturingLoader mLoader;
};

const char* const kCustCommands = "<cmd id=\"4400\" name=\"cust\"><act><k>1</k></act></cmd>";
const char* const kCloudCommands = "<cmd id=\"4500\" name=\"cloud\"><act><k>2</k></act></cmd>";

TEST_F(VelmoraLoadXmlTest, CloudCopyForThisBuildWins) {
    writeCustConfig(policyXml(kCustCommands));
    writeCloudConfig("eng.1234", policyXml(kCloudCommands));
    ASSERT_TRUE(load());
    EXPECT_EQ(mLoader.chains.count(4500), 1u);
    EXPECT_EQ(mLoader.chains.count(4400), 0u);
    EXPECT_EQ(LogCapture::countContaining("switch to cloud update config file : "), 1);
}

// Every way the cloud copy can be unusable: the customisation copy is loaded instead, and the
// reason is logged.
struct FallbackRow {
    const char* name;
    std::string incremental;  // empty: the property is missing
    const char* cloudXml;     // null: no cloud file for that build
    const char* log;
};

class CloudFallbackTest : public VelmoraLoadXmlTest,
                          public ::testing::WithParamInterface<FallbackRow> {};

TEST_P(CloudFallbackTest, LoadsTheCustomisationCopy) {
    const FallbackRow& row = GetParam();
    writeCustConfig(policyXml(kCustCommands));
    if (row.cloudXml != nullptr) {
        writeCloudConfig(row.incremental, row.cloudXml);
    } else {
        env().incremental = row.incremental;
    }
    ASSERT_TRUE(load());
    EXPECT_EQ(mLoader.chains.count(4400), 1u);
    EXPECT_EQ(mLoader.chains.count(4500), 0u);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, row.log)) << row.log;
    EXPECT_EQ(LogCapture::countContaining("switch to velmora config file : "), 1);
}

INSTANTIATE_TEST_SUITE_P(
    Rows, CloudFallbackTest,
    ::testing::Values(
        FallbackRow{"NoProperty", "", nullptr, "get property ro.build.version.incremental failed!"},
        FallbackRow{"NoCloudFile", "no-such-build", nullptr,
                    "get cloud velmora_config_cust.xml failed!,ret:2"},
        FallbackRow{"NoPolicyElement", "b1", "<config><cmd id=\"4500\"/></config>",
                    "get cloud velmora_config_cust.xml failed!,ret:3"},
        FallbackRow{"EmptyPolicy", "b1", "<policy></policy>",
                    "get cloud velmora_config_cust.xml failed!,ret:3"},
        // The cloud path does not fit its buffer.
        FallbackRow{"OverlongBuildName", std::string(120, 'v'), nullptr, "get file path failed!"}),
    [](const ::testing::TestParamInfo<FallbackRow>& info) { return info.param.name; });

TEST_F(VelmoraLoadXmlTest, CloudCopyWithoutValidCommandsHidesCustomisationCopy) {
    writeCustConfig(policyXml(kCustCommands));
    writeCloudConfig("b2", policyXml("<cmd name=\"x\"/><cmd id=\"abc\"/>"));
    EXPECT_FALSE(load());
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "empty rawXmlDataMap!!"));
    EXPECT_EQ(mLoader.conversions, 0);
    EXPECT_EQ(LogCapture::countContaining("switch to velmora config file"), 0);
}

TEST_F(VelmoraLoadXmlTest, BrokenCustomisationCopyFails) {
    writeCustConfig("<policy><cmd id=\"1\"></policy>");
    EXPECT_FALSE(load());
    EXPECT_EQ(LogCapture::countContaining("LoadFile error, path:" + mTmpDir), 1);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "get velmora_config_cust.xml failed!,ret:2"));
    EXPECT_EQ(mLoader.conversions, 0);
}

TEST_F(VelmoraLoadXmlTest, RecordsFollowTheDocument) {
    writeCustConfig(policyXml(
        "<cmd id=\"4116\" name=\"probe\"><act type=\"1\"><k1>8</k1><k2>100</k2></act></cmd>"
        "<anything id=\"4400\"><a/></anything>"));
    ASSERT_TRUE(load());
    const auto& probe = mLoader.chains.at(4116);
    ASSERT_EQ(probe.size(), 2u);
    EXPECT_EQ(probe[0].type, 0);
    EXPECT_EQ(probe[0].name, "probe");
    EXPECT_TRUE(probe[0].names.empty());
    EXPECT_EQ(probe[1].cmdId, 4116);
    EXPECT_EQ(probe[1].type, 1);
    EXPECT_EQ(probe[1].name, "probe");
    EXPECT_EQ(probe[1].names, (std::vector<std::string>{"k1", "k2"}));
    EXPECT_EQ(probe[1].values, (std::vector<std::string>{"8", "100"}));

    // No name: "unknown" everywhere; an action without parameters is an empty record.
    const auto& bare = mLoader.chains.at(4400);
    ASSERT_EQ(bare.size(), 2u);
    EXPECT_EQ(bare[0].name, "unknown");
    EXPECT_EQ(bare[1].name, "unknown");
    EXPECT_TRUE(bare[1].names.empty());
    EXPECT_TRUE(bare[1].values.empty());
}

TEST_F(VelmoraLoadXmlTest, FirstDefinitionOfAnIdWins) {
    writeCustConfig(
        policyXml("<cmd id=\"4400\" name=\"first\"><act><bad></bad></act></cmd>"
                  "<cmd id=\"4400\" name=\"second\"><act><k>1</k></act></cmd>"));
    ASSERT_TRUE(load());
    const auto& chain = mLoader.chains.at(4400);
    ASSERT_EQ(chain.size(), 1u);  // the first had no usable action, and still wins
    EXPECT_EQ(chain[0].name, "first");
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR,
                                "multi-cmdId exist! we choose the first one, cmdId=4400"));
}

TEST_F(VelmoraLoadXmlTest, AtMostThreeActionsAndRejectedOnesCount) {
    writeCustConfig(policyXml(
        "<cmd id=\"4400\">"
        "<a><v>1</v></a><a><v>2</v><empty/></a><a><v>3</v></a><a><v>4</v></a><a><v>5</v></a>"
        "</cmd>"));
    ASSERT_TRUE(load());
    const auto& chain = mLoader.chains.at(4400);
    ASSERT_EQ(chain.size(), 3u);
    EXPECT_EQ(chain[1].values, std::vector<std::string>{"1"});
    EXPECT_EQ(chain[2].values, std::vector<std::string>{"3"});
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "xml name or value is NULL!"));
}

// Files that are not what a size check on the path would make of them: each is read through the
// descriptor its size was taken from, and refused with a line naming it.
struct UnusualFileRow {
    const char* name;
    // Makes the file at `path`; may start a thread that feeds it, joined after the load.
    std::function<std::thread(const std::string& path)> make;
    const char* log;
};

class UnusualConfigFileTest : public VelmoraLoadXmlTest,
                              public ::testing::WithParamInterface<UnusualFileRow> {};

TEST_P(UnusualConfigFileTest, IsRefusedWithALineNamingIt) {
    const UnusualFileRow& row = GetParam();
    const std::string path = mTmpDir + "/unusual.xml";
    std::thread feeder = row.make(path);
    RawXmlDataMap rawMap;
    EXPECT_EQ(mLoader.innerLoad(path.c_str(), &rawMap), 2);
    if (feeder.joinable()) {
        feeder.join();
    }
    EXPECT_TRUE(rawMap.empty());
    EXPECT_EQ(LogCapture::countContaining(row.log), 1) << row.log;
    EXPECT_EQ(LogCapture::countContaining(path), 1);
}

constexpr size_t kOverLimit = 16u * 1024 * 1024 + 1;

// clang-format off
INSTANTIATE_TEST_SUITE_P(
    Rows, UnusualConfigFileTest,
    ::testing::Values(
        // Size 0 when it is looked at, then more than the limit: the read stops at the limit.
        UnusualFileRow{"GrowsPastTheLimitWhileRead",
                       [](const std::string& path) {
                           EXPECT_EQ(mkfifo(path.c_str(), 0600), 0);
                           return std::thread([path] {
                               signal(SIGPIPE, SIG_IGN);  // the loader stops reading early
                               const int fd = open(path.c_str(), O_WRONLY);
                               const std::string block(64 * 1024, ' ');
                               size_t sent = 0;
                               while (fd >= 0 && sent < kOverLimit + block.size()) {
                                   const ssize_t n = write(fd, block.data(), block.size());
                                   if (n <= 0) break;
                                   sent += static_cast<size_t>(n);
                               }
                               if (fd >= 0) close(fd);
                           });
                       },
                       "grew past 16777216 bytes while read"},
        UnusualFileRow{"Directory",
                       [](const std::string& path) {
                           EXPECT_EQ(mkdir(path.c_str(), 0700), 0);
                           return std::thread();
                       },
                       "LoadFile error, path:"},
        UnusualFileRow{"Missing", [](const std::string&) { return std::thread(); },
                       "LoadFile error, path:"}),
    [](const ::testing::TestParamInfo<UnusualFileRow>& info) { return info.param.name; });
// clang-format on

}  // namespace
}  // namespace fake
}  // namespace velmora
