#include "server/VelmoraServer.h"

#include "config/Action.h"
#include "config/CommandIds.h"
#include "config/VelmoraLoadXml.h"
#include "config/VelmoraParser.h"
#include "freq/FreqClientManager.h"
#include "platform/VelmoraLog.h"
#include "platform/VelmoraPlat.h"
#include "probe/ProbeHandler.h"
#include "sched/SchedLevelManager.h"

using namespace velmora;

// The host was built against plain bool flags: the atomics must keep their footprint.
static_assert(sizeof(std::atomic<bool>) == sizeof(bool) &&
                  alignof(std::atomic<bool>) == alignof(bool),
              "std::atomic<bool> must lay out like bool");
static_assert(std::atomic<bool>::is_always_lock_free, "flags are read from every host thread");

namespace {

// The probe worker owns its action chain and frees it by walking mNext, but a parsed copy's
// mNext is borrowed from the parser's chain: a probe command with a second alternative would be
// freed twice (or after a reload, read after free). Keep only the first alternative.
void detachBorrowedChain(Action* probeAction) {
    if (probeAction->mNext != nullptr) {
        VLOGW("probe command has more than one action, only the first is used");
        probeAction->mNext = nullptr;
    }
}

}  // namespace

VelmoraServer::VelmoraServer()
    : mPlatPtr(nullptr),
      mFreqClientPtr(nullptr),
      mSchedLevelPtr(nullptr),
      mProbeHandler(nullptr),
      mDebugLog(false),
      mInitialized(false),
      mPolicyEnabled(false),
      mCurSpecialCmdId(0) {
    initExistingPriority();
}

VelmoraServer::~VelmoraServer() {
    releaseComponents();
}

void VelmoraServer::releaseComponents() {
    // The platform goes first although the managers point at it: their destructors never call
    // into the platform. The probe worker is the exception, it calls the platform on its own
    // thread until it is stopped, so it is stopped (and waited for) before the platform goes.
    if (mProbeHandler != nullptr) {
        mProbeHandler->stopProbeThread();
    }
    delete mPlatPtr;
    mPlatPtr = nullptr;
    delete mFreqClientPtr;
    mFreqClientPtr = nullptr;
    delete mSchedLevelPtr;
    mSchedLevelPtr = nullptr;
    delete mProbeHandler;
    mProbeHandler = nullptr;
}

void VelmoraServer::deleteObject() {
    releaseComponents();
}

int VelmoraServer::velmoraGetVersion() {
    return 1;
}

void VelmoraServer::deleteActionPtr(Action* action) {
    deleteActionChain(action);
}

int VelmoraServer::parseCommand(int cmdId, Action* action) {
    VelmoraParser* parser = mPlatPtr != nullptr ? mPlatPtr->mParserPtr : nullptr;
    if (parser == nullptr) {
        return -1;
    }
    pthread_rwlock_rdlock(&parser->mRwLock);
    const int ret = parser->doParseLocked(cmdId, action);
    pthread_rwlock_unlock(&parser->mRwLock);
    return ret;
}

int VelmoraServer::init() {
    mPlatPtr = getPlat();
    if (mPlatPtr == nullptr) {
        VLOGE("get platform ptr failed!");
        return -1;
    }
    mPlatPtr->mServerPtr = this;

    mFreqClientPtr = getFreqClient(mPlatPtr);
    if (mFreqClientPtr == nullptr) {
        VLOGE("get freqClient ptr failed!");
        delete mPlatPtr;
        mPlatPtr = nullptr;
        return -1;
    }
    mSchedLevelPtr = getSchedLevel(mPlatPtr);
    if (mSchedLevelPtr == nullptr) {
        VLOGE("get schedLevel ptr failed!");
        delete mPlatPtr;
        mPlatPtr = nullptr;
        delete mFreqClientPtr;
        mFreqClientPtr = nullptr;
        return -1;
    }

    // The platform owns the parser from here on, also if loading fails below.
    VelmoraParser* parser = new VelmoraParser();
    mPlatPtr->mParserPtr = parser;

    ActionMap* actionMap = nullptr;
    VelmoraLoadXml* loader = createVelmoraLoadXml();
    if (loader == nullptr) {
        VLOGE("server get loader failed!");
    } else {
        actionMap = loader->loadXmlMap();
        if (actionMap == nullptr) {
            VLOGE("load xml map failed!");
        }
        delete loader;
    }
    if (actionMap == nullptr) {
        VLOGE("createParser failed!");
        releaseComponents();
        return -1;
    }
    parser->mActionMap = actionMap;
    parser->mServerPtr = mPlatPtr->mServerPtr;

    const int initRet = mPlatPtr->initialize();
    if (initRet != 0) {
        VLOGE("initialize failed!");
        releaseComponents();
        return initRet;
    }

    mInitialized = true;
    const int defaultRet = velmoraEvent(kCmdDefaultSchedLevel, "", 0, nullptr);
    if (defaultRet != 0) {
        mInitialized = false;
        releaseComponents();
        VLOGE("init default group sched level failed!");
        return defaultRet;
    }

    Action* probeAction = new Action();
    if (parseCommand(kCmdProbe, probeAction) != 0) {
        deleteActionPtr(probeAction);
        VLOGE("doParse probe event failed!");
        return 4;
    }
    detachBorrowedChain(probeAction);
    mProbeHandler = new ProbeHandler(mPlatPtr, probeAction);

    initPriorityMap();
    return 0;
}

int VelmoraServer::updateProbeHandler() {
    Action* action = new Action();
    VelmoraParser* parser = mPlatPtr != nullptr ? mPlatPtr->mParserPtr : nullptr;
    // Runs under the parser's write lock: parse without taking the read lock.
    if (parser == nullptr || parser->doParseLocked(kCmdProbe, action) != 0) {
        deleteActionPtr(action);
        VLOGE("updateProbeHandler:doParse probe event failed!");
        return 4;
    }
    detachBorrowedChain(action);
    if (mProbeHandler == nullptr) {
        deleteActionPtr(action);
        VLOGE("updateProbeHandler:mProbeHandler is NULL!");
        return 4;
    }
    if (mProbeHandler->updateProbeThread(action) == 0) {
        return 0;
    }
    VLOGE("updateProbeHandler:updateProbeThread failed!");
    deleteActionPtr(action);
    return 4;
}
