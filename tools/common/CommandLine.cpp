#include "tools/common/CommandLine.h"

#include <getopt.h>

#include <mutex>

namespace velmora {

namespace {

// Guards getopt_long's globals (optind, optarg, optopt, opterr and its hidden scan state): one
// parse at a time in the process.
std::mutex gGetoptLock;

// getopt_long's code for the long option at index i: above every one-byte short option.
constexpr int kLongBase = 256;

const std::vector<std::string> kNone;

bool isLong(const std::string& name) {
    return name.size() > 2 && name[0] == '-' && name[1] == '-';
}

}  // namespace

CommandLine::CommandLine(std::string program, std::string usage)
    : program_(std::move(program)), usage_(std::move(usage)) {
    flag("--help", 'h');
    flag("--version");
}

CommandLine& CommandLine::add(const std::string& name, char alias, bool takesValue, bool repeats) {
    Option option;
    option.name = name;
    option.alias = isLong(name) ? alias : name[1];
    option.takesValue = takesValue;
    option.repeats = repeats;
    options_.push_back(option);
    return *this;
}

CommandLine& CommandLine::flag(const std::string& name, char alias) {
    return add(name, alias, false, true);
}

CommandLine& CommandLine::value(const std::string& name, char alias) {
    return add(name, alias, true, false);
}

CommandLine& CommandLine::repeatable(const std::string& name, char alias) {
    return add(name, alias, true, true);
}

CommandLine& CommandLine::excludes(const std::string& a, const std::string& b,
                                   const std::string& why) {
    rules_.push_back({a, b, true, why.empty() ? a + " and " + b + " exclude each other" : why});
    return *this;
}

CommandLine& CommandLine::needs(const std::string& a, const std::string& b,
                                const std::string& why) {
    rules_.push_back({a, b, false, why.empty() ? a + " needs " + b : why});
    return *this;
}

const CommandLine::Option* CommandLine::find(const std::string& name) const {
    for (const Option& option : options_) {
        if (option.name == name) {
            return &option;
        }
    }
    return nullptr;
}

bool CommandLine::has(const std::string& name) const {
    const Option* option = find(name);
    return option != nullptr && option->times > 0;
}

std::string CommandLine::get(const std::string& name) const {
    const Option* option = find(name);
    return option == nullptr || option->given.empty() ? std::string() : option->given.back();
}

const std::vector<std::string>& CommandLine::values(const std::string& name) const {
    const Option* option = find(name);
    return option == nullptr ? kNone : option->given;
}

std::string CommandLine::problem(const std::string& message) const {
    return program_ + ": " + message + "\nTry '" + program_ + " --help'.\n";
}

bool CommandLine::refuse(std::ostream& err, const std::string& message) {
    err << problem(message);
    status_ = kUsageError;
    return false;
}

std::string CommandLine::unknown(const std::string& arg, int code) const {
    if (code >= kLongBase) {
        return options_[code - kLongBase].name + " takes no value";
    }
    if (code > 0) {
        return std::string("unknown option -") + static_cast<char>(code);
    }
    const std::string typed = arg.substr(0, arg.find('='));
    std::string matches;
    for (const Option& option : options_) {
        if (isLong(option.name) && option.name.compare(0, typed.size(), typed) == 0) {
            matches += (matches.empty() ? "" : ", ") + option.name;
        }
    }
    if (typed.size() > 2 && matches.find(',') != std::string::npos) {
        return "ambiguous option " + typed + " (" + matches + ")";
    }
    return "unknown option " + typed;
}

bool CommandLine::parse(const std::vector<std::string>& args, std::ostream& out,
                        std::ostream& err) {
    status_ = 0;
    operands_.clear();
    for (Option& option : options_) {
        option.times = 0;
        option.given.clear();
    }
    // "-": operands come back in order as code 1; ":": a missing value comes back as ':'.
    std::string shortOptions = "-:";
    std::vector<struct option> longOptions;
    for (size_t i = 0; i < options_.size(); ++i) {
        const Option& option = options_[i];
        if (option.alias != 0) {
            shortOptions += option.alias;
            shortOptions += option.takesValue ? ":" : "";
        }
        if (isLong(option.name)) {
            longOptions.push_back({option.name.c_str() + 2,
                                   option.takesValue ? required_argument : no_argument, nullptr,
                                   kLongBase + static_cast<int>(i)});
        }
    }
    longOptions.push_back({nullptr, 0, nullptr, 0});
    std::vector<std::string> words = {program_};
    words.insert(words.end(), args.begin(), args.end());
    std::vector<char*> argv;
    for (std::string& word : words) {
        argv.push_back(&word[0]);
    }
    argv.push_back(nullptr);
    const int argc = static_cast<int>(words.size());

    std::lock_guard<std::mutex> hold(gGetoptLock);
    optind = 0;  // glibc: start afresh, forgetting the last parse
    opterr = 0;  // every message is ours
    for (;;) {
        const int code =
            getopt_long(argc, argv.data(), shortOptions.c_str(), longOptions.data(), nullptr);
        if (code == -1) {
            break;
        }
        if (code == 1) {
            operands_.push_back(optarg);
            continue;
        }
        if (code == '?') {
            return refuse(err, unknown(optind > 0 ? argv[optind - 1] : "", optopt));
        }
        size_t index = options_.size();
        const int which = code == ':' ? optopt : code;
        for (size_t i = 0; i < options_.size(); ++i) {
            if (which == kLongBase + static_cast<int>(i) ||
                (which < kLongBase && options_[i].alias == which)) {
                index = i;
                break;
            }
        }
        if (index == options_.size()) {
            return refuse(err, unknown(argv[optind - 1], which));
        }
        Option& option = options_[index];
        if (code == ':') {
            return refuse(err, option.name + " needs a value");
        }
        if (option.name == "--help") {
            out << usage_;
            return false;
        }
        if (option.name == "--version") {
            out << program_ << ' ' << VELMORA_VERSION << '\n';
            return false;
        }
        if (option.takesValue && !option.repeats && option.times > 0) {
            return refuse(err, option.name + " given twice ('" + option.given.back() + "', '" +
                                   optarg + "')");
        }
        ++option.times;
        if (option.takesValue) {
            option.given.push_back(optarg);
        }
    }
    for (int i = optind; i < argc; ++i) {
        operands_.push_back(argv[i]);
    }
    for (const Rule& rule : rules_) {
        if (has(rule.a) && has(rule.b) == rule.together) {
            return refuse(err, rule.why);
        }
    }
    return true;
}

}  // namespace velmora
