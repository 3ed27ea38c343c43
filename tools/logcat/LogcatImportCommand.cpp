#include "tools/logcat/LogcatImportCommand.h"

#include <sys/stat.h>

#include <cstdio>
#include <fstream>
#include <sstream>

#include "tools/common/CommandLine.h"
#include "tools/common/InputFile.h"
#include "tools/logcat/LoadMerge.h"
#include "tools/logcat/LogcatImporter.h"

namespace velmora {

namespace {

constexpr const char* kProgram = "velmora-import-logcat";

constexpr const char* kUsage =
    "usage: velmora-import-logcat LOG -o TRACE [--load FILE]\n"
    "  LOG        text of adb logcat (threadtime or time; year, epoch, monotonic, uid), at\n"
    "             most 256 MiB\n"
    "  -o TRACE   the event trace to write, for velmora-replay; an existing one is\n"
    "             kept (it may hold your edits) unless --force is given\n"
    "  --force    overwrite an existing TRACE\n"
    "  --load FILE  merge the load lines of scripts/record-load into the trace by time (the\n"
    "             log captured with -v epoch or -v monotonic, the clock the file names)\n"
    "  --help     print this help and exit\n"
    "  --version  print the version and exit\n"
    "An option's value follows it (-o TRACE, --load FILE) or is joined to it (-oTRACE,\n"
    "--load=FILE).\n"
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
    CommandLine line(kProgram, kUsage);
    line.value("-o").value("--load").flag("--force");
    if (!line.parse(args, out, err)) {
        return line.status();
    }
    const std::vector<std::string>& operands = line.operands();
    if (operands.size() > 1) {
        err << line.problem("more than one log given (" + operands[0] + ", " + operands[1] + ")");
        return kUsageError;
    }
    const std::string logPath = operands.empty() ? std::string() : operands[0];
    const std::string tracePath = line.get("-o");
    const std::string loadPath = line.get("--load");
    const bool force = line.has("--force");
    if (logPath.empty() || tracePath.empty()) {
        err << kProgram << ": "
            << (logPath.empty() ? "no log given (LOG)" : "no trace to write (-o TRACE)") << "\n"
            << kUsage;
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
