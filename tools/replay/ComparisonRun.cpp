#include "tools/replay/ComparisonRun.h"

#include <tinyxml2.h>
#include <unistd.h>

#include <set>
#include <vector>

#include "tools/energy/EnergyComparison.h"
#include "tools/insight/InsightJson.h"
#include "tools/insight/ReplayComparison.h"
#include "tools/replay/ComparedConfig.h"
#include "tools/replay/ReplayOutputs.h"

namespace velmora {

ComparisonRun::ComparisonRun(ReplayOptions options, std::string compareDir, FILE* out, FILE* err)
    : mOptions(std::move(options)), mCompareDir(std::move(compareDir)), mOut(out), mErr(err) {}

std::string ComparisonRun::loadError(const std::string& dir) {
    const std::string path = dir + "/" + ComparedConfig::kConfigFile;
    if (access(path.c_str(), R_OK) != 0)
        return "no readable " + path;
    tinyxml2::XMLDocument doc;
    if (doc.LoadFile(path.c_str()) != tinyxml2::XML_SUCCESS)
        return doc.ErrorStr();
    const tinyxml2::XMLElement* root = doc.RootElement();
    if (root == nullptr || std::string(root->Name()) != "policy")
        return path + ": the root element is not <policy>";
    return "";
}

int ComparisonRun::run() {
    if (mOptions.interactive || mOptions.tracePath.empty()) {
        fprintf(mErr, "velmora-replay: --compare needs a trace file\n");
        return ReplaySession::kBadInput;
    }
    const ComparedConfig configB(mCompareDir);
    std::string error = configB.error().empty() ? loadError(configB.dir()) : configB.error();
    if (error.empty()) {
        // Well-formed XML can still fail the server's start-up (no start-up command 5376, say):
        // find that out now, not after run A has written its files.
        ReplayOptions trial = mOptions;
        trial.configDirs = {configB.dir()};
        trial.eventLogPath = "/dev/null";
        FILE* sink = fopen("/dev/null", "w");
        FILE* why = tmpfile();
        if (sink != nullptr && why != nullptr) {
            ReplaySession session(trial, sink, why);
            if (session.setUp() != ReplaySession::kOk) {
                char line[512] = {0};
                rewind(why);
                if (fgets(line, sizeof(line), why) != nullptr) {
                    error = line;
                    error.erase(0,
                                error.find(": ") == std::string::npos ? 0 : error.find(": ") + 2);
                    if (!error.empty() && error.back() == '\n')
                        error.pop_back();
                }
                if (error.empty())
                    error = "the server does not start with it";
            }
        }
        if (sink != nullptr)
            fclose(sink);
        if (why != nullptr)
            fclose(why);
    }
    if (!error.empty()) {
        fprintf(mErr, "velmora-replay: configuration %s does not load: %s\n", mCompareDir.c_str(),
                error.c_str());
        return ReplaySession::kSetupFailed;
    }
    for (const std::string* path : {&mOptions.summaryJsonPath, &mOptions.reportPath}) {
        std::string why;
        if (!path->empty() && !ReplayOutputs::checkWritable(*path, &why)) {
            fprintf(mErr, "velmora-replay: %s\n", why.c_str());
            return ReplaySession::kSetupFailed;
        }
    }
    // Both runs in virtual time: the same trace gives the same answers, so every difference is
    // the configuration's.
    ReplayOptions a = mOptions;
    a.fast = true;
    a.summaryJsonPath.clear();
    a.keepCallDigests = true;
    // Run A's own output comes after the comparison (or not at all): it waits in a file.
    FILE* outA = mCompareOnly ? fopen("/dev/null", "w") : tmpfile();
    ReplaySession sessionA(a, outA != nullptr ? outA : mOut, mErr);
    const int resultA = sessionA.run();
    auto printRunA = [&] {
        if (outA == nullptr)
            return;
        if (!mCompareOnly) {
            fprintf(mOut, "\nrun A:\n");
            rewind(outA);
            char buf[4096];
            size_t n;
            while ((n = fread(buf, 1, sizeof(buf), outA)) > 0)
                fwrite(buf, 1, n, mOut);
        }
        fclose(outA);
        outA = nullptr;
    };
    if (resultA != ReplaySession::kOk) {
        printRunA();
        return resultA;
    }
    const InsightResult insightA = sessionA.insight();

    ReplayOptions b = a;
    b.keepCallDigests = false;
    b.compareWithDigests = insightA.callDigests;
    b.configDirs = {configB.dir()};
    b.writeFiles = false;
    b.eventLogPath = "/dev/null";
    b.quiet = true;
    FILE* quiet = fopen("/dev/null", "w");
    ReplaySession sessionB(b, quiet != nullptr ? quiet : mOut, mErr);
    const int resultB = sessionB.run();
    if (quiet != nullptr)
        fclose(quiet);
    if (resultB != ReplaySession::kOk) {
        printRunA();
        return resultB;
    }

    std::string labelA = mOptions.configDirs.empty() ? mOptions.tracePath : mOptions.configDirs[0];
    if (mOptions.configDirs.empty()) {
        const size_t slash = labelA.find_last_of('/');
        labelA = slash == std::string::npos ? "." : labelA.substr(0, slash);
    }
    ReplayComparison comparison(labelA, insightA, mCompareDir, sessionB.insight());
    if (!comparison.diverges()) {
        const std::set<int> differing =
            ComparedConfig::differingCommands(configFileA(), configB.file());
        if (!differing.empty())
            comparison.setOverrides(ComparedConfig::overridingLines(mOptions.tracePath, differing));
    }
    // The cost first: what the change does to the energy and the starved time per domain.
    fprintf(mOut, "%s",
            (comparison.headline() +
             EnergyComparison::text(comparison.a().energy, comparison.b().energy) +
             comparison.divergenceText() + comparison.nodesText())
                .c_str());
    int status = ReplaySession::kOk;
    if (!mOptions.summaryJsonPath.empty()) {
        std::string why;
        if (!InsightJson::writeComparison(comparison, mOptions.summaryJsonPath, &why)) {
            fprintf(mErr, "velmora-replay: %s\n", why.c_str());
            status = ReplaySession::kSetupFailed;
        } else {
            fprintf(mOut, "comparison: %s\n", mOptions.summaryJsonPath.c_str());
        }
    }
    printRunA();
    return status;
}

std::string ComparisonRun::configFileA() const {
    std::vector<std::string> dirs = mOptions.configDirs;
    if (dirs.empty()) {  // the session's default: the trace's directory
        const size_t slash = mOptions.tracePath.find_last_of('/');
        dirs.push_back(slash == std::string::npos ? "." : mOptions.tracePath.substr(0, slash));
    }
    for (const auto& dir : dirs) {
        const std::string file = dir + "/" + ComparedConfig::kConfigFile;
        if (access(file.c_str(), R_OK) == 0)
            return file;
    }
    return "";
}

}  // namespace velmora
