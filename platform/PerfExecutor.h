// The object of the platform layer that carries out every request on the hardware.
//
// Supplied by the platform layer through VelmoraPlat::mExecutorPtr; the library only calls it.
// The slot order of the virtual operations is part of the binary interface with the closed
// platform components and must not change. Implementations must accept concurrent calls from
// host threads, the managers (under their own locks) and the probe worker.
#pragma once

class Action;

class PerfExecutor {
public:
    // Applies an action. payload[0] is 0 to apply (switch on, boost) and -1 to withdraw.
    // Returns 0 on success.
    virtual int doAction(const Action* action, unsigned int payloadNum, const int* payload) = 0;
    // Applies a merged frequency configuration for a client id or an event's command id.
    virtual int doPerfSetConfig(int id, int count, const int* tags, const int* values) = 0;
    // Reads the current values of `count` tags into `values`.
    virtual int doPerfGetConfig(int count, const int* tags, int* values) = 0;
    // Applies scheduler-group levels, groups[i] at levels[i].
    virtual int doSchedLevelAction(int count, const int* groups, const int* levels) = 0;
    // Selects the thread the next probe action applies to: state 0 before a boost, -1 before
    // an unboost.
    virtual int setProbeTid(unsigned int tid, int state) = 0;
    virtual ~PerfExecutor() = default;
};
