// The benchmark platform layer: the symbols the library imports, with an executor that does
// nothing, so that a measurement shows the library's own cost and not a platform's.
//
// Unlike the test platform it records nothing (recording allocates); the only observation is
// the probe boost hook, which the probe latency benchmark installs. Configuration comes from one
// file named by setConfigPath(); there is no cloud copy, no launch policy, and the device event
// log drops its lines. The loader is the test platform's (tests/fakes/FakeLoadXml.h), so the
// benchmarks read configurations written in the tests' vocabulary.
#pragma once

#include <pthread.h>

#include <cstdint>
#include <string>

#include "platform/PerfExecutor.h"
#include "platform/VelmoraPlat.h"

namespace velmora {
namespace bench {

class NoopExecutor : public PerfExecutor {
public:
    int doAction(const Action* action, unsigned int payloadNum, const int* payload) override;
    int doPerfSetConfig(int id, int count, const int* tags, const int* values) override;
    int doPerfGetConfig(int count, const int* tags, int* values) override;
    int doSchedLevelAction(int count, const int* groups, const int* levels) override;
    int setProbeTid(unsigned int tid, int state) override;
};

// Called on the thread that applies a probe boost, right when doAction receives it.
using ProbeBoostHook = void (*)(unsigned int tid, pthread_t thread);

// Points get_one_cfg_file at `path`. Call before the server's init.
void setConfigPath(const std::string& path);
// Installs (or with null removes) the probe boost hook.
void setProbeBoostHook(ProbeBoostHook hook);
// The executor every platform object of this layer hands out.
NoopExecutor& executor();

}  // namespace bench
}  // namespace velmora
