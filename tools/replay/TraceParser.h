// The event-trace format of velmora-replay: one host call per line.
//
//     # comment (also after a call)
//     [@<ms>] <call>                  "@<ms>" waits until trace time <ms> before the call
//     @<ms>                           a time stamp on its own
//     sleep <ms>
//     event <cmdId> [<payload>...] [msg="<text>"]
//     reload                          event 20230
//     setconfig <clientId> <tag>=<value> [<tag>=<value>...]
//     getconfig <tag> [<tag>...]
//     dump <option>                   --help --logon --logoff --freqlist --easgrouplist
//     policy <name> <duration>        launch-policy answer (cold, winswitch); -1 clears it
//     load <domain>=<u> [...]         the load of performance domains from now on, u in [0, 1]
//
// An event takes up to 63 payload ints, a request up to kMaxTags pairs and a query up to kMaxTags
// tags (velmora-import-logcat writes a longer request of a device's log as a note).
// Numbers are decimal or 0x hexadecimal, with an optional minus sign; times (the "@" stamp and
// sleep) are not negative. Errors name the file and line: "trace.txt:12: malformed number 'x1'
// for payload"; an unknown call name gets a did-you-mean ("unknown call 'evnt'; did you mean
// 'event'?"). Whether a load line's domains have energy tables is the device profile's
// business (LoadDomains).
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace velmora {

// One domain's share of a `load` line: its average utilisation relative to the capacity of its
// top frequency.
struct LoadShare {
    std::string domain;  // a <frequencies> id of the device profile, e.g. "cpu.big"
    double u = 0;        // 0..1
};

struct TraceCall {
    enum class Kind { Stamp, Sleep, Event, Reload, SetConfig, GetConfig, Dump, Policy, Load };

    Kind kind = Kind::Stamp;
    std::string file;
    int line = 0;
    int64_t atMs = -1;             // "@<ms>" prefix, -1 when absent
    int64_t sleepMs = 0;           // sleep
    int id = 0;                    // event: cmdId; setconfig: clientId; policy: duration
    std::vector<int> payload;      // event
    bool hasMsg = false;           // event: msg= given (null message otherwise)
    std::string text;              // event: msg; dump: option; policy: name
    std::vector<int> tags;         // setconfig, getconfig
    std::vector<int> values;       // setconfig
    std::vector<LoadShare> loads;  // load
    std::string source;            // the line as written, for the echo
};

class TraceParser {
public:
    static constexpr int kMaxTags = 1024;
    // The most domains one load line names.
    static constexpr int kMaxLoads = 64;

    // Parses one line; appends a call unless the line is blank or a comment. 0, or -1 with
    // `error` naming file:line.
    static int parseLine(const std::string& line, const std::string& file, int lineNo,
                         std::vector<TraceCall>* calls, std::string* error);
    // parseLine() into `call`, whose buffers are reused: `any` tells whether the line held a
    // call (false for a blank line or a comment, `call` then untouched). On an error `call` may
    // be half filled.
    static int parseInto(const std::string& line, const std::string& file, int lineNo,
                         TraceCall* call, bool* any, std::string* error);
    // Every line of `text`, read by TraceReader (a UTF-8 byte-order mark at its start is
    // skipped). Goes on past bad lines: -1 when there was one, with `error` holding one message
    // per bad line, separated by newlines; the calls of the good lines are appended either way.
    static int parseText(const std::string& text, const std::string& file,
                         std::vector<TraceCall>* calls, std::string* error);
    // parseText on the contents of `path`; a missing file is an error naming it. A replay
    // reads its trace with TraceReader instead, without keeping every call.
    static int parseFile(const std::string& path, std::vector<TraceCall>* calls,
                         std::string* error);
};

}  // namespace velmora
