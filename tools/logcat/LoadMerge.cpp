#include "tools/logcat/LoadMerge.h"

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <map>
#include <sstream>

namespace velmora {

namespace {

constexpr const char* kHeader = "# record-load:";

bool isIdChar(char c) {
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') || c == '.' ||
           c == '_' || c == '-';
}

// A utilisation as written: digits with at most one point, in [0, 1].
bool isShare(const std::string& text) {
    if (text.empty() || text.find_first_not_of("0123456789.") != std::string::npos ||
        std::count(text.begin(), text.end(), '.') > 1 || text == ".")
        return false;
    const double value = strtod(text.c_str(), nullptr);
    return value >= 0 && value <= 1;
}

// The time of a trace line: "@25000  event ..." or a note "# @25000 ..."; -1 for others.
int64_t traceLineMs(const std::string& line) {
    size_t at = line.rfind("# @", 0) == 0 ? 2 : 0;
    if (line.size() <= at + 1 || line[at] != '@')
        return -1;
    return strtoll(line.c_str() + at + 1, nullptr, 10);
}

}  // namespace

bool LoadMerge::read(const std::string& text, const std::string& name, std::string* error) {
    mName = name;
    std::istringstream in(text);
    std::string line;
    int lineNo = 0;
    while (std::getline(in, line)) {
        ++lineNo;
        if (!line.empty() && line.back() == '\r')
            line.pop_back();
        if (line.rfind(kHeader, 0) == 0) {
            const size_t clock = line.find("clock=");
            if (clock != std::string::npos) {
                mClock = line.substr(clock + 6, line.find(' ', clock) - clock - 6);
                mClockLine = lineNo;
            }
            continue;
        }
        const size_t start = line.find_first_not_of(" \t");
        if (start == std::string::npos || line[start] == '#')
            continue;
        Sample sample;
        std::string what;
        if (!readLine(line.substr(start), &sample, &what)) {
            *error = name + ":" + std::to_string(lineNo) + ": " + what;
            return false;
        }
        mSamples.push_back(std::move(sample));
    }
    if (mSamples.empty()) {
        *error = name + ": no load lines";
        return false;
    }
    std::stable_sort(mSamples.begin(), mSamples.end(),
                     [](const Sample& a, const Sample& b) { return a.atMs < b.atMs; });
    return true;
}

bool LoadMerge::readLine(const std::string& line, Sample* sample, std::string* what) const {
    std::istringstream words(line);
    std::string stamp, verb, pair;
    words >> stamp >> verb;
    if (stamp.size() < 2 || stamp[0] != '@' ||
        stamp.find_first_not_of("0123456789", 1) != std::string::npos) {
        *what = "not a load line (expected '@T load <id>=<u> ...')";
        return false;
    }
    errno = 0;
    sample->atMs = strtoll(stamp.c_str() + 1, nullptr, 10);
    if (errno != 0) {
        *what = "time " + stamp + " out of range";
        return false;
    }
    if (verb != "load") {
        *what = "not a load line (expected '@T load <id>=<u> ...')";
        return false;
    }
    while (words >> pair) {
        const size_t eq = pair.find('=');
        const std::string id = pair.substr(0, eq);
        if (eq == std::string::npos || id.empty() || !std::all_of(id.begin(), id.end(), isIdChar)) {
            *what = "'" + pair + "' is not <id>=<u>";
            return false;
        }
        if (!isShare(pair.substr(eq + 1))) {
            *what = "load of " + id + " is not a number in [0, 1]";
            return false;
        }
        sample->loads.emplace_back(id, pair.substr(eq + 1));
    }
    if (sample->loads.empty()) {
        *what = "a load line without <id>=<u>";
        return false;
    }
    return true;
}

bool LoadMerge::checkClock(Clock log, std::string* error) const {
    const char* logClock = log == Clock::kEpoch ? "epoch" : "monotonic";
    if (!mClock.empty() && mClock != logClock) {
        *error = mName + ":" + std::to_string(mClockLine) + ": load times on the " + mClock +
                 " clock, the log's are " + logClock + " (record-load --clock " + logClock + ")";
        return false;
    }
    return true;
}

std::string LoadMerge::merge(const std::string& trace, int64_t firstCallUs) const {
    const int64_t firstMs = firstCallUs / 1000;
    std::string out;
    size_t next = 0;
    // What the domains were at the first call: one line at @0.
    std::map<std::string, std::string> before;
    std::vector<std::pair<std::string, std::string>> order;
    for (; next < mSamples.size() && mSamples[next].atMs < firstMs; ++next) {
        for (const auto& load : mSamples[next].loads) {
            if (before.count(load.first) == 0)
                order.emplace_back(load.first, "");
            before[load.first] = load.second;
        }
    }
    for (auto& load : order)
        load.second = before[load.first];
    bool startWritten = order.empty();
    std::istringstream in(trace);
    std::string line;
    while (std::getline(in, line)) {
        const int64_t ms = traceLineMs(line);
        if (ms >= 0) {
            if (!startWritten) {
                out += text(0, order);
                startWritten = true;
            }
            for (; next < mSamples.size() && mSamples[next].atMs - firstMs <= ms; ++next)
                out += text(mSamples[next].atMs - firstMs, mSamples[next].loads);
        }
        out += line + "\n";
    }
    for (; next < mSamples.size(); ++next)
        out += text(mSamples[next].atMs - firstMs, mSamples[next].loads);
    return out;
}

std::string LoadMerge::text(int64_t atMs,
                            const std::vector<std::pair<std::string, std::string>>& loads) {
    std::string line = "@" + std::to_string(atMs);
    line.append(line.size() < 8 ? 8 - line.size() : 1, ' ');
    line += "load";
    for (const auto& load : loads)
        line += " " + load.first + "=" + load.second;
    return line + "\n";
}

}  // namespace velmora
