// Bounds-taking snprintf_s / sscanf_s for C libraries without them (glibc, bionic).
//
// sscanf_s walks the format one conversion at a time and hands each conversion to the C
// library's sscanf together with a trailing %n, so that every buffer size can be enforced before
// the conversion writes anything.
#include "compat/BoundedString.h"

#include <ctype.h>
#include <string.h>

#include <string>

int vsnprintf_s(char* dest, size_t destMax, size_t count, const char* format, va_list args) {
    if (dest == nullptr || destMax == 0) {
        return -1;
    }
    if (format == nullptr) {
        dest[0] = '\0';
        return -1;
    }
    const size_t limit = count < destMax ? count : destMax - 1;
    const int len = vsnprintf(dest, destMax, format, args);
    if (len < 0 || static_cast<size_t>(len) > limit) {
        dest[0] = '\0';
        return -1;
    }
    return len;
}

int snprintf_s(char* dest, size_t destMax, size_t count, const char* format, ...) {
    va_list args;
    va_start(args, format);
    const int ret = vsnprintf_s(dest, destMax, count, format, args);
    va_end(args);
    return ret;
}

namespace {

// One conversion (%d, %s, %[...] and so on) split out of the caller's format.
struct Conversion {
    bool suppress = false;
    int width = 0;          // 0: none given
    std::string length;     // hh, h, l, ll, L, j, z, t
    char conv = '\0';
    std::string scanSet;    // for %[...]: the text between '[' and ']' inclusive
};

// Parses a conversion after '%'. Returns the position after it, or null when malformed.
const char* parseConversion(const char* f, Conversion* c) {
    if (*f == '*') {
        c->suppress = true;
        ++f;
    }
    while (isdigit(static_cast<unsigned char>(*f))) {
        c->width = c->width * 10 + (*f - '0');
        ++f;
    }
    while (*f == 'h' || *f == 'l' || *f == 'L' || *f == 'j' || *f == 'z' || *f == 't') {
        c->length.push_back(*f);
        ++f;
    }
    if (*f == '\0') {
        return nullptr;
    }
    c->conv = *f++;
    if (c->conv == '[') {
        const char* start = f - 1;
        if (*f == '^') {
            ++f;
        }
        if (*f == ']') {
            ++f;
        }
        while (*f != '\0' && *f != ']') {
            ++f;
        }
        if (*f != ']') {
            return nullptr;
        }
        ++f;
        c->scanSet.assign(start, f);
    }
    return f;
}

std::string subFormat(const Conversion& c, int width) {
    std::string fmt = "%";
    if (c.suppress) {
        fmt.push_back('*');
    }
    if (width > 0) {
        fmt += std::to_string(width);
    }
    fmt += c.length;
    if (c.conv == '[') {
        fmt += c.scanSet;
    } else {
        fmt.push_back(c.conv);
    }
    fmt += "%n";
    return fmt;
}

}  // namespace

int vsscanf_s(const char* buffer, const char* format, va_list args) {
    if (buffer == nullptr || format == nullptr) {
        return -1;
    }
    const char* in = buffer;
    const char* f = format;
    int assigned = 0;
    bool converted = false;  // a conversion has matched, so running out of input is no EOF

    while (*f != '\0') {
        if (isspace(static_cast<unsigned char>(*f))) {
            while (isspace(static_cast<unsigned char>(*f))) {
                ++f;
            }
            while (isspace(static_cast<unsigned char>(*in))) {
                ++in;
            }
            continue;
        }
        if (*f != '%' || f[1] == '%') {
            if (*f == '%') {
                ++f;  // "%%" matches one '%' after optional white space
                while (isspace(static_cast<unsigned char>(*in))) {
                    ++in;
                }
            }
            if (*in == '\0') {
                return converted ? assigned : -1;
            }
            if (*in != *f) {
                return assigned;
            }
            ++in;
            ++f;
            continue;
        }

        Conversion c;
        f = parseConversion(f + 1, &c);
        if (f == nullptr) {
            return assigned;
        }
        if (c.conv == 'n') {
            if (!c.suppress) {
                *va_arg(args, int*) = static_cast<int>(in - buffer);
            }
            continue;
        }

        const bool isText = c.conv == 's' || c.conv == 'c' || c.conv == '[';
        void* target = nullptr;
        size_t size = 0;
        if (!c.suppress) {
            target = va_arg(args, void*);
            if (isText) {
                size = va_arg(args, size_t);
                if (target == nullptr || size == 0) {
                    return assigned;
                }
            }
        }

        int width = c.width;
        bool boundedByBuffer = false;
        if (isText && !c.suppress) {
            if (c.conv == 'c') {
                const size_t need = width > 0 ? static_cast<size_t>(width) : 1;
                if (need > size) {
                    return assigned;
                }
            } else if (width == 0 || static_cast<size_t>(width) > size - 1) {
                width = static_cast<int>(size - 1);
                boundedByBuffer = true;
                if (width == 0) {
                    static_cast<char*>(target)[0] = '\0';
                    return assigned;
                }
            }
        }

        const std::string fmt = subFormat(c, width);
        int consumed = -1;
        int ret;
        if (c.suppress) {
            ret = sscanf(in, fmt.c_str(), &consumed);
        } else {
            ret = sscanf(in, fmt.c_str(), target, &consumed);
        }
        if (ret == EOF) {
            return converted ? assigned : -1;
        }
        if (consumed < 0) {
            return assigned;  // matching failure
        }

        if (boundedByBuffer) {
            // The conversion stopped at the buffer's end: fail if the text went on.
            const char next = in[consumed];
            bool overflow = false;
            if (c.conv == 's') {
                overflow = next != '\0' && !isspace(static_cast<unsigned char>(next));
            } else if (next != '\0') {
                char probe[2];
                const std::string one = "%1" + c.scanSet;
                overflow = sscanf(in + consumed, one.c_str(), probe) == 1;
            }
            if (overflow) {
                static_cast<char*>(target)[0] = '\0';
                return assigned;
            }
        }

        in += consumed;
        converted = true;
        if (!c.suppress) {
            ++assigned;
        }
    }
    return assigned;
}

int sscanf_s(const char* buffer, const char* format, ...) {
    va_list args;
    va_start(args, format);
    const int ret = vsscanf_s(buffer, format, args);
    va_end(args);
    return ret;
}
