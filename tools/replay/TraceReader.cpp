#include "tools/replay/TraceReader.h"

#include <cstring>
#include <fstream>
#include <sstream>
#include <utility>

namespace velmora {

namespace {

// Editors on some systems start a UTF-8 file with a byte-order mark.
constexpr char kUtf8Bom[] = "\xEF\xBB\xBF";
constexpr size_t kUtf8BomBytes = sizeof(kUtf8Bom) - 1;

}  // namespace

TraceReader::TraceReader(const std::string& path)
    : mFile(path), mIn(new std::ifstream(path, std::ios::binary)) {}

TraceReader::TraceReader(const std::string& text, const std::string& file)
    : mFile(file), mIn(new std::istringstream(text)) {}

TraceReader::~TraceReader() = default;

bool TraceReader::isOpen() const {
    return static_cast<bool>(*mIn);
}

bool TraceReader::readLine(std::string* line, bool* tooLong) {
    line->clear();
    *tooLong = false;
    bool any = false;
    for (;;) {
        if (mBlockAt == mBlock.size()) {
            // The stream is read a block at a time and the lines are cut out of the block.
            mBlock.resize(kBlockBytes);
            const std::streamsize got = mIn->rdbuf()->sgetn(&mBlock[0], kBlockBytes);
            mBlock.resize(got > 0 ? static_cast<size_t>(got) : 0);
            mBlockAt = 0;
            if (mBlock.empty())
                return any;  // a last line without a newline
        }
        any = true;
        const char* begin = mBlock.data() + mBlockAt;
        const size_t left = mBlock.size() - mBlockAt;
        const char* newline = static_cast<const char*>(memchr(begin, '\n', left));
        const size_t size = newline != nullptr ? static_cast<size_t>(newline - begin) : left;
        const size_t room = kMaxLineBytes - line->size();
        line->append(begin, size < room ? size : room);
        if (size > room)
            *tooLong = true;
        mBlockAt += size;
        if (newline != nullptr) {
            ++mBlockAt;
            return true;
        }
    }
}

TraceReader::Step TraceReader::next(TraceCall* call, std::string* error) {
    if (!isOpen())
        return Step::End;
    bool tooLong = false;
    while (readLine(&mLine, &tooLong)) {
        ++mLineNo;
        if (mLineNo == 1 && mLine.compare(0, kUtf8BomBytes, kUtf8Bom) == 0)
            mLine.erase(0, kUtf8BomBytes);
        std::string lineError;
        if (tooLong) {
            lineError = mFile + ":" + std::to_string(mLineNo) + ": line longer than " +
                        std::to_string(kMaxLineBytes) + " bytes";
        } else {
            bool any = false;
            if (TraceParser::parseInto(mLine, mFile, mLineNo, &mParsed, &any, &lineError) == 0) {
                if (!any)
                    continue;  // blank or a comment
                // The caller's call goes back to be filled next time, with its buffers.
                std::swap(*call, mParsed);
                ++mCalls;
                return Step::Call;
            }
        }
        if (error != nullptr)
            *error = lineError;
        return Step::BadLine;
    }
    return Step::End;
}

}  // namespace velmora
