#include "tools/lint/CommandRules.h"

#include <cstdlib>
#include <map>

#include "config/Tags.h"
#include "tools/lint/CommandClass.h"

namespace velmora {

namespace {

constexpr int kHmpGroupTag = VELMORA_TAG_GROUP_HMP;
constexpr int kFirstEasGroupTag = VELMORA_TAG_GROUP_BOOST;
constexpr int kLastGroupTag = VELMORA_TAG_GROUP_BACKGROUND;
constexpr int kMaxGroupPairs = kEasGroupCount;
constexpr int kPriorityTag = kTagScenePriority;
constexpr const char* kPriorityKey = kScenePriorityKey;
// The probe worker caps the start-up probe action's duration; a reloaded one keeps its own.
constexpr int kMaxProbeDurationMs = kProbeDurationCapMs;

const char* const kEasGroupNames[kEasGroupCount] = {
    "group_boost",          "group_vip",        "group_top_app",
    "group_root",           "group_foreground", "group_system_background",
    "group_key_background", "group_background",
};

std::string str(int value) {
    return std::to_string(value);
}

int durationLine(const CheckedRecord& record) {
    return record.durationParam != nullptr ? record.durationParam->line : record.located->line;
}

int pairLine(const CheckedRecord& record, int i) {
    return record.pairParams[i]->line;
}

std::string pairName(const CheckedRecord& record, int i) {
    return "<" + record.pairParams[i]->name + ">";
}

bool isOnOffTag(int tag) {
    return isFreqFloorTag(tag) || isFreqCapTag(tag) || tag == kTagDdrMinFreq;
}

}  // namespace

int CommandRules::configuredPriority(int cmdId, const Action& action, bool* given, int* index) {
    *given = false;
    int priority = 0;
    const bool governor = cmdId >= kGovSceneFirst;
    for (int i = 0; i < action.mParamNum; ++i) {
        if (governor && static_cast<size_t>(2 * i + 1) < action.mParams.size() &&
            action.mParams[2 * i] == kPriorityKey) {
            priority = atoi(action.mParams[2 * i + 1].c_str());
            *given = true;
            if (index != nullptr) {
                *index = i;
            }
        } else if (!governor && static_cast<size_t>(2 * i + 1) < action.mTagValues.size() &&
                   action.mTagValues[2 * i] == kPriorityTag) {
            priority = action.mTagValues[2 * i + 1];
            *given = true;
            if (index != nullptr) {
                *index = i;
            }
        }
    }
    return priority;
}

int CommandRules::effectivePriority(const CheckedCommand& command) {
    const CheckedRecord* record = command.dispatched();
    bool given = false;
    if (record != nullptr && command.id <= kScenePriorityReadLast) {
        const int priority = configuredPriority(command.id, *record->action, &given);
        if (given && isValidPriority(priority)) {
            return priority;
        }
    }
    return CommandClass::builtInPriority(command.id);
}

void CommandRules::check(const std::vector<CheckedCommand>& commands) {
    const CheckedCommand* startup = nullptr;
    const CheckedCommand* probe = nullptr;
    for (const auto& command : commands) {
        if (command.id == kCmdDefaultSchedLevel) {
            startup = &command;
        } else if (command.id == kCmdProbe) {
            probe = &command;
        }
        checkCommand(command);
    }
    checkStartup(startup);
    checkProbe(probe);
    checkGovernorScenesUnderHost(commands);
}

void CommandRules::checkGovernorScenesUnderHost(const std::vector<CheckedCommand>& commands) {
    const CheckedCommand* host = nullptr;
    for (const auto& command : commands) {
        if (command.id == kGovHostScene && command.dispatched() != nullptr &&
            command.dispatched()->action->mDuration >= 0) {
            host = &command;
        }
    }
    if (host == nullptr) {
        return;  // scene 4119 can never be current
    }
    const int hostPriority = effectivePriority(*host);
    for (const auto& command : commands) {
        const CheckedRecord* record = command.dispatched();
        if (command.id < kGovSceneFirst || command.id > kScenePriorityReadLast ||
            record == nullptr || record->action->mDuration < 0) {
            continue;
        }
        const int priority = effectivePriority(command);
        if (!isValidPriority(priority) || priority > hostPriority) {
            continue;  // refused, or it takes over from 4119 and is withdrawn like any scene
        }
        // A note, not a warning: it is how governor scenes under the game scene work, and only
        // a surprise when the host switches one off before the game scene.
        mDiagnostics.note(command.line(),
                          "governor scene " + str(command.id) + " (priority " + str(priority) +
                              ") is applied under scene 4119 (priority " + str(hostPriority) +
                              "): switched off while 4119 stays current, it is not withdrawn and "
                              "its settings stay");
        mDiagnostics.explain(
            "while scene 4119 is current, a governor scene that does not outrank it is applied "
            "on its own; when it is switched off while 4119 stays current, the server re-applies "
            "the remaining governor scene with the highest priority but never withdraws the one "
            "switched off, so its settings stay until another request overwrites them.");
    }
}

void CommandRules::checkStartup(const CheckedCommand* command) {
    if (command == nullptr) {
        mDiagnostics.error(mPolicyLine,
                           "no start-up command 5376: the server's init fails (status 2) and the "
                           "server never runs");
        return;
    }
    const CheckedRecord* record = command->dispatched();
    if (record == nullptr) {
        mDiagnostics.error(command->line(),
                           "start-up command 5376 has no usable action: init installs no default "
                           "group levels");
        return;
    }
    const int duration = record->action->mDuration;
    if (duration != 0) {
        mDiagnostics.error(durationLine(*record),
                           "start-up command 5376 needs duration 0, not " + str(duration) +
                               (duration < 0 ? ": it is disabled" : ": it runs as a timed action") +
                               " and init installs no default group levels");
        return;
    }
    const Action& action = *record->action;
    const int pairs = action.mParamNum;
    for (int i = 0; i < pairs; ++i) {
        const int tag = action.mTagValues[2 * i];
        if (!isGroupTag(tag)) {
            return;  // reported by checkSchedLevels, with the same consequence for init
        }
    }
    if (pairs == 1 && action.mTagValues[0] != kHmpGroupTag) {
        mDiagnostics.error(pairLine(*record, 0),
                           "start-up command 5376 with a single pair needs <group_hmp>, not " +
                               pairName(*record, 0) + ": the server's init fails");
        return;
    }
    if (pairs != 1 && pairs != kEasGroupCount) {
        mDiagnostics.error(durationLine(*record),
                           "start-up command 5376 has " + str(pairs) +
                               " group pairs: it needs one (<group_hmp>) or eight (the EAS groups "
                               "<group_boost>..<group_background>); the server's init fails");
        return;
    }
    std::map<int, int> seen;
    for (int i = 0; i < pairs; ++i) {
        const int tag = action.mTagValues[2 * i];
        if (pairs == kEasGroupCount && tag == kHmpGroupTag) {
            mDiagnostics.error(pairLine(*record, i),
                               "start-up command 5376 with eight pairs takes only EAS groups: " +
                                   pairName(*record, i) + " makes the server's init fail");
            return;
        }
        if (seen.count(tag) != 0) {
            mDiagnostics.warning(pairLine(*record, i), "start-up command 5376 sets " +
                                                           pairName(*record, i) +
                                                           " twice: the later level wins");
        }
        seen[tag] = i;
    }
    if (pairs == kEasGroupCount) {
        for (int tag = kFirstEasGroupTag; tag <= kLastGroupTag; ++tag) {
            if (seen.count(tag) == 0) {
                mDiagnostics.warning(command->line(),
                                     "start-up command 5376 gives no level for <" +
                                         std::string(kEasGroupNames[tag - kFirstEasGroupTag]) +
                                         ">: that group keeps level 0");
            }
        }
    }
}

void CommandRules::checkProbe(const CheckedCommand* command) {
    if (command == nullptr) {
        mDiagnostics.error(mPolicyLine,
                           "no probe command 4116: the server's init stops early (status 4), "
                           "probe events fail and configured scene priorities are never read");
        mDiagnostics.explain(
            "init parses the probe command right after the start-up event and returns 4 when it "
            "is missing, before it reads the configured scene priorities: until a reload only "
            "the built-in priorities of scenes 4118..4121 apply, every other scene is refused.");
        return;
    }
    const CheckedRecord* record = command->dispatched();
    if (record == nullptr) {
        mDiagnostics.warning(command->line(),
                             "probe command 4116 has no usable action: probed threads get nothing");
        return;
    }
    if (command->records.size() > 1) {
        mDiagnostics.warning(command->records[1].located->line,
                             "probe command 4116 has " + str(command->records.size()) +
                                 " actions: only the first is used");
    }
    const int duration = record->action->mDuration;
    if (duration > kMaxProbeDurationMs) {
        mDiagnostics.warning(durationLine(*record),
                             "probe duration " + str(duration) + " ms is capped to " +
                                 str(kMaxProbeDurationMs) +
                                 " at start-up but used as configured after a reload");
        mDiagnostics.explain(
            "the probe worker clamps the duration of the probe action it is built with to " +
            str(kMaxProbeDurationMs) +
            " ms; a reload hands it the newly parsed action unchanged, so the same configuration "
            "boosts probed threads longer after a reload than after start-up.");
    }
}

void CommandRules::checkCommand(const CheckedCommand& command) {
    const CheckedRecord* record = command.dispatched();
    const int duration = record != nullptr ? record->action->mDuration : -1;
    const DispatchClass dispatchClass =
        CommandClass::classify(command.id, record != nullptr, duration);
    const std::string id = str(command.id);
    switch (dispatchClass) {
        case DispatchClass::kNeverRead:
            mDiagnostics.warning(command.line(),
                                 "command " + id + " is never read: " +
                                     CommandClass::effect(dispatchClass, command.id, duration));
            break;
        case DispatchClass::kNoAction:
            if (command.id != kCmdDefaultSchedLevel) {
                mDiagnostics.warning(command.line(), "command " + id +
                                                         " has no usable action: its events do "
                                                         "nothing");
            }
            break;
        case DispatchClass::kDisabled:
            if (command.id != kCmdDefaultSchedLevel) {
                mDiagnostics.note(durationLine(*record),
                                  "command " + id + " is disabled (duration " + str(duration) +
                                      "): its events do nothing");
            }
            break;
        case DispatchClass::kSpecialScene:
        case DispatchClass::kGovernorScene:
            checkScenePriority(command, *record);
            break;
        case DispatchClass::kOnOff:
            if (duration == 0) {
                checkOnOff(command, *record);
            }
            break;
        case DispatchClass::kStartupLevels:
        case DispatchClass::kSchedLevel:
            checkSchedLevels(command, *record);
            break;
        case DispatchClass::kMemoryLatency:
        case DispatchClass::kProbe:
        case DispatchClass::kTimedAction:
            break;
    }
}

void CommandRules::checkSchedLevels(const CheckedCommand& command, const CheckedRecord& record) {
    const Action& action = *record.action;
    const std::string id = str(command.id);
    const std::string consequence = command.id == kCmdDefaultSchedLevel
                                        ? "the server's init fails"
                                        : "every event fails (status 3)";
    if (action.mParamNum < 1 || action.mParamNum > kMaxGroupPairs) {
        if (command.id != kCmdDefaultSchedLevel) {
            mDiagnostics.error(durationLine(record),
                               "duration-0 command " + id + " has " + str(action.mParamNum) +
                                   " pairs: scheduling-level events take 1..8 group pairs; " +
                                   consequence);
        }
        return;
    }
    for (int i = 0; i < action.mParamNum; ++i) {
        const int tag = action.mTagValues[2 * i];
        if (!isGroupTag(tag)) {
            mDiagnostics.error(pairLine(record, i),
                               "duration-0 command " + id + " carries " + pairName(record, i) +
                                   " (tag " + str(tag) +
                                   "): scheduling-level events take only group tags 50..58; " +
                                   consequence);
        }
    }
}

void CommandRules::checkOnOff(const CheckedCommand& command, const CheckedRecord& record) {
    const Action& action = *record.action;
    const std::string id = str(command.id);
    if (action.mParamNum == 0) {
        mDiagnostics.warning(record.located->line,
                             "on/off command " + id + " has no pairs: switching it does nothing");
        return;
    }
    std::map<int, int> lastOfTag;  // tag -> pair index; a later pair replaces an earlier one
    for (int i = 0; i < action.mParamNum; ++i) {
        const int tag = action.mTagValues[2 * i];
        const int value = action.mTagValues[2 * i + 1];
        if (!isOnOffTag(tag)) {
            mDiagnostics.error(pairLine(record, i),
                               "on/off command " + id + " carries " + pairName(record, i) +
                                   " (tag " + str(tag) +
                                   "): on/off commands take only tags 1, 2, 4, 5, 7, 8 and 10; "
                                   "every switch fails (-1)");
        } else if (value < 1) {
            mDiagnostics.error(pairLine(record, i),
                               "on/off command " + id + ": " + pairName(record, i) + " value " +
                                   str(value) + " is below 1; every switch fails (-1)");
        }
        lastOfTag[tag] = i;
    }
    const int floorCap[][2] = {{VELMORA_TAG_LITTLE_CPU_MIN_FREQ, VELMORA_TAG_LITTLE_CPU_MAX_FREQ},
                               {VELMORA_TAG_BIG_CPU_MIN_FREQ, VELMORA_TAG_BIG_CPU_MAX_FREQ},
                               {VELMORA_TAG_GPU_MIN_FREQ, VELMORA_TAG_GPU_MAX_FREQ}};
    for (const auto& pair : floorCap) {
        auto floor = lastOfTag.find(pair[0]);
        auto cap = lastOfTag.find(pair[1]);
        if (floor == lastOfTag.end() || cap == lastOfTag.end()) {
            continue;
        }
        const int floorValue = action.mTagValues[2 * floor->second + 1];
        const int capValue = action.mTagValues[2 * cap->second + 1];
        if (floorValue >= 1 && capValue >= 1 && floorValue > capValue) {
            mDiagnostics.error(pairLine(record, floor->second),
                               "on/off command " + id + ": floor " +
                                   pairName(record, floor->second) + " " + str(floorValue) +
                                   " is above the cap " + pairName(record, cap->second) + " " +
                                   str(capValue) + "; switching it on fails (-1)");
        }
    }
}

void CommandRules::checkScenePriority(const CheckedCommand& command, const CheckedRecord& record) {
    const std::string id = str(command.id);
    const bool governor = command.id >= kGovSceneFirst;
    const std::string kind = governor ? "governor scene " : "special scene ";
    if (command.id > kScenePriorityReadLast) {
        mDiagnostics.error(command.line(),
                           kind + id +
                               " never gets a configured priority (the server reads them up to "
                               "4351 only): every switch is refused (-1)");
        mDiagnostics.explain(
            "the server reads configured scene priorities for ids 4118..4351; scene 4352 keeps "
            "priority 0, which is not a valid priority, so switching it on or off returns -1.");
        return;
    }
    bool given = false;
    int index = 0;
    const int priority = configuredPriority(command.id, *record.action, &given, &index);
    if (given && isValidPriority(priority)) {
        return;
    }
    const int builtIn = CommandClass::builtInPriority(command.id);
    const std::string source = governor ? "<priority>" : "priority (tag 101)";
    if (!given) {
        if (builtIn == 0) {
            mDiagnostics.error(record.located->line,
                               kind + id + " has no " + source + ": every switch is refused (-1)");
        }
        return;
    }
    // Governor priorities are text read with atoi: show what was written.
    const std::string written =
        governor ? "'" + record.action->mParams[2 * index + 1] + "' (" + str(priority) + ")"
                 : str(priority);
    const std::string what = kind + id + " priority " + written + " is outside 1..500";
    if (builtIn != 0) {
        mDiagnostics.warning(pairLine(record, index),
                             what + ": ignored, the built-in priority " + str(builtIn) + " stays");
    } else {
        mDiagnostics.error(pairLine(record, index), what + ": every switch is refused (-1)");
    }
}

}  // namespace velmora
