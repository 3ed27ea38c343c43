#include "config/VelmoraParser.h"

#include "config/VelmoraLoadXml.h"
#include "platform/VelmoraLog.h"
#include "server/VelmoraServer.h"

VelmoraParser::VelmoraParser() : mActionMap(nullptr), mServerPtr(nullptr) {
    pthread_rwlock_init(&mRwLock, nullptr);
}

VelmoraParser::~VelmoraParser() {
    pthread_rwlock_wrlock(&mRwLock);
    deleteActionMap(mActionMap);
    mActionMap = nullptr;
    mServerPtr = nullptr;
    pthread_rwlock_unlock(&mRwLock);
    pthread_rwlock_destroy(&mRwLock);
}

void VelmoraParser::deleteActionMap(ActionMap* map) {
    if (map == nullptr) {
        return;
    }
    for (auto& entry : *map) {
        velmora::deleteActionChain(entry.second);
    }
    delete map;
}

int VelmoraParser::doParseLocked(int32_t cmdId, Action* target) {
    if (target == nullptr || mActionMap == nullptr) {
        VLOGE("doParse failed, nullptr!");
        return 2;
    }
    auto it = mActionMap->find(cmdId);
    if (it == mActionMap->end()) {
        return 1;
    }
    const Action* head = it->second;
    if (head == nullptr || head->mNext == nullptr) {
        // A command without alternatives: the caller's default target means "nothing to do".
        return 0;
    }
    const Action* source = head->mNext;
    target->mCmdId = source->mCmdId;
    target->mName = source->mName;
    target->mDuration = source->mDuration;
    target->mParamNum = source->mParamNum;
    if (source != target) {
        target->mTagValues = source->mTagValues;
        target->mParams = source->mParams;
    }
    target->mNext = source->mNext;
    return 0;
}

void VelmoraParser::updateParser() {
    VelmoraLoadXml* loader = createVelmoraLoadXml();
    if (loader == nullptr) {
        VLOGE("server get loader failed!");
        return;
    }
    ActionMap* newMap = loader->loadXmlMap();
    if (newMap == nullptr) {
        VLOGE("load xml map failed!");
        delete loader;
        return;
    }
    delete loader;

    pthread_rwlock_wrlock(&mRwLock);
    deleteActionMap(mActionMap);
    mActionMap = newMap;
    if (mServerPtr != nullptr) {
        // Both hooks run under the write lock and must not take it again.
        mServerPtr->updatePriorityMap();
        mServerPtr->updateProbeHandler();
    }
    pthread_rwlock_unlock(&mRwLock);
}
