#include "host/record/TimelineJson.h"

#include <cstdio>

namespace velmora {

namespace {

void processName(std::string& out, int pid, std::string_view name) {
    out.append("{\"name\":\"process_name\",\"ph\":\"M\",\"pid\":");
    TimelineJson::appendInteger(out, pid);
    out.append(",\"tid\":0,\"args\":{\"name\":\"").append(name).append("\"}}");
}

}  // namespace

std::string TimelineJson::formatNumber(double v) {
    char buf[64];
    snprintf(buf, sizeof(buf), "%.17g", v);
    return buf;
}

void TimelineJson::appendInteger(std::string& out, int64_t value) {
    char buf[24];
    char* end = buf + sizeof(buf);
    char* at = end;
    // In unsigned arithmetic, so that the most negative value has its digits too.
    uint64_t magnitude = value < 0 ? 0 - static_cast<uint64_t>(value) : static_cast<uint64_t>(value);
    do {
        *--at = static_cast<char>('0' + magnitude % 10);
        magnitude /= 10;
    } while (magnitude != 0);
    if (value < 0)
        *--at = '-';
    out.append(at, static_cast<size_t>(end - at));
}

void TimelineJson::appendEscaped(std::string& out, std::string_view in) {
    // Which bytes a JSON string cannot hold as they are: controls, the quote, the backslash.
    static const struct Special {
        bool byte[256] = {};
        Special() {
            for (int c = 0; c < 0x20; ++c)
                byte[c] = true;
            byte[static_cast<unsigned char>('"')] = true;
            byte[static_cast<unsigned char>('\\')] = true;
        }
    } kSpecial;
    size_t plain = 0;  // start of the run of characters that need no escape
    for (size_t i = 0; i < in.size(); ++i) {
        const unsigned char c = static_cast<unsigned char>(in[i]);
        if (!kSpecial.byte[c])
            continue;
        out.append(in.data() + plain, i - plain);
        plain = i + 1;
        switch (c) {
            case '"':
                out.append("\\\"");
                break;
            case '\\':
                out.append("\\\\");
                break;
            case '\n':
                out.append("\\n");
                break;
            case '\r':
                out.append("\\r");
                break;
            case '\t':
                out.append("\\t");
                break;
            default: {
                char buf[8];
                snprintf(buf, sizeof(buf), "\\u%04x", c);
                out.append(buf);
            }
        }
    }
    out.append(in.data() + plain, in.size() - plain);
}

std::string TimelineJson::escape(const std::string& in) {
    std::string out;
    out.reserve(in.size() + 2);
    appendEscaped(out, in);
    return out;
}

void TimelineJson::opening(std::string& out) {
    out.append("{\"displayTimeUnit\":\"ms\",\"traceEvents\":[\n");
    processName(out, kNodePid, "device nodes");
    out.append(",\n");
    processName(out, kEventPid, "events");
    out.append(",\n");
    processName(out, kServerPid, "velmora server");
}

void TimelineJson::closing(std::string& out) {
    out.append("\n]}\n");
}

void TimelineJson::nodeCounter(std::string& out, std::string_view key, std::string_view number,
                               int64_t us, std::string_view source) {
    out.append("{\"name\":\"");
    appendEscaped(out, key);
    out.append("\",\"ph\":\"C\"");
    if (!source.empty()) {
        out.append(",\"cat\":\"");
        appendEscaped(out, source);
        out.append("\"");
    }
    out.append(",\"ts\":");
    appendInteger(out, us);
    out.append(",\"pid\":");
    appendInteger(out, kNodePid);
    out.append(",\"tid\":0,\"args\":{\"value\":").append(number).append("}}");
}

void TimelineJson::nodeText(std::string& out, std::string_view key, std::string_view text,
                            int64_t us) {
    out.append("{\"name\":\"");
    appendEscaped(out, key);
    out.append("=");
    appendEscaped(out, text);
    out.append("\",\"cat\":\"node\",\"ph\":\"i\",\"s\":\"p\",\"ts\":");
    appendInteger(out, us);
    out.append(",\"pid\":");
    appendInteger(out, kNodePid);
    out.append(",\"tid\":0}");
}

void TimelineJson::serverCounter(std::string& out, std::string_view track, int64_t value,
                                 int64_t us) {
    out.append("{\"name\":\"");
    appendEscaped(out, track);
    out.append("\",\"ph\":\"C\",\"ts\":");
    appendInteger(out, us);
    out.append(",\"pid\":");
    appendInteger(out, kServerPid);
    out.append(",\"tid\":0,\"args\":{\"value\":");
    appendInteger(out, value);
    out.append("}}");
}

void TimelineJson::serverSlice(std::string& out, std::string_view name, int64_t beginUs,
                               int64_t endUs, int64_t tid) {
    out.append("{\"name\":\"");
    appendEscaped(out, name);
    out.append("\",\"ph\":\"X\",\"ts\":");
    appendInteger(out, beginUs);
    out.append(",\"dur\":");
    appendInteger(out, endUs - beginUs);
    out.append(",\"pid\":");
    appendInteger(out, kServerPid);
    out.append(",\"tid\":");
    appendInteger(out, tid);
    out.append("}");
}

void TimelineJson::instant(std::string& out, std::string_view category, std::string_view name,
                           int64_t us) {
    out.append("{\"name\":\"");
    appendEscaped(out, name);
    out.append("\",\"cat\":\"");
    appendEscaped(out, category);
    out.append("\",\"ph\":\"i\",\"s\":\"g\",\"ts\":");
    appendInteger(out, us);
    out.append(",\"pid\":");
    appendInteger(out, kEventPid);
    out.append(",\"tid\":0}");
}

void TimelineJson::spanTrack(std::string& out, int tid, std::string_view track) {
    out.append("{\"name\":\"thread_name\",\"ph\":\"M\",\"pid\":");
    appendInteger(out, kEventPid);
    out.append(",\"tid\":");
    appendInteger(out, tid);
    out.append(",\"args\":{\"name\":\"");
    appendEscaped(out, track);
    out.append("\"}}");
}

void TimelineJson::span(std::string& out, std::string_view category, std::string_view name,
                        int64_t beginUs, int64_t endUs, int tid) {
    out.append("{\"name\":\"");
    appendEscaped(out, name);
    out.append("\",\"cat\":\"");
    appendEscaped(out, category);
    out.append("\",\"ph\":\"X\",\"ts\":");
    appendInteger(out, beginUs);
    out.append(",\"dur\":");
    appendInteger(out, endUs - beginUs);
    out.append(",\"pid\":");
    appendInteger(out, kEventPid);
    out.append(",\"tid\":");
    appendInteger(out, tid);
    out.append("}");
}

}  // namespace velmora
