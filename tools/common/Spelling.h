// Did-you-mean suggestions for names typed by people: parameter names, governors, trace calls.
// Stateless; thread safe.
#pragma once

#include <string>
#include <vector>

namespace velmora {

class Spelling {
public:
    // The candidate closest to `word` by edit distance, if it is close enough to be a likely
    // typo (at most a third of the word's length, and at least one edit allowed); "" otherwise.
    static std::string closest(const std::string& word, const std::vector<std::string>& candidates);
    // Levenshtein distance of `a` and `b`.
    static size_t distance(const std::string& a, const std::string& b);
};

}  // namespace velmora
