// Frequency-client manager: turns every frequency and thermal limit asked of the device into one
// value per tag and sends it to the platform.
//
// Owns the raw requests of the three clients (KX, JN, ZOLA), their merged values, the caps and
// floors of on/off events (one table per tag, keyed by command id) and the statistics reporter.
// The server creates one through getFreqClient at init and calls doPerfSetConfig from its client
// configuration entry point (onOff null) and its on/off action path (command id and on/off word),
// from any host thread.
//
// Locking: mLock guards every table, both flags and the reporter. doPerfSetConfig holds it for
// the whole request, platform calls included; nothing called under it re-enters the manager.
// The dump never takes it: it prints mFreqListSnapshot, which every operation that changes a
// client table republishes under mLock before it returns, when a printed value changed (mLock
// before the snapshot's own lock). Field order and the single
// virtual destructor are part of the binary interface with separately built components.
#pragma once

#include <utils/Mutex.h>
#include <utils/String8.h>

#include <array>
#include <cstdint>
#include <map>
#include <set>

#include "dump/DumpSnapshot.h"
#include "freq/FreqTags.h"
#include "platform/VelmoraExport.h"
#include "report/FreqInfoUpload.h"

class PerfExecutor;
class VelmoraPlat;

class FreqClientManager {
public:
    using TagMap = std::map<int32_t, int32_t>;    // tag -> value
    using EventMap = std::map<int32_t, int32_t>;  // command id -> value

    // Marker for "no cap found" inside the minimum searches.
    static constexpr int32_t kNoCap = 0x7fffffff;

    explicit FreqClientManager(VelmoraPlat* plat);
    virtual ~FreqClientManager();

    // Single entry point. id 0: feature switch; 1..3 and negative: client request (onOff null);
    // 4 and above: event request with *onOff 0 (on) or -1 (off). Returns 0 on success or when
    // ignored, -1 on rejected input or missing executor, else the platform's nonzero result.
    int doPerfSetConfig(int id, int tagLen, const int* tags, const int* configs, const int* onOff)
        EXCLUDES(mLock);
    // Event request: floors (1, 4, 7) and caps (2, 5, 8) merged with the other events and the
    // clients. Same results as doPerfSetConfig. REQUIRES: mLock held.
    int doPerfEventConfig(int cmdId, int tagLen, const int* tags, const int* configs, int onOff)
        REQUIRES(mLock);

    // Appends the three clients' stored requests, as last published. Never waits for mLock.
    void dumpFreqList(android::String8& out) EXCLUDES(mLock);
    // Appends the seven merged tags of `table`, inserting missing ones as 0.
    void printFreqList(TagMap& table, android::String8& out);

    // Feature switch: turns statistics upload on (never off). REQUIRES: mLock held.
    void enableFreqInfoUpload(int tagLen, const int* tags, const int* configs) REQUIRES(mLock);
    // Stores a successful client request's raw merged-tag values. REQUIRES: mLock held.
    void cacheTags(int clientId, int tagLen, const int* tags, const int* configs) REQUIRES(mLock);
    // Copies the merged tags of the request into `table`; other tags are ignored. REQUIRES:
    // mLock held.
    void updateConfigMap(int tagLen, const int* tags, const int* configs, TagMap& table)
        REQUIRES(mLock);
    // Reads the top frequencies into the reporter. 0 or the platform's failure (-1 without
    // executor). Does not take mLock and does not set mMaxFreqRead. REQUIRES: mLock held.
    int readMaxFreq() REQUIRES(mLock);

    // Merging rules. Those reading the manager's tables REQUIRE mLock held.
    // Smallest positive of a and b; 0 over -1; -1 only when both are -1.
    int getValidMinValue(int a, int b);
    // Fork-on-big rule: 0 wins, then 1, then -1.
    int getTaskForkMinValue(int a, int b);
    // Merged value of the two other clients for `tag`; -1 (logged) for ids other than 1..3.
    int getMinTagConfigs(int clientId, int tag) REQUIRES(mLock);
    // A client's request merged with the two other clients; -1 for an invalid fork request.
    int getNewConfig(int clientId, int tag, int config) REQUIRES(mLock);
    // Smallest positive value of `table`, else 0.
    int getMinConfig(const EventMap& table);
    // Smallest positive event cap for tags 2, 5, 8; 0 for other tags or no active cap.
    int getSceneConfig(int tag) REQUIRES(mLock);
    // `config` merged with the active event caps of `tag`.
    int getConfigWithSceneEvent(int config, int tag) REQUIRES(mLock);
    // Effective cap of an event: other events' caps, the clients' merged cap and, when on, freq.
    int getMinFreqFromMap(int cmdId, int onOff, int tag, int freq, const EventMap& table)
        REQUIRES(mLock);
    // Effective floor of an event: largest of the other events' floors and, when on, freq.
    int getMaxFreqFromMap(int cmdId, int onOff, int freq, const EventMap& table);
    // False only when both are positive and the floor exceeds the cap.
    bool isFreqValValid(int minFreq, int maxFreq);

