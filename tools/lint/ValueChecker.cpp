#include "tools/lint/ValueChecker.h"

#include <map>

#include "config/Tags.h"
#include "host/vocabulary/ParamVocabulary.h"
#include "tools/common/Spelling.h"
#include "host/device/profile/KernelRules.h"
#include "tools/lint/CommandClass.h"

namespace velmora {

namespace {

// A figure this many times off the node's range is most likely in the wrong unit (kHz for Hz).
constexpr long long kUnitFactor = 1000;

std::string pairName(const CheckedRecord& record, int i) {
    return "<" + record.pairParams[i]->name + ">";
}

// The node an integer pair writes, "" for none (priorities, tags without a node).
std::string nodeOfTag(const NodeMap& nodes, int tag) {
    return tag == kTagScenePriority ? std::string() : nodes.keyForTag(tag);
}

// Floor and cap tags of one frequency domain, and what the domain is called in messages.
struct Domain {
    int floorTag;
    int capTag;
};
const Domain kDomains[] = {
    {VELMORA_TAG_LITTLE_CPU_MIN_FREQ, VELMORA_TAG_LITTLE_CPU_MAX_FREQ},
    {VELMORA_TAG_BIG_CPU_MIN_FREQ, VELMORA_TAG_BIG_CPU_MAX_FREQ},
    {VELMORA_TAG_GPU_MIN_FREQ, VELMORA_TAG_GPU_MAX_FREQ},
};

}  // namespace

void ValueChecker::check(const std::vector<CheckedCommand>& commands) {
    for (const auto& command : commands) {
        const CheckedRecord* record = command.dispatched();
        if (record == nullptr || command.id == kCmdMemLatencyRatio ||
            (command.id >= kCmdClientRestart && command.id != kCmdMemLatency)) {
            continue;  // no action, or events never read it
        }
        checkRecord(command, *record);
    }
    checkFloorsAgainstCaps(commands);
}

void ValueChecker::checkRecord(const CheckedCommand& command, const CheckedRecord& record) {
    const Action& action = *record.action;
    for (int i = 0; i < action.mParamNum; ++i) {
        if (static_cast<size_t>(i) >= record.pairParams.size()) {
            break;
        }
        if (static_cast<size_t>(2 * i + 1) < action.mTagValues.size()) {
            const int tag = action.mTagValues[2 * i];
            const int value = action.mTagValues[2 * i + 1];
            const std::string key = nodeOfTag(mNodes, tag);
            const NodeSpec* spec = key.empty() ? nullptr : mNodes.find(key);
            // 0 (and below) withdraws a floor or cap: nothing is written.
            if (spec != nullptr &&
                !((spec->kind == NodeKind::Floor || spec->kind == NodeKind::Cap) && value <= 0)) {
                checkValue(command, record, i, key, std::to_string(value));
            }
        } else if (static_cast<size_t>(2 * i + 1) < action.mParams.size()) {
            const std::string& name = action.mParams[2 * i];
            const std::string& text = action.mParams[2 * i + 1];
            std::string key = ParamVocabulary::textNodeForName(name);
            int value = 0;
            if (key.empty() && ParamVocabulary::parseInt(text, &value)) {
                key = nodeOfTag(mNodes, ParamVocabulary::tagForName(name));
            }
            if (!key.empty() && mNodes.find(key) != nullptr) {
                checkValue(command, record, i, key, text);
            }
        }
    }
}

void ValueChecker::checkValue(const CheckedCommand& command, const CheckedRecord& record, int i,
                              const std::string& key, const std::string& text) {
    const NodeSpec& spec = *mNodes.find(key);
    const ValueRule& rule = spec.rule;
    const KernelRules::Outcome outcome = KernelRules::take(spec, text);
    const int line = record.pairParams[i]->line;
    const std::string what =
        pairName(record, i) + " '" + text + "' of command " + std::to_string(command.id);
    if (outcome.verdict == KernelRules::Verdict::kRounded) {
        mDiagnostics.note(line, what + " lies between available frequencies of " + key +
                                    ": the kernel uses " + outcome.effective);
        return;
    }
    if (outcome.verdict != KernelRules::Verdict::kRefused) {
        return;
    }
    mDiagnostics.error(
        line, what + ": " + outcome.reason + " of " + key + ", the device refuses the write");
    if (rule.type == ValueRule::Type::kChoices) {
        const std::string guess = Spelling::closest(text, rule.choices);
        std::string offered;
        for (const auto& choice : rule.choices) {
            offered += (offered.empty() ? "" : ", ") + choice;
        }
        mDiagnostics.attachNote(line, (guess.empty() ? "" : "did you mean '" + guess + "'? ") +
                                          "the device offers " + offered);
        return;
    }
    int value = 0;
    if (rule.type != ValueRule::Type::kSteps || !ParamVocabulary::parseInt(text, &value)) {
        return;
    }
    // kHz written to a devfreq node (Hz), or Hz to a cpufreq node (kHz).
    const long long scaledUp = static_cast<long long>(value) * kUnitFactor;
    const long long scaledDown = value / kUnitFactor;
    if (scaledUp >= rule.min && scaledUp <= rule.max) {
        mDiagnostics.attachNote(line, text + " is about 1000 times below the node's range: a " +
                                          (rule.unit == "Hz" ? "kHz" : "smaller-unit") +
                                          " figure? " + key + " takes " + rule.unit);
    } else if (scaledDown >= rule.min && scaledDown <= rule.max) {
        mDiagnostics.attachNote(line, text + " is about 1000 times above the node's range: " +
                                          (rule.unit == "kHz" ? "an Hz" : "a larger-unit") +
                                          " figure? " + key + " takes " + rule.unit);
    }
}

bool ValueChecker::canBeOnTogether(int a, int b) {
    if (!CommandClass::isScene(a) || !CommandClass::isScene(b)) {
        return true;
    }
    // One scene is applied at a time, except a governor scene under the game scene.
    const bool aGov = a >= kGovSceneFirst;
    const bool bGov = b >= kGovSceneFirst;
    return (a == kGovHostScene && bGov) || (b == kGovHostScene && aGov);
}

void ValueChecker::checkFloorsAgainstCaps(const std::vector<CheckedCommand>& commands) {
    // Only limits that stay on until switched off: scenes and on/off commands. Short boosts
    // under a cap are the usual design (the cap wins), not a mistake.
    std::map<int, std::vector<Limit>> byTag;
    for (const auto& command : commands) {
        const CheckedRecord* record = command.dispatched();
        if (record == nullptr || record->action->mDuration < 0 ||
            !(CommandClass::isScene(command.id) || CommandClass::isOnOff(command.id))) {
            continue;
        }
        const Action& action = *record->action;
        for (int i = 0; i < action.mParamNum; ++i) {
            int tag = -1;
            int value = 0;
            if (static_cast<size_t>(2 * i + 1) < action.mTagValues.size()) {
                tag = action.mTagValues[2 * i];
                value = action.mTagValues[2 * i + 1];
            } else if (static_cast<size_t>(2 * i + 1) < action.mParams.size() &&
                       ParamVocabulary::parseInt(action.mParams[2 * i + 1], &value)) {
                tag = ParamVocabulary::tagForName(action.mParams[2 * i]);
            }
            if ((isFreqFloorTag(tag) || isFreqCapTag(tag)) && value > 0 &&
                static_cast<size_t>(i) < record->pairParams.size()) {
                byTag[tag].push_back({&command, i, value});
            }
        }
    }
    for (const auto& domain : kDomains) {
        for (const Limit& floor : byTag[domain.floorTag]) {
            for (const Limit& cap : byTag[domain.capTag]) {
                if (floor.command == cap.command || floor.value <= cap.value ||
                    !canBeOnTogether(floor.command->id, cap.command->id)) {
                    continue;
                }
                const CheckedRecord& f = *floor.command->dispatched();
                const CheckedRecord& c = *cap.command->dispatched();
                mDiagnostics.warning(f.pairParams[floor.pair]->line,
                                     "floor " + pairName(f, floor.pair) + " " +
                                         std::to_string(floor.value) + " of command " +
                                         std::to_string(floor.command->id) + " is above the cap " +
                                         pairName(c, cap.pair) + " " + std::to_string(cap.value) +
                                         " of command " + std::to_string(cap.command->id) +
                                         " (line " + std::to_string(c.pairParams[cap.pair]->line) +
                                         "), and both can be on at once: the cap wins");
            }
        }
    }
}

}  // namespace velmora
