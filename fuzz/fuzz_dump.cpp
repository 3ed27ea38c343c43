// dumpVelmoraServerInfo over arbitrary arguments, with client requests and events in between so
// that the frequency and group tables it prints are not always the start-up ones.
//
// Input: a sequence of steps, each an op byte:
//   op % 4 == 0, 1: dump. Descriptor byte (0: /dev/null, 1: -1, 2: a closed descriptor,
//                   3: /dev/null), argument count byte % 4, then per argument a selector byte
//                   (even: a known option, odd: a string with a 16-bit length).
//   op % 4 == 2:    velmoraSetConfig(client byte % 5, one tag, one value).
//   op % 4 == 3:    velmoraEvent(known command, payload {0 or -1}).
#include <fcntl.h>
#include <unistd.h>

#include <cstdint>
#include <string>
#include <vector>

#include "fuzz/FuzzHost.h"
#include "fuzz/FuzzInput.h"
#include "server/VelmoraServer.h"

namespace {

const char* const kOptions[] = {"--help", "--logon", "--logoff", "--freqlist", "--easgrouplist",
                                "",       "--HELP",  "--freqlist\n"};
constexpr int32_t kEventIds[] = {4099, 4114, 4113, 4118, 4119, 4224, 12288, 12300, 20224};
constexpr size_t kMaxStepsPerInput = 16;

int devNull() {
    static const int fd = open("/dev/null", O_WRONLY | O_CLOEXEC);
    return fd;
}

int closedFd() {
    static const int fd = [] {
        const int f = open("/dev/null", O_WRONLY | O_CLOEXEC);
        close(f);
        return f;
    }();
    return fd;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    VelmoraServer& server = velmora::fuzz::server("dump");
    velmora::fuzz::FuzzInput in(data, size);
    for (size_t n = 0; n < kMaxStepsPerInput && !in.empty(); ++n) {
        const uint8_t op = in.byte() % 4;
        if (op == 2) {
            const int clientId = in.byte() % 5;
            const int tag = in.integer();
            const int value = in.integer();
            server.velmoraSetConfig(clientId, 1, &tag, &value);
            continue;
        }
        if (op == 3) {
            const int32_t cmdId = kEventIds[in.byte() % (sizeof(kEventIds) / sizeof(kEventIds[0]))];
            const int payload = (in.byte() & 1) != 0 ? -1 : 0;
            server.velmoraEvent(cmdId, nullptr, 1, &payload);
            continue;
        }
        int fd = devNull();
        switch (in.byte() % 4) {
            case 1: fd = -1; break;
            case 2: fd = closedFd(); break;
            default: break;
        }
        std::vector<std::string> args;
        const int argc = in.byte() % 4;
        for (int i = 0; i < argc; ++i) {
            const uint8_t sel = in.byte();
            if ((sel & 1) == 0) {
                args.emplace_back(kOptions[(sel >> 1) % (sizeof(kOptions) / sizeof(kOptions[0]))]);
            } else {
                args.push_back(in.longString());
            }
        }
        server.dumpVelmoraServerInfo(fd, args);
    }
    velmora::fuzz::trimHostRecords(512);
    return 0;
}
