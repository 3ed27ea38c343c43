// Log helpers for the library. Every line goes to the Android log under one tag so that
// `logcat -s "velmora server"` shows the whole server.
#pragma once

#include <android/log.h>

#define VELMORA_LOG_TAG "velmora server"

#define VLOGD(...) __android_log_print(ANDROID_LOG_DEBUG, VELMORA_LOG_TAG, __VA_ARGS__)
#define VLOGI(...) __android_log_print(ANDROID_LOG_INFO, VELMORA_LOG_TAG, __VA_ARGS__)
#define VLOGW(...) __android_log_print(ANDROID_LOG_WARN, VELMORA_LOG_TAG, __VA_ARGS__)
#define VLOGE(...) __android_log_print(ANDROID_LOG_ERROR, VELMORA_LOG_TAG, __VA_ARGS__)
