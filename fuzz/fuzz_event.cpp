// velmoraEvent over arbitrary command ids, texts and payloads on an initialised server.
//
// Input: a sequence of events, each
//   id selector (even: a known command, odd: 4 raw bytes), flags (bit 0 text, bit 1 payload),
//   payload count byte, the payload values (FuzzInput::integer), the text (length byte + bytes).
// A payload, when given, has exactly `count` values: that is the entry point's contract. Without
// one the count is passed as read, with a null pointer.
#include <cstdint>
#include <string>
#include <vector>

#include "fuzz/FuzzHost.h"
#include "fuzz/FuzzInput.h"
#include "server/VelmoraServer.h"

namespace {

// Commands of the example configuration, the fixed event classes and the edges of the ranges.
constexpr int32_t kKnownIds[] = {
    5376,  4116,  4099,  4098,  4100,  4101,  4102,  4105,  4114,  4113,  4118,  4119,
    4120,  4121,  4224,  4230,  4352,  4117,  12288, 12300, 13568, 12287, 20481, 20480,
    20230, 20225, 20224, 20226, -1,    0,
};
constexpr size_t kMaxEventsPerInput = 32;

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    VelmoraServer& server = velmora::fuzz::server("event");
    velmora::fuzz::FuzzInput in(data, size);
    for (size_t n = 0; n < kMaxEventsPerInput && !in.empty(); ++n) {
        const int32_t cmdId = in.pick(kKnownIds, sizeof(kKnownIds) / sizeof(kKnownIds[0]));
        const uint8_t flags = in.byte();
        const unsigned int payloadNum = in.byte();
        std::vector<int> payload;
        if ((flags & 2) != 0) {
            for (unsigned int i = 0; i < payloadNum; ++i) {
                payload.push_back(in.integer());
            }
        }
        const std::string msg = (flags & 1) != 0 ? in.shortString() : std::string();
        server.velmoraEvent(cmdId, (flags & 1) != 0 ? msg.c_str() : nullptr, payloadNum,
                            (flags & 2) != 0 ? payload.data() : nullptr);
    }
    // Every event adds timeline records; dropped after each input, so an input frees what it
    // allocated and libFuzzer's leak check (a full heap scan, run after any input that leaves
    // allocations behind) does not run on nearly every input.
    velmora::fuzz::trimHostRecords(1);
    return 0;
}
