#include "host/device/DeviceTree.h"

#include <errno.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

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

DeviceTree::~DeviceTree() {
    std::lock_guard<std::mutex> lock(mLock);
    forgetLocked();
}

void DeviceTree::forgetLocked() {
    for (auto& entry : mNodeState) {
        if (entry.second.fd >= 0) {
            close(entry.second.fd);
        }
    }
    mNodeState.clear();
    mGeneration.fetch_add(1, std::memory_order_release);
}

DeviceTree::Node* DeviceTree::nodeLocked(const std::string& key) {
    auto it = mNodeState.find(key);
    if (it != mNodeState.end()) {
        return &it->second;
    }
    const NodeSpec* spec = mNodes.find(key);
    if (spec == nullptr) {
        return nullptr;
    }
    Node& node = mNodeState[key];
    node.path = (mRoot == "/" ? std::string() : mRoot) + "/" + spec->path;
    return &node;
}

void DeviceTree::setRoot(const std::string& root) {
    std::lock_guard<std::mutex> lock(mLock);
    mRoot = root;
    while (mRoot.size() > 1 && mRoot.back() == '/') {
        mRoot.pop_back();
    }
    forgetLocked();
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
    forgetLocked();
    return 0;
}

bool DeviceTree::loadLocked(const std::string& key, Node& node) {
    if (node.known) {
        return true;
    }
    std::ifstream file(node.path);
    std::string text;
    if (!file || !std::getline(file, text)) {
        return false;
    }
    text = trimmed(text);
    node.known = true;
    node.current = text;
    node.baseline = text;
    mTimeline.recordInitial(key, node.path, text);
    return true;
}

bool DeviceTree::read(const std::string& key, std::string* text) {
    std::lock_guard<std::mutex> lock(mLock);
    Node* node = nodeLocked(key);
    if (node == nullptr || !loadLocked(key, *node)) {
        return false;
    }
    *text = node->current;
    return true;
}

bool DeviceTree::baseline(const std::string& key, std::string* text) {
    std::lock_guard<std::mutex> lock(mLock);
    Node* node = nodeLocked(key);
    if (node == nullptr || !loadLocked(key, *node)) {
        return false;
    }
    *text = node->baseline;
    return true;
}

bool DeviceTree::openNode(Node& node) {
    node.fd = open(node.path.c_str(), O_WRONLY | O_CLOEXEC);
    if (node.fd < 0) {
        return false;
    }
    struct stat st;
    node.regular = fstat(node.fd, &st) == 0 && S_ISREG(st.st_mode);
    return true;
}

bool DeviceTree::writeNode(Node& node, const std::string& text) {
    char small[128];
    std::string large;
    const size_t size = text.size() + 1;
    char* line = small;
    if (size > sizeof(small)) {
        large = text + "\n";
        line = &large[0];
    } else {
        memcpy(small, text.data(), text.size());
        small[text.size()] = '\n';
    }
    // One retry on a fresh descriptor: the node may have been replaced (a simulated tree
    // seeded again, a driver that came back).
    for (int attempt = 0; attempt < 2; ++attempt) {
        if (node.fd < 0 && !openNode(node)) {
            continue;
        }
        if (pwrite(node.fd, line, size, 0) == static_cast<ssize_t>(size) &&
            (!node.regular || !node.known || node.current.size() + 1 <= size ||
             ftruncate(node.fd, static_cast<off_t>(size)) == 0)) {
            return true;
        }
        const int saved = errno;
        close(node.fd);
        node.fd = -1;
        errno = saved;
    }
    return false;
}

int DeviceTree::write(const std::string& key, const std::string& text) {
    std::lock_guard<std::mutex> lock(mLock);
    Node* node = nodeLocked(key);
    if (node == nullptr) {
        VLOGE("host: write to unknown node %s", key.c_str());
        return -1;
    }
    // A node that cannot be read still takes writes (write-only nodes such as tasks files).
    const bool known = loadLocked(key, *node);
    if (known && node->current == text) {
        return 0;
    }
    if (!writeNode(*node, text)) {
        VLOGE("host: write %s to %s failed: %s", text.c_str(), node->path.c_str(), strerror(errno));
        return -1;
    }
    node->current = text;
    if (!known) {
        node->known = true;  // write-only node: from now on only changes are written
        node->baseline.clear();
    }
    mTimeline.recordWrite(key, node->path, text);
    return 0;
}

}  // namespace velmora
