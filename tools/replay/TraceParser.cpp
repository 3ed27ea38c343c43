#include "tools/replay/TraceParser.h"

#include <cctype>
#include <cerrno>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <string_view>

#include "tools/common/Spelling.h"
#include "tools/replay/TraceReader.h"

namespace velmora {

namespace {

const std::vector<std::string> kCalls = {"sleep",     "event", "reload", "setconfig",
                                         "getconfig", "dump",  "policy", "load"};

// The words of one line, kept from line to line so that parsing a long trace allocates nothing
// once they have grown: the characters of every word (quotes removed) one after the other, and
// each word as a view into them.
struct Words {
    std::string chars;  // only grows: as long as the longest line so far
    std::vector<std::string_view> list;
};

// Splits a line into words; a word may contain a double-quoted part (msg="a b").
bool tokenize(const std::string& line, Words* words, std::string* problem) {
    words->list.clear();
    // The words never outgrow the line, so the views into the buffer stay valid.
    if (words->chars.size() < line.size())
        words->chars.resize(line.size());
    char* const chars = &words->chars[0];
    size_t size = 0;  // characters of words so far
    size_t wordStart = 0;
    bool inWord = false;
    bool quoted = false;
    auto endWord = [&] {
        words->list.emplace_back(chars + wordStart, size - wordStart);
        inWord = false;
    };
    for (char c : line) {
        if (quoted) {
            if (c == '"') {
                quoted = false;
            } else {
                chars[size++] = c;
            }
            continue;
        }
        if (c == '#') {
            break;
        }
        if (c == ' ' || c == '\t' || c == '\r') {
            if (inWord)
                endWord();
            continue;
        }
        if (!inWord) {
            inWord = true;
            wordStart = size;
        }
        if (c == '"') {
            quoted = true;
        } else {
            chars[size++] = c;
        }
    }
    if (quoted) {
        *problem = "unterminated quote";
        return false;
    }
    if (inWord)
        endWord();
    return true;
}

// A plain decimal ("1804800", "-1"; no leading zero, which strtoll reads as octal) of at most
// 18 digits, read without strtoll: most numbers of a trace are such. False for anything else.
bool parsePlainDecimal(std::string_view text, int64_t* value) {
    const bool negative = !text.empty() && text[0] == '-';
    const std::string_view digits = negative ? text.substr(1) : text;
    if (digits.empty() || digits.size() > 18 || (digits[0] == '0' && digits.size() > 1))
        return false;
    int64_t v = 0;
    for (char c : digits) {
        if (c < '0' || c > '9')
            return false;
        v = v * 10 + (c - '0');
    }
    *value = negative ? -v : v;
    return true;
}

bool parseNumber(std::string_view text, int64_t min, int64_t max, int64_t* value) {
    // strtoll would skip the blanks of a quoted " 5".
    if (text.empty() || isspace(static_cast<unsigned char>(text[0]))) {
        return false;
    }
    int64_t plain = 0;
    if (parsePlainDecimal(text, &plain)) {
        if (plain < min || plain > max)
            return false;
        *value = plain;
        return true;
    }
    char small[64];
    std::string large;
    const char* begin = small;
    if (text.size() < sizeof(small)) {
        memcpy(small, text.data(), text.size());
        small[text.size()] = '\0';
    } else {
        large.assign(text);
        begin = large.c_str();
    }
    errno = 0;
    char* end = nullptr;
    const long long v = strtoll(begin, &end, 0);
    if (*end != '\0' || errno == ERANGE || v < min || v > max) {
        return false;
    }
    *value = v;
    return true;
}

// A load as written: digits with at most one decimal point ("0.35", "1", ".5", "1.0"). No sign,
// exponent, hexadecimal, inf or nan: a load is a share, and strtod alone takes all of those.
bool parseShare(std::string_view text, double* value) {
    if (text.empty() || text.size() > 32)
        return false;
    bool digit = false;
    bool point = false;
    for (char c : text) {
        if (c >= '0' && c <= '9') {
            digit = true;
        } else if (c == '.' && !point) {
            point = true;
        } else {
            return false;
        }
    }
    if (!digit)
        return false;
    char buf[40];
    memcpy(buf, text.data(), text.size());
    buf[text.size()] = '\0';
    *value = strtod(buf, nullptr);
    return true;
}

class LineParser {
public:
    LineParser(const std::string& file, int lineNo, std::string* error)
        : mFile(file), mLineNo(lineNo), mError(error) {}

