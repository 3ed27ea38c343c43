// Fixture for tests that run the library on the test platform: a fresh FakeEnv, log capture,
// a scratch directory for configuration files and helpers to start a server on a configuration.
#pragma once

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "server/VelmoraServer.h"
#include "tests/fakes/FakeEnv.h"
#include "tests/fakes/LogCapture.h"

namespace velmora {
namespace fake {

// Start-up defaults in EAS mode (all eight groups at 0) and a probe command: the least a
// configuration needs for init to return 0.
extern const char* const kStartupCommands;

// Wraps `commands` in a policy element.
std::string policyXml(const std::string& commands);

class ServerTest : public ::testing::Test {
protected:
    void SetUp() override;
    void TearDown() override;

    // Writes `xml` as the customisation copy and points get_one_cfg_file at it.
    void writeCustConfig(const std::string& xml);
    // Writes `xml` as the cloud copy for build `incremental` and sets the property.
    void writeCloudConfig(const std::string& incremental, const std::string& xml);
    // Writes policyXml(kStartupCommands + extra) as the customisation copy, constructs a
    // server and runs init. Returns init's status.
    int startServer(const std::string& extraCommands = "");

    // What the server writes to a descriptor for one dump option, or for any argument list.
    std::string dump(const std::string& option) { return dumpArgs({option}); }
    std::string dumpArgs(const std::vector<std::string>& args);

    FakeEnv& env() { return FakeEnv::get(); }
    FakeExecutor& executor() { return FakeEnv::get().executor; }

    std::string mTmpDir;
    std::string mCloudPath;
    std::unique_ptr<VelmoraServer> mServer;
};

}  // namespace fake
}  // namespace velmora
