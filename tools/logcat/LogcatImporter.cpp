#include "tools/logcat/LogcatImporter.h"

#include <algorithm>
#include <cstdio>

#include "config/CommandIds.h"
#include "tools/replay/TraceParser.h"

namespace velmora {

namespace {

constexpr const char* kServerTag = "velmora server";
// What the user puts in place of the message the log lacks (a probe reads "pid=%d|tid=%d",
// a memory-latency event "pid=%d|tid=%d|ratio_b=%s ratio_l=%s").
constexpr const char* kPlaceholderMsg = "pid=0|tid=0";
// Placeholder tag for queries, whose tags the server does not log: the little cluster's top
// frequency, which every device can read.
constexpr int kPlaceholderQueryTag = 22;
// Dates without year: a stamp this far before the previous one means the log saw a new year;
// the year counted then is 2000, a leap year.
constexpr int64_t kHalfYearUs = 183LL * 24 * 3600 * 1000000;
constexpr int64_t kYearWithoutYearUs = 366LL * 24 * 3600 * 1000000;
// Calls start in this column: "@25000  event 4099 0".
constexpr size_t kCallColumn = 8;

// `text` with control characters (a newline in a file name) as '?', for a comment line.
std::string printable(std::string text) {
    for (char& c : text) {
        if (static_cast<unsigned char>(c) < 0x20 || c == 0x7f)
            c = '?';
    }
    return text;
}

std::string plural(int n, const char* one, const char* many) {
    return std::to_string(n) + " " + (n == 1 ? one : many);
}

}  // namespace

std::string ImportCounts::text() const {
    return plural(lines, "line", "lines") + ", " +
           plural(serverLines, "velmora server line", "velmora server lines") + ": " +
           plural(events, "event", "events") + ", " + plural(requests, "request", "requests") +
           ", " + plural(queries, "query", "queries") + ", " + plural(dumps, "dump", "dumps") +
           "; " + plural(placeholders, "placeholder", "placeholders") + " to edit, " +
           plural(unjoined, "request", "requests") + " not joined; skipped " +
           std::to_string(otherTags) + " other tags, " + std::to_string(otherProcesses) +
           " other processes, " + std::to_string(garbage) + " garbage, " +
           std::to_string(otherServerLines) + " other server lines" +
           (tooLong > 0 ? "; " + plural(tooLong, "request", "requests") + " too long to write"
                        : std::string());
}

int LogcatImporter::importText(const std::string& text, const std::string& sourceName,
                               std::string* error) {
    if (text.find_first_not_of(" \t\r\n") == std::string::npos) {
        *error = sourceName + ": empty log";
        return -1;
    }
    if (text.find('\0') != std::string::npos) {
        *error = sourceName + ": binary data, not logcat text";
        return -1;
    }
    size_t start = 0;
    int lineNo = 0;
    while (start < text.size()) {
        size_t end = text.find('\n', start);
        if (end == std::string::npos)
            end = text.size();
        std::string line = text.substr(start, end - start);
        if (!line.empty() && line.back() == '\r')
            line.pop_back();
        readLine(line, ++lineNo);
        start = end + 1;
    }
    std::vector<JoinedRequest> open;
    mJoiner.finish(&open);
    for (const auto& request : open)
        addRequest(request);
    if (mCounts.events + mCounts.requests + mCounts.queries == 0) {
        *error = sourceName + ": " + noCallsError();
        return -1;
    }
    writeTrace(sourceName);
    return 0;
}

std::string LogcatImporter::noCallsError() const {
    if (!mDetected)
        return "not logcat text in a known format (threadtime or time, with or without the "
               "year, epoch, monotonic and uid modifiers)";
    if (mCounts.serverLines == 0)
        return "no \"velmora server\" lines among " + plural(mCounts.lines, "line", "lines") +
               " of logcat -v " + mFormat.name();
    return "no host calls among " +
           plural(mCounts.serverLines, "velmora server line", "velmora server lines");
}

void LogcatImporter::readLine(const std::string& line, int lineNo) {
    if (line.find_first_not_of(' ') == std::string::npos)
        return;
    ++mCounts.lines;
    if (!mDetected && !LogcatFormat::detect(line, &mFormat)) {
        ++mCounts.garbage;  // e.g. "--------- beginning of main"
        return;
    }
    mDetected = true;
    LogcatRecord record;
    if (!mFormat.parse(line, &record)) {
        ++mCounts.garbage;
        return;
    }
    if (mFormat.lacksYear() && record.timeUs + mYearShiftUs + kHalfYearUs < mLastUs)
        mYearShiftUs += kYearWithoutYearUs;
    record.timeUs += mYearShiftUs;
    mLastUs = record.timeUs;
    if (record.tag != kServerTag) {
        ++mCounts.otherTags;
        return;
    }
    if (mPid < 0)
        mPid = record.pid;
    if (record.pid != mPid) {
        ++mCounts.otherProcesses;
        return;
    }
    ++mCounts.serverLines;
    readServerLine(record, lineNo);
}

void LogcatImporter::readServerLine(const LogcatRecord& record, int lineNo) {
    const ServerMessage m = ServerMessage::parse(record.message);
    // The time layout has no thread ids: its lines are all taken for one thread.
    const int thread = record.tid >= 0 ? record.tid : record.pid;
    const bool restartEventLast = mRestartEventLast[thread];
    mRestartEventLast[thread] =
        m.kind == ServerMessage::Kind::kEvent && m.cmdId == kCmdClientRestart;
    switch (m.kind) {
        case ServerMessage::Kind::kEvent:
            noteDebugLogging(record.timeUs, lineNo);
            addEvent(m, record.timeUs, lineNo, "");
            break;
        case ServerMessage::Kind::kSetConfigPair: {
            std::vector<JoinedRequest> done;
            mJoiner.add(m, record.timeUs, lineNo, thread, &done);
            for (const auto& request : done)
                addRequest(request);
            break;
        }
        case ServerMessage::Kind::kGetConfig: {
            noteDebugLogging(record.timeUs, lineNo);
            std::string call = "getconfig";
            for (int i = 0; i < m.tagLen; ++i)
                call += " " + std::to_string(kPlaceholderQueryTag);
            mEntries.push_back(
                {record.timeUs, lineNo, call,
                 "EDIT: the log names " + std::to_string(m.tagLen) + " tags but not which"});
            ++mCounts.queries;
            ++mCounts.placeholders;
            break;
        }
        case ServerMessage::Kind::kClientRestart:
            if (restartEventLast) {
                ++mCounts.otherServerLines;  // the event line before it was this call
                break;
            }
            addEvent(m, record.timeUs, lineNo, "from the client-restart line");
            break;
        case ServerMessage::Kind::kDumpRejected:
            mEntries.push_back(
                {record.timeUs, lineNo, "", "a dump the server turned down: " + record.message});
            ++mCounts.dumps;
            break;
        case ServerMessage::Kind::kOther:
            ++mCounts.otherServerLines;
            break;
    }
}

// The server logs its entry points only while debug logging is on, so the first such line
// shows that the dump option "--logon" was given before it.
void LogcatImporter::noteDebugLogging(int64_t timeUs, int line) {
    if (mDebugSeen)
        return;
    mDebugSeen = true;
    mEntries.push_back(
        {timeUs, line, "dump --logon", "debug logging was on: the entry points are logged"});
    ++mCounts.dumps;
}

void LogcatImporter::addEvent(const ServerMessage& m, int64_t timeUs, int line,
                              std::string comment) {
    ++mCounts.events;
    if (m.cmdId == kCmdReload && !m.hasPayload) {
        mEntries.push_back({timeUs, line, "reload", comment});
        return;
    }
    std::string call = "event " + std::to_string(m.cmdId);
    if (m.hasPayload)
        call += " " + std::to_string(m.payload);
    if (m.cmdId == kCmdProbe || m.cmdId == kCmdMemLatencyRatio) {
        call += std::string(" msg=\"") + kPlaceholderMsg + "\"";
        comment = std::string("EDIT: the log lacks the message of the ") +
                  (m.cmdId == kCmdProbe ? "probe" : "memory-latency event");
        ++mCounts.placeholders;
    }
    mEntries.push_back({timeUs, line, call, comment});
}

void LogcatImporter::addRequest(const JoinedRequest& request) {
    if (request.tags.size() > static_cast<size_t>(TraceParser::kMaxTags)) {
        // velmora-replay would refuse the line.
        mEntries.push_back({request.timeUs, request.firstLine, "",
                            "not written: a request of client " +
                                std::to_string(request.clientId) + " with " +
                                std::to_string(request.tags.size()) +
                                " pairs, more than a trace call takes (" +
                                std::to_string(TraceParser::kMaxTags) + "), log line " +
                                std::to_string(request.firstLine)});
        ++mCounts.tooLong;
        return;
    }
    std::string call = "setconfig " + std::to_string(request.clientId);
    for (size_t i = 0; i < request.tags.size(); ++i)
        call += " " + std::to_string(request.tags[i]) + "=" + std::to_string(request.configs[i]);
    std::string comment;
    if (!request.complete()) {
        comment = "not joined: only pairs";
        for (size_t i = 0; i < request.indexes.size(); ++i)
            comment += (i == 0 ? " " : ",") + std::to_string(request.indexes[i]);
        comment += " of " + std::to_string(request.tagLen) + ", thread " +
                   std::to_string(request.thread) + ", log line " +
                   std::to_string(request.firstLine);
        if (request.lastLine != request.firstLine)
            comment += "-" + std::to_string(request.lastLine);
        ++mCounts.unjoined;
    }
    mEntries.push_back({request.timeUs, request.firstLine, call, comment});
    ++mCounts.requests;
}

void LogcatImporter::writeTrace(const std::string& sourceName) {
    // Requests are complete only at their last line; they belong where their first one was.
    std::stable_sort(mEntries.begin(), mEntries.end(),
                     [](const Entry& a, const Entry& b) { return a.line < b.line; });
    int64_t firstUs = 0;
    for (const auto& e : mEntries) {
        if (!e.call.empty()) {
            firstUs = e.timeUs;
            break;
        }
    }
    mFirstCallUs = firstUs;
    mTrace = "# Imported by velmora-import-logcat from " + printable(sourceName) + " (logcat -v " +
             mFormat.name() + ", process " + std::to_string(mPid) + ").\n# " + mCounts.text() +
             ".\n# Times are milliseconds since the first call. The log holds the first payload "
             "int of an\n# event only, no launch-policy answers and no dump but \"--logon\".\n\n";
    int64_t lastMs = 0;
    char stamp[32];
    for (const auto& e : mEntries) {
        // Buffers of logcat may interleave slightly out of order; a trace only goes forward.
        lastMs = std::max(lastMs, (e.timeUs - firstUs) / 1000);
        snprintf(stamp, sizeof(stamp), "@%lld", static_cast<long long>(lastMs));
        if (e.call.empty()) {
            mTrace += "# " + std::string(stamp) + " " + e.comment + "\n";
            continue;
        }
        // At least one blank after the stamp, however long the log.
        std::string line = "@" + std::to_string(lastMs);
        line.append(line.size() < kCallColumn ? kCallColumn - line.size() : 1, ' ');
        line += e.call;
        if (!e.comment.empty())
            line += "  # " + e.comment;
        mTrace += line + "\n";
    }
}

}  // namespace velmora
