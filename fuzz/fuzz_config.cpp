// velmoraSetConfig and velmoraGetConfig over arbitrary arrays.
//
// Input: a sequence of requests, each
//   op byte (bit 0: get instead of set; bit 1: null arrays for a non-positive count),
//   set only: client id (FuzzInput::integer),
//   count byte (0x80 and above: the negative count (int8_t)byte, else byte % 64),
//   then count tags and, for set, count values (FuzzInput::integer each).
// Arrays always hold exactly `count` entries, the entry points' contract; a negative count
// comes with a small array or, by the op bit, with null pointers.
#include <cstdint>
#include <vector>

#include "fuzz/FuzzHost.h"
#include "fuzz/FuzzInput.h"
#include "server/VelmoraServer.h"

namespace {

constexpr size_t kMaxRequestsPerInput = 32;
constexpr int kMaxCount = 64;

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    VelmoraServer& server = velmora::fuzz::server("config");
    velmora::fuzz::FuzzInput in(data, size);
    for (size_t n = 0; n < kMaxRequestsPerInput && !in.empty(); ++n) {
        const uint8_t op = in.byte();
        const bool get = (op & 1) != 0;
        const bool nullArrays = (op & 2) != 0;
        const int clientId = get ? 0 : in.integer();
        const uint8_t countByte = in.byte();
        const int count = countByte >= 0x80 ? static_cast<int8_t>(countByte)
                                            : countByte % kMaxCount;
        std::vector<int> tags;
        std::vector<int> values;
        if (count > 0) {
            for (int i = 0; i < count; ++i) {
                tags.push_back(in.integer());
            }
            for (int i = 0; i < count; ++i) {
                values.push_back(get ? 0 : in.integer());
            }
        } else if (!nullArrays) {
            tags.assign(1, 0);
            values.assign(1, 0);
        }
        const int* tagPtr = tags.empty() ? nullptr : tags.data();
        int* valuePtr = values.empty() ? nullptr : values.data();
        if (get) {
            server.velmoraGetConfig(count, tagPtr, valuePtr);
        } else {
            server.velmoraSetConfig(clientId, count, tagPtr, valuePtr);
        }
    }
    velmora::fuzz::trimHostRecords(512);
    return 0;
}
