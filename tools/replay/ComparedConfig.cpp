#include "tools/replay/ComparedConfig.h"

#include <sys/stat.h>
#include <tinyxml2.h>
#include <unistd.h>

#include <climits>
#include <cstdlib>
#include <map>

#include "config/CommandIds.h"
#include "tools/replay/TraceReader.h"

namespace velmora {

namespace {

bool isDirectory(const std::string& path) {
    struct stat st {};
    return stat(path.c_str(), &st) == 0 && S_ISDIR(st.st_mode);
}

bool isFile(const std::string& path) {
    struct stat st {};
    return stat(path.c_str(), &st) == 0 && S_ISREG(st.st_mode);
}

std::string parentOf(const std::string& path) {
    const size_t slash = path.find_last_of('/');
    if (slash == std::string::npos)
        return ".";
    return slash == 0 ? "/" : path.substr(0, slash);
}

std::string baseOf(const std::string& path) {
    const size_t slash = path.find_last_of('/');
    return slash == std::string::npos ? path : path.substr(slash + 1);
}

std::string withoutTrailingSlash(std::string path) {
    while (path.size() > 1 && path.back() == '/')
        path.pop_back();
    return path;
}

// Each command element by id, as printed: two that print alike are alike.
std::map<int, std::string> commandsOf(const std::string& file, bool* ok) {
    std::map<int, std::string> out;
    tinyxml2::XMLDocument doc;
    *ok = doc.LoadFile(file.c_str()) == tinyxml2::XML_SUCCESS && doc.RootElement() != nullptr;
    if (!*ok)
        return out;
    for (const tinyxml2::XMLElement* cmd = doc.RootElement()->FirstChildElement(); cmd != nullptr;
         cmd = cmd->NextSiblingElement()) {
        int id = 0;
        if (cmd->QueryIntAttribute("id", &id) != tinyxml2::XML_SUCCESS)
            continue;
        tinyxml2::XMLPrinter printer(nullptr, /*compact=*/true);
        cmd->Accept(&printer);
        out[id] += printer.CStr();
    }
    return out;
}

}  // namespace

ComparedConfig::ComparedConfig(const std::string& given) {
    const std::string path = withoutTrailingSlash(given);
    if (isDirectory(path)) {
        if (isFile(path + "/" + kConfigFile)) {
            mDir = path;
        } else if (baseOf(path) == "xml" && isFile(path + "/velmora_config_cust.xml")) {
            mDir = parentOf(path);
        } else {
            mError =
                "no configuration in " + given + " (looked for " + path + "/" + kConfigFile + ")";
            return;
        }
        mFile = mDir + "/" + kConfigFile;
        return;
    }
    if (!isFile(path)) {
        mError = access(path.c_str(), F_OK) == 0 ? given + " is neither a file nor a directory"
                                                 : "no such file or directory: " + given;
        return;
    }
    mFile = path;
    if (baseOf(path) == "velmora_config_cust.xml" && baseOf(parentOf(path)) == "xml") {
        mDir = parentOf(parentOf(path));
        return;
    }
    // A file of any other name or place: the server sees it through a link.
    char absolute[PATH_MAX];
    if (realpath(path.c_str(), absolute) == nullptr) {
        mError = "cannot resolve " + given;
        return;
    }
    const char* tmp = getenv("TMPDIR");
    std::string pattern =
        std::string(tmp != nullptr && *tmp != '\0' ? tmp : "/tmp") + "/velmora-compare-XXXXXX";
    if (mkdtemp(&pattern[0]) == nullptr) {
        mError = "cannot make a scratch directory " + pattern;
        return;
    }
    mScratch = pattern;
    if (mkdir((mScratch + "/xml").c_str(), 0700) != 0 ||
        symlink(absolute, (mScratch + "/" + kConfigFile).c_str()) != 0) {
        mError = "cannot link " + given + " into " + mScratch;
        return;
    }
    mDir = mScratch;
}

ComparedConfig::~ComparedConfig() {
    if (mScratch.empty())
        return;
    unlink((mScratch + "/" + kConfigFile).c_str());
    rmdir((mScratch + "/xml").c_str());
    rmdir(mScratch.c_str());
}

std::set<int> ComparedConfig::differingCommands(const std::string& fileA,
                                                const std::string& fileB) {
    std::set<int> out;
    bool okA = false, okB = false;
    const auto a = commandsOf(fileA, &okA);
    const auto b = commandsOf(fileB, &okB);
    if (!okA || !okB)
        return out;
    for (const auto& entry : a) {
        auto other = b.find(entry.first);
        if (other == b.end() || other->second != entry.second)
            out.insert(entry.first);
    }
    for (const auto& entry : b) {
        if (a.count(entry.first) == 0)
            out.insert(entry.first);
    }
    return out;
}

std::vector<std::string> ComparedConfig::overridingLines(const std::string& tracePath,
                                                         const std::set<int>& commands) {
    std::vector<std::string> out;
    std::set<int> called;
    TraceReader reader(tracePath);
    TraceCall call;
    TraceReader::Step step;
    while ((step = reader.next(&call, nullptr)) != TraceReader::Step::End) {
        if (step != TraceReader::Step::Call)
            continue;
        if (call.kind == TraceCall::Kind::Event) {
            called.insert(call.id);
        } else if (call.kind == TraceCall::Kind::Policy && call.id >= 0) {
            const int command = call.text == kColdPolicyName        ? kCmdColdStart
                                : call.text == kWinSwitchPolicyName ? kCmdWinSwitch
                                                                    : -1;
            const size_t text = call.source.find_first_not_of(" \t");
            if (commands.count(command) != 0)
                out.push_back(call.file + ":" + std::to_string(call.line) + ": " +
                              call.source.substr(text == std::string::npos ? 0 : text) +
                              " (the launch policy prescribes the duration of command " +
                              std::to_string(command) + ")");
        }
    }
    for (const int command : commands) {
        if (called.count(command) == 0)
            out.push_back(tracePath + ": no event line names command " + std::to_string(command));
    }
    return out;
}

}  // namespace velmora
