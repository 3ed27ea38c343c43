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

const char* const kAnalysisConfig = R"(<policy>
  <cmd id="5376" name="defaults"><act><duration>0</duration><tag_51>0</tag_51><tag_52>0</tag_52>
    <tag_53>0</tag_53><tag_54>0</tag_54><tag_55>0</tag_55><tag_56>0</tag_56><tag_57>0</tag_57>
    <tag_58>0</tag_58></act></cmd>
  <cmd id="4116" name="probe"><act><duration>100</duration><big_min>1497600</big_min></act></cmd>
  <cmd id="4099" name="cold_launch"><act><duration>1500</duration><big_min>1804800</big_min></act></cmd>
  <cmd id="4118" name="video"><act><gpu_max>600000000</gpu_max></act></cmd>
  <cmd id="4119" name="game"><act><big_min>2419200</big_min></act></cmd>
  <cmd id="4230" name="game_gpu"><act><priority>40</priority><gpu_governor>performance</gpu_governor></act></cmd>
  <cmd id="12300" name="touch_floor"><act><duration>0</duration><little_min>1209600</little_min></act></cmd>
</policy>
)";

}  // namespace hosttest
}  // namespace velmora
