// velmora-import-logcat: the command line around LogcatImporter.
//
//   velmora-import-logcat LOG -o TRACE
//
// Reads the logcat text LOG, writes the trace TRACE and prints the counts of what was read.
// Bad input (unreadable, a directory, empty, binary, larger than 256 MiB, an unknown format, no
// server calls) prints one line to `err`, writes no trace and exits 1; a usage error exits 2
// (CommandLine's conventions).
#pragma once

#include <ostream>
#include <string>
#include <vector>

namespace velmora {

class LogcatImportCommand {
public:
    static constexpr int kOk = 0;
    static constexpr int kBadInput = 1;
    static constexpr int kUsageError = 2;

    // `args` without the program name. One of the exit statuses above.
    static int run(const std::vector<std::string>& args, std::ostream& out, std::ostream& err);
};

}  // namespace velmora
