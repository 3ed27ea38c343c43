#include "tools/logcat/ServerMessage.h"

#include <climits>
#include <cstdlib>
#include <vector>

namespace velmora {

namespace {

// Matches `text` against `pattern`, in which '#' stands for a decimal int with an optional
// minus sign (as "%d" prints it); the whole text must match. The ints go to `values`.
bool match(const std::string& text, const char* pattern, std::vector<int>* values) {
    values->clear();
    size_t at = 0;
    for (const char* p = pattern; *p != '\0'; ++p) {
        if (*p != '#') {
            if (at >= text.size() || text[at] != *p)
                return false;
            ++at;
            continue;
        }
        const size_t start = at;
        if (at < text.size() && text[at] == '-')
            ++at;
        const size_t digits = at;
        while (at < text.size() && text[at] >= '0' && text[at] <= '9' && at - digits < 11)
            ++at;
        if (at == digits)
            return false;
        const long long v = strtoll(text.c_str() + start, nullptr, 10);
        if (v < INT_MIN || v > INT_MAX)
            return false;
        values->push_back(static_cast<int>(v));
    }
    return at == text.size();
}

// A query longer than this is not one the host could have made; its placeholder would be huge.
constexpr int kMaxQueryTags = 256;

const char* const kDumpWarnings[] = {
    "invalid dump FD, #",
    "dump parameter is NULL!",
    "there is too many dump parameter!",
    "debug parameter is too long!",
};

}  // namespace

ServerMessage ServerMessage::parse(const std::string& text) {
    ServerMessage m;
    std::vector<int> v;
    if (match(text, "velmoraEvent cmdId=#, payload=#", &v)) {
        m.kind = Kind::kEvent;
        m.cmdId = v[0];
        m.hasPayload = true;
        m.payload = v[1];
    } else if (match(text, "velmoraEvent cmdId=#", &v)) {
        m.kind = Kind::kEvent;
        m.cmdId = v[0];
    } else if (match(text, "setConfig clientId=#, tagLen=#, tags[#]=#, configs[#]=#", &v)) {
        if (v[2] != v[4] || v[2] < 0 || v[2] >= v[1])
            return m;
        m.kind = Kind::kSetConfigPair;
        m.clientId = v[0];
        m.tagLen = v[1];
        m.index = v[2];
        m.tag = v[3];
        m.config = v[5];
    } else if (match(text, "velmoraGetConfig tagLen=#", &v)) {
        if (v[0] < 1 || v[0] > kMaxQueryTags)
            return m;
        m.kind = Kind::kGetConfig;
        m.tagLen = v[0];
    } else if (match(text, "client may rebooted, clean special scene set, cmdId is #", &v)) {
        m.kind = Kind::kClientRestart;
        m.cmdId = v[0];
    } else {
        for (const char* warning : kDumpWarnings) {
            if (match(text, warning, &v))
                m.kind = Kind::kDumpRejected;
        }
    }
    return m;
}

}  // namespace velmora
