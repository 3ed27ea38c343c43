#include "tools/insight/JsonStreamWriter.h"

namespace velmora {

void JsonStreamWriter::indent(size_t depth) {
    for (size_t i = 0; i < depth; ++i)
        mOut.put(' ');
}

void JsonStreamWriter::openValue() {
    if (mAfterKey) {
        mAfterKey = false;
        return;
    }
    if (mLevels.empty())
        return;  // the document itself
    mOut << (mLevels.back() ? ",\n" : "\n");
    mLevels.back() = true;
    indent(mLevels.size());
}

void JsonStreamWriter::closeLevel(char bracket) {
    const bool filled = mLevels.back();
    mLevels.pop_back();
    if (filled) {
        mOut.put('\n');
        indent(mLevels.size());
    }
    mOut.put(bracket);
}

void JsonStreamWriter::value(const nlohmann::json& value) {
    openValue();
    // dump(1) lays the value out from column 0: every line after its first moves in by the
    // depth it sits at.
    const std::string text = value.dump(1);
    size_t from = 0;
    for (size_t newline = text.find('\n'); newline != std::string::npos;
         newline = text.find('\n', from)) {
        mOut.write(text.data() + from, static_cast<std::streamsize>(newline + 1 - from));
        indent(mLevels.size());
        from = newline + 1;
    }
    mOut.write(text.data() + from, static_cast<std::streamsize>(text.size() - from));
}

void JsonStreamWriter::beginArray() {
    openValue();
    mOut.put('[');
    mLevels.push_back(false);
}

void JsonStreamWriter::endArray() {
    closeLevel(']');
}

void JsonStreamWriter::object(const nlohmann::json& members, const Streamed& streamed) {
    openValue();
    mOut.put('{');
    mLevels.push_back(false);
    auto member = members.begin();
    auto stream = streamed.begin();
    while (member != members.end() || stream != streamed.end()) {
        const bool whole =
            stream == streamed.end() || (member != members.end() && member.key() < stream->first);
        const std::string& key = whole ? member.key() : stream->first;
        mOut << (mLevels.back() ? ",\n" : "\n");
        mLevels.back() = true;
        indent(mLevels.size());
        mOut << nlohmann::json(key).dump() << ": ";
        mAfterKey = true;
        if (whole) {
            value(*member);
            ++member;
        } else {
            stream->second();
            ++stream;
        }
        mAfterKey = false;
    }
    closeLevel('}');
}

}  // namespace velmora
