// Loading a configuration of 1,000 commands with the host layer's conversion (loadXmlMap:
// tinyxml2 parse, raw records, conversion into Action chains, freeing both), against tinyxml2
// parsing the same file alone. Log output is dropped.
#include <android/log.h>
#include <benchmark/benchmark.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <tinyxml2.h>

#include <cstdio>
#include <fstream>
#include <string>

#include "config/VelmoraLoadXml.h"
#include "config/VelmoraParser.h"
#include "host/platform/HostEnvironment.h"

namespace {

constexpr int kCommands = 1000;

void dropLine(const struct __android_logger_data*, const char*) {}

// A configuration shaped like a device's: launch boosts with floors, group levels, caps;
// one to three actions per command; every parameter from the host vocabulary.
std::string configXml() {
    static const char* const kParams[][2] = {
        {"little_min", "1804800"}, {"big_min", "2419200"},      {"gpu_min", "500000000"},
        {"little_max", "1497600"}, {"big_max", "2016000"},      {"gpu_max", "700000000"},
        {"fork_on_big", "1"},      {"group_top_app", "20"},     {"group_background", "-10"},
        {"ddr_min", "800000000"},  {"ipa_control_temp", "85000"},
    };
    constexpr int kParamKinds = sizeof(kParams) / sizeof(kParams[0]);
    std::string xml = "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n<policy>\n";
    for (int i = 0; i < kCommands; ++i) {
        const int id = 30000 + i;
        xml += "    <cmd id=\"" + std::to_string(id) + "\" name=\"command_" + std::to_string(i) +
               "\">\n";
        const int actions = 1 + i % 3;
        for (int a = 0; a < actions; ++a) {
            xml += "        <act type=\"" + std::to_string(a) + "\"><duration>" +
                   std::to_string(100 * (a + 1)) + "</duration>";
            for (int p = 0; p < 4; ++p) {
                const auto& param = kParams[(i + a + p) % kParamKinds];
                xml += std::string("<") + param[0] + ">" + param[1] + "</" + param[0] + ">";
            }
            xml += "</act>\n";
        }
        xml += "    </cmd>\n";
    }
    xml += "</policy>\n";
    return xml;
}

std::string gPath;

void setUp() {
    __android_log_set_logger(dropLine);
    char dir[] = "/tmp/velmora-bench-load-XXXXXX";
    if (mkdtemp(dir) == nullptr) {
        perror("mkdtemp");
        exit(2);
    }
    mkdir((std::string(dir) + "/xml").c_str(), 0755);
    gPath = std::string(dir) + "/xml/velmora_config_cust.xml";
    std::ofstream(gPath) << configXml();
    velmora::HostEnvironment& env = velmora::HostEnvironment::get();
    env.properties().unset("ro.build.version.incremental");  // no cloud copy
    env.properties().setConfigDirs({dir});
}

void BM_Tinyxml2Parse(benchmark::State& state) {
    for (auto _ : state) {
        tinyxml2::XMLDocument doc(true);
        if (doc.LoadFile(gPath.c_str()) != tinyxml2::XML_SUCCESS) {
            state.SkipWithError("tinyxml2 failed");
            break;
        }
        benchmark::DoNotOptimize(doc.FirstChildElement());
    }
}
BENCHMARK(BM_Tinyxml2Parse)->Unit(benchmark::kMicrosecond);

void BM_LoadXmlMap(benchmark::State& state) {
    for (auto _ : state) {
        VelmoraLoadXml* loader = createVelmoraLoadXml();
        ActionMap* map = loader->loadXmlMap();
        if (map == nullptr || map->size() != static_cast<size_t>(kCommands)) {
            state.SkipWithError("load failed");
            VelmoraParser::deleteActionMap(map);
            delete loader;
            break;
        }
        VelmoraParser::deleteActionMap(map);
        delete loader;
    }
}
BENCHMARK(BM_LoadXmlMap)->Unit(benchmark::kMicrosecond);

}  // namespace

int main(int argc, char** argv) {
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) {
        return 1;
    }
    setUp();
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return 0;
}
