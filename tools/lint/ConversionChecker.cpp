#include "tools/lint/ConversionChecker.h"

#include "host/vocabulary/ParamVocabulary.h"
#include "tools/common/Spelling.h"

namespace velmora {

namespace {

constexpr const char* kDuration = "duration";

}  // namespace

CheckedRecord ConversionChecker::check(int cmdId, const LocatedAction& action,
                                       const Action& converted) {
    CheckedRecord record;
    record.action = &converted;
    record.located = &action;
    const std::string id = std::to_string(cmdId);
    const bool stringPairs = ParamVocabulary::usesStringPairs(cmdId);
    int duration = 0;  // the conversion's default when no usable <duration> is given
    for (const LocatedParam& param : action.params) {
        int value = 0;
        if (param.name == kDuration) {
            if (ParamVocabulary::parseInt(param.text, &value)) {
                duration = value;
                record.durationParam = &param;
            } else {
                mDiagnostics.warning(param.line, "duration '" + param.text + "' of command " + id +
                                                     " is not an integer: ignored, the duration "
                                                     "stays " +
                                                     std::to_string(duration));
            }
            continue;
        }
        if (static_cast<int>(record.pairParams.size()) >= ParamVocabulary::kMaxPairs) {
            // The conversion stops here: later durations are not read either.
            mDiagnostics.warning(param.line, "command " + id + " has more than " +
                                                 std::to_string(ParamVocabulary::kMaxPairs) +
                                                 " parameters: <" + param.name +
                                                 "> and every later one are left out");
            break;
        }
        const bool known = ParamVocabulary::tagForName(param.name) >= 0 ||
                           (stringPairs && !ParamVocabulary::textNodeForName(param.name).empty());
        if (!known) {
            const std::string guess =
                Spelling::closest(param.name, ParamVocabulary::names(stringPairs));
            mDiagnostics.warning(param.line,
                                 "unknown parameter <" + param.name + "> in command " + id +
                                     ": the host conversion leaves it out" +
                                     (guess.empty() ? "" : "; did you mean <" + guess + ">?"));
            continue;
        }
        if (!stringPairs && !ParamVocabulary::parseInt(param.text, &value)) {
            mDiagnostics.warning(param.line, "<" + param.name + "> value '" + param.text +
                                                 "' of command " + id +
                                                 " is not an integer: left out");
            continue;
        }
        record.pairParams.push_back(&param);
    }
    if (converted.mParamNum != static_cast<int>(record.pairParams.size()) ||
        converted.mDuration != duration) {
        mDiagnostics.error(action.line,
                           "the checker and the host conversion disagree about this action of "
                           "command " +
                               id + ": expected " + std::to_string(record.pairParams.size()) +
                               " pairs and duration " + std::to_string(duration) + ", got " +
                               std::to_string(converted.mParamNum) + " and " +
                               std::to_string(converted.mDuration) + " (please report this)");
        record.pairParams.resize(
            std::min(record.pairParams.size(), static_cast<size_t>(converted.mParamNum)));
    }
    return record;
}

}  // namespace velmora
