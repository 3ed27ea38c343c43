#include "tools/logcat/LogcatImportCommand.h"

#include <sys/stat.h>

#include <cstdio>
#include <fstream>
#include <sstream>

#include "tools/common/InputFile.h"
#include "tools/logcat/LoadMerge.h"
#include "tools/logcat/LogcatImporter.h"

namespace velmora {

namespace {

constexpr const char* kUsage =
    "usage: velmora-import-logcat LOG -o TRACE [--load FILE]\n"
    "  LOG        text of adb logcat (threadtime or time; year, epoch, monotonic, uid), at\n"
    "             most 256 MiB\n"
    "  -o TRACE   the event trace to write, for velmora-replay; an existing one is\n"
    "             kept (it may hold your edits) unless --force is given\n"
    "  --force    overwrite an existing TRACE\n"
    "  --load FILE  merge the load lines of scripts/record-load into the trace by time (the\n"
    "             log captured with -v epoch or -v monotonic, the clock the file names)\n"
    "  --version  print the version and exit\n"
    "Exit status: 0 imported, 1 bad input, 2 a usage error.\n";

// Merges the load file at `loadPath` into `trace`; false after one line to `err`.
bool mergeLoad(const std::string& loadPath, const std::string& logPath,
               const LogcatImporter& importer, std::string* trace, std::ostream& err) {
    const std::string refusal = InputFile::refusal(loadPath);
    std::ifstream in(loadPath, std::ios::binary);
    if (!refusal.empty() || !in) {
        err << "velmora-import-logcat: " << loadPath
            << (refusal.empty() ? ": cannot be read" : " " + refusal) << "\n";
        return false;
    }
    std::stringstream text;
    text << in.rdbuf();
    LoadMerge load;
    std::string error;
    if (!load.read(text.str(), loadPath, &error)) {
        err << "velmora-import-logcat: " << error << "\n";
        return false;
    }
    const LogcatFormat::Clock clock = importer.format().clock();
    if (clock == LogcatFormat::Clock::kDate) {
        err << "velmora-import-logcat: " << logPath << ": dated stamps, no clock to place "
            << loadPath << " on (capture with logcat -v threadtime,epoch)\n";
        return false;
    }
    if (!load.checkClock(clock == LogcatFormat::Clock::kEpoch ? LoadMerge::Clock::kEpoch
                                                              : LoadMerge::Clock::kMonotonic,
                         &error)) {
        err << "velmora-import-logcat: " << error << "\n";
        return false;
    }
    *trace = load.merge(*trace, importer.firstCallUs());
    return true;
}

}  // namespace

int LogcatImportCommand::run(const std::vector<std::string>& args, std::ostream& out,
                             std::ostream& err) {
    std::string logPath;
    std::string tracePath;
    std::string loadPath;
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
        } else if (args[i] == "--load" && i + 1 < args.size()) {
            loadPath = args[++i];
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
    std::string traceText = importer.trace();
    if (!loadPath.empty() && !mergeLoad(loadPath, logPath, importer, &traceText, err)) {
        return kBadInput;
    }
    // Written beside it and renamed: an existing trace is replaced whole or not at all.
    const std::string partial = tracePath + ".partial";
    std::ofstream trace(partial, std::ios::trunc);
    trace << traceText;
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
