// The command parser: holds the command configuration as a map from command id to an Action
// chain and copies one command into a caller's Action on request.
//
// Owned by the platform object (VelmoraPlat::mParserPtr). mRwLock guards mActionMap and every
// record reachable from it: each parse takes it for reading around doParseLocked, a reload takes
// it for writing while it swaps the map and refreshes the server. Lock order: mRwLock (write)
// before the server's mutex and before the probe worker's mutex; nobody takes mRwLock while
// holding either of those.
#pragma once

#include <pthread.h>

#include <cstdint>

#include "config/Action.h"
#include "platform/VelmoraExport.h"

class VelmoraServer;

// Exported: the platform object holds the parser and its destructor deletes it.
class VELMORA_EXPORT VelmoraParser {
public:
    VelmoraParser();
    // Takes the write lock, frees every chain and the map, then destroys the lock.
    virtual ~VelmoraParser();

    // Copies the record after the head of `cmdId`'s chain into `target`. Its mNext is borrowed
    // from the parser's chain. Returns 0 when parsed (or nothing to copy), 1 for an unknown
    // cmdId, 2 without target or map.
    // REQUIRES: mRwLock held for reading or writing.
    int doParseLocked(int32_t cmdId, Action* target);

    // Reloads the configuration (event 20230). A failed load keeps the current one; a
    // successful one replaces it and refreshes the server's priorities and probe action, all
    // under the write lock.
    void updateParser();

    ActionMap* mActionMap;        // owned; guarded by mRwLock
    pthread_rwlock_t mRwLock;     // public: callers lock it themselves
    VelmoraServer* mServerPtr;    // not owned

    // Frees every chain of `map` and the map itself. Null is allowed.
    static void deleteActionMap(ActionMap* map);
};
