#include "tests/host/HostTestSupport.h"

#include <gtest/gtest.h>
#include <stdlib.h>
#include <sys/stat.h>

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

std::string configDir(const std::string& name, const std::string& config) {
    const std::string dir = makeScratchDir(name);
    mkdir((dir + "/xml").c_str(), 0755);
    writeFile(dir + "/xml/velmora_config_cust.xml", config);
    return dir;
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

std::string readAndClose(FILE* file) {
    rewind(file);
    std::string text;
    char buffer[512];
    while (fgets(buffer, sizeof(buffer), file) != nullptr) {
        text += buffer;
    }
    fclose(file);
    return text;
}

ReplayOptions replayOptions(const std::string& dir, const std::string& trace) {
    ReplayOptions options;
    options.tracePath = trace;
    options.fast = true;
    options.quiet = true;
    options.deviceRoot = dir + "/device";
    options.timelinePath = dir + "/timeline.json";
    options.eventLogPath = dir + "/events.log";
    return options;
}

std::string examplesDir() {
    return std::string(VELMORA_SOURCE_DIR) + "/examples";
}

}  // namespace hosttest
}  // namespace velmora
