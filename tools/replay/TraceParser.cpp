#include "tools/replay/TraceParser.h"

#include <cctype>
#include <cerrno>
#include <climits>
#include <cstdlib>

#include "tools/common/Spelling.h"
#include "tools/replay/TraceReader.h"

namespace velmora {

namespace {

const std::vector<std::string> kCalls = {"sleep",     "event", "reload", "setconfig",
                                         "getconfig", "dump",  "policy"};

// Splits a line into words; a word may contain a double-quoted part (msg="a b").
bool tokenize(const std::string& line, std::vector<std::string>* words, std::string* problem) {
    std::string word;
    bool inWord = false;
    bool quoted = false;
    for (char c : line) {
        if (quoted) {
            if (c == '"') {
                quoted = false;
            } else {
                word += c;
            }
            continue;
        }
        if (c == '#') {
            break;
        }
        if (c == ' ' || c == '\t' || c == '\r') {
            if (inWord) {
                words->push_back(word);
                word.clear();
                inWord = false;
            }
            continue;
        }
        inWord = true;
        if (c == '"') {
            quoted = true;
        } else {
            word += c;
        }
    }
    if (quoted) {
        *problem = "unterminated quote";
        return false;
    }
    if (inWord) {
        words->push_back(word);
    }
    return true;
}

bool parseNumber(const std::string& text, int64_t min, int64_t max, int64_t* value) {
    // strtoll would skip the blanks of a quoted " 5".
    if (text.empty() || isspace(static_cast<unsigned char>(text[0]))) {
        return false;
    }
    errno = 0;
    char* end = nullptr;
    const long long v = strtoll(text.c_str(), &end, 0);
    if (*end != '\0' || errno == ERANGE || v < min || v > max) {
        return false;
    }
    *value = v;
    return true;
}

class LineParser {
public:
    LineParser(const std::string& file, int lineNo, std::string* error)
        : mWhere(file + ":" + std::to_string(lineNo) + ": "), mError(error) {}

    bool fail(const std::string& message) {
        if (mError != nullptr)
            *mError = mWhere + message;
        return false;
    }
    bool intArg(const std::string& text, const std::string& what, int* value) {
        int64_t v = 0;
        if (!parseNumber(text, INT_MIN, UINT32_MAX, &v)) {
            return fail("malformed number '" + text + "' for " + what);
        }
        *value = static_cast<int>(static_cast<int64_t>(static_cast<int32_t>(v)));
        return true;
    }
    bool msArg(const std::string& text, const std::string& what, int64_t* value) {
        if (!parseNumber(text, 0, INT64_MAX / 1000, value)) {
            return fail("malformed time '" + text + "' for " + what);
        }
        return true;
    }

private:
    std::string mWhere;
    std::string* mError;
};

}  // namespace

int TraceParser::parseLine(const std::string& line, const std::string& file, int lineNo,
                           std::vector<TraceCall>* calls, std::string* error) {
    LineParser p(file, lineNo, error);
    std::vector<std::string> words;
    std::string problem;
    if (!tokenize(line, &words, &problem)) {
        p.fail(problem);
        return -1;
    }
    if (words.empty()) {
        return 0;
    }
    TraceCall call;
    call.file = file;
    call.line = lineNo;
    call.source = line.substr(0, line.find('#'));
    while (!call.source.empty() && (call.source.back() == ' ' || call.source.back() == '\r')) {
        call.source.pop_back();
    }
    size_t i = 0;
    if (words[0][0] == '@') {
        if (!p.msArg(words[0].substr(1), "time stamp", &call.atMs)) {
            return -1;
        }
        i = 1;
        if (words.size() == 1) {
            calls->push_back(std::move(call));
            return 0;
        }
    }
    const std::string& verb = words[i];
    const std::vector<std::string> args(words.begin() + static_cast<long>(i) + 1, words.end());
    auto argc = [&](size_t min, size_t max) {
        if (args.size() < min || args.size() > max) {
            return p.fail("'" + verb + "' takes " +
                          (min == max ? std::to_string(min)
                                      : std::to_string(min) + ".." + std::to_string(max)) +
                          " argument(s), got " + std::to_string(args.size()));
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
        for (size_t k = 1; k < args.size(); ++k) {
            if (args[k].compare(0, 4, "msg=") == 0) {
                call.hasMsg = true;
                call.text = args[k].substr(4);
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
        for (size_t k = 1; k < args.size(); ++k) {
            const size_t eq = args[k].find('=');
            if (eq == std::string::npos) {
                p.fail("expected <tag>=<value>, got '" + args[k] + "'");
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
        for (const auto& arg : args) {
            int tag = 0;
            if (!p.intArg(arg, "tag", &tag))
                return -1;
            call.tags.push_back(tag);
        }
    } else if (verb == "dump") {
        call.kind = TraceCall::Kind::Dump;
        if (!argc(1, 1))
            return -1;
        call.text = args[0];
    } else if (verb == "policy") {
        call.kind = TraceCall::Kind::Policy;
        if (!argc(2, 2) || !p.intArg(args[1], "policy duration", &call.id))
            return -1;
        call.text = args[0];
    } else {
        const std::string guess = Spelling::closest(verb, kCalls);
        p.fail("unknown call '" + verb + "'" +
               (guess.empty() ? std::string() : "; did you mean '" + guess + "'?"));
        return -1;
    }
    calls->push_back(std::move(call));
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
