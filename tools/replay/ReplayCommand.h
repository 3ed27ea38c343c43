// The velmora-replay command line: options and the trace, usage errors, then one ReplaySession
// (or ComparisonRun for --compare) with Ctrl-C caught. main() only forwards its arguments here.
//
//   velmora-replay [options] TRACE
//   velmora-replay [options] --interactive
//
// The replay prints through FILE* (the session's lines and summary on `out`, warnings on `err`).
// Exit status: 0 the trace ran, 1 bad input, 2 a usage error or the set-up failed, 130
// interrupted.
#pragma once

#include <cstdio>
#include <ostream>
#include <string>
#include <vector>

#include "tools/replay/ReplaySession.h"

namespace velmora {

// What the command line asks for beyond the session's own options.
struct ReplayRequest {
    ReplayOptions options;
    std::string compareDir;     // --compare
    bool compareOnly = false;   // --compare-only
    std::string serverLogPath;  // --server-log
    bool verbose = false;       // the server's log on stderr
};

class ReplayCommand {
public:
    static constexpr int kUsageError = 2;
    // Exit status after an interrupt, as a shell reports a process ended by SIGINT.
    static constexpr int kInterrupted = 130;
    // parse(): the command line asks for a replay.
    static constexpr int kGoOn = -1;

    // `args` without the program name. Returns the exit status.
    static int run(const std::vector<std::string>& args, FILE* out, FILE* err);

    // Reads `args` into `request`: kGoOn, or the exit status after --help, --version or a usage
    // error (said on `out` / `err`).
    static int parse(const std::vector<std::string>& args, ReplayRequest* request,
                     std::ostream& out, std::ostream& err);
};

}  // namespace velmora
