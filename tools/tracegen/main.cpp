// velmora-gen-trace: writes a seeded random trace for velmora-replay (TraceGenerator.h), to
// reproduce a property-test seed or to make a long trace for the benchmarks. Not installed. See
// TraceGenCommand.h.
#include <iostream>
#include <string>
#include <vector>

#include "tools/tracegen/TraceGenCommand.h"

int main(int argc, char** argv) {
    const std::vector<std::string> args(argv + 1, argv + argc);
    return velmora::TraceGenCommand::run(args, std::cout, std::cerr);
}
