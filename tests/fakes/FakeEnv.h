// The test platform layer: defines every symbol the library imports (getPlat,
// createVelmoraLoadXml, the policy server, property_get, get_one_cfg_file, the device event
// log) and lets a test script them. One process-wide instance; tests reset it in SetUp.
#pragma once

#include <map>
#include <mutex>
#include <string>
#include <vector>

#include "platform/VelmoraPlat.h"
#include "tests/fakes/FakeExecutor.h"

namespace velmora {
namespace fake {

class FakePlatform : public VelmoraPlat {
public:
    int initialize() override;
    ~FakePlatform() override;
};

class FakeEnv {
public:
    static FakeEnv& get();
    void reset();

    // Script.
    bool failGetPlat = false;
    bool failLoader = false;
    int initializeResult = 0;
    std::string incremental;      // value of ro.build.version.incremental; empty: missing
    std::string custConfigPath;   // answer of get_one_cfg_file; empty: no file

    void setPolicy(const std::string& name, int duration);
    int policy(const char* name);
    int policyQueries() const;

    // Observations.
    FakeExecutor executor;  // every new platform's mExecutorPtr; outlives the platforms
    FakePlatform* lastPlat = nullptr;
    int platformsDeleted = 0;
    int initializeCalls = 0;

    void addJankLine(const std::string& line);
    std::vector<std::string> jankLines() const;

private:
    mutable std::mutex mLock;  // guards the policy table and the event-log lines
    std::map<std::string, int> mPolicies;
    int mPolicyQueries = 0;
    std::vector<std::string> mJankLines;
};

}  // namespace fake
}  // namespace velmora
