#include "host/DeviceTree.h"

#include <errno.h>
#include <sys/stat.h>

#include <cstring>
#include <fstream>

#include "platform/VelmoraLog.h"

namespace velmora {

namespace {

// mkdir -p for the directory part of `path`.
bool makeParents(const std::string& path) {
    for (size_t pos = path.find('/', 1); pos != std::string::npos; pos = path.find('/', pos + 1)) {
        const std::string dir = path.substr(0, pos);
        if (mkdir(dir.c_str(), 0755) != 0 && errno != EEXIST) {
            return false;
        }
    }
    return true;
}

std::string trimmed(const std::string& text) {
    const size_t end = text.find_last_not_of(" \t\r\n");
    return end == std::string::npos ? std::string() : text.substr(0, end + 1);
}

}  // namespace

DeviceTree::DeviceTree(const NodeMap& nodes, Timeline& timeline)
    : mNodes(nodes), mTimeline(timeline) {}

void DeviceTree::setRoot(const std::string& root) {
    std::lock_guard<std::mutex> lock(mLock);
    mRoot = root;
    while (mRoot.size() > 1 && mRoot.back() == '/') {
        mRoot.pop_back();
    }
    mCurrent.clear();
    mBaseline.clear();
}

std::string DeviceTree::root() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mRoot;
}

bool DeviceTree::simulated() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mRoot != "/";
}

std::string DeviceTree::pathOf(const std::string& key) const {
    const NodeSpec* spec = mNodes.find(key);
    if (spec == nullptr) {
        return std::string();
    }
    std::lock_guard<std::mutex> lock(mLock);
    return (mRoot == "/" ? std::string() : mRoot) + "/" + spec->path;
}

int DeviceTree::seed() {
    if (!simulated()) {
        return 0;
    }
    for (const auto& spec : mNodes.nodes()) {
        const std::string path = pathOf(spec.key);
        std::ofstream file;
        if (makeParents(path)) {
            file.open(path, std::ios::trunc);
        }
        if (!file) {
            VLOGE("host: cannot create simulated node %s: %s", path.c_str(), strerror(errno));
            return -1;
        }
        file << spec.seed << "\n";
    }
    std::lock_guard<std::mutex> lock(mLock);
    mCurrent.clear();
    mBaseline.clear();
    return 0;
}

bool DeviceTree::loadLocked(const std::string& key, const NodeSpec& spec) {
    if (mCurrent.count(key) != 0) {
        return true;
    }
    const std::string path = (mRoot == "/" ? std::string() : mRoot) + "/" + spec.path;
    std::ifstream file(path);
    std::string text;
    if (!file || !std::getline(file, text)) {
        return false;
    }
    text = trimmed(text);
    mCurrent[key] = text;
    mBaseline[key] = text;
    mTimeline.recordInitial(key, path, text);
    return true;
}

bool DeviceTree::read(const std::string& key, std::string* text) {
    const NodeSpec* spec = mNodes.find(key);
    std::lock_guard<std::mutex> lock(mLock);
    if (spec == nullptr || !loadLocked(key, *spec)) {
        return false;
    }
    *text = mCurrent[key];
    return true;
}

bool DeviceTree::baseline(const std::string& key, std::string* text) {
    const NodeSpec* spec = mNodes.find(key);
    std::lock_guard<std::mutex> lock(mLock);
    if (spec == nullptr || !loadLocked(key, *spec)) {
        return false;
    }
    *text = mBaseline[key];
    return true;
}

int DeviceTree::write(const std::string& key, const std::string& text) {
    const NodeSpec* spec = mNodes.find(key);
    if (spec == nullptr) {
        VLOGE("host: write to unknown node %s", key.c_str());
        return -1;
    }
    std::lock_guard<std::mutex> lock(mLock);
    const std::string path = (mRoot == "/" ? std::string() : mRoot) + "/" + spec->path;
    // A node that cannot be read still takes writes (write-only nodes such as tasks files).
    if (loadLocked(key, *spec) && mCurrent[key] == text) {
        return 0;
    }
    std::ofstream file(path, std::ios::trunc);
    if (file) {
        file << text << "\n";
        file.flush();
    }
    if (!file) {
        VLOGE("host: write %s to %s failed: %s", text.c_str(), path.c_str(), strerror(errno));
        return -1;
    }
    mCurrent[key] = text;
    mTimeline.recordWrite(key, path, text);
    return 0;
}

}  // namespace velmora
