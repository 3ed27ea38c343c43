// velmora-synth: writes seeded, plausible sessions of the example device (SessionSynth.h) for
// fleet runs, benchmarks and the demo. See SynthCommand.h.
#include <iostream>
#include <string>
#include <vector>

#include "tools/synth/SynthCommand.h"

int main(int argc, char** argv) {
    const std::vector<std::string> args(argv + 1, argv + argc);
    return velmora::SynthCommand::run(args, std::cout, std::cerr);
}
