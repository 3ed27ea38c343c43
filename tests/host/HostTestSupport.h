// Helpers shared by the host-layer tests: scratch directories and reading node files.
#pragma once

#include <string>

namespace velmora {
namespace hosttest {

// A new empty directory under the test's temporary directory.
std::string makeScratchDir(const std::string& name);
// Whole contents of `path` without a trailing newline; "<missing>" when unreadable.
std::string readFile(const std::string& path);
void writeFile(const std::string& path, const std::string& text);

}  // namespace hosttest
}  // namespace velmora
