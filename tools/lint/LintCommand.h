// The velmora-lint command line: options, the file argument and usage errors, then one
// ConfigLinter run. main() only forwards its arguments here, so tests drive the whole program
// (output and exit status) without starting a process.
//
//   velmora-lint [--explain] [--werror] [--device PROFILE.xml] CONFIG.xml
//
// Findings and the listing go to `out`; usage errors to `err` (CommandLine's conventions).
// Stateless.
#pragma once

#include <ostream>
#include <string>
#include <vector>

#include "tools/common/CommandLine.h"

namespace velmora {

class LintCommand {
public:
    // Exit status of a usage error (no file, unreadable file, unknown option), the same as for
    // a configuration with errors: either way the file was not shown to be usable.
    static constexpr int kUsageError = CommandLine::kUsageError;

    // `args` are the arguments after the program name. Returns the exit status.
    static int run(const std::vector<std::string>& args, std::ostream& out, std::ostream& err);

    static void printUsage(std::ostream& to);
};

}  // namespace velmora
