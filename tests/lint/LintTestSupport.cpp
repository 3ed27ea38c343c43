#include "tests/lint/LintTestSupport.h"

#include <sstream>

#include "tests/host/HostTestSupport.h"
#include "tools/lint/LintCommand.h"

namespace velmora {
namespace linttest {

namespace {

// Copies as it goes: replacing in place moves the rest of the text every time, which is
// quadratic in the output of a configuration of thousands of commands.
std::string replaceAll(const std::string& text, const std::string& from, const std::string& to) {
    std::string out;
    size_t start = 0;
    for (size_t at = text.find(from); at != std::string::npos; at = text.find(from, start)) {
        out.append(text, start, at - start);
        out += to;
        start = at + from.size();
    }
    out.append(text, start, std::string::npos);
    return out;
}

}  // namespace

std::vector<std::string> LintResult::outLines() const {
    std::vector<std::string> lines;
    std::istringstream in(out);
    for (std::string line; std::getline(in, line);) {
        lines.push_back(line);
    }
    return lines;
}

std::string configFile(const std::string& text) {
    const std::string path = hosttest::makeScratchDir("lint") + "/config.xml";
    hosttest::writeFile(path, text);
    return path;
}

std::string withBase(const std::string& body) {
    return "<policy>\n"
           "<cmd id=\"5376\" name=\"defaults\"><a><duration>0</duration>"
           "<group_hmp>10</group_hmp></a></cmd>\n"
           "<cmd id=\"4116\" name=\"probe\"><a><duration>50</duration>"
           "<big_min>1497600</big_min></a></cmd>\n" +
           body + "</policy>\n";
}

LintResult runLint(const std::vector<std::string>& options, const std::string& configPath) {
    std::vector<std::string> args = options;
    args.push_back(configPath);
    std::ostringstream out;
    std::ostringstream err;
    LintResult result;
    result.status = LintCommand::run(args, out, err);
    result.out = replaceAll(out.str(), configPath, "F");
    result.err = replaceAll(err.str(), configPath, "F");
    return result;
}

}  // namespace linttest
}  // namespace velmora
