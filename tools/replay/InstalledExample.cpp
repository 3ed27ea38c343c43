#include "tools/replay/InstalledExample.h"

#include <limits.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

namespace velmora {

std::string installedExampleDir() {
    char self[PATH_MAX];
    const ssize_t length = readlink("/proc/self/exe", self, sizeof(self) - 1);
    if (length <= 0) {
        return std::string();
    }
    std::string dir(self, static_cast<size_t>(length));
    dir.erase(dir.find_last_of('/'));
    // Canonical, so the paths handed to the server stay short: its lookup buffer is small.
    char examples[PATH_MAX];
    if (realpath((dir + "/" + VELMORA_BIN_TO_EXAMPLES).c_str(), examples) == nullptr) {
        return std::string();
    }
    struct stat st;
    const std::string config = std::string(examples) + "/xml/velmora_config_cust.xml";
    if (stat(config.c_str(), &st) != 0 || !S_ISREG(st.st_mode)) {
        return std::string();
    }
    return examples;
}

std::vector<std::string> defaultConfigDirs(const std::string& tracePath, bool interactive) {
    const std::string example = installedExampleDir();
    if (example.empty()) {
        return {};
    }
    std::string traceDir = ".";
    const size_t slash = tracePath.find_last_of('/');
    if (!interactive && slash != std::string::npos) {
        traceDir = slash == 0 ? "/" : tracePath.substr(0, slash);
    }
    return {traceDir, example};
}

}  // namespace velmora
