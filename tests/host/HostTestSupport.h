// Helpers shared by the host-layer tests: scratch directories, node files and replay options.
#pragma once

#include <cstdio>
#include <string>

#include "tools/replay/ReplaySession.h"

namespace velmora {
namespace hosttest {

// A new empty directory under the test's temporary directory.
std::string makeScratchDir(const std::string& name);
// Whole contents of `path` without a trailing newline; "<missing>" when unreadable.
std::string readFile(const std::string& path);
void writeFile(const std::string& path, const std::string& text);
// Everything written to `file` (a tmpfile()); closes it.
std::string readAndClose(FILE* file);

// A quiet replay of `trace` in virtual time with the device, timeline and event log in `dir`.
ReplayOptions replayOptions(const std::string& dir, const std::string& trace);
// A new configuration directory holding `config` as xml/velmora_config_cust.xml.
std::string configDir(const std::string& name, const std::string& config);
// The example configuration's directory.
std::string examplesDir();
// A small configuration for the analysis and comparison tests: start-up levels, the probe
// command, a cold launch, video and game scenes, a governor scene and an on/off floor.
extern const char* const kAnalysisConfig;

}  // namespace hosttest
}  // namespace velmora
