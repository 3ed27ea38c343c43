#include "host/record/Timeline.h"

#include <cstdio>
#include <cstdlib>

#include "host/record/SpoolRecord.h"
#include "host/record/TimelineJson.h"

namespace velmora {

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
    mValues.clear();
    mValueIds.clear();
    mCounters.clear();
    mSpool.clear();
    mCounterSource = nullptr;
}

void Timeline::recordSpan(const std::string& track, const std::string& category,
                          const std::string& name, int64_t beginUs, int64_t endUs) {
    SpoolRecord record;
    record.add(track).add(category).add(name).add(beginUs).add(endUs);
    std::lock_guard<std::mutex> lock(mLock);
    mSpool.append(kSpanGroup, record.bytes());
}

void Timeline::setCounterSource(CounterSource source) {
    std::lock_guard<std::mutex> lock(mLock);
    mCounterSource = std::move(source);
}

Timeline::Track* Timeline::findTrackLocked(const std::string& key) {
    for (auto& track : mTracks) {
        if (track.key == key) {
            return &track;
        }
    }
    return nullptr;
}

uint32_t Timeline::valueLocked(const std::string& text) {
    auto it = mValueIds.find(text);
    if (it != mValueIds.end())
        return it->second;
    Value value;
    value.text = text;
    value.numeric = parseNodeNumber(text, &value.number);
    mValues.push_back(value);
    const uint32_t id = static_cast<uint32_t>(mValues.size() - 1);
    mValueIds.emplace(text, id);
    return id;
}

size_t Timeline::counterGroupLocked(std::string_view track) {
    for (size_t i = 0; i < mCounters.size(); ++i) {
        if (mCounters[i] == track)
            return kFirstCounterGroup + i;
    }
    mCounters.emplace_back(track);
    return kFirstCounterGroup + mCounters.size() - 1;
}

void Timeline::recordInitial(const std::string& key, const std::string& path,
                             const std::string& text) {
    const int64_t now = mClock.nowUs();
    std::lock_guard<std::mutex> lock(mLock);
    if (findTrackLocked(key) == nullptr) {
        mTracks.push_back({key, path, {{now, valueLocked(text)}}});
    }
}

void Timeline::recordWrite(const std::string& key, const std::string& path,
                           const std::string& text) {
    const int64_t now = mClock.nowUs();
    std::lock_guard<std::mutex> lock(mLock);
    Track* track = findTrackLocked(key);
    if (track == nullptr) {
        // A write to a node nobody read first: its initial value is unknown, keep the write.
        mTracks.push_back({key, path, {{now, valueLocked(text)}}});
        return;
    }
    track->samples.push_back({now, valueLocked(text)});
}

void Timeline::recordInstant(std::string_view category, std::string_view name) {
    SpoolRecord record;
    record.add(mClock.nowUs()).add(category).add(name);
    std::lock_guard<std::mutex> lock(mLock);
    mSpool.append(kInstantGroup, record.bytes());
}

void Timeline::recordCounter(std::string_view track, int64_t value) {
    SpoolRecord record;
    record.add(mClock.nowUs()).add(value);
    std::lock_guard<std::mutex> lock(mLock);
    mSpool.append(counterGroupLocked(track), record.bytes());
}

void Timeline::recordSlice(std::string_view name, int64_t beginUs, int64_t endUs, int tid) {
    SpoolRecord record;
    record.add(beginUs).add(endUs).add(static_cast<int64_t>(tid)).add(name);
    std::lock_guard<std::mutex> lock(mLock);
    mSpool.append(kSliceGroup, record.bytes());
}

std::vector<Timeline::CounterSample> Timeline::counter(const std::string& track) const {
    std::lock_guard<std::mutex> lock(mLock);
    std::vector<CounterSample> out;
    for (size_t i = 0; i < mCounters.size(); ++i) {
        if (mCounters[i] != track)
            continue;
        mSpool.forEach(kFirstCounterGroup + i, [&](const char* data, size_t size) {
            SpoolRecord::Reader record(data, size);
            const int64_t us = record.integer();
            out.push_back({us, record.integer()});
        });
    }
    return out;
}

std::vector<Timeline::Slice> Timeline::slices() const {
    std::lock_guard<std::mutex> lock(mLock);
    std::vector<Slice> out;
    mSpool.forEach(kSliceGroup, [&](const char* data, size_t size) {
        SpoolRecord::Reader record(data, size);
        Slice slice;
        slice.beginUs = record.integer();
        slice.endUs = record.integer();
        slice.tid = static_cast<int>(record.integer());
        slice.name = record.text();
        out.push_back(slice);
    });
    return out;
}

std::vector<Timeline::NodeSummary> Timeline::summary() const {
    std::lock_guard<std::mutex> lock(mLock);
    std::vector<NodeSummary> out;
    for (const auto& track : mTracks) {
        NodeSummary s;
        s.key = track.key;
        s.path = track.path;
        s.initial = mValues[track.samples.front().value].text;
        s.final = mValues[track.samples.back().value].text;
        s.changes = static_cast<int>(track.samples.size()) - 1;
        bool first = true;
        for (const auto& sample : track.samples) {
            const Value& value = mValues[sample.value];
            if (!value.numeric) {
                s.numeric = false;
                continue;
            }
            if (first || value.number < s.min)
                s.min = value.number;
            if (first || value.number > s.max)
                s.max = value.number;
            first = false;
        }
        out.push_back(s);
    }
    return out;
}

