#include "tools/lint/LintCommand.h"

#include <sys/stat.h>

#include <cerrno>
#include <cstring>
#include <fstream>
#include <sstream>

#include "tools/common/CommandLine.h"
#include "tools/lint/ConfigLinter.h"

namespace velmora {

namespace {

constexpr const char* kProgram = "velmora-lint";
// The loader refuses a larger configuration before reading it (config/VelmoraLoadXml.cpp).
constexpr long long kMaxConfigBytes = 16LL * 1024 * 1024;

// Empty when `path` is a readable regular file, else why not.
std::string unreadableReason(const std::string& path) {
    struct stat info {};
    if (stat(path.c_str(), &info) != 0) {
        return strerror(errno);
    }
    if (S_ISDIR(info.st_mode)) {
        return "is a directory";
    }
    std::ifstream in(path);
    if (!in) {
        return "cannot be read";
    }
    return std::string();
}

}  // namespace

void LintCommand::printUsage(std::ostream& to) {
    to << "usage: " << kProgram << " [--explain] [--werror] [--device PROFILE.xml] CONFIG.xml\n"
       << "Checks a command configuration the way the server loads and dispatches it and\n"
       << "reports findings as FILE:LINE: error|warning|note: MESSAGE.\n"
       << "  --explain   list how every command is dispatched (class, duration, pairs)\n"
       << "  --werror    exit 1 when there are warnings (and no errors)\n"
       << "  --device F  check values against device profile F (default: the example device,\n"
       << "              examples/device/example-device.xml); also --device=F\n"
       << "  --help      print this help and exit\n"
       << "  --version   print the version and exit\n"
       << "Exit status: 0 clean (notes allowed), 1 warnings with --werror, 2 errors or a\n"
       << "usage error.\n";
}

int LintCommand::run(const std::vector<std::string>& args, std::ostream& out, std::ostream& err) {
    std::ostringstream usage;
    printUsage(usage);
    CommandLine line(kProgram, usage.str());
    line.flag("--explain").flag("--werror").value("--device");
    if (!line.parse(args, out, err)) {
        return line.status();
    }
    const std::vector<std::string>& operands = line.operands();
    if (operands.size() > 1) {
        err << line.problem("more than one configuration given (" + operands[0] + ", " +
                            operands[1] + ")");
        return kUsageError;
    }
    if (operands.empty() || operands[0].empty()) {
        err << kProgram << ": no configuration file given\n";
        printUsage(err);
        return kUsageError;
    }
    const std::string& path = operands[0];
    const std::string devicePath = line.get("--device");
    LintOptions options;
    options.explain = line.has("--explain");
    options.werror = line.has("--werror");
    const std::string reason = unreadableReason(path);
    if (!reason.empty()) {
        err << kProgram << ": " << path << ": " << reason << '\n';
        return kUsageError;
    }
    struct stat info {};
    if (stat(path.c_str(), &info) == 0 && static_cast<long long>(info.st_size) > kMaxConfigBytes) {
        // Said here in words: the checker would otherwise read it whole and find the loader
        // refusing what the checker parsed.
        out << path << ":1: error: the file is " << static_cast<long long>(info.st_size)
            << " bytes, more than the " << kMaxConfigBytes
            << " (16 MiB) a configuration may have: the server refuses it without reading it\n";
        return kUsageError;
    }
    DeviceProfile device;
    if (!devicePath.empty()) {
        std::string error;
        if (device.load(devicePath, &error) != 0) {
            err << kProgram << ": " << error << '\n';
            return kUsageError;
        }
        options.device = &device;
    }
    ConfigLinter linter(path, options);
    return linter.run(out);
}

}  // namespace velmora
