#include "host/record/TimelineJson.h"

#include <cstdio>

namespace velmora {

namespace {

std::string formatNumber(double v) {
    char buf[64];
    snprintf(buf, sizeof(buf), "%.17g", v);
    return buf;
}

std::string processName(int pid, const char* name) {
    return "{\"name\":\"process_name\",\"ph\":\"M\",\"pid\":" + std::to_string(pid) +
           ",\"tid\":0,\"args\":{\"name\":\"" + name + "\"}}";
}

}  // namespace

std::string TimelineJson::escape(const std::string& in) {
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

std::string TimelineJson::opening() {
    return "{\"displayTimeUnit\":\"ms\",\"traceEvents\":[\n" +
           processName(kNodePid, "device nodes") + ",\n" + processName(kEventPid, "events") +
           ",\n" + processName(kServerPid, "velmora server");
}

std::string TimelineJson::closing() {
    return "\n]}\n";
}

std::string TimelineJson::nodeCounter(const std::string& key, double value, int64_t us,
                                      const std::string& source) {
    return "{\"name\":\"" + escape(key) + "\",\"ph\":\"C\"" +
           (source.empty() ? "" : ",\"cat\":\"" + escape(source) + "\"") +
           ",\"ts\":" + std::to_string(us) + ",\"pid\":" + std::to_string(kNodePid) +
           ",\"tid\":0,\"args\":{\"value\":" + formatNumber(value) + "}}";
}

std::string TimelineJson::nodeText(const std::string& key, const std::string& text, int64_t us) {
    return "{\"name\":\"" + escape(key + "=" + text) +
           "\",\"cat\":\"node\",\"ph\":\"i\",\"s\":\"p\",\"ts\":" + std::to_string(us) +
           ",\"pid\":" + std::to_string(kNodePid) + ",\"tid\":0}";
}

std::string TimelineJson::serverCounter(const std::string& track, int64_t value, int64_t us) {
    return "{\"name\":\"" + escape(track) + "\",\"ph\":\"C\",\"ts\":" + std::to_string(us) +
           ",\"pid\":" + std::to_string(kServerPid) +
           ",\"tid\":0,\"args\":{\"value\":" + std::to_string(value) + "}}";
}

std::string TimelineJson::serverSlice(const std::string& name, int64_t beginUs, int64_t endUs,
                                      int tid) {
    return "{\"name\":\"" + escape(name) + "\",\"ph\":\"X\",\"ts\":" + std::to_string(beginUs) +
           ",\"dur\":" + std::to_string(endUs - beginUs) +
           ",\"pid\":" + std::to_string(kServerPid) + ",\"tid\":" + std::to_string(tid) + "}";
}

std::string TimelineJson::instant(const std::string& category, const std::string& name,
                                  int64_t us) {
    return "{\"name\":\"" + escape(name) + "\",\"cat\":\"" + escape(category) +
           "\",\"ph\":\"i\",\"s\":\"g\",\"ts\":" + std::to_string(us) +
           ",\"pid\":" + std::to_string(kEventPid) + ",\"tid\":0}";
}

std::string TimelineJson::spanTrack(int tid, const std::string& track) {
    return "{\"name\":\"thread_name\",\"ph\":\"M\",\"pid\":" + std::to_string(kEventPid) +
           ",\"tid\":" + std::to_string(tid) + ",\"args\":{\"name\":\"" + escape(track) + "\"}}";
}

std::string TimelineJson::span(const std::string& category, const std::string& name,
                               int64_t beginUs, int64_t endUs, int tid) {
    return "{\"name\":\"" + escape(name) + "\",\"cat\":\"" + escape(category) +
           "\",\"ph\":\"X\",\"ts\":" + std::to_string(beginUs) +
           ",\"dur\":" + std::to_string(endUs - beginUs) + ",\"pid\":" + std::to_string(kEventPid) +
           ",\"tid\":" + std::to_string(tid) + "}";
}

}  // namespace velmora
