#include "tests/lint/LintTestSupport.h"

#include <stdlib.h>

#include <filesystem>
#include <fstream>
#include <sstream>

#include "tools/lint/LintCommand.h"

namespace velmora {
namespace linttest {

namespace {

void replaceAll(std::string* text, const std::string& from, const std::string& to) {
    if (from.empty()) {
        return;
    }
    for (size_t at = text->find(from); at != std::string::npos;
         at = text->find(from, at + to.size())) {
        text->replace(at, from.size(), to);
    }
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

ScratchDir::ScratchDir() {
    char pattern[] = "/tmp/velmora-lint-test-XXXXXX";
    const char* made = mkdtemp(pattern);
    mPath = made != nullptr ? made : "/tmp";
}

ScratchDir::~ScratchDir() {
    std::error_code ignored;
    std::filesystem::remove_all(mPath, ignored);
}

std::string ScratchDir::write(const std::string& name, const std::string& text) const {
    const std::string path = mPath + "/" + name;
    std::ofstream(path) << text;
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
    result.out = out.str();
    result.err = err.str();
    replaceAll(&result.out, configPath, "F");
    replaceAll(&result.err, configPath, "F");
    return result;
}

}  // namespace linttest
}  // namespace velmora
