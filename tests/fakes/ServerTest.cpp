#include "tests/fakes/ServerTest.h"

#include <stdlib.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>

namespace velmora {
namespace fake {

const char* const kStartupCommands =
    "<cmd id=\"5376\" name=\"default_sched\"><act><duration>0</duration>"
    "<t51>0</t51><t52>0</t52><t53>0</t53><t54>0</t54>"
    "<t55>0</t55><t56>0</t56><t57>0</t57><t58>0</t58></act></cmd>"
    "<cmd id=\"4116\" name=\"probe\"><act><duration>8</duration><t1>1000</t1></act></cmd>";

std::string policyXml(const std::string& commands) {
    return "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n<policy>" + commands + "</policy>\n";
}

void ServerTest::SetUp() {
    FakeEnv::get().reset();
    LogCapture::start();
    char tmpl[] = "/tmp/velmora-test-XXXXXX";
    ASSERT_NE(mkdtemp(tmpl), nullptr);
    mTmpDir = tmpl;
}

void ServerTest::TearDown() {
    mServer.reset();
    if (!mCloudPath.empty()) {
        unlink(mCloudPath.c_str());
    }
    std::error_code ignored;  // a scratch directory SetUp could not make
    std::filesystem::remove_all(mTmpDir, ignored);
    FakeEnv::get().reset();
}

void ServerTest::writeCustConfig(const std::string& xml) {
    const std::string path = mTmpDir + "/velmora_config_cust.xml";
    std::ofstream(path, std::ios::trunc) << xml;
    env().custConfigPath = path;
}

void ServerTest::writeCloudConfig(const std::string& incremental, const std::string& xml) {
    std::filesystem::create_directories(VELMORA_CLOUD_CONFIG_DIR);
    mCloudPath = std::string(VELMORA_CLOUD_CONFIG_DIR) + "/cloud_cust_velmora_config_" +
                 incremental + ".xml";
    std::ofstream(mCloudPath, std::ios::trunc) << xml;
    env().incremental = incremental;
}

std::string ServerTest::dumpArgs(const std::vector<std::string>& args) {
    int fds[2];
    if (pipe(fds) != 0) {
        ADD_FAILURE() << "pipe failed";
        return "";
    }
    mServer->dumpVelmoraServerInfo(fds[1], args);
    close(fds[1]);
    std::string text;
    char buf[4096];
    ssize_t n;
    while ((n = read(fds[0], buf, sizeof(buf))) > 0) {
        text.append(buf, static_cast<size_t>(n));
    }
    close(fds[0]);
    return text;
}

int ServerTest::startServer(const std::string& extraCommands) {
    writeCustConfig(policyXml(std::string(kStartupCommands) + extraCommands));
    mServer = std::make_unique<VelmoraServer>();
    return mServer->init();
}

}  // namespace fake
}  // namespace velmora
