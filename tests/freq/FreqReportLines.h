// Reads the frequency-limit report lines that reached the test platform's device event log.
#pragma once

#include <regex>
#include <string>
#include <vector>

#include "tests/fakes/FakeEnv.h"

namespace velmora {
namespace fake {

// The report lines with the wall-clock stamp cut out: "3:361:#ARG1:<20261115121456,1,-1,,,4>"
// becomes ",1,-1,,,4>". A line of another shape is returned whole, prefixed with "?", so that
// a comparison shows it.
inline std::vector<std::string> reportBodies() {
    static const std::regex kLine("^3:361:#ARG1:<[0-9]{14}(,.*>)$");
    std::vector<std::string> bodies;
    for (const std::string& line : FakeEnv::get().jankLines()) {
        std::smatch match;
        bodies.push_back(std::regex_match(line, match, kLine) ? match[1].str() : "?" + line);
    }
    return bodies;
}

}  // namespace fake
}  // namespace velmora
