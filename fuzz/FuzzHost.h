// Shared set-up of the fuzz targets: quiet logging, the host platform layer on a simulated
// device of its own, and one server per process.
//
// The server is created once and never deleted: the probe worker outlives a deleted server,
// and building one per input would also spend most of the time in init. Inputs therefore see
// the state earlier inputs left behind, like calls from a long-running host service do.
#pragma once

#include <string>

class VelmoraServer;

namespace velmora {
namespace fuzz {

// Installs a logger that drops every line. Messages are still formatted (liblog formats before
// it hands a line to the logger), so format arguments stay under the sanitizers' eyes.
void silenceLog();

// Points the host layer at a fresh simulated device under the fuzz work directory
// (<work>/<name>/device) and at the example configuration; no cloud copy. Idempotent.
void prepareHost(const char* name);

// Directory private to this target for scratch files.
std::string workDir(const char* name);

// The process's server, initialised on the example configuration at first use. Aborts when
// init fails: every input would be wasted on a server that answers 1.
VelmoraServer& server(const char* name);

// Drops what the host layer recorded (timeline, event log) every `every` calls, so that long
// runs stay within the fuzzer's memory limit.
void trimHostRecords(unsigned every);

}  // namespace fuzz
}  // namespace velmora
