// The command line of every velmora tool, read the GNU way (getopt_long): "--name VALUE" and
// "--name=VALUE", "-o VALUE" and "-oVALUE", a unique prefix of a long name, options and operands
// in any order, "--" ends the options. --help (usage on stdout) and --version ("<tool>
// <version>") are every tool's own and end the run with status 0. A line that cannot be run is
// one line on stderr naming the problem, then "Try '<tool> --help'.", status 2: an unknown or
// ambiguous option, a missing value, a value to a flag, a single-valued option given twice and
// options the tool declared conflicting.
//
//   CommandLine line("velmora-x", kUsage);
//   line.flag("--fast").value("--speed").value("-o").excludes("--fast", "--speed");
//   if (!line.parse(args, out, err)) return line.status();
//
// Options are named as typed ("--speed", "-o"). Parses one line at a time in the process
// (getopt_long keeps its state in globals, guarded here).
#pragma once

#include <ostream>
#include <string>
#include <vector>

namespace velmora {

class CommandLine {
public:
    // Exit status of a command line that cannot be run, the same for every velmora tool.
    static constexpr int kUsageError = 2;

    // `program` names the tool in its messages; `usage` is what --help prints.
    CommandLine(std::string program, std::string usage);

    // An option without a value; given again it is still just given. `alias` is a one-letter
    // short form of a long option (0: none).
    CommandLine& flag(const std::string& name, char alias = 0);
    // An option with a value, given at most once.
    CommandLine& value(const std::string& name, char alias = 0);
    // An option with a value that may be given again; values() keeps them in order.
    CommandLine& repeatable(const std::string& name, char alias = 0);
    // `a` and `b` are refused together: `why` is the message (default "A and B exclude each
    // other").
    CommandLine& excludes(const std::string& a, const std::string& b, const std::string& why = "");
    // `a` is refused without `b` (default message "A needs B").
    CommandLine& needs(const std::string& a, const std::string& b, const std::string& why = "");

    // Reads `args` (without the program's name). True when the tool goes on with what was given;
    // false when it is done, with status(): 0 after --help or --version (said on `out`), 2 after a
    // usage error (said on `err`).
    bool parse(const std::vector<std::string>& args, std::ostream& out, std::ostream& err);
    int status() const { return status_; }

    bool has(const std::string& name) const;
    // The value given to `name` ("" when it was not).
    std::string get(const std::string& name) const;
    const std::vector<std::string>& values(const std::string& name) const;
    const std::vector<std::string>& operands() const { return operands_; }

    // The lines of a usage error the tool found itself (a malformed value, a missing operand):
    // "<program>: <message>" and the hint.
    std::string problem(const std::string& message) const;
    const std::string& program() const { return program_; }
    const std::string& usage() const { return usage_; }

private:
    struct Option {
        std::string name;
        char alias;
        bool takesValue;
        bool repeats;
        int times = 0;
        std::vector<std::string> given;
    };
    struct Rule {
        std::string a;
        std::string b;
        bool together;  // refused together (else: `a` refused without `b`)
        std::string why;
    };

    CommandLine& add(const std::string& name, char alias, bool takesValue, bool repeats);
    const Option* find(const std::string& name) const;
    // What went wrong in getopt_long's '?' for `arg`.
    std::string unknown(const std::string& arg, int code) const;
    bool refuse(std::ostream& err, const std::string& message);

    std::string program_;
    std::string usage_;
    std::vector<Option> options_;
    std::vector<Rule> rules_;
    std::vector<std::string> operands_;
    int status_ = 0;
};

}  // namespace velmora
