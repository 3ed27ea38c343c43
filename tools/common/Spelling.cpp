#include "tools/common/Spelling.h"

#include <algorithm>

namespace velmora {

size_t Spelling::distance(const std::string& a, const std::string& b) {
    std::vector<size_t> row(b.size() + 1);
    for (size_t j = 0; j <= b.size(); ++j) {
        row[j] = j;
    }
    for (size_t i = 1; i <= a.size(); ++i) {
        size_t diagonal = row[0];
        row[0] = i;
        for (size_t j = 1; j <= b.size(); ++j) {
            const size_t above = row[j];
            row[j] =
                std::min({row[j] + 1, row[j - 1] + 1, diagonal + (a[i - 1] == b[j - 1] ? 0 : 1)});
            diagonal = above;
        }
    }
    return row[b.size()];
}

std::string Spelling::closest(const std::string& word, const std::vector<std::string>& candidates) {
    const size_t limit = std::max<size_t>(1, word.size() / 3);
    std::string best;
    size_t bestDistance = limit + 1;
    for (const auto& candidate : candidates) {
        // The distance is at least the difference in length: a long word (a line of garbage in
        // a trace) costs nothing.
        const size_t longer = std::max(word.size(), candidate.size());
        if (longer - std::min(word.size(), candidate.size()) >= bestDistance) {
            continue;
        }
        const size_t d = distance(word, candidate);
        if (d < bestDistance) {
            best = candidate;
            bestDistance = d;
        }
    }
    return best;
}

}  // namespace velmora
