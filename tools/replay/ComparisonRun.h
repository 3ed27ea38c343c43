// velmora-replay --compare CONFIG_B: replays one trace twice in virtual time, under its own
// configuration (A) and under CONFIG_B (a configuration file or a directory holding one,
// ComparedConfig), and reports what the change does: first where the device went different ways
// (a call, or a timed change such as an action expiring) and per node the final value, its holder
// and the time at each value; then run A's own summary, unless only the comparison is asked for.
// When the configurations differ and the runs do not, it names the trace lines that override the
// difference. The timeline and report are those of run A; --summary-json receives the
// comparison.
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

    // Print only the comparison, not run A's summary after it.
    void setCompareOnly(bool only) { mCompareOnly = only; }

    // One of ReplaySession's exit codes.
    int run();

    // "" when `dir` holds a configuration that loads, otherwise why it does not.
    static std::string loadError(const std::string& dir);

private:
    // The configuration file run A uses: the first of its directories that has one.
    std::string configFileA() const;

    ReplayOptions mOptions;
    std::string mCompareDir;
    bool mCompareOnly = false;
    FILE* mOut;
    FILE* mErr;
};

}  // namespace velmora
