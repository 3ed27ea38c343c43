#include "host/record/Timeline.h"

#include <cstdio>
#include <cstdlib>
#include <fstream>

namespace velmora {

namespace {

constexpr int kNodePid = 1;
constexpr int kEventPid = 2;
constexpr int kServerPid = 3;

std::string jsonEscape(const std::string& in) {
    std::string out;
    out.reserve(in.size() + 2);
    for (char c : in) {
        switch (c) {
            case '"':
                out += "\\\"";
                break;
            case '\\':
                out += "\\\\";
                break;
            case '\n':
                out += "\\n";
                break;
            case '\r':
                out += "\\r";
                break;
            case '\t':
                out += "\\t";
                break;
            default:
                if (static_cast<unsigned char>(c) < 0x20) {
                    char buf[8];
                    snprintf(buf, sizeof(buf), "\\u%04x", static_cast<unsigned char>(c));
                    out += buf;
                } else {
                    out += c;
                }
        }
    }
    return out;
}

std::string formatNumber(double v) {
    char buf[64];
    snprintf(buf, sizeof(buf), "%.17g", v);
    return buf;
}

}  // namespace

bool parseNodeNumber(const std::string& text, double* value) {
    size_t begin = text.find_first_not_of(" \t\n");
    size_t end = text.find_last_not_of(" \t\n");
    if (begin == std::string::npos) {
        return false;
    }
    const std::string trimmed = text.substr(begin, end - begin + 1);
    char* stop = nullptr;
    const double v = strtod(trimmed.c_str(), &stop);
    if (stop == trimmed.c_str() || *stop != '\0') {
        return false;
    }
    *value = v;
    return true;
}

Timeline::Timeline(HostClock& clock) : mClock(clock) {}

void Timeline::clear() {
    std::lock_guard<std::mutex> lock(mLock);
    mTracks.clear();
    mInstants.clear();
    mCounters.clear();
    mSlices.clear();
    mSpans.clear();
    mCounterSource = nullptr;
}

void Timeline::recordSpan(const std::string& track, const std::string& category,
                          const std::string& name, int64_t beginUs, int64_t endUs) {
    std::lock_guard<std::mutex> lock(mLock);
    mSpans.push_back({track, category, name, beginUs, endUs});
}

void Timeline::setCounterSource(CounterSource source) {
    std::lock_guard<std::mutex> lock(mLock);
    mCounterSource = std::move(source);
}

Timeline::Track* Timeline::findTrack(const std::string& key) {
    for (auto& track : mTracks) {
        if (track.key == key) {
            return &track;
        }
    }
    return nullptr;
}

void Timeline::recordInitial(const std::string& key, const std::string& path,
                             const std::string& text) {
    const int64_t now = mClock.nowUs();
    std::lock_guard<std::mutex> lock(mLock);
    if (findTrack(key) == nullptr) {
        mTracks.push_back({key, path, {{now, text}}});
    }
}

void Timeline::recordWrite(const std::string& key, const std::string& path,
                           const std::string& text) {
    const int64_t now = mClock.nowUs();
    std::lock_guard<std::mutex> lock(mLock);
    Track* track = findTrack(key);
    if (track == nullptr) {
        // A write to a node nobody read first: its initial value is unknown, keep the write.
        mTracks.push_back({key, path, {{now, text}}});
        return;
    }
    track->samples.push_back({now, text});
}

void Timeline::recordInstant(const std::string& category, const std::string& name) {
    const int64_t now = mClock.nowUs();
    std::lock_guard<std::mutex> lock(mLock);
    mInstants.push_back({now, category, name});
}

void Timeline::recordCounter(const std::string& track, int64_t value) {
    const int64_t now = mClock.nowUs();
    std::lock_guard<std::mutex> lock(mLock);
    for (auto& counter : mCounters) {
        if (counter.track == track) {
            counter.samples.push_back({now, value});
            return;
        }
    }
    mCounters.push_back({track, {{now, value}}});
}

void Timeline::recordSlice(const std::string& name, int64_t beginUs, int64_t endUs, int tid) {
    std::lock_guard<std::mutex> lock(mLock);
    mSlices.push_back({beginUs, endUs, tid, name});
}

std::vector<Timeline::CounterSample> Timeline::counter(const std::string& track) const {
    std::lock_guard<std::mutex> lock(mLock);
    for (const auto& counter : mCounters) {
        if (counter.track == track) {
            return counter.samples;
        }
    }
    return {};
}

std::vector<Timeline::Slice> Timeline::slices() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mSlices;
}

std::vector<Timeline::NodeSummary> Timeline::summary() const {
    std::lock_guard<std::mutex> lock(mLock);
    std::vector<NodeSummary> out;
    for (const auto& track : mTracks) {
        NodeSummary s;
        s.key = track.key;
        s.path = track.path;
        s.initial = track.samples.front().text;
        s.final = track.samples.back().text;
        s.changes = static_cast<int>(track.samples.size()) - 1;
        bool first = true;
        for (const auto& sample : track.samples) {
            double v = 0;
            if (!parseNodeNumber(sample.text, &v)) {
                s.numeric = false;
                continue;
            }
            if (first || v < s.min)
                s.min = v;
            if (first || v > s.max)
                s.max = v;
            first = false;
        }
        out.push_back(s);
    }
    return out;
}

