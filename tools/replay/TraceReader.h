// Reads a trace one call at a time, so that a replay holds one line of it in memory however long
// the trace is. The lines are parsed by TraceParser::parseLine, so the calls and the messages
// about bad lines ("trace.txt:12: malformed number 'x1' for payload") are the parser's; a UTF-8
// byte-order mark at the start is skipped, and a line longer than kMaxLineBytes is a bad line
// (read past without being kept).
#pragma once

#include <cstddef>
#include <istream>
#include <memory>
#include <string>
#include <vector>

#include "tools/replay/TraceParser.h"

namespace velmora {

class TraceReader {
public:
    static constexpr size_t kMaxLineBytes = 64 * 1024;
    enum class Step { Call, BadLine, End };

    // The trace at `path`; isOpen() tells whether it could be read.
    explicit TraceReader(const std::string& path);
    // `text` as the trace `file` (the name its messages give).
    TraceReader(const std::string& text, const std::string& file);
    ~TraceReader();

    bool isOpen() const;
    // The next call; blank lines and comments are skipped. For a bad line, `error` (when given)
    // names file:line and what is wrong, and the next step goes on after it.
    Step next(TraceCall* call, std::string* error);
    // Number of calls next() returned so far.
    size_t calls() const { return mCalls; }

private:
    // The next line without its newline; false at the end. `tooLong` when it was cut short.
    bool readLine(std::string* line, bool* tooLong);

    std::string mFile;  // name in messages
    std::unique_ptr<std::istream> mIn;
    int mLineNo = 0;
    size_t mCalls = 0;
    static constexpr size_t kBlockBytes = 64 * 1024;
    std::string mBlock;   // read from the stream, not yet cut into lines from mBlockAt on
    size_t mBlockAt = 0;
    std::string mLine;
    TraceCall mParsed;  // the line being parsed; swapped with the caller's call when good
};

}  // namespace velmora
