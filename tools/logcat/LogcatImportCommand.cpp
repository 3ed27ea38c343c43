#include "tools/logcat/LogcatImportCommand.h"

#include <sys/stat.h>

#include <cstdio>
#include <fstream>
#include <sstream>

#include "tools/common/InputFile.h"
#include "tools/logcat/LogcatImporter.h"

namespace velmora {

namespace {

constexpr const char* kUsage =
    "usage: velmora-import-logcat LOG -o TRACE\n"
    "  LOG        text of adb logcat (threadtime or time; year, epoch, monotonic, uid), at\n"
    "             most 256 MiB\n"
    "  -o TRACE   the event trace to write, for velmora-replay; an existing one is\n"
    "             kept (it may hold your edits) unless --force is given\n"
    "  --force    overwrite an existing TRACE\n"
    "  --version  print the version and exit\n"
    "Exit status: 0 imported, 1 bad input, 2 a usage error.\n";

}  // namespace

int LogcatImportCommand::run(const std::vector<std::string>& args, std::ostream& out,
                             std::ostream& err) {
    std::string logPath;
    std::string tracePath;
    bool force = false;
    for (size_t i = 0; i < args.size(); ++i) {
        if (args[i] == "-h" || args[i] == "--help") {
            out << kUsage;
            return kOk;
        }
        if (args[i] == "--version") {
            out << "velmora-import-logcat " << VELMORA_VERSION << "\n";
            return kOk;
        }
        if (args[i] == "--force") {
            force = true;
        } else if (args[i] == "-o" && i + 1 < args.size()) {
            tracePath = args[++i];
        } else if (!args[i].empty() && args[i][0] != '-' && logPath.empty()) {
            logPath = args[i];
        } else {
            err << "velmora-import-logcat: unexpected argument '" << args[i] << "'\n" << kUsage;
            return kUsageError;
        }
    }
    if (logPath.empty() || tracePath.empty()) {
        err << kUsage;
        return kUsageError;
    }
    struct stat st {};
    if (!force && stat(tracePath.c_str(), &st) == 0) {
        err << "velmora-import-logcat: " << tracePath
            << " exists and is kept (it may hold your edits); --force overwrites it\n";
        return kBadInput;
    }
    const std::string refusal = InputFile::refusal(logPath);
    if (!refusal.empty()) {
        err << "velmora-import-logcat: " << logPath << " " << refusal << "\n";
        return kBadInput;
    }
    std::ifstream in(logPath, std::ios::binary);
    if (!in) {
        err << "velmora-import-logcat: " << logPath << ": cannot be read\n";
        return kBadInput;
    }
    std::stringstream text;
    text << in.rdbuf();

    LogcatImporter importer;
    std::string error;
    if (importer.importText(text.str(), logPath, &error) != 0) {
        err << "velmora-import-logcat: " << error << "\n";
        return kBadInput;
    }
    // Written beside it and renamed: an existing trace is replaced whole or not at all.
    const std::string partial = tracePath + ".partial";
    std::ofstream trace(partial, std::ios::trunc);
    trace << importer.trace();
    trace.close();
    if (!trace || rename(partial.c_str(), tracePath.c_str()) != 0) {
        std::remove(partial.c_str());
        err << "velmora-import-logcat: " << tracePath << ": cannot be written\n";
        return kBadInput;
    }
    out << logPath << " (logcat -v " << importer.formatName() << "): " << importer.counts().text()
        << "\nwrote " << tracePath << "\n";
    return kOk;
}

}  // namespace velmora
