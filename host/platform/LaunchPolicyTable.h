// The launch-policy answers of the host: what OnDemandBoostServer::getPolicy returns for
// "cold" and "winswitch". Empty by default (every policy answers -1, "prescribes nothing").
// Thread safe.
#pragma once

#include <map>
#include <mutex>
#include <string>

namespace velmora {

class LaunchPolicyTable {
public:
    // `duration` -1 removes the answer.
    void set(const std::string& name, int duration);
    void clear();
    // The duration prescribed for `name`, or -1.
    int get(const std::string& name);
    // Number of get() calls so far (how often the server asked).
    int queries() const;

private:
    mutable std::mutex mLock;  // guards both members
    std::map<std::string, int> mDurations;
    int mQueries = 0;
};

}  // namespace velmora
