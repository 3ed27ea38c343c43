#include "tools/replay/ReplaySession.h"

#include <pthread.h>
#include <unistd.h>

#include <memory>
#include <set>

#include "config/CommandIds.h"
#include "config/VelmoraParser.h"
#include "host/device/profile/DeviceProfile.h"
#include "host/platform/HostEnvironment.h"
#include "host/platform/HostPlatform.h"
#include "platform/VelmoraPlat.h"
#include "server/VelmoraServer.h"
#include "tools/common/InputFile.h"
#include "tools/energy/EnergyModel.h"
#include "tools/energy/EnergySummary.h"
#include "tools/energy/LoadDomains.h"
#include "tools/insight/InsightSummary.h"
#include "tools/insight/ReplayInsight.h"
#include "tools/replay/CallWarnings.h"
#include "tools/replay/PacedLineReader.h"
#include "tools/replay/ProgressLine.h"
#include "tools/replay/ReplayOutputs.h"
#include "tools/replay/SameCpuScope.h"
#include "tools/replay/TraceReader.h"
#include "tools/replay/TraceSurvey.h"

namespace velmora {

namespace {

constexpr int kReloadCmdId = kCmdReload;
// How long, in trace time, the end of a replay waits for the library's probe worker to
// withdraw its boosts (a boost lives at most kProbeBoostLifetimeMs), in steps of
// kProbeDrainStepMs, and then for the worker to drop the withdrawn entries.
constexpr int64_t kProbeDrainLimitMs = 1000;  // several lifetimes
constexpr int64_t kProbeDrainStepMs = 1;
constexpr int64_t kProbeSettleMs = 20;
// How often a paced interactive replay brings the device up to the wall clock between lines.
constexpr int kInteractiveTickMs = 10;

std::string directoryOf(const std::string& path) {
    const size_t slash = path.find_last_of('/');
    if (slash == std::string::npos)
        return ".";
    return slash == 0 ? "/" : path.substr(0, slash);
}

}  // namespace

ReplaySession::ReplaySession(ReplayOptions options, FILE* out, FILE* err, FILE* input)
    : mOptions(std::move(options)), mOut(out), mErr(err), mInput(input) {}

ReplaySession::~ReplaySession() {
    tearDown();
}

int ReplaySession::setUp() {
    HostEnvironment& env = HostEnvironment::get();
    env.reset();
    // Without a timeline file nothing reads the server's tracks or the per-call instants.
    env.setServerTracing(writesTimeline());
    if (mOptions.fast) {
        env.clock().setVirtual();
    } else {
        env.clock().setPaced(mOptions.speed);
    }
    std::string error;
    if (loadProfile() != kOk)
        return kBadInput;
    if (!mOptions.devicePath.empty())
        env.nodeMap().useProfile(mProfile);
    if (!mOptions.nodeMapPath.empty() && env.nodeMap().load(mOptions.nodeMapPath, &error) != 0) {
        fprintf(mErr, "velmora-replay: %s\n", error.c_str());
        return kBadInput;
    }
    std::vector<std::string> dirs = mOptions.configDirs;
    if (dirs.empty()) {
        dirs.push_back(mOptions.interactive ? "." : directoryOf(mOptions.tracePath));
    }
    env.properties().setConfigDirs(dirs);
    if (env.properties().findConfigFile("xml/velmora_config_cust.xml").empty()) {
        fprintf(mErr, "velmora-replay: no xml/velmora_config_cust.xml in %s\n", dirs[0].c_str());
        return kBadInput;
    }
    for (const auto& property : mOptions.properties) {
        env.properties().set(property.first, property.second);
    }
    const std::string root =
        mOptions.deviceRoot.empty() ? HostEnvironment::defaultSimulatedRoot() : mOptions.deviceRoot;
    // A device root of our own making goes again at the end, unless asked to keep it; one the
    // user named stays.
    mOwnedRoot = mOptions.deviceRoot.empty() && !mOptions.keepRoot ? root : std::string();
    if (env.useDeviceRoot(root, /*fresh=*/true) != 0) {
        fprintf(mErr, "velmora-replay: device root %s is not usable\n", root.c_str());
        return kSetupFailed;
    }
    if (!env.eventLog().setPath(mOptions.eventLogPath)) {
        fprintf(mErr, "velmora-replay: cannot write %s\n", mOptions.eventLogPath.c_str());
        return kSetupFailed;
    }
    if (mOptions.insight) {
        mInsight.reset(new ReplayInsight(env.clock(), env.nodeMap(),
                                         [this](int cmdId) { return commandName(cmdId); }));
    }
    // Every node gets its initial value on the timeline, also the ones nothing will touch.
    for (const auto& node : env.nodeMap().nodes()) {
        std::string text;
        if (env.device().read(node.key, &text) && mInsight != nullptr)
            mInsight->setInitial(node.key, text);
    }
    if (mOptions.fast)
        mSameCpu.reset(new SameCpuScope());
    mServer.reset(new VelmoraServer());
    const int status = mServer->init();
    if (auto* plat = dynamic_cast<HostPlatform*>(mServer->mPlatPtr); plat && mInsight) {
        plat->executor()->setObserver(mInsight.get());
    }
    fprintf(mOut, "init -> %d (device %s)\n", status, root.c_str());
    env.clock().alignWall();  // trace time 0 is the end of the initialisation
    // 4 means the probe command is missing; everything else is running.
    if (status != 0 && status != 4) {
        fprintf(mErr,
                "velmora-replay: server init failed with %d; check the configuration with "
                "velmora-lint %s\n",
                status, env.properties().findConfigFile("xml/velmora_config_cust.xml").c_str());
        mServer.reset();
        mSameCpu.reset();
        return kSetupFailed;
    }
    return kOk;
}

int ReplaySession::loadProfile() {
    if (mProfileLoaded)
        return kOk;
    std::string error;
    if (mOptions.devicePath.empty()) {
        mProfile = DeviceProfile::builtIn();
    } else if (mProfile.load(mOptions.devicePath, &error) != 0) {
        fprintf(mErr, "velmora-replay: %s\n", error.c_str());
        return kBadInput;
    }
    mProfileLoaded = true;
    return kOk;
}

void ReplaySession::echo(const TraceCall& call, const std::string& result) {
    if (mOptions.quiet)
        return;
    const int64_t ms = HostEnvironment::get().clock().nowMs();
    fprintf(mOut, "[%7lld.%03lld] %s:%d %s -> %s\n", static_cast<long long>(ms / 1000),
            static_cast<long long>(ms % 1000), call.file.c_str(), call.line, call.source.c_str(),
            result.c_str());
    fflush(mOut);
}

std::string ReplaySession::commandName(int cmdId) const {
    auto cached = mNames.find(cmdId);
    if (cached != mNames.end())
        return cached->second;
    VelmoraParser* parser = mServer != nullptr && mServer->mPlatPtr != nullptr
                                ? mServer->mPlatPtr->mParserPtr
                                : nullptr;
    if (parser == nullptr)
        return "";
    Action action;
    pthread_rwlock_rdlock(&parser->mRwLock);
    const int ret = parser->doParseLocked(cmdId, &action);
    pthread_rwlock_unlock(&parser->mRwLock);
    return mNames[cmdId] = ret == 0 ? action.mName : "";
}

int ReplaySession::perform(const TraceCall& call) {
    if (call.kind == TraceCall::Kind::Load)
        return performLoad(call);
    CallRecord record;
    record.kind = call.kind == TraceCall::Kind::Event       ? CallRecord::Kind::Event
                  : call.kind == TraceCall::Kind::SetConfig ? CallRecord::Kind::SetConfig
                                                            : CallRecord::Kind::Other;
    record.id = call.id;
    if (record.kind == CallRecord::Kind::Event) {
        record.payload = call.payload;
        record.msg = call.text;
    } else if (record.kind == CallRecord::Kind::SetConfig) {
        record.tags = call.tags;
        record.values = call.values;
    }
    record.where = call.file + ":" + std::to_string(call.line);
    record.text = call.source;
    record.atUs = call.atMs >= 0 ? call.atMs * 1000 : -1;
    if (call.kind == TraceCall::Kind::Reload)
        mNames.clear();  // names may change with the configuration
    // Begun before the clock moves, so that what falls due on the way belongs to this call.
    if (mInsight != nullptr)
        mInsight->beginCall(std::move(record));
    const int status = performCall(call);
    if (mInsight != nullptr)
        mInsight->endCall(status);
    return status;
}

void ReplaySession::warnIfBehind(const TraceCall& call, const char* what) const {
    const long long now = HostEnvironment::get().clock().nowMs();
    if (call.atMs >= 0 && call.atMs < now) {
        fprintf(mErr,
                "velmora-replay: %s:%d: warning: @%lld is before the time already reached "
                "(%lld ms); %s %lld ms\n",
                call.file.c_str(), call.line, static_cast<long long>(call.atMs), now, what, now);
    }
}

int ReplaySession::performLoad(const TraceCall& call) {
    // Not a host call: the server never sees it and the analysis need not. A load stamped at or
    // before the time reached holds from there, without the hand-over to the probe worker that
    // moving the clock costs; one ahead of it moves the clock like any "@".
    HostClock& clock = HostEnvironment::get().clock();
    warnIfBehind(call, "the load holds from");
    if (call.atMs > clock.nowMs())
        clock.advanceTo(call.atMs);
    if (clock.interrupted())
        return 0;
    for (const auto& share : call.loads)
        mLoads.set(clock.nowUs(), share.domain, share.u);
    echo(call, "ok");
    return 0;
}

int ReplaySession::performCall(const TraceCall& call) {
    HostEnvironment& env = HostEnvironment::get();
    warnIfBehind(call, "the call runs at");
    // This also lets the probe worker finish what the last call gave it, so a line without a
    // time runs after it, as it would a moment later on a device.
    env.clock().advanceTo(call.atMs >= 0 ? call.atMs : env.clock().nowMs());
    if (env.clock().interrupted())
        return 0;  // interrupted on the way: the call never came
    int status = 0;
    std::string result;
    switch (call.kind) {
        case TraceCall::Kind::Stamp:
            return 0;
        case TraceCall::Kind::Sleep:
            env.clock().sleepMs(call.sleepMs);
            return 0;
        case TraceCall::Kind::Policy:
            env.launchPolicies().set(call.text, call.id);
            echo(call, "ok");
            return 0;
        case TraceCall::Kind::Load:
            return performLoad(call);
        case TraceCall::Kind::Event:
            status = mServer->velmoraEvent(call.id, call.hasMsg ? call.text.c_str() : nullptr,
                                           static_cast<unsigned int>(call.payload.size()),
                                           call.payload.empty() ? nullptr : call.payload.data());
            break;
        case TraceCall::Kind::Reload:
            status = mServer->velmoraEvent(kReloadCmdId, nullptr, 0, nullptr);
            break;
        case TraceCall::Kind::SetConfig:
            status = mServer->velmoraSetConfig(call.id, static_cast<int>(call.tags.size()),
                                               call.tags.data(), call.values.data());
            break;
        case TraceCall::Kind::GetConfig: {
            std::vector<int> values(call.tags.size(), -1);
            status = mServer->velmoraGetConfig(static_cast<int>(call.tags.size()), call.tags.data(),
                                               values.data());
            for (size_t i = 0; i < values.size(); ++i) {
                result += std::to_string(call.tags[i]) + "=" + std::to_string(values[i]) + " ";
            }
            break;
        }
        case TraceCall::Kind::Dump:
            echo(call, "");
            fflush(mOut);
            mServer->dumpVelmoraServerInfo(fileno(mOut), {call.text});
            ++mCalls;
            return 0;
    }
    ++mCalls;
    if (status != 0)
        ++mFailed;
    if (writesTimeline())
        env.timeline().recordInstant("call", call.source + " -> " + std::to_string(status));
    echo(call, result + std::to_string(status));
    return status;
}

int ReplaySession::replayFile() {
    // Every bad line is reported before anything runs. The first pass keeps what the warnings
    // need, the second replays the calls as it reads them: the trace is never held in memory.
    // A directory, a binary file or a huge one is refused before a byte of it is parsed; a
    // missing trace is reported by the survey.
    if (access(mOptions.tracePath.c_str(), F_OK) == 0) {
        const std::string refusal = InputFile::refusal(mOptions.tracePath);
        if (!refusal.empty()) {
            fprintf(mErr, "velmora-replay: %s %s\n", mOptions.tracePath.c_str(), refusal.c_str());
            return kBadInput;
        }
    }
    if (loadProfile() != kOk)
        return kBadInput;
    const LoadDomains domains(mProfile);
    TraceSurvey survey;
    survey.checkLoadsWith(&domains);
    const int errors = survey.read(mOptions.tracePath, [this](const std::string& message) {
        fprintf(mErr, "velmora-replay: %s\n", message.c_str());
    });
    if (errors != 0)
        return kBadInput;
    const int setup = setUp();
    if (setup != kOk)
        return setup;
    if (mInsight != nullptr && mOptions.keepCallDigests)
        mInsight->keepCallDigests();
    if (mInsight != nullptr && !mOptions.compareWithDigests.empty())
        mInsight->compareWith(std::move(mOptions.compareWithDigests));
    CallWarnings::print(survey, *mServer, mOptions.tracePath, mErr);
    HostClock& clock = HostEnvironment::get().clock();
    ProgressLine progress(mErr);
    TraceReader reader(mOptions.tracePath);
    TraceCall call;
    while (reader.next(&call, nullptr) != TraceReader::Step::End) {
        if (clock.interrupted()) {
            break;
        }
        perform(call);
        progress.update(clock.nowMs(), mCalls);
    }
    progress.clear();
    return kOk;
}

int ReplaySession::replayInteractive() {
    const int setup = setUp();
    if (setup != kOk)
        return setup;
    int result = kOk;
    int lineNo = 0;
    HostClock& clock = HostEnvironment::get().clock();
    // Paced, the device follows the wall clock between lines too; unpaced, time moves only
    // with the "@" stamps of the lines.
    const bool paced = clock.paced() && fileno(mInput) >= 0;
    auto catchUp = [&clock] { clock.advanceTo(clock.wallUs() / 1000); };
    PacedLineReader reader(paced ? fileno(mInput) : -1, catchUp, kInteractiveTickMs);
    auto stop = [&clock] { return clock.interrupted(); };
    std::string line;
    char buffer[4096];
    for (;;) {
        if (paced) {
            if (!reader.next(&line, stop))
                break;
            catchUp();
        } else {
            if (clock.interrupted() || fgets(buffer, sizeof(buffer), mInput) == nullptr)
                break;
            line = buffer;
            if (!line.empty() && line.back() == '\n')
                line.pop_back();
        }
        std::vector<TraceCall> calls;
        std::string error;
        if (TraceParser::parseLine(line, "<stdin>", ++lineNo, &calls, &error) != 0 ||
            (!calls.empty() && !LoadDomains(mProfile).check(calls[0], &error))) {
            fprintf(mErr, "velmora-replay: %s\n", error.c_str());
            result = kBadInput;  // keep going: a typo should not end the session
            continue;
        }
        for (const auto& call : calls)
            perform(call);
    }
    return result;
}

void ReplaySession::waitForProbeBoosts() {
    auto* plat = mServer != nullptr ? dynamic_cast<HostPlatform*>(mServer->mPlatPtr) : nullptr;
    if (plat == nullptr)
        return;
    HostClock& clock = HostEnvironment::get().clock();
    const int64_t limit = clock.nowMs() + kProbeDrainLimitMs;
    while (plat->executor()->boostedThreads() != 0 && clock.nowMs() < limit) {
        clock.sleepMs(kProbeDrainStepMs);
    }
    clock.sleepMs(kProbeSettleMs);
}

void ReplaySession::tearDown() {
    if (mServer == nullptr)
        return;
    waitForProbeBoosts();
    if (auto* plat = dynamic_cast<HostPlatform*>(mServer->mPlatPtr)) {
        plat->executor()->setObserver(nullptr);
    }
    mServer.reset();
    mSameCpu.reset();
    removeOwnedRoot();
}

void ReplaySession::removeOwnedRoot() {
    if (mOwnedRoot.empty())
        return;
    std::string error;
    if (!HostEnvironment::get().removeSimulatedRoot(mOwnedRoot, &error))
        fprintf(mErr, "velmora-replay: %s\n", error.c_str());
    mOwnedRoot.clear();
}

void ReplaySession::finishInsight() {
    if (mInsight == nullptr)
        return;
    mResult = mInsight->finish();
    mResult.energy = EnergyModel::run(mProfile, mResult, mLoads);
    if (auto* plat = mServer != nullptr ? dynamic_cast<HostPlatform*>(mServer->mPlatPtr) : nullptr)
        plat->executor()->setObserver(nullptr);
    mInsight.reset();
    if (!writesTimeline())
        return;
    Timeline& timeline = HostEnvironment::get().timeline();
    for (const auto& span : mResult.spans) {
        timeline.recordSpan(span.track, span.category, span.name, span.beginUs, span.endUs);
    }
    auto holders = std::make_shared<const ChangeHolders>(ReplayInsight::holdersByChange(mResult));
    timeline.setCounterSource(
        [holders](const std::string& key, size_t sample) { return holders->at(key, sample); });
}

std::string ReplaySession::summaryText() const {
    return ReplayOutputs::summaryText(mResult);
}

int ReplaySession::run() {
    if (mOptions.writeFiles) {
        // Found out before anything is replayed, not after a long replay.
        for (const std::string* path : {&mOptions.summaryJsonPath, &mOptions.reportPath}) {
            std::string error;
            if (!path->empty() && !ReplayOutputs::checkWritable(*path, &error)) {
                fprintf(mErr, "velmora-replay: %s\n", error.c_str());
                return kSetupFailed;
            }
        }
    }
    const int result = mOptions.interactive ? replayInteractive() : replayFile();
    if (mServer == nullptr)
        return result;
    finishInsight();
    tearDown();
    HostEnvironment& env = HostEnvironment::get();
    if (env.clock().interrupted())
        fprintf(mOut, "\ninterrupted at %lld ms: what ran so far\n",
                static_cast<long long>(env.clock().nowMs()));
    fprintf(mOut, "\n%d host calls, %d with a nonzero status, %zu report lines\n\n", mCalls,
            mFailed, env.eventLog().lines().size());
    fputs(summaryText().c_str(), mOut);
    if (!mResult.nodes.empty()) {
        fputs(("\n" + InsightSummary::residency(mResult)).c_str(), mOut);
        fputs(("\n" + InsightSummary::warnings(mResult)).c_str(), mOut);
        fputs(("\n" + EnergySummary::text(mResult.energy, mResult.endUs)).c_str(), mOut);
    }
    const int written =
        mOptions.writeFiles ? ReplayOutputs::write(mOptions, mResult, mOut, mErr) : kOk;
    if (mOptions.keepRoot && mOptions.deviceRoot.empty())
        fprintf(mOut, "device kept: %s\n", env.device().root().c_str());
    return written != kOk ? written : result;
}

}  // namespace velmora
