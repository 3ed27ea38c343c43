#include "tests/host/HostTestSupport.h"

#include <gtest/gtest.h>
#include <stdlib.h>

#include <fstream>
#include <sstream>

namespace velmora {
namespace hosttest {

std::string makeScratchDir(const std::string& name) {
    std::string pattern = testing::TempDir() + "/velmora-" + name + "-XXXXXX";
    if (mkdtemp(&pattern[0]) == nullptr) {
        ADD_FAILURE() << "mkdtemp failed for " << pattern;
    }
    return pattern;
}

std::string readFile(const std::string& path) {
    std::ifstream file(path);
    if (!file) {
        return "<missing>";
    }
    std::stringstream content;
    content << file.rdbuf();
    std::string text = content.str();
    while (!text.empty() && text.back() == '\n') {
        text.pop_back();
    }
    return text;
}

void writeFile(const std::string& path, const std::string& text) {
    std::ofstream file(path, std::ios::trunc);
    file << text;
}

}  // namespace hosttest
}  // namespace velmora
