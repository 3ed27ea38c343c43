#include "tools/lint/LintCommand.h"

#include <sys/stat.h>

#include <cerrno>
#include <cstring>
#include <fstream>

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
       << "              examples/device/example-device.xml)\n"
       << "  --version   print the version and exit\n"
       << "Exit status: 0 clean (notes allowed), 1 warnings with --werror, 2 errors or a\n"
       << "usage error.\n";
}

int LintCommand::run(const std::vector<std::string>& args, std::ostream& out, std::ostream& err) {
    LintOptions options;
    std::string path;
    std::string devicePath;
    bool pathGiven = false;
    for (size_t i = 0; i < args.size(); ++i) {
        const std::string& arg = args[i];
        if (arg == "--device") {
            if (i + 1 >= args.size()) {
                err << kProgram << ": --device needs a device profile\n";
                return kUsageError;
            }
            devicePath = args[++i];
        } else if (arg == "--explain") {
            options.explain = true;
        } else if (arg == "--werror") {
            options.werror = true;
        } else if (arg == "--help" || arg == "-h") {
            printUsage(out);
            return 0;
        } else if (arg == "--version") {
            out << kProgram << ' ' << VELMORA_VERSION << '\n';
            return 0;
        } else if (arg.size() > 1 && arg[0] == '-') {
            err << kProgram << ": unknown option " << arg << '\n';
            printUsage(err);
            return kUsageError;
        } else if (pathGiven) {
            err << kProgram << ": more than one configuration given (" << path << ", " << arg
                << ")\n";
            return kUsageError;
        } else {
            path = arg;
            pathGiven = true;
        }
    }
    if (!pathGiven || path.empty()) {
        err << kProgram << ": no configuration file given\n";
        printUsage(err);
        return kUsageError;
    }
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
