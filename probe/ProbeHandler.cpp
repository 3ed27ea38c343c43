#include "probe/ProbeHandler.h"

namespace {
void deleteChain(Action* action) {
    while (action != nullptr) {
        Action* next = action->mNext;
        delete action;
        action = next;
    }
}
}  // namespace

ProbeHandler::ProbeHandler(VelmoraPlat*, Action* action) : mAction(action) {}

ProbeHandler::~ProbeHandler() {
    deleteChain(mAction);
}

int ProbeHandler::handle(const char*, unsigned int, const int*) {
    return 0;
}

int ProbeHandler::updateProbeThread(Action* action) {
    deleteChain(mAction);
    mAction = action;
    return 0;
}
