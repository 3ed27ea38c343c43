// One load of a configuration file the way the server loads it: the library's own parse
// (VelmoraLoadXml::innerLoad, the function loadXmlMap calls on the chosen file) into RawXmlData
// chains, then the platform layer's conversion (createActionMap of the loader that
// createVelmoraLoadXml() supplies) into Action chains. The checker compares its findings with
// these results instead of re-implementing the loader.
//
// Owns both maps and frees them. Whatever the library logs during the load is kept in log()
// rather than printed: it would only repeat, without line numbers, what the checker reports.
// Not thread safe: it swaps liblog's process-wide logger while it runs.
#pragma once

#include <string>
#include <vector>

#include "config/Action.h"
#include "config/RawXmlData.h"

namespace velmora {

class LoaderRun {
public:
    LoaderRun() = default;
    ~LoaderRun();
    LoaderRun(const LoaderRun&) = delete;
    LoaderRun& operator=(const LoaderRun&) = delete;

    // Loads `path`. Returns innerLoad's status: 0 loaded, 2 XML error, 3 no "policy" or no
    // command element in it; -1 when the platform layer supplied no loader.
    int run(const std::string& path);
    // Loads `text` as if it were the file's contents. The loader only opens paths, so the text
    // goes to an anonymous file in memory (memfd) that the loader opens by its /proc/self/fd
    // name; nothing is written to a file system. -1 also when no such file can be made.
    int runText(const std::string& text);

    int status() const { return mStatus; }
    const RawXmlDataMap& rawMap() const { return mRawMap; }
    // The converted commands; null unless the load succeeded with at least one command (the
    // server does not convert an empty map: loadXmlMap fails instead).
    const ActionMap* actionMap() const { return mActionMap; }
    // The converted chain of `cmdId`: head record first. Null when there is none.
    const Action* chainOf(int cmdId) const;
    // Log lines of the library and the platform layer during the load, in order.
    const std::vector<std::string>& log() const { return mLog; }

private:
    int mStatus = -1;
    RawXmlDataMap mRawMap;
    ActionMap* mActionMap = nullptr;
    std::vector<std::string> mLog;
};

}  // namespace velmora
