#include "tools/lint/LoadChecker.h"

#include <cstdlib>
#include <set>

#include "tools/lint/ConversionChecker.h"

namespace velmora {

namespace {

// The loader looks at this many action elements per command; later ones are never read.
constexpr size_t kActionsRead = 3;
// Ids 0..3 are the client ids (feature switch, KX, JN, ZOLA) that the platform's set-config call
// also receives in place of a command id.
constexpr int kLowestCommandId = 4;

std::string describe(const LocatedCommand& command) {
    return "<" + command.element + " name=\"" + command.name + "\">";
}

bool sameParams(const RawXmlData& record, const LocatedAction& action) {
    if (record.names.size() != action.params.size()) {
        return false;
    }
    for (size_t i = 0; i < action.params.size(); ++i) {
        const LocatedParam& param = action.params[i];
        if (!param.hasText || record.names[i] != param.name || record.values[i] != param.text) {
            return false;
        }
    }
    return true;
}

}  // namespace

void LoadChecker::disagree(int line, const std::string& what) {
    mDiagnostics.error(
        line, "the checker and the library's loader disagree: " + what + " (please report this)");
}

bool LoadChecker::check(std::vector<CheckedCommand>* commands) {
    if (!checkDocument()) {
        return false;
    }
    std::set<int> effective;
    for (const auto& command : mLocated.commands()) {
        checkCommandElement(command);
        if (command.idIsDecimal && mLocated.firstWithId(command.id) == &command) {
            effective.insert(command.id);
            commands->push_back(checkActions(command));
        }
    }
    for (const auto& entry : mLoader.rawMap()) {
        if (effective.count(entry.first) == 0) {
            disagree(mLocated.rootLine(), "the loader holds command " +
                                              std::to_string(entry.first) +
                                              " but no element defines it");
        }
    }
    if (mLoader.rawMap().empty()) {
        mDiagnostics.error(mLocated.rootLine(),
                           "no command has a usable id: the server loads nothing from this file");
        commands->clear();
        return false;
    }
    return true;
}

bool LoadChecker::checkDocument() {
    const int status = mLoader.status();
    if (!mLocated.xmlError().empty()) {
        mDiagnostics.error(mLocated.errorLine(), "not well-formed XML: " + mLocated.xmlError() +
                                                     "; the server loads nothing from this file");
        if (status != 2) {
            disagree(mLocated.errorLine(), "the loader read the file although it is not XML");
        }
        return false;
    }
    if (status == -1) {
        mDiagnostics.error(0, "the platform layer supplied no loader");
        return false;
    }
    if (!mLocated.hasPolicy()) {
        const std::string found = mLocated.rootName().empty()
                                      ? "the document has no element"
                                      : "the top-level element is <" + mLocated.rootName() + ">";
        mDiagnostics.error(mLocated.rootLine(),
                           found + ", not <policy>: the server loads nothing from this file");
        return false;
    }
    if (mLocated.commands().empty()) {
        mDiagnostics.error(mLocated.rootLine(),
                           "<policy> has no command element: the server loads nothing from "
                           "this file");
        return false;
    }
    if (status != 0) {
        disagree(mLocated.rootLine(), "the loader failed with status " + std::to_string(status));
        return false;
    }
    return true;
}

void LoadChecker::checkCommandElement(const LocatedCommand& command) {
    if (!command.hasIdAttribute) {
        mDiagnostics.error(command.line,
                           "command " + describe(command) + " has no \"id\": the loader skips it");
        return;
    }
    if (!command.idIsDecimal) {
        mDiagnostics.error(command.line, "command " + describe(command) + " has id \"" +
                                             command.idText +
                                             "\", which is not a decimal integer: the loader "
                                             "skips it");
        return;
    }
    const std::string id = std::to_string(command.id);
    // tinyxml2 converts with sscanf: text beyond the int range wraps instead of failing.
    if (strtoll(command.idText.c_str(), nullptr, 10) != command.id) {
        mDiagnostics.warning(
            command.line,
            "id \"" + command.idText + "\" does not fit an int: the loader reads it as " + id);
    }
    const LocatedCommand* first = mLocated.firstWithId(command.id);
    if (first != &command) {
        mDiagnostics.warning(command.line, "duplicate command id " + id +
                                               ": the first definition wins, this one is ignored");
        mDiagnostics.attachNote(first->line, "the first definition of command " + id + " is here");
        return;
    }
    if (command.id < kLowestCommandId) {
        mDiagnostics.warning(command.line,
                             "command id " + id +
                                 " is below 4: the platform cannot tell it from the client ids "
                                 "0..3 (feature switch, KX, JN, ZOLA)");
    }
    if (command.actions.size() > kActionsRead) {
        mDiagnostics.warning(command.actions[kActionsRead].line,
                             "command " + id + " has " + std::to_string(command.actions.size()) +
                                 " action elements: only the first three are read, this one and "
                                 "later ones are ignored");
    }
}

void LoadChecker::reportDroppedAction(const LocatedCommand& command, const LocatedAction& action) {
    const std::string id = std::to_string(command.id);
    for (const auto& param : action.params) {
        if (!param.hasText) {
            mDiagnostics.error(param.line, "parameter <" + param.name + "> of command " + id +
                                               " has no text: the loader drops the whole action");
            return;
        }
    }
    disagree(action.line,
             "the loader dropped an action of command " + id + " whose parameters all have text");
}

CheckedCommand LoadChecker::checkActions(const LocatedCommand& command) {
    CheckedCommand checked;
    checked.id = command.id;
    checked.located = &command;
    auto raw = mLoader.rawMap().find(command.id);
    if (raw == mLoader.rawMap().end()) {
        disagree(command.line, "the loader did not keep command " + std::to_string(command.id));
        return checked;
    }
    const Action* converted = mLoader.chainOf(command.id);
    const RawXmlData* record = raw->second->next;
    converted = converted != nullptr ? converted->mNext : nullptr;
    ConversionChecker conversion(mDiagnostics);
    const size_t read = std::min(command.actions.size(), kActionsRead);
    for (size_t i = 0; i < read; ++i) {
        const LocatedAction& action = command.actions[i];
        if (record == nullptr || !sameParams(*record, action)) {
            reportDroppedAction(command, action);
            continue;
        }
        if (converted == nullptr) {
            disagree(action.line,
                     "the conversion left out an action of command " + std::to_string(command.id));
            break;
        }
        checked.records.push_back(conversion.check(command.id, action, *converted));
        record = record->next;
        converted = converted->mNext;
    }
    if (record != nullptr) {
        disagree(command.line, "the loader kept more actions of command " +
                                   std::to_string(command.id) + " than the file gives");
    }
    return checked;
}

}  // namespace velmora
