// The checks every tool makes on a text file named on its command line before reading it: a
// regular, readable file, at most kMaxBytes long, and text (no NUL byte and nothing that is not
// UTF-8 within the first kSniffBytes). What is wrong comes back as a phrase to follow the file
// name, never quoting the file's bytes.
#pragma once

#include <cstdint>
#include <string>

namespace velmora {

class InputFile {
public:
    // The largest trace or log a tool reads: 256 MiB.
    static constexpr int64_t kMaxBytes = 256LL * 1024 * 1024;
    // How much of the start of a file is looked at for binary content.
    static constexpr size_t kSniffBytes = 1024;

    // Empty when `path` may be read; otherwise why not, e.g. "is a directory", "is binary, not
    // text (a NUL byte at offset 12)", "is 300000000 bytes, more than the 268435456 (256 MiB)
    // a tool reads". `maxBytes` lowers the cap for tests.
    static std::string refusal(const std::string& path, int64_t maxBytes = kMaxBytes);

    // Offset of the first NUL byte or byte sequence that is not UTF-8 in `data`, -1 when there is
    // none. A sequence cut short by the end of `data` counts as text.
    static long firstBinaryByte(const std::string& data, bool* isNul);
};

}  // namespace velmora
