// Process exit while a thread is still tracing through the device's own sink. The probe worker
// lives as long as the process: exit runs the destructors of static objects while it may be in
// the middle of a trace point, so the sink it reaches must still be there. On a host, atrace
// never reports its tag as enabled, so the worker's own points stop at Trace::enabled(); the
// thread here calls the points directly, as the worker does once tracing is on.
#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <atomic>
#include <cstdlib>
#include <thread>

#include "trace/ServerTrace.h"
#include "trace/Trace.h"

namespace velmora {
namespace {

// Each run exits once; a destroyed sink shows up as an abort ("pure virtual method called") or
// a sanitizer report in some of them.
constexpr int kRuns = 20;
// Points traced before the exit starts, so the thread is known to be in its loop.
constexpr long kPointsBeforeExit = 1000;

// Child process: traces from a second thread without pause and exits from the first.
[[noreturn]] void traceWhileExiting() {
    Trace::setSink(nullptr);  // atrace, the device's sink
    static std::atomic<long> points{0};
    std::thread worker([] {
        for (;;) {
            Trace::beginSlice("probe");
            Trace::counter(ServerTrace::kProbeBoostedTrack, points.fetch_add(1));
            Trace::endSlice();
        }
    });
    worker.detach();
    while (points.load() < kPointsBeforeExit) {
        std::this_thread::yield();
    }
    exit(0);
}

TEST(TraceExitTest, ExitWhileAThreadTracesThroughTheDeviceSinkIsClean) {
    for (int run = 0; run < kRuns; ++run) {
        fflush(nullptr);
        const pid_t pid = fork();
        ASSERT_GE(pid, 0);
        if (pid == 0) {
            traceWhileExiting();
        }
        int status = 0;
        ASSERT_EQ(waitpid(pid, &status, 0), pid);
        ASSERT_TRUE(WIFEXITED(status)) << "run " << run << ": ended by signal "
                                       << (WIFSIGNALED(status) ? WTERMSIG(status) : 0);
        ASSERT_EQ(WEXITSTATUS(status), 0) << "run " << run;
    }
}

}  // namespace
}  // namespace velmora
