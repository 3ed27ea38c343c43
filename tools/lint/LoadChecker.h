// Checks what the loader and the platform layer's conversion make of a configuration file: the
// document as a whole, every command element (usable id, duplicates, ids the platform cannot
// tell from client ids, action elements past the third, actions dropped for a parameter without
// text) and every parameter of every accepted action (through ConversionChecker).
//
// Verdicts come from the LoaderRun: the checker lines each raw record and each converted record
// up with the element it came from. Where its own reading of the file disagrees with the
// loader's, it says so as an error instead of guessing.
//
// The result is the list of commands as the server holds them, one CheckedCommand per id in
// document order, each record tied to its action element and each pair to its parameter
// element, for the per-class rules and the --explain listing. Not thread safe.
#pragma once

#include <vector>

#include "config/Action.h"
#include "tools/lint/Diagnostics.h"
#include "tools/lint/LoaderRun.h"
#include "tools/lint/LocatedConfig.h"

namespace velmora {

// One converted record of a command (the server dispatches the first one).
struct CheckedRecord {
    const Action* action = nullptr;               // owned by the LoaderRun
    const LocatedAction* located = nullptr;       // owned by the LocatedConfig
    std::vector<const LocatedParam*> pairParams;  // element of each pair, index for index
    const LocatedParam* durationParam = nullptr;  // element that set mDuration, or null
};

// One command the server holds.
struct CheckedCommand {
    int id = 0;
    const LocatedCommand* located = nullptr;
    std::vector<CheckedRecord> records;  // accepted actions, in chain order

    int line() const { return located->line; }
    // The record the server dispatches, or null when the command has no usable action.
    const CheckedRecord* dispatched() const { return records.empty() ? nullptr : &records[0]; }
};

class LoadChecker {
public:
    LoadChecker(const LocatedConfig& located, const LoaderRun& loader, Diagnostics& diagnostics)
        : mLocated(located), mLoader(loader), mDiagnostics(diagnostics) {}

    // Runs every load-level check. False when the server would load nothing from the file (the
    // reason is reported); then `commands` stays empty.
    bool check(std::vector<CheckedCommand>* commands);

private:
    bool checkDocument();
    void checkCommandElement(const LocatedCommand& command);
    // Lines the raw chain of `command` up with its first three action elements and converts
    // the records that the loader accepted.
    CheckedCommand checkActions(const LocatedCommand& command);
    void reportDroppedAction(const LocatedCommand& command, const LocatedAction& action);
    void disagree(int line, const std::string& what);

    const LocatedConfig& mLocated;
    const LoaderRun& mLoader;
    Diagnostics& mDiagnostics;
};

}  // namespace velmora
