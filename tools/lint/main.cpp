// velmora-lint: checks a command configuration the way the server reads it. See LintCommand.h
// and the README's "Checking a configuration".
#include <iostream>
#include <string>
#include <vector>

#include "tools/lint/LintCommand.h"

int main(int argc, char** argv) {
    const std::vector<std::string> args(argv + 1, argv + argc);
    return velmora::LintCommand::run(args, std::cout, std::cerr);
}
