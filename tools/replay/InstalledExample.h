// The example configuration and traces installed with velmora-replay, under
// <prefix>/share/velmora/examples. Found from the program's own place, so an install prefix or an
// unpacked package may move; a program run from the build tree has none.
#pragma once

#include <string>
#include <vector>

namespace velmora {

// The installed example directory (holding xml/velmora_config_cust.xml), or "" when there is none
// next to this program.
std::string installedExampleDir();

// Where the configuration is looked up when no --config-dir is given: the trace's directory (the
// current one when interactive), then the installed example. Empty when there is no installed
// example, leaving the replay's own default.
std::vector<std::string> defaultConfigDirs(const std::string& tracePath, bool interactive);

}  // namespace velmora
