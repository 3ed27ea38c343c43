// Whole-file reading and writing for the host layer and the tools: the device profile and the
// node map are read whole and then parsed, reports and timelines are written whole. One place
// says what a failure is called, so every tool names the file the same way.
//
// Stateless; safe from any thread as long as two callers do not write the same path.
#pragma once

#include <functional>
#include <ostream>
#include <string>

namespace velmora {

class TextFile {
public:
    // The whole content of `path` in `text`. False when it cannot be opened or read (`text` is
    // then left as it was).
    static bool read(const std::string& path, std::string* text);

    // Reads `path` and returns what `parse` makes of its text; -1 with "PATH: cannot open WHAT"
    // in `error` (may be null) when it cannot be read.
    static int parseFile(const std::string& path, const char* what,
                         const std::function<int(const std::string& text)>& parse,
                         std::string* error);

    // Replaces `path` with what `fill` writes to the stream. False, with "cannot write PATH"
    // (not opened) or "write failed: PATH" (a write or the close failed) in `error`, which may
    // be null.
    static bool write(const std::string& path, const std::function<void(std::ostream&)>& fill,
                      std::string* error);
};

// A whole decimal integer in `text` (no white space, no trailing characters, in range) stored
// in `value`; false, with `value` unchanged, for anything else.
bool parseDecimalInteger(const std::string& text, long long* value);

}  // namespace velmora
