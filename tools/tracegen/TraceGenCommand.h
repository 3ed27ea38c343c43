// The velmora-gen-trace command line: the generator's options, then one TraceGenerator run
// written to `out` or to -o FILE, and a summary line on `err`. main() only forwards its
// arguments here.
//
//   velmora-gen-trace [--seed N] [--hour] [--duration-ms MS] ... [-o FILE]
//
// Exit status: 0 written, 1 the trace could not be written, 2 a usage error. Stateless.
#pragma once

#include <ostream>
#include <string>
#include <vector>

namespace velmora {

class TraceGenCommand {
public:
    static constexpr int kOk = 0;
    static constexpr int kNotWritten = 1;
    static constexpr int kUsageError = 2;

    // `args` without the program name. One of the exit statuses above.
    static int run(const std::vector<std::string>& args, std::ostream& out, std::ostream& err);
};

}  // namespace velmora