    // Event tables. REQUIRES: mLock held; `tag` one of 1, 2, 4, 5, 7, 8.
    void setMapFreq(int cmdId, int tag, int value) REQUIRES(mLock);
    // Stores (on) or clears (any other onOff) the event's positive requested values.
    void saveDataToMap(int cmdId, int onOff, const TagMap& requested) REQUIRES(mLock);

    // Construction steps.
    void initConfigSet();
    // Every merged tag of `table` at -1 (never set). REQUIRES: mLock held.
    void initConfigMap(TagMap& table) REQUIRES(mLock);
    // Only the constructor calls it, before the object is shared.
    void initFreqMap() NO_THREAD_SAFETY_ANALYSIS;

    VelmoraPlat* mPlatPtr;         // not owned
    std::set<int32_t> mConfigSet;  // the merged tags; fixed at construction
    // Guarded by mLock.
    TagMap mKxConfigMap GUARDED_BY(mLock);  // raw last accepted request, -1 never set
    TagMap mJnConfigMap GUARDED_BY(mLock);
    TagMap mZolaConfigMap GUARDED_BY(mLock);
    TagMap mMinConfigMap GUARDED_BY(mLock);  // merged client value per merged tag
    EventMap mLittleMinFreqMap GUARDED_BY(mLock);
    EventMap mLittleMaxFreqMap GUARDED_BY(mLock);
    EventMap mBigMinFreqMap GUARDED_BY(mLock);
    EventMap mBigMaxFreqMap GUARDED_BY(mLock);
    EventMap mGpuMinFreqMap GUARDED_BY(mLock);
    EventMap mGpuMaxFreqMap GUARDED_BY(mLock);
    // Event tag -> one of the six tables above; fixed at construction, the tables are not owned
    // through it.
    std::map<int32_t, EventMap*> mFreqMap;
    android::Mutex mLock;
    FreqInfoUpload mFreqInfoUpload GUARDED_BY(mLock);
    bool mMaxFreqRead GUARDED_BY(mLock);    // top frequencies handed to the reporter
    bool mUploadEnabled GUARDED_BY(mLock);  // set by the feature switch, never cleared

    // What "--freqlist" prints: KX's, JN's and ZOLA's values of the seven merged tags, in dump
    // order, copied from the client tables whenever one of them changes.
    static constexpr int kFreqListClients = 3;
    static constexpr int kFreqListTags = 7;
    using FreqListValues = std::array<std::array<int32_t, kFreqListTags>, kFreqListClients>;

private:
    velmora::DumpSnapshot<FreqListValues> mFreqListSnapshot;

    // Copies the client tables into mFreqListSnapshot when a printed value differs from the last
    // copy; called by every operation that changes a client table.
    void publishFreqListLocked() REQUIRES(mLock);
    // Whether `table` is one of the client tables the dump prints.
    bool isClientTable(const TagMap& table) const NO_THREAD_SAFETY_ANALYSIS;
    // The platform's executor, or null when the platform or its executor is absent.
    PerfExecutor* executor() const;
    // The client's table, or null for ids other than 1..3.
    TagMap* clientTable(int clientId) REQUIRES(mLock);

    FreqListValues mFreqListPublished GUARDED_BY(mLock);  // what mFreqListSnapshot holds
};

// A new manager built on `plat`, owned by the caller. Exported: a factory of the platform
// interface, which a platform layer may call to build its own manager (it needs nothing else of
// the class: it only keeps the pointer and deletes it through the virtual destructor).
VELMORA_EXPORT FreqClientManager* getFreqClient(VelmoraPlat* plat);
