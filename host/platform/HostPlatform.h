// The host platform object: what getPlat() hands the server on a Linux host. Owns its executor,
// which works on the device of the HostEnvironment (simulated tree or real nodes).
#pragma once

#include "host/platform/HostExecutor.h"
#include "platform/VelmoraPlat.h"

namespace velmora {

class HostPlatform : public VelmoraPlat {
public:
    HostPlatform();
    // Deletes the executor (stopping its timer) before the base deletes the parser.
    ~HostPlatform() override;
    // Prepares the device tree (seeds the default simulated device on first use). 0, or 3 when
    // the device root is not usable.
    int initialize() override;

    HostExecutor* executor() { return mExecutor; }

private:
    HostExecutor* mExecutor;  // also in mExecutorPtr; owned
};

}  // namespace velmora
