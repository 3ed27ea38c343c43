// The configuration B of velmora-replay --compare, given as the configuration file itself or as
// a directory holding it (DIR/xml/velmora_config_cust.xml, or the xml directory itself). The
// server looks its configuration up as <dir>/xml/velmora_config_cust.xml, so a file anywhere
// else is linked into a scratch directory under $TMPDIR, removed with this object.
//
// It also answers the question a comparison with no difference leaves open: the configurations
// differ, so why did the runs not? The commands whose elements differ, and the trace lines that
// keep the difference from mattering: a launch policy prescribing the duration of a launch
// command, or a command no event line of the trace names.
#pragma once

#include <set>
#include <string>
#include <vector>

namespace velmora {

class ComparedConfig {
public:
    static constexpr const char* kConfigFile = "xml/velmora_config_cust.xml";

    // Finds the configuration at `path`; error() says why not when it cannot.
    explicit ComparedConfig(const std::string& path);
    ~ComparedConfig();
    ComparedConfig(const ComparedConfig&) = delete;
    ComparedConfig& operator=(const ComparedConfig&) = delete;

    const std::string& error() const { return mError; }
    // The directory to give the server (holding xml/velmora_config_cust.xml).
    const std::string& dir() const { return mDir; }
    // The configuration file itself.
    const std::string& file() const { return mFile; }

    // Ids of the commands whose elements differ between two configuration files (one missing
    // from either counts); empty when the files cannot be read.
    static std::set<int> differingCommands(const std::string& fileA, const std::string& fileB);
    // "file:line: text" of every trace line that makes a difference in `commands` not matter:
    // launch policies prescribing the duration of a launch command, and, for a command no
    // event line names, one line saying so.
    static std::vector<std::string> overridingLines(const std::string& tracePath,
                                                    const std::set<int>& commands);

private:
    std::string mError;
    std::string mDir;
    std::string mFile;
    std::string mScratch;  // the scratch directory made for a lone file, "" for none
};

}  // namespace velmora
