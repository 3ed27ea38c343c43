// The velmora-synth command line: how many sessions, how long, with or without load lines, then
// the sessions written to -o DIR and a summary line on `err`. main() only forwards its arguments
// here.
//
//   velmora-synth [--seed N] [--count N] [--duration-ms MS] [--load-period-ms MS | --no-load]
//                 -o DIR
//
// Exit status: 0 written, 2 a usage error or a directory or session that cannot be written.
// Stateless.
#pragma once

#include <ostream>
#include <string>
#include <vector>

namespace velmora {

class SynthCommand {
public:
    static constexpr int kOk = 0;
    static constexpr int kUsageError = 2;
    static constexpr int kNotWritten = 2;

    // `args` without the program name. One of the exit statuses above.
    static int run(const std::vector<std::string>& args, std::ostream& out, std::ostream& err);
};

}  // namespace velmora
