// Turns the server's own log lines, as `adb logcat` printed them, into an event trace for
// velmora-replay (docs/replay.md): events with their first payload int, client requests joined
// from their per-pair lines, queries, and the dump options the log shows. Times are
// milliseconds since the first call.
//
// Only lines of the tag "velmora server" from one process (the first that logs with the tag)
// are read; other tags, other processes and lines that are not logcat text are counted and
// skipped. What the log does not hold is said in the trace: events whose message text the
// server does not log (probe, memory latency) and queries, whose tags it does not log, get
// placeholders marked "EDIT"; requests whose pairs could not be joined get a note.
//
// One import per object; not thread safe.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include "tools/logcat/LogcatFormat.h"
#include "tools/logcat/RequestJoiner.h"
#include "tools/logcat/ServerMessage.h"

namespace velmora {

struct ImportCounts {
    int lines = 0;        // lines that are not blank
    int serverLines = 0;  // of the tag "velmora server" from the server's process
    int events = 0;
    int requests = 0;
    int queries = 0;
    int dumps = 0;         // dump options seen: "--logon" (the entry-point lines), turned down
    int placeholders = 0;  // calls with a part the log lacks, marked EDIT
    int unjoined = 0;      // requests whose pairs could not be joined
    int tooLong = 0;       // requests of more pairs than a trace call takes, written as notes
    int otherTags = 0;
    int otherProcesses = 0;
    int garbage = 0;           // not a logcat line of the format
    int otherServerLines = 0;  // the server's own messages: errors, the host layer's notes

    // One line: "120 lines, 80 velmora server lines: 60 events, ...".
    std::string text() const;
};

class LogcatImporter {
public:
    // Imports `text`, read from `sourceName` (named in the trace's header). 0, or -1 with a
    // one-line `error` and no trace: empty log, binary data, unknown format, no server lines,
    // no host calls among them.
    int importText(const std::string& text, const std::string& sourceName, std::string* error);

    const std::string& trace() const { return mTrace; }
    const ImportCounts& counts() const { return mCounts; }
    // The format detected, as given to `logcat -v` ("threadtime,year").
    std::string formatName() const { return mFormat.name(); }
    const LogcatFormat& format() const { return mFormat; }
    // The log time of the trace's @0 (its first call), on the format's clock.
    int64_t firstCallUs() const { return mFirstCallUs; }

private:
    struct Entry {
        int64_t timeUs = 0;
        int line = 0;
        std::string call;  // empty for a note of its own
        std::string comment;
    };

    void readLine(const std::string& line, int lineNo);
    void readServerLine(const LogcatRecord& record, int lineNo);
    void addEvent(const ServerMessage& m, int64_t timeUs, int line, std::string comment);
    void addRequest(const JoinedRequest& request);
    void noteDebugLogging(int64_t timeUs, int line);
    std::string noCallsError() const;
    void writeTrace(const std::string& sourceName);

    LogcatFormat mFormat;
    bool mDetected = false;
    int64_t mYearShiftUs = 0;  // added to dates without year once the log has seen a new year
    int64_t mLastUs = 0;
    int64_t mFirstCallUs = 0;
    int mPid = -1;  // the server's process
    bool mDebugSeen = false;
    std::map<int, bool> mRestartEventLast;  // by thread: its last line was event 20224
    RequestJoiner mJoiner;
    std::vector<Entry> mEntries;
    ImportCounts mCounts;
    std::string mTrace;
};

}  // namespace velmora