std::vector<Timeline::Instant> Timeline::instants(const std::string& category) const {
    std::lock_guard<std::mutex> lock(mLock);
    std::vector<Instant> out;
    mSpool.forEach(kInstantGroup, [&](const char* data, size_t size) {
        SpoolRecord::Reader record(data, size);
        Instant instant;
        instant.us = record.integer();
        instant.category = record.text();
        if (instant.category != category)
            return;
        instant.name = record.text();
        out.push_back(instant);
    });
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

bool Timeline::writeLocked(std::string& out, FILE* file, bool* written) const {
    constexpr size_t kFlushBytes = 256 * 1024;
    *written = true;
    // Hands what the buffer holds to the file; without one the buffer keeps the whole text.
    auto drain = [&](bool last) {
        if (file == nullptr || (!last && out.size() < kFlushBytes))
            return;
        *written &= fwrite(out.data(), 1, out.size(), file) == out.size();
        out.clear();
    };
    TimelineJson::opening(out);
    // A value is formatted once however many samples share it.
    std::vector<std::string> numbers(mValues.size());
    for (size_t i = 0; i < mValues.size(); ++i) {
        if (mValues[i].numeric)
            numbers[i] = TimelineJson::formatNumber(mValues[i].number);
    }
    for (const auto& track : mTracks) {
        for (size_t i = 0; i < track.samples.size(); ++i) {
            const Sample& sample = track.samples[i];
            const Value& value = mValues[sample.value];
            out.append(",\n");
            if (value.numeric) {
                const std::string source =
                    mCounterSource ? mCounterSource(track.key, i) : std::string();
                TimelineJson::nodeCounter(out, track.key, numbers[sample.value], sample.us,
                                          source);
            } else {
                TimelineJson::nodeText(out, track.key, value.text, sample.us);
            }
            drain(false);
        }
    }
    // The server's tracks, named as on a device: counters and complete slices per thread.
    bool complete = true;
    for (size_t i = 0; i < mCounters.size(); ++i) {
        complete &= mSpool.forEachRecord(kFirstCounterGroup + i, [&](const char* data, size_t size) {
            SpoolRecord::Reader record(data, size);
            const int64_t us = record.integer();
            out.append(",\n");
            TimelineJson::serverCounter(out, mCounters[i], record.integer(), us);
            drain(false);
        });
    }
    complete &= mSpool.forEachRecord(kSliceGroup, [&](const char* data, size_t size) {
        SpoolRecord::Reader record(data, size);
        const int64_t beginUs = record.integer();
        const int64_t endUs = record.integer();
        const int tid = static_cast<int>(record.integer());
        out.append(",\n");
        TimelineJson::serverSlice(out, record.view(), beginUs, endUs, tid);
        drain(false);
    });
    complete &= mSpool.forEachRecord(kInstantGroup, [&](const char* data, size_t size) {
        SpoolRecord::Reader record(data, size);
        const int64_t us = record.integer();
        const std::string_view category = record.view();
        out.append(",\n");
        TimelineJson::instant(out, category, record.view(), us);
        drain(false);
    });
    // Spans: one named thread of the "events" process per track, tid 0 keeps the instants.
    std::vector<std::string> spanTracks;
    complete &= mSpool.forEachRecord(kSpanGroup, [&](const char* data, size_t size) {
        SpoolRecord::Reader record(data, size);
        const std::string_view track = record.view();
        const std::string_view category = record.view();
        const std::string_view name = record.view();
        const int64_t beginUs = record.integer();
        const int64_t endUs = record.integer();
        size_t tid = 1;
        while (tid <= spanTracks.size() && spanTracks[tid - 1] != track)
            ++tid;
        if (tid > spanTracks.size()) {
            spanTracks.emplace_back(track);
            out.append(",\n");
            TimelineJson::spanTrack(out, static_cast<int>(tid), track);
        }
        out.append(",\n");
        TimelineJson::span(out, category, name, beginUs, endUs, static_cast<int>(tid));
        drain(false);
    });
    TimelineJson::closing(out);
    drain(true);
    return complete;
}

std::string Timeline::chromeJson() const {
    std::lock_guard<std::mutex> lock(mLock);
    std::string out;
    bool written = true;
    writeLocked(out, nullptr, &written);
    return out;
}

bool Timeline::writeChromeJson(const std::string& path, std::string* error) const {
    FILE* file = fopen(path.c_str(), "we");
    if (file == nullptr) {
        if (error != nullptr)
            *error = "cannot write " + path;
        return false;
    }
    std::lock_guard<std::mutex> lock(mLock);
    std::string out;
    out.reserve(512 * 1024);
    bool written = true;
    const bool complete = writeLocked(out, file, &written);
    written &= fclose(file) == 0;
    if (!complete) {
        if (error != nullptr)
            *error =
                "the timeline's scratch file could not be read back: " + path + " is incomplete";
        return false;
    }
    if (!written) {
        if (error != nullptr)
            *error = "write failed: " + path;
        return false;
    }
    return true;
}

}  // namespace velmora
