// velmora-lint's check of a command configuration given as text (ConfigLinter::runText): the
// library's loader and the host layer's conversion behind it, the line-numbered second read,
// every rule, the listing of --explain and the findings as printed. Whatever the text, the
// findings are printed lines naming the configuration, and the exit status is one of three.
#include <cstdint>
#include <sstream>
#include <string>

#include "tools/lint/ConfigLinter.h"
#include "tools/lint/Diagnostics.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string text(reinterpret_cast<const char*>(data), size);
    velmora::LintOptions options;
    options.explain = true;
    options.werror = true;
    velmora::ConfigLinter linter("fuzz.xml", options);
    std::ostringstream out;
    const int status = linter.runText(text, out);
    if (status != velmora::Diagnostics::kClean && status != velmora::Diagnostics::kErrors &&
        status != velmora::Diagnostics::kWarningsAsErrors) {
        __builtin_trap();
    }
    // An error is always said, with the configuration's name.
    if (status == velmora::Diagnostics::kErrors &&
        out.str().find("fuzz.xml:") == std::string::npos) {
        __builtin_trap();
    }
    return 0;
}
