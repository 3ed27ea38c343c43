#include "tools/energy/LoadDomains.h"

#include <algorithm>

#include "host/device/profile/DeviceProfile.h"
#include "tools/common/Spelling.h"

namespace velmora {

namespace {

std::string joined(const std::vector<std::string>& words) {
    std::string out;
    for (const auto& word : words)
        out += (out.empty() ? "" : ", ") + word;
    return out;
}

bool contains(const std::vector<std::string>& words, const std::string& word) {
    return std::find(words.begin(), words.end(), word) != words.end();
}

}  // namespace

LoadDomains::LoadDomains(const DeviceProfile& profile) : mDomains(profile.frequencyDomains()) {
    for (const auto& table : profile.energyTables())
        mTables.push_back(table.id);
}

bool LoadDomains::check(const TraceCall& call, std::string* error) const {
    if (call.kind != TraceCall::Kind::Load)
        return true;
    const std::string where = call.file + ":" + std::to_string(call.line) + ": ";
    for (const auto& share : call.loads) {
        if (!contains(mDomains, share.domain)) {
            const std::string guess = Spelling::closest(share.domain, mDomains);
            *error = where + "load of '" + share.domain + "': the device has no such domain (" +
                     joined(mDomains) + ")" +
                     (guess.empty() ? "" : "; did you mean '" + guess + "'?");
            return false;
        }
        if (!contains(mTables, share.domain)) {
            *error = where + "load of '" + share.domain +
                     "': the device profile has no energy table for it (" +
                     (mTables.empty() ? std::string("it has none") : "it has " + joined(mTables)) +
                     ")";
            return false;
        }
    }
    return true;
}

}  // namespace velmora
