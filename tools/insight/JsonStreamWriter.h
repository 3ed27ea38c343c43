// Writes a JSON document to a stream piece by piece, laid out exactly as nlohmann::json's
// dump(1) lays out the same document, so that a large one (the holders of every node change of
// a long replay) is never held whole. Small parts are given as nlohmann values; arrays and
// objects with large members are written by the caller, element by element.
#pragma once

#include <functional>
#include <map>
#include <ostream>
#include <string>
#include <vector>

#include <nlohmann/json.hpp>

namespace velmora {

class JsonStreamWriter {
public:
    explicit JsonStreamWriter(std::ostream& out) : mOut(out) {}

    // A whole value: the document, an element of the open array, or a streamed member's value.
    void value(const nlohmann::json& value);
    // An array whose elements the caller writes in between (value(), beginArray(), object()).
    void beginArray();
    void endArray();
    // An object of `members` (an object, written whole) and of `streamed` members, whose values
    // their functions write with one call of this writer each. Members come in nlohmann's order
    // (sorted by key); a key must not be in both.
    using Streamed = std::map<std::string, std::function<void()>>;
    void object(const nlohmann::json& members, const Streamed& streamed);

private:
    // Opens the next value: after a member's key nothing, in an array its separator and indent.
    void openValue();
    void closeLevel(char bracket);
    void indent(size_t depth);

    std::ostream& mOut;
    std::vector<bool> mLevels;  // per open array or object: whether anything is in it yet
    bool mAfterKey = false;
};

}  // namespace velmora