    bool fail(const std::string& message) {
        if (mError != nullptr)
            *mError = mFile + ":" + std::to_string(mLineNo) + ": " + message;
        return false;
    }
    bool intArg(std::string_view text, const std::string& what, int* value) {
        int64_t v = 0;
        if (!parseNumber(text, INT_MIN, UINT32_MAX, &v)) {
            return fail("malformed number '" + std::string(text) + "' for " + what);
        }
        *value = static_cast<int>(static_cast<int64_t>(static_cast<int32_t>(v)));
        return true;
    }
    bool msArg(std::string_view text, const std::string& what, int64_t* value) {
        if (!parseNumber(text, 0, INT64_MAX / 1000, value)) {
            return fail("malformed time '" + std::string(text) + "' for " + what);
        }
        return true;
    }

private:
    const std::string& mFile;
    int mLineNo;
    std::string* mError;
};

// Sets every field of `call` for a new line, keeping the capacity of its buffers.
void reset(TraceCall* call, const std::string& file, int lineNo) {
    call->kind = TraceCall::Kind::Stamp;
    call->file.assign(file);
    call->line = lineNo;
    call->atMs = -1;
    call->sleepMs = 0;
    call->id = 0;
    call->payload.clear();
    call->hasMsg = false;
    call->text.clear();
    call->tags.clear();
    call->values.clear();
    call->loads.clear();
    call->source.clear();
}

}  // namespace

int TraceParser::parseLine(const std::string& line, const std::string& file, int lineNo,
                           std::vector<TraceCall>* calls, std::string* error) {
    TraceCall call;
    bool any = false;
    if (parseInto(line, file, lineNo, &call, &any, error) != 0)
        return -1;
    if (any)
        calls->push_back(std::move(call));
    return 0;
}

int TraceParser::parseInto(const std::string& line, const std::string& file, int lineNo,
                           TraceCall* out, bool* any, std::string* error) {
    *any = false;
    LineParser p(file, lineNo, error);
    thread_local Words words;
    std::string problem;
    if (!tokenize(line, &words, &problem)) {
        p.fail(problem);
        return -1;
    }
    const std::vector<std::string_view>& word = words.list;
    if (word.empty()) {
        return 0;
    }
    TraceCall& call = *out;
    reset(&call, file, lineNo);
    const size_t hash = line.find('#');
    call.source.assign(line, 0, hash);
    while (!call.source.empty() && (call.source.back() == ' ' || call.source.back() == '\r')) {
        call.source.pop_back();
    }
    size_t i = 0;
    if (!word[0].empty() && word[0][0] == '@') {
        if (!p.msArg(word[0].substr(1), "time stamp", &call.atMs)) {
            return -1;
        }
        i = 1;
        if (word.size() == 1) {
            *any = true;
            return 0;
        }
    }
    const std::string_view verb = word[i];
    // The arguments: args[0] .. args[argCount - 1].
    const std::string_view* args = word.data() + i + 1;
    const size_t argCount = word.size() - i - 1;
    auto argc = [&](size_t min, size_t max) {
        if (argCount < min || argCount > max) {
            return p.fail("'" + std::string(verb) + "' takes " +
                          (min == max ? std::to_string(min)
                                      : std::to_string(min) + ".." + std::to_string(max)) +
                          " argument(s), got " + std::to_string(argCount));
        }
        return true;
    };
    if (verb == "sleep") {
        call.kind = TraceCall::Kind::Sleep;
        if (!argc(1, 1) || !p.msArg(args[0], "sleep", &call.sleepMs))
            return -1;
    } else if (verb == "event") {
        call.kind = TraceCall::Kind::Event;
        if (!argc(1, 64) || !p.intArg(args[0], "command id", &call.id))
            return -1;
        for (size_t k = 1; k < argCount; ++k) {
            if (args[k].compare(0, 4, "msg=") == 0) {
                call.hasMsg = true;
                call.text.assign(args[k].substr(4));
                continue;
            }
            int v = 0;
            if (!p.intArg(args[k], "payload", &v))
                return -1;
            call.payload.push_back(v);
        }
    } else if (verb == "reload") {
        call.kind = TraceCall::Kind::Reload;
        if (!argc(0, 0))
            return -1;
    } else if (verb == "setconfig") {
        call.kind = TraceCall::Kind::SetConfig;
        if (!argc(2, kMaxTags + 1) || !p.intArg(args[0], "client id", &call.id))
            return -1;
        for (size_t k = 1; k < argCount; ++k) {
            const size_t eq = args[k].find('=');
            if (eq == std::string_view::npos) {
                p.fail("expected <tag>=<value>, got '" + std::string(args[k]) + "'");
                return -1;
            }
            int tag = 0, value = 0;
            if (!p.intArg(args[k].substr(0, eq), "tag", &tag) ||
                !p.intArg(args[k].substr(eq + 1), "value", &value)) {
                return -1;
            }
            call.tags.push_back(tag);
            call.values.push_back(value);
        }
    } else if (verb == "getconfig") {
        call.kind = TraceCall::Kind::GetConfig;
        if (!argc(1, kMaxTags))
            return -1;
        for (size_t k = 0; k < argCount; ++k) {
            int tag = 0;
            if (!p.intArg(args[k], "tag", &tag))
                return -1;
            call.tags.push_back(tag);
        }
    } else if (verb == "dump") {
        call.kind = TraceCall::Kind::Dump;
        if (!argc(1, 1))
            return -1;
        call.text.assign(args[0]);
    } else if (verb == "policy") {
        call.kind = TraceCall::Kind::Policy;
        if (!argc(2, 2) || !p.intArg(args[1], "policy duration", &call.id))
            return -1;
        call.text.assign(args[0]);
    } else if (verb == "load") {
        call.kind = TraceCall::Kind::Load;
        if (!argc(1, TraceParser::kMaxLoads))
            return -1;
        for (size_t k = 0; k < argCount; ++k) {
            const size_t eq = args[k].find('=');
            if (eq == std::string_view::npos || eq == 0) {
                p.fail("expected <domain>=<load>, got '" + std::string(args[k]) + "'");
                return -1;
            }
            LoadShare share;
            share.domain.assign(args[k].substr(0, eq));
            const std::string_view value = args[k].substr(eq + 1);
            if (!parseShare(value, &share.u) || share.u > 1) {
                p.fail("load '" + std::string(value) + "' of " + share.domain +
                       " is not a number in [0, 1]");
                return -1;
            }
            for (const auto& earlier : call.loads) {
                if (earlier.domain == share.domain) {
                    p.fail("load line names " + share.domain + " twice");
                    return -1;
                }
            }
            call.loads.push_back(std::move(share));
        }
    } else {
        const std::string guess = Spelling::closest(std::string(verb), kCalls);
        p.fail("unknown call '" + std::string(verb) + "'" +
               (guess.empty() ? std::string() : "; did you mean '" + guess + "'?"));
        return -1;
    }
    *any = true;
    return 0;
}

namespace {

int readAll(TraceReader& reader, std::vector<TraceCall>* calls, std::string* error) {
    int result = 0;
    std::string errors;
    TraceCall call;
    std::string lineError;
    for (TraceReader::Step step;
         (step = reader.next(&call, &lineError)) != TraceReader::Step::End;) {
        if (step == TraceReader::Step::Call) {
            calls->push_back(std::move(call));
        } else {
            errors += (errors.empty() ? "" : "\n") + lineError;
            result = -1;
        }
    }
    if (error != nullptr && result != 0) {
        *error = errors;
    }
    return result;
}

}  // namespace

int TraceParser::parseText(const std::string& text, const std::string& file,
                           std::vector<TraceCall>* calls, std::string* error) {
    TraceReader reader(text, file);
    return readAll(reader, calls, error);
}

int TraceParser::parseFile(const std::string& path, std::vector<TraceCall>* calls,
                           std::string* error) {
    TraceReader reader(path);
    if (!reader.isOpen()) {
        if (error != nullptr)
            *error = path + ": cannot open trace";
        return -1;
    }
    return readAll(reader, calls, error);
}

}  // namespace velmora
