// C functions of the device that the library calls and never defines. On a device they come from
// the system libraries; on a Linux host from the host platform layer or the test platform.
#pragma once

#ifdef __cplusplus
extern "C" {
#endif

// System property lookup; returns the length of the value written to `value`.
int property_get(const char* key, char* value, const char* defaultValue);
// Customisation-file lookup: writes the path of `pathSuffix` into `buf` (128 bytes) and returns
// `buf`, or returns null when no such file exists.
char* get_one_cfg_file(const char* pathSuffix, int type, char* buf);
// Device event log.
int __zklog_jank_print(int prio, int tag, const char* fmt, ...)
    __attribute__((format(printf, 3, 4)));

#ifdef __cplusplus
}
#endif

// Buffer size that property_get callers must provide.
#define VELMORA_PROPERTY_VALUE_MAX 128
