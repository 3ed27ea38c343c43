// A program of another project, built against an installed Velmora: brings the server up on the
// host platform layer with the installed example configuration.
//   velmora-consumer EXAMPLE_DIR DEVICE_ROOT    exit status: what the server's init returned
#include <cstdio>

#include "host/platform/HostEnvironment.h"
#include "server/VelmoraServer.h"

int main(int argc, char** argv) {
    if (argc != 3) {
        fprintf(stderr, "usage: velmora-consumer EXAMPLE_DIR DEVICE_ROOT\n");
        return 100;
    }
    velmora::HostEnvironment& env = velmora::HostEnvironment::get();
    env.properties().setConfigDirs({argv[1]});
    if (env.useDeviceRoot(argv[2], /*fresh=*/true) != 0) {
        return 101;
    }
    VelmoraServer server;
    const int status = server.init();
    printf("init -> %d\n", status);
    return status;
}
