// Per node, who held the value it took in each change (0: the initial value), matching the
// timeline's samples of the node one to one. Each holder's name is kept once and a change costs
// an index, so that the timeline can name the holder of every counter sample of a long replay.
#pragma once

#include <cstddef>
#include <cstdint>
#include <map>
#include <string>
#include <vector>

namespace velmora {

class ChangeHolders {
public:
    // The holder of `key`'s value in its change-th change, "" when unknown.
    const std::string& at(const std::string& key, size_t change) const {
        static const std::string kUnknown;
        auto it = mByNode.find(key);
        if (it == mByNode.end() || change >= it->second.size())
            return kUnknown;
        return mNames[it->second[change]];
    }

    // The next change of `key`, held by `holder`; or a new holder of its last change.
    void add(const std::string& key, const std::string& holder) {
        mByNode[key].push_back(id(holder));
    }
    void replaceLast(const std::string& key, const std::string& holder) {
        std::vector<uint32_t>& changes = mByNode[key];
        if (!changes.empty())
            changes.back() = id(holder);
    }

private:
    uint32_t id(const std::string& holder) {
        auto it = mIds.find(holder);
        if (it != mIds.end())
            return it->second;
        mNames.push_back(holder);
        return mIds[holder] = static_cast<uint32_t>(mNames.size() - 1);
    }

    std::vector<std::string> mNames;
    std::map<std::string, uint32_t> mIds;
    std::map<std::string, std::vector<uint32_t>> mByNode;
};

}  // namespace velmora
