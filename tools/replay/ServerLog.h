// Where the server's own log (liblog) goes during a replay: a file (--server-log), stderr
// (--verbose), both, or nowhere, so that the terminal shows the replay and the tool's own
// messages only. Process-wide, like liblog's logger; set once before the server starts.
#pragma once

#include <string>

namespace velmora {

class ServerLog {
public:
    // Sends every liblog line from now on to `path` (truncated first; empty: no file) and, when
    // `toStderr`, to stderr in liblog's own layout too. With neither, the lines are dropped.
    // False, with `error` set, when the file cannot be written; the log is then left alone.
    static bool route(const std::string& path, bool toStderr, std::string* error);
    // liblog prints to stderr again, the file (if any) is closed.
    static void restore();
};

}  // namespace velmora
