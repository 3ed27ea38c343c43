// Bounds-taking formatting and scanning for C libraries that lack them.
//
// snprintf_s writes at most `count` characters plus the terminator into `dest` of `destMax`
// bytes. When the text does not fit (or an argument is invalid) it leaves an empty string and
// returns -1; otherwise it returns the number of characters written.
//
// sscanf_s works like sscanf, except that every %s, %c and %[ conversion takes the size of its
// buffer (size_t) right after the buffer pointer. A string that would not fit, terminator
// included, fails its conversion: the buffer is left empty and scanning stops there.
#pragma once

#include <stdarg.h>
#include <stddef.h>
#include <stdio.h>

#ifdef __cplusplus
extern "C" {
#endif

#if !defined(VELMORA_HAVE_SNPRINTF_S)
int snprintf_s(char* dest, size_t destMax, size_t count, const char* format, ...)
    __attribute__((format(printf, 4, 5)));
int vsnprintf_s(char* dest, size_t destMax, size_t count, const char* format, va_list args)
    __attribute__((format(printf, 4, 0)));
int sscanf_s(const char* buffer, const char* format, ...);
int vsscanf_s(const char* buffer, const char* format, va_list args);
#endif

#ifdef __cplusplus
}
#endif
