// Checks what the host layer's conversion (ParamVocabulary::toAction, run for every accepted
// action by HostLoadXml::createActionMap) makes of the parameters of one action element:
// names it does not understand, values that are not integers, a duration that is not an
// integer, parameters past the 43rd pair. It asks the conversion's own vocabulary
// (ParamVocabulary) what a name means, walks the parameters in the conversion's order, and then
// checks that the converted record has exactly the pairs and duration it expected.
//
// Stateless apart from the diagnostics it reports to; not thread safe.
#pragma once

#include "config/Action.h"
#include "tools/lint/Diagnostics.h"
#include "tools/lint/LoadChecker.h"
#include "tools/lint/LocatedConfig.h"

namespace velmora {

class ConversionChecker {
public:
    explicit ConversionChecker(Diagnostics& diagnostics) : mDiagnostics(diagnostics) {}

    // Reports what the conversion leaves out of `action` (an element of command `cmdId` that
    // the loader accepted) and ties `converted`, its converted record, to the elements.
    CheckedRecord check(int cmdId, const LocatedAction& action, const Action& converted);

private:
    Diagnostics& mDiagnostics;
};

}  // namespace velmora