std::vector<Timeline::Instant> Timeline::instants(const std::string& category) const {
    std::lock_guard<std::mutex> lock(mLock);
    std::vector<Instant> out;
    for (const auto& instant : mInstants) {
        if (instant.category == category) {
            out.push_back(instant);
        }
    }
    return out;
}

int Timeline::changes(const std::string& key) const {
    std::lock_guard<std::mutex> lock(mLock);
    for (const auto& track : mTracks) {
        if (track.key == key) {
            return static_cast<int>(track.samples.size()) - 1;
        }
    }
    return 0;
}

std::string Timeline::chromeJson() const {
    std::lock_guard<std::mutex> lock(mLock);
    std::string out = "{\"displayTimeUnit\":\"ms\",\"traceEvents\":[\n";
    out +=
        "{\"name\":\"process_name\",\"ph\":\"M\",\"pid\":1,\"tid\":0,"
        "\"args\":{\"name\":\"device nodes\"}},\n";
    out +=
        "{\"name\":\"process_name\",\"ph\":\"M\",\"pid\":2,\"tid\":0,"
        "\"args\":{\"name\":\"events\"}},\n";
    out +=
        "{\"name\":\"process_name\",\"ph\":\"M\",\"pid\":3,\"tid\":0,"
        "\"args\":{\"name\":\"velmora server\"}}";
    for (const auto& track : mTracks) {
        for (size_t i = 0; i < track.samples.size(); ++i) {
            const Sample& sample = track.samples[i];
            double v = 0;
            out += ",\n";
            if (parseNodeNumber(sample.text, &v)) {
                // The holder rides in the category: counter args must all be numbers.
                const std::string source =
                    mCounterSource ? mCounterSource(track.key, i) : std::string();
                out += "{\"name\":\"" + jsonEscape(track.key) + "\",\"ph\":\"C\"" +
                       (source.empty() ? "" : ",\"cat\":\"" + jsonEscape(source) + "\"") +
                       ",\"ts\":" + std::to_string(sample.us) +
                       ",\"pid\":" + std::to_string(kNodePid) +
                       ",\"tid\":0,\"args\":{\"value\":" + formatNumber(v) + "}}";
            } else {
                // Text nodes (governors) have no counter value: an instant on the node track.
                out += "{\"name\":\"" + jsonEscape(track.key + "=" + sample.text) +
                       "\",\"cat\":\"node\",\"ph\":\"i\",\"s\":\"p\",\"ts\":" +
                       std::to_string(sample.us) + ",\"pid\":" + std::to_string(kNodePid) +
                       ",\"tid\":0}";
            }
        }
    }
    // The server's tracks, named as on a device: counters and complete slices per thread.
    for (const auto& counter : mCounters) {
        for (const auto& sample : counter.samples) {
            out += ",\n{\"name\":\"" + jsonEscape(counter.track) +
                   "\",\"ph\":\"C\",\"ts\":" + std::to_string(sample.us) +
                   ",\"pid\":" + std::to_string(kServerPid) +
                   ",\"tid\":0,\"args\":{\"value\":" + std::to_string(sample.value) + "}}";
        }
    }
    for (const auto& slice : mSlices) {
        out += ",\n{\"name\":\"" + jsonEscape(slice.name) +
               "\",\"ph\":\"X\",\"ts\":" + std::to_string(slice.beginUs) +
               ",\"dur\":" + std::to_string(slice.endUs - slice.beginUs) +
               ",\"pid\":" + std::to_string(kServerPid) + ",\"tid\":" + std::to_string(slice.tid) +
               "}";
    }
    for (const auto& instant : mInstants) {
        out += ",\n{\"name\":\"" + jsonEscape(instant.name) + "\",\"cat\":\"" +
               jsonEscape(instant.category) +
               "\",\"ph\":\"i\",\"s\":\"g\",\"ts\":" + std::to_string(instant.us) +
               ",\"pid\":" + std::to_string(kEventPid) + ",\"tid\":0}";
    }
    // Spans: one named thread of the "events" process per track, tid 0 keeps the instants.
    std::vector<std::string> spanTracks;
    for (const auto& span : mSpans) {
        size_t tid = 1;
        while (tid <= spanTracks.size() && spanTracks[tid - 1] != span.track)
            ++tid;
        if (tid > spanTracks.size()) {
            spanTracks.push_back(span.track);
            out +=
                ",\n{\"name\":\"thread_name\",\"ph\":\"M\",\"pid\":" + std::to_string(kEventPid) +
                ",\"tid\":" + std::to_string(tid) + ",\"args\":{\"name\":\"" +
                jsonEscape(span.track) + "\"}}";
        }
        out += ",\n{\"name\":\"" + jsonEscape(span.name) + "\",\"cat\":\"" +
               jsonEscape(span.category) +
               "\",\"ph\":\"X\",\"ts\":" + std::to_string(span.beginUs) +
               ",\"dur\":" + std::to_string(span.endUs - span.beginUs) +
               ",\"pid\":" + std::to_string(kEventPid) + ",\"tid\":" + std::to_string(tid) + "}";
    }
    out += "\n]}\n";
    return out;
}

bool Timeline::writeChromeJson(const std::string& path, std::string* error) const {
    std::ofstream file(path, std::ios::trunc);
    if (!file) {
        if (error != nullptr)
            *error = "cannot write " + path;
        return false;
    }
    file << chromeJson();
    file.close();
    if (!file) {
        if (error != nullptr)
            *error = "write failed: " + path;
        return false;
    }
    return true;
}

}  // namespace velmora
