#include "host/vocabulary/HostLoadXml.h"

#include "host/vocabulary/ParamVocabulary.h"
#include "platform/VelmoraLog.h"

namespace velmora {

ActionMap* HostLoadXml::createActionMap(RawXmlDataMap& rawMap) {
    auto* map = new ActionMap();
    for (const auto& entry : rawMap) {
        const RawXmlData* head = entry.second;
        if (head == nullptr) {
            continue;
        }
        auto* first = new Action();
        first->mCmdId = head->cmdId;
        first->mName = head->name;
        Action* tail = first;
        int records = 0;
        for (const RawXmlData* record = head->next; record != nullptr; record = record->next) {
            tail->mNext = ParamVocabulary::toAction(*record);
            tail = tail->mNext;
            ++records;
        }
        if (records == 0) {
            VLOGW("config: cmdId=%d (%s) has no usable action", head->cmdId, head->name.c_str());
        }
        (*map)[entry.first] = first;
    }
    return map;
}

}  // namespace velmora
