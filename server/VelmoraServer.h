// The performance server: the object the host service constructs, initialises once and then
// calls from its own threads for events, client configuration requests, queries and dumps.
//
// Owns the platform object, the frequency-client manager, the scheduling-level manager and the
// probe handler (deleted in that order), the special-scene priority table and the scene state.
// init, deleteObject and the destructor are not synchronised; every other entry point may run
// on several host threads at once after init.
//
// Locks: mMutex guards mPriorityMap, mOnEventSet and mCurSpecialCmdId. It is never held while
// calling the platform, a manager or the parser; the parser's write lock (reload) is taken
// before it. Field order and virtual slot order are part of the binary interface with the host.
#pragma once

#include <utils/Mutex.h>

#include <atomic>
#include <cstdint>
#include <map>
#include <set>
#include <string>
#include <vector>

#include "platform/VelmoraExport.h"

class Action;
class FreqClientManager;
class ProbeHandler;
class SchedLevelManager;
class VelmoraPlat;

// Exported: the host service constructs it and calls its entry points.
class VELMORA_EXPORT VelmoraServer {
public:
    VelmoraServer();
    virtual ~VelmoraServer();

    // Host entry points. Status codes: 0 success or nothing to do, 1 not initialised, 2 parse
    // failure, 3 action/request/query failure, 4 missing component, -1 invalid parameters;
    // platform results are passed through where noted.
    virtual int velmoraEvent(int cmdId, const char* msg, unsigned int payloadNum,
                             const int* payload);
    virtual int velmoraSetConfig(int clientId, int tagLen, const int* tags, const int* configs);
    virtual int velmoraGetConfig(int tagLen, const int* tags, int* configs);

    // Builds the components and loads the configuration. 0 on success, 4 when only the probe
    // command is missing (server otherwise running), otherwise the failure status.
    int init();
    // Releases the four components; keeps the flags and tables.
    void deleteObject();
    // Writes the answer to one dump option to `fd`. Works in every state.
    void dumpVelmoraServerInfo(int fd, const std::vector<std::string>& args);
    // Interface version of the server: always 1.
    int velmoraGetVersion();
    // Deletes a whole Action chain, following mNext. Null is allowed.
    void deleteActionPtr(Action* action);

    // Event dispatch helpers (VelmoraServerEvent.cpp).
    int isVelmoraEnable(int cmdId, const int* payload);
    void updatePolicy(int cmdId, Action* action, const int* payload);
    bool isParamValid(unsigned int payloadNum, const int* payload);
    int doProbeEvent(const char* msg, unsigned int payloadNum, const int* payload);
    int doNotificationEvent(int cmdId, unsigned int payloadNum, const int* payload);
    int doOnOffAction(const Action* action, unsigned int payloadNum, const int* payload);

    // Reload hooks, called by the parser with its write lock held.
    int updateProbeHandler();
    void updatePriorityMap() EXCLUDES(mMutex);

    // Priority arbitration (VelmoraServerPriority.cpp). Except for initExistingPriority (from
    // the constructor), initPriorityMap (from init) and updatePriorityMap (takes mMutex
    // itself), REQUIRES: mMutex held.
    void initExistingPriority() REQUIRES(mMutex);
    // Runs inside init, before any other thread can call in; takes no server lock.
    void initPriorityMap() NO_THREAD_SAFETY_ANALYSIS;
    void setPriorityMap(int cmdId, Action* action) REQUIRES(mMutex);
    int getPriority(Action* action);
    int getInterPriority(Action* action);
    bool isPriorityValid(int cmdId) REQUIRES(mMutex);
    int doOnEvent(int cmdId, int newPrio, int curPrio) REQUIRES(mMutex);
    int doOffEvent(int cmdId, int* nextCmdId, int* flag) REQUIRES(mMutex);
    int getMaxGovPrioCmdIdInOnEvent(int cmdId) REQUIRES(mMutex);
    int getMaxGovPrioCmdIdInOffEvent() REQUIRES(mMutex);
    int getCmdIdWithMaxPrio(bool govOnly) REQUIRES(mMutex);

    // Special scenes (VelmoraServerScene.cpp) and memory latency (VelmoraServerMemlatency.cpp).
    int doSpecialSceneEvent(int cmdId, unsigned int payloadNum, const int* payload);
    int doSpecialAction(int cmdId, int value);
    int doMemlatencyEvent(int cmdId, const char* msg, unsigned int payloadNum,
                          const int* payload);

    VelmoraPlat* mPlatPtr;
    FreqClientManager* mFreqClientPtr;
    SchedLevelManager* mSchedLevelPtr;
    ProbeHandler* mProbeHandler;
    android::Mutex mMutex;
    // The dump and notification 20225 write these two flags while every host thread reads
    // them; each is a lone switch that orders nothing else, so relaxed loads and stores do.
    // std::atomic<bool> has the size, alignment and offset of the plain bool it replaces.
    std::atomic<bool> mDebugLog;       // entry-point traces; switched by "--logon" / "--logoff"
    bool mInitialized;                 // entry points return 1 while false
    std::atomic<bool> mPolicyEnabled;  // launch policies replace durations; bit 18 of 20225
    // Guarded by mMutex.
    int32_t mCurSpecialCmdId GUARDED_BY(mMutex);  // scene currently applied, 0 for none
    std::map<int32_t, int32_t> mPriorityMap GUARDED_BY(mMutex);  // lookups insert on miss
    std::set<int32_t> mOnEventSet GUARDED_BY(mMutex);  // scenes switched on

private:
    // Parses `cmdId` into `action` under the parser's read lock. -1 without parser.
    int parseCommand(int cmdId, Action* action);
    // Deletes and nulls the four components in ownership order.
    void releaseComponents();
};
