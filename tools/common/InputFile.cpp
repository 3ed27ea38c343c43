#include "tools/common/InputFile.h"

#include <sys/stat.h>

#include <cerrno>
#include <cstdio>
#include <cstring>

namespace velmora {

namespace {

// Length of the UTF-8 sequence a lead byte starts, 0 when it cannot start one.
size_t sequenceLength(unsigned char lead) {
    if (lead < 0x80)
        return 1;
    if (lead >= 0xC2 && lead <= 0xDF)
        return 2;
    if (lead >= 0xE0 && lead <= 0xEF)
        return 3;
    if (lead >= 0xF0 && lead <= 0xF4)
        return 4;
    return 0;
}

bool isContinuation(unsigned char byte) {
    return (byte & 0xC0) == 0x80;
}

}  // namespace

long InputFile::firstBinaryByte(const std::string& data, bool* isNul) {
    *isNul = false;
    size_t i = 0;
    while (i < data.size()) {
        const unsigned char lead = static_cast<unsigned char>(data[i]);
        if (lead == 0) {
            *isNul = true;
            return static_cast<long>(i);
        }
        const size_t length = sequenceLength(lead);
        if (length == 0)
            return static_cast<long>(i);
        for (size_t k = 1; k < length; ++k) {
            if (i + k >= data.size())
                return -1;  // cut short by the end of what was read
            const unsigned char next = static_cast<unsigned char>(data[i + k]);
            // Overlong three- and four-byte forms, surrogates and code points above U+10FFFF.
            const bool badSecond =
                k == 1 && ((lead == 0xE0 && next < 0xA0) || (lead == 0xED && next > 0x9F) ||
                           (lead == 0xF0 && next < 0x90) || (lead == 0xF4 && next > 0x8F));
            if (!isContinuation(next) || badSecond)
                return static_cast<long>(i);
        }
        i += length;
    }
    return -1;
}

std::string InputFile::refusal(const std::string& path, int64_t maxBytes) {
    struct stat info {};
    if (stat(path.c_str(), &info) != 0)
        return std::string("cannot be read: ") + strerror(errno);
    if (S_ISDIR(info.st_mode))
        return "is a directory, not a file";
    if (S_ISREG(info.st_mode) && static_cast<int64_t>(info.st_size) > maxBytes) {
        return "is " + std::to_string(static_cast<long long>(info.st_size)) +
               " bytes, more than the " + std::to_string(static_cast<long long>(maxBytes)) +
               (maxBytes == kMaxBytes ? " (256 MiB)" : "") + " a file may have here";
    }
    // Regular files only: a pipe or a terminal would lose what is sniffed.
    if (!S_ISREG(info.st_mode))
        return std::string();
    FILE* file = fopen(path.c_str(), "rb");
    if (file == nullptr)
        return std::string("cannot be read: ") + strerror(errno);
    std::string start(kSniffBytes, '\0');
    start.resize(fread(&start[0], 1, start.size(), file));
    fclose(file);
    bool isNul = false;
    const long at = firstBinaryByte(start, &isNul);
    if (at < 0)
        return std::string();
    return std::string("is binary, not text (") +
           (isNul ? "a NUL byte" : "a byte that is not UTF-8") + " at offset " +
           std::to_string(at) + ")";
}

}  // namespace velmora
