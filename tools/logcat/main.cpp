// velmora-import-logcat: turns the server's log lines captured with adb logcat into an event
// trace for velmora-replay. See LogcatImportCommand.h and docs/replay.md.
#include <iostream>
#include <string>
#include <vector>

#include "tools/logcat/LogcatImportCommand.h"

int main(int argc, char** argv) {
    const std::vector<std::string> args(argv + 1, argv + argc);
    return velmora::LogcatImportCommand::run(args, std::cout, std::cerr);
}
