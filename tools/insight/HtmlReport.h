// The offline report of one replay: a single HTML file with everything inline (no network, no
// external scripts or fonts), so it opens on machines without access to the outside world.
// SVG step plots of the node groups over the trace with scene, on/off and action spans shaded,
// residency bars, who holds each final value, and the warnings.
//
// A small inline script measures the plots once the page is laid out and leaves the figures in
// the body's data-plots attribute, for the browser check of the test suite.
#pragma once

#include <ostream>
#include <string>
#include <vector>

#include "tools/insight/InsightResult.h"

namespace velmora {

class HtmlReport {
public:
    struct Group {
        std::string title;
        std::vector<std::string> keys;
    };
    // The plotted groups, in page order; nodes missing from a result are left out.
    static const std::vector<Group>& groups();

    static std::string html(const InsightResult& result);
    // Writes html() to `out` as it is made, and to `path` (false with `error` set when the file
    // cannot be written): the plots of a long replay are never one string.
    static void write(const InsightResult& result, std::ostream& out);
    static bool write(const InsightResult& result, const std::string& path, std::string* error);
};

}  // namespace velmora
