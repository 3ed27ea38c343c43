# Writes OUT, the C++ source of ReportScripts (tools/insight/ReportScripts.h): the text of
# PLOTTING, STYLE and PAGE as raw string literals. Run at build time by tools/CMakeLists.txt.
set(delimiter "velmora_script")
file(READ "${PLOTTING}" plotting)
file(READ "${STYLE}" style)
file(READ "${PAGE}" page)
foreach(text plotting style page)
    string(FIND "${${text}}" ")${delimiter}\"" found)
    if(NOT found EQUAL -1)
        message(FATAL_ERROR "${text} script holds the raw string delimiter ${delimiter}")
    endif()
    # Inlined into <script> and <style> elements, which such text would end early.
    string(TOLOWER "${${text}}" lower)
    string(FIND "${lower}" "</script" found_script)
    string(FIND "${lower}" "</style" found_style)
    if(NOT found_script EQUAL -1 OR NOT found_style EQUAL -1)
        message(FATAL_ERROR "${text} script holds the end of a <script> or <style> element")
    endif()
endforeach()
file(WRITE "${OUT}.tmp"
"// Made by cmake/EmbedReportScripts.cmake from ${PLOTTING}, ${STYLE} and ${PAGE}.
#include \"tools/insight/ReportScripts.h\"

namespace velmora {

const char* ReportScripts::plotting() {
    return R\"${delimiter}(${plotting})${delimiter}\";
}

const char* ReportScripts::plottingStyle() {
    return R\"${delimiter}(${style})${delimiter}\";
}

const char* ReportScripts::page() {
    return R\"${delimiter}(${page})${delimiter}\";
}

}  // namespace velmora
")
file(RENAME "${OUT}.tmp" "${OUT}")
