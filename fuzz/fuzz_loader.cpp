// The configuration loader over arbitrary file contents: the bytes become the customisation
// copy, loadXmlMap parses it and the host layer's conversion turns it into Action chains, which
// are then freed the way the parser frees a replaced map.
#include <cstdint>
#include <cstdio>
#include <string>

#include "config/VelmoraLoadXml.h"
#include "config/VelmoraParser.h"
#include "fuzz/FuzzHost.h"
#include "host/platform/HostEnvironment.h"

namespace {

std::string gConfigPath;

}  // namespace

extern "C" int LLVMFuzzerInitialize(int* /*argc*/, char*** /*argv*/) {
    using velmora::fuzz::workDir;
    velmora::fuzz::silenceLog();
    velmora::HostEnvironment& env = velmora::HostEnvironment::get();
    // No cloud copy: the loader goes straight to the customisation copy written below.
    env.properties().unset("ro.build.version.incremental");
    const std::string dir = workDir("loader");
    workDir("loader/xml");
    env.properties().setConfigDirs({dir});
    gConfigPath = dir + "/xml/velmora_config_cust.xml";
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    FILE* file = fopen(gConfigPath.c_str(), "wb");
    if (file == nullptr) {
        return 0;
    }
    fwrite(data, 1, size, file);
    fclose(file);

    VelmoraLoadXml* loader = createVelmoraLoadXml();
    if (loader == nullptr) {
        return 0;
    }
    ActionMap* map = loader->loadXmlMap();
    // Every command must come back as a chain headed by its own id.
    if (map != nullptr) {
        for (const auto& entry : *map) {
            if (entry.second == nullptr || entry.second->mCmdId != entry.first) {
                __builtin_trap();
            }
        }
    }
    VelmoraParser::deleteActionMap(map);
    delete loader;
    return 0;
}
