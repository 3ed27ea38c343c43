// Scheduler-group levels: one level per group for each source that may ask for one (the
// configured defaults, the clients KX, JN and ZOLA, and duration-0 events), merged into the
// level the platform applies.
//
// Owns seven tables keyed by group tag 50..58 (all nine tags present from construction) and the
// level scale; the platform object is borrowed and never touched by the destructor, since the
// server deletes the platform first. The server creates one manager through getSchedLevel() and
// calls doEventSchedLevel (event dispatch, start-up command 5376 included), doPerfSetSchedLevel
// (client requests) and dumpEasGroupList (debug dump) from any host thread.
//
// Locking: mLock is the manager's only lock and is not recursive. The two entry points take it
// after validating their input and hold it through the platform call, so a slow platform holds
// up the other entry point; nothing else is locked while it is held except the dump snapshot's
// own short lock, taken last to publish what the dump prints. Every other table operation
// expects the caller to hold it (see REQUIRES). The dump never takes it: it prints
// mEasGroupSnapshot, which every operation that changes a printed table republishes before it
// returns (an entry point once, when it returns), and only when a printed value changed.
// getSchedLevelMap hands out a table without it.
#pragma once

#include <utils/Mutex.h>
#include <utils/String8.h>

#include <cstdint>
#include <map>
#include <vector>

#include "config/Tags.h"
#include "dump/DumpSnapshot.h"
#include "platform/VelmoraExport.h"

class Action;
class VelmoraPlat;

class SchedLevelManager {
public:
    using LevelMap = std::map<int, int>;  // group tag -> level

    explicit SchedLevelManager(VelmoraPlat* plat);
    virtual ~SchedLevelManager();

    // Entry point for duration-0 events. 0 on success or when no ZOLA level changed, -1 on a
    // malformed action or missing executor, otherwise the executor's nonzero result (state
    // rolled back). Command 5376 only records the defaults.
    int doEventSchedLevel(const Action* action) EXCLUDES(mLock);
    // Entry point for client requests (tags 40/42). 0 on success, -1 on rejected input or
    // missing executor, otherwise the executor's nonzero result (state rolled back).
    int doPerfSetSchedLevel(int clientId, int tagLen, const int* tags, const int* configs)
        EXCLUDES(mLock);
    // Appends the default, current, KX, JN and ZOLA tables, as last published. Never waits for
    // mLock.
    void dumpEasGroupList(android::String8& out) EXCLUDES(mLock);
    // Appends one line per active group of `table`.
    void printEasGroupList(LevelMap& table, android::String8& out) NO_THREAD_SAFETY_ANALYSIS;

    // Table set-up: all nine tags at 0, or at ZOLA_SCHED_LEVEL_NONE.
    void initSchedLevelMap(LevelMap& table);
    void initZolaSchedLevelMap(LevelMap& table);
    // Fills the level scale -20..40 in steps of 10.
    void initSchedLevelVec();

    // Decoding of a packed client value; -1 when out of range. A level of -1 cannot be told
    // apart from the error, so callers reject it.
    int getSchedGroup(int config);
    int getSchedLevel(int config);
    // Position of `level` on the scale, -1 when it is not on it.
    int getIndex(int level);

    // The operations below that change a printed table (default, current, KX, JN, ZOLA) leave
    // the dump's copy current before they return.

    // Records the defaults of command 5376 (`tags` holds its pairs interleaved) into the
    // default table and the three client tables, and reports them in `groups`/`levels`.
    // 0, or -1 on a shape that is neither one hmp pair nor eight EAS pairs (nothing changed).
    int initDefaultSchedLevel(int tagLen, const std::vector<int>& tags, int* groups, int* levels)
        REQUIRES(mLock);

    // Applies an event to the ZOLA event tables and copies changed groups into the ZOLA table.
    // 1 when the ZOLA table changed, else 0.
    int updateSchedLevelMapIfNeeded(const Action* action) REQUIRES(mLock);
    // Writes the action's pairs into `table`; a later pair for the same tag wins.
    void updateZolaSchedValue(const Action* action, LevelMap& table);
    // Copies every group whose event level differs into the ZOLA table. 1 if any did, else 0.
    int checkIfZolaLevelChanged() REQUIRES(mLock);

    // Merges all sources into the current table and lists the active groups (eight EAS groups,
    // or the hmp group alone) in `groups`/`levels`, which must hold 8 entries.
    void updateCurrentMapLocked(int* count, int* groups, int* levels) REQUIRES(mLock);
    // Merge and hand-over without rollback. 0, -1 without executor, or the executor's result.
    int updateCurrentSchedlevel() REQUIRES(mLock);
    // Moves every level of a client table one position along the scale (`step` +1 or -1),
    // never above the group's default.
    void updateSchedLevelByOneStep(LevelMap& table, int step) REQUIRES(mLock);

    // The table of client 1, 2 or 3; null (and an error log) for any other id.
    LevelMap* getSchedLevelMap(int clientId) NO_THREAD_SAFETY_ANALYSIS;

    VelmoraPlat* mPlatPtr;  // not owned; deleted by the server before this manager

    // Guarded by mLock.
    LevelMap mDefaultLevelMap GUARDED_BY(mLock);
    LevelMap mCurrentLevelMap GUARDED_BY(mLock);
    LevelMap mKxLevelMap GUARDED_BY(mLock);
    LevelMap mJnLevelMap GUARDED_BY(mLock);
    LevelMap mZolaLevelMap GUARDED_BY(mLock);
    LevelMap mZolaFirstEventMap GUARDED_BY(mLock);
    LevelMap mZolaEventMap GUARDED_BY(mLock);

    // Written by the constructor only and read-only afterwards, so the decoders read them
    // without the lock.
    int mSchedLevels[50];
    int mSchedLevelNum;

    // Guarded by mLock.
    bool mZolaFirstEventSeen GUARDED_BY(mLock);
    bool mHmpMode GUARDED_BY(mLock);

    android::Mutex mLock;

    // What "--easgrouplist" prints: the levels of the nine group tags in the default, current,
    // KX, JN and ZOLA tables, and the mode that picks the lines.
    struct EasGroupValues {
        static constexpr int kTables = 5;
        static constexpr int kGroups = 9;  // tags 50..58
        int32_t levels[kTables][kGroups];
        bool hmpMode;
        bool operator==(const EasGroupValues& other) const;
    };

private:
    class PublishOnReturn;

    velmora::DumpSnapshot<EasGroupValues> mEasGroupSnapshot;

    // Copies the five dumped tables into mEasGroupSnapshot when a printed value differs from
    // the last copy. Held back while an entry point runs, which publishes once as it returns,
    // so that a dump never shows levels the entry point is about to roll back.
    void publishEasGroupListLocked() REQUIRES(mLock);

    // Guarded by mLock.
    EasGroupValues mEasGroupPublished GUARDED_BY(mLock);  // what mEasGroupSnapshot holds
    bool mPublishDeferred GUARDED_BY(mLock);              // an entry point is running
};

// Creates the manager for `plat`; the caller owns it. Exported for the same reason as
// getFreqClient: a factory of the platform interface.
VELMORA_EXPORT SchedLevelManager* getSchedLevel(VelmoraPlat* plat);
