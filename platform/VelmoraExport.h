// What libvelmora.so exports.
//
// The library is compiled with hidden visibility: only the types and functions that the host
// service and the closed platform components use carry VELMORA_EXPORT, each with a note on who
// needs it. Everything else (the managers, the probe worker, the reporter, the helpers) stays
// private to the library, so changing it is not an interface change. The allowed set is
// checked by scripts/check-exports; the per-architecture references live in abi/.
#pragma once

#define VELMORA_EXPORT __attribute__((visibility("default")))
