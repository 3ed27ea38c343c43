// The scripts the replay report inlines, compiled into the tools from the files they come from
// (cmake/EmbedReportScripts.cmake): the dygraphs plotting library of Debian's libjs-dygraphs
// package (MIT licence, its notice kept at the top) and its style sheet, found at configure time,
// and the report's own ReportScript.js.
#pragma once

namespace velmora {

class ReportScripts {
public:
    static const char* plotting();
    static const char* plottingStyle();
    static const char* page();
};

}  // namespace velmora
