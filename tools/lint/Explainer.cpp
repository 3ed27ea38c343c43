#include "tools/lint/Explainer.h"

#include "host/vocabulary/ParamVocabulary.h"
#include "tools/lint/CommandClass.h"
#include "tools/lint/CommandRules.h"

namespace velmora {

namespace {

constexpr const char* kIndent = "    ";
// On/off pairs with this tag bypass the frequency manager.
constexpr int kPlatformOnlyTag = 10;

bool hasPlatformTag(const CheckedRecord& record) {
    const Action& action = *record.action;
    for (int i = 0; i < action.mParamNum; ++i) {
        if (action.mTagValues[2 * i] == kPlatformOnlyTag) {
            return true;
        }
    }
    return false;
}

}  // namespace

void Explainer::explain(const std::vector<CheckedCommand>& commands) {
    for (const auto& command : commands) {
        explainOne(command);
    }
}

void Explainer::explainOne(const CheckedCommand& command) {
    const CheckedRecord* record = command.dispatched();
    const int duration = record != nullptr ? record->action->mDuration : -1;
    const DispatchClass dispatchClass =
        CommandClass::classify(command.id, record != nullptr, duration);
    mOut << command.id << ' ' << command.located->name << " (line " << command.line()
         << "): " << CommandClass::name(dispatchClass);
    if (dispatchClass == DispatchClass::kSpecialScene ||
        dispatchClass == DispatchClass::kGovernorScene) {
        const int priority = CommandRules::effectivePriority(command);
        mOut << ", priority ";
        if (priority > 0) {
            mOut << priority;
        } else {
            mOut << "none";
        }
    }
    if (record != nullptr) {
        const int pairs = record->action->mParamNum;
        mOut << ", duration " << duration << ", " << pairs << (pairs == 1 ? " pair" : " pairs");
    }
    mOut << '\n';
    if (record != nullptr && record->action->mParamNum > 0) {
        printPairs(command.id, *record);
    }
    if (command.records.size() > 1) {
        mOut << kIndent << "+ " << command.records.size() - 1
             << " further action(s) passed along with it, never dispatched on their own\n";
    }
    mOut << kIndent << "-> " << CommandClass::effect(dispatchClass, command.id, duration);
    if ((dispatchClass == DispatchClass::kSpecialScene ||
         dispatchClass == DispatchClass::kGovernorScene) &&
        CommandRules::effectivePriority(command) == 0) {
        mOut << " (this one never: no valid priority)";
    }
    if (dispatchClass == DispatchClass::kOnOff && duration == 0 && hasPlatformTag(*record)) {
        mOut << "; tag 10 goes to the platform's own action";
    }
    mOut << '\n';
}

void Explainer::printPairs(int cmdId, const CheckedRecord& record) {
    const Action& action = *record.action;
    const bool stringPairs = ParamVocabulary::usesStringPairs(cmdId);
    mOut << kIndent;
    for (int i = 0; i < action.mParamNum; ++i) {
        if (i > 0) {
            mOut << ' ';
        }
        if (stringPairs) {
            mOut << action.mParams[2 * i] << "=\"" << action.mParams[2 * i + 1] << '"';
            continue;
        }
        const size_t at = static_cast<size_t>(i);
        if (at < record.pairParams.size()) {
            mOut << record.pairParams[at]->name;
        }
        mOut << '(' << action.mTagValues[2 * i] << ")=" << action.mTagValues[2 * i + 1];
    }
    mOut << '\n';
}

}  // namespace velmora
