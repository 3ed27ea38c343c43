// velmora-replay: replays an event trace against the server on the host platform layer.
// See ReplayCommand.h and docs/replay.md for the trace format.
#include <cstdio>
#include <string>
#include <vector>

#include "tools/replay/ReplayCommand.h"

int main(int argc, char** argv) {
    const std::vector<std::string> args(argv + 1, argv + argc);
    return velmora::ReplayCommand::run(args, stdout, stderr);
}
