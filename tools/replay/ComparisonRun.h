// velmora-replay --compare DIR_B: replays one trace twice in virtual time, under its own
// configuration (A) and under the one in DIR_B (B), and reports what the change does: per node
// the final value, its holder and the time at each value, and the first call after which the
// device went different ways. The timeline and report are those of run A; --summary-json
// receives the comparison.
//
// Checks everything it will need before replaying: a configuration B that does not load, or an
// output that cannot be written, ends the run with one message and exit status 2, with nothing
// written.
#pragma once

#include <cstdio>
#include <string>

#include "tools/replay/ReplaySession.h"

namespace velmora {

class ComparisonRun {
public:
    ComparisonRun(ReplayOptions options, std::string compareDir, FILE* out, FILE* err);

    // One of ReplaySession's exit codes.
    int run();

    // "" when `dir` holds a configuration that loads, otherwise why it does not.
    static std::string loadError(const std::string& dir);

private:
    ReplayOptions mOptions;
    std::string mCompareDir;
    FILE* mOut;
    FILE* mErr;
};

}  // namespace velmora
