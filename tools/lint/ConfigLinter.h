// Checks one command configuration file the way the server would read it: loads it with the
// library's loader and the platform layer's conversion (LoaderRun), reads it a second time for
// line numbers (LocatedConfig), then reports load-level findings (LoadChecker, with
// ConversionChecker per action), what the server does with each command (CommandRules) and
// what the device makes of the values (ValueChecker, against a device profile), and
// on request lists how every command is dispatched (Explainer).
//
// One object per file; not thread safe (a load swaps liblog's process-wide logger).
#pragma once

#include <ostream>
#include <string>

#include "host/device/profile/DeviceProfile.h"
#include "tools/lint/Diagnostics.h"

namespace velmora {

class LoaderRun;
class LocatedConfig;

struct LintOptions {
    bool explain = false;  // list every command's dispatch before the findings
    bool werror = false;   // warnings make the exit status 1
    // Device whose nodes the values are written to; null for the example device.
    const DeviceProfile* device = nullptr;
};

class ConfigLinter {
public:
    ConfigLinter(std::string path, LintOptions options);

    // Checks the file and prints the listing (with --explain) and then the findings to `out`.
    // Returns the exit status: Diagnostics::kClean, kWarningsAsErrors or kErrors.
    // REQUIRES: the file exists and is readable (the command line checks it first).
    int run(std::ostream& out);
    // The same check on `text` given in memory; the path given to the constructor only names
    // it in the findings.
    int runText(const std::string& text, std::ostream& out);

    const Diagnostics& diagnostics() const { return mDiagnostics; }

private:
    // The checks and the printing, once both reads of the configuration are done.
    int report(const LoaderRun& loader, const LocatedConfig& located, std::ostream& out);

    std::string mPath;
    LintOptions mOptions;
    Diagnostics mDiagnostics;
};

}  // namespace velmora
