// Fixture of the server tests that drive velmoraEvent and velmoraSetConfig: start-up on extra
// commands, the on/off words, the scene commands of the configuration, the platform's view of
// scene switches as apply/withdraw steps, and the server's scene state read under its mutex.
#pragma once

#include <map>
#include <ostream>
#include <set>
#include <string>
#include <vector>

#include "tests/fakes/ServerTest.h"

namespace velmora {
namespace fake {

inline constexpr int kOn = 0;
inline constexpr int kOff = -1;
inline constexpr int kProbe = 4116;
inline constexpr int kClientRestart = 20224;
inline constexpr int kNotification = 20225;
inline constexpr int kReload = 20230;

// One doAction call as the platform saw it.
struct Step {
    int cmdId;
    std::vector<int> payload;
    bool operator==(const Step& o) const { return cmdId == o.cmdId && payload == o.payload; }
};

inline std::ostream& operator<<(std::ostream& os, const Step& s) {
    os << (s.payload == std::vector<int>{kOn}    ? "apply "
           : s.payload == std::vector<int>{kOff} ? "withdraw "
                                                 : "payload? ")
       << s.cmdId;
    return os;
}

inline Step apply(int cmdId) {
    return {cmdId, {kOn}};
}
inline Step withdraw(int cmdId) {
    return {cmdId, {kOff}};
}
using Steps = std::vector<Step>;

inline std::string scene(int cmdId, const std::string& body = "", int duration = 0) {
    return "<cmd id=\"" + std::to_string(cmdId) + "\" name=\"scene_" + std::to_string(cmdId) +
           "\"><act><duration>" + std::to_string(duration) + "</duration>" + body + "</act></cmd>";
}

inline std::string govScene(int cmdId, int priority) {
    return scene(cmdId, "<s_priority>" + std::to_string(priority) + "</s_priority>");
}

// Built-in scenes 4118 (100), 4119 (200), 4120 (20), 4121 (70); governor scenes 4230 and 4240
// (50 each), 4250 (30) and 4260 (300, above 4119); 4130 is configured without a priority.
inline const std::string kSceneCommands =
    scene(4118, "<t1>1500</t1>") + scene(4119) + scene(4120) + scene(4121) + govScene(4230, 50) +
    govScene(4240, 50) + govScene(4250, 30) + govScene(4260, 300) + scene(4130, "<t1>1</t1>");

// Expected "--freqlist" block of one client: `freq` maps tags to values, the others are -1.
inline std::string freqBlock(const char* name, const std::map<int, int>& freq) {
    auto line = [&](const char* label, int tag) {
        const auto it = freq.find(tag);
        return std::string(label) + std::to_string(it == freq.end() ? -1 : it->second) + "\n";
    };
    return std::string(name) + " set freq is:\n" + line("tag=little cpu max,        value=", 2) +
           line("tag=big cpu max,           value=", 5) +
           line("tag=gpu max,               value=", 8) +
           line("tag=ipa switch temp,       value=", 17) +
           line("tag=ipa control temp,      value=", 18) +
           line("tag=ipa sustainable power, value=", 19) +
           line("tag=fork on big cluster,   value=", 20);
}

struct SceneState {
    int cur;
    std::set<int32_t> on;
    std::map<int32_t, int32_t> prio;
};

inline SceneState snapshot(VelmoraServer* s) {
    android::Mutex::Autolock lock(s->mMutex);
    return {s->mCurSpecialCmdId, s->mOnEventSet, s->mPriorityMap};
}

class ServerSceneTest : public ServerTest {
protected:
    void start(const std::string& extra = kSceneCommands) {
        ASSERT_EQ(startServer(extra), 0);
        executor().clear();
        LogCapture::clear();
    }
    int on(int cmdId) { return mServer->velmoraEvent(cmdId, "", 1, &kOn); }
    int off(int cmdId) { return mServer->velmoraEvent(cmdId, "", 1, &kOff); }
    int restart() { return mServer->velmoraEvent(kClientRestart, "", 0, nullptr); }
    int reload() { return mServer->velmoraEvent(kReload, "", 0, nullptr); }
    int setConfig(int clientId, const std::vector<int>& tags, const std::vector<int>& configs) {
        return mServer->velmoraSetConfig(clientId, static_cast<int>(tags.size()), tags.data(),
                                         configs.data());
    }
    std::vector<ExecutorCall> actions() { return executor().calls(Op::DoAction); }
    // Replaces the configuration with the start-up commands and `extra`, then reloads it.
    int reload(const std::string& extra) {
        writeCustConfig(policyXml(std::string(kStartupCommands) + extra));
        return reload();
    }
    // The doAction calls recorded since the last call, then forgets them.
    Steps steps() {
        Steps out;
        for (const ExecutorCall& c : executor().calls(Op::DoAction)) {
            out.push_back({c.id, c.payload});
        }
        executor().clear();
        return out;
    }
    SceneState state() { return snapshot(mServer.get()); }
};

}  // namespace fake
}  // namespace velmora
