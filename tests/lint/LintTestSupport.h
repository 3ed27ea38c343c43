// Helpers for the checker's tests: configurations written to a scratch directory and runs of
// the whole command line with its output and exit status.
#pragma once

#include <string>
#include <vector>

namespace velmora {
namespace linttest {

// What one run of velmora-lint printed and returned. The configuration's path is replaced by
// "F" in both texts, so expectations read "F:12: warning: ...".
struct LintResult {
    int status = -1;
    std::string out;
    std::string err;
    std::vector<std::string> outLines() const;
};

// `text` written as config.xml in a new scratch directory; returns its path.
std::string configFile(const std::string& text);

// The start of a configuration whose start-up and probe commands are fine (lines 1 to 3); the
// body given to withBase starts on line 4.
std::string withBase(const std::string& body);

// Runs velmora-lint with `options` followed by `configPath`.
LintResult runLint(const std::vector<std::string>& options, const std::string& configPath);

}  // namespace linttest
}  // namespace velmora
