#include "tests/fakes/FakeLoadXml.h"

#include <cstdlib>

namespace velmora {
namespace fake {

namespace {

Action* convertRecord(const RawXmlData& raw) {
    auto* action = new Action();
    action->mCmdId = raw.cmdId;
    action->mName = raw.name;
    action->mDuration = 0;
    for (size_t i = 0; i < raw.names.size(); ++i) {
        const std::string& name = raw.names[i];
        const std::string& value = raw.values[i];
        if (name == "duration") {
            action->mDuration = atoi(value.c_str());
        } else if (name.size() > 2 && name.compare(0, 2, "s_") == 0) {
            action->mParams.push_back(name.substr(2));
            action->mParams.push_back(value);
        } else if (name.size() > 1 && name[0] == 't') {
            action->mTagValues.push_back(atoi(name.c_str() + 1));
            action->mTagValues.push_back(atoi(value.c_str()));
        }
    }
    const size_t pairs =
        action->mParams.empty() ? action->mTagValues.size() : action->mParams.size();
    action->mParamNum = static_cast<int>(pairs / 2);
    return action;
}

}  // namespace

ActionMap* FakeLoadXml::createActionMap(RawXmlDataMap& rawMap) {
    auto* map = new ActionMap();
    for (const auto& entry : rawMap) {
        const RawXmlData* raw = entry.second;
        auto* head = new Action();
        head->mCmdId = raw->cmdId;
        head->mName = raw->name;
        Action* tail = head;
        for (const RawXmlData* rec = raw->next; rec != nullptr; rec = rec->next) {
            tail->mNext = convertRecord(*rec);
            tail = tail->mNext;
        }
        (*map)[entry.first] = head;
    }
    return map;
}

}  // namespace fake
}  // namespace velmora
