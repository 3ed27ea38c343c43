#include "config/Action.h"

#include <utility>

Action::Action(int32_t cmdId, std::string name, int32_t duration, int32_t paramNum,
               std::vector<std::string> params)
    : mCmdId(cmdId), mName(std::move(name)), mDuration(duration), mParamNum(paramNum) {
    const size_t count = paramNum > 0 ? static_cast<size_t>(paramNum) * 2 : 0;
    mParams.resize(count);
    for (size_t i = 0; i < count && i < params.size(); ++i) {
        mParams[i] = std::move(params[i]);
    }
}

namespace velmora {

void deleteActionChain(Action* head) {
    while (head != nullptr) {
        Action* next = head->mNext;
        delete head;
        head = next;
    }
}

}  // namespace velmora
