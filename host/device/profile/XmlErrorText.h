// Plain words for tinyxml2's parse errors: what was expected where the parser stopped, instead
// of the library's error code names. Used for device profiles and by velmora-lint for command
// configurations. Stateless.
#pragma once

#include <string>

namespace tinyxml2 {
class XMLDocument;
}

namespace velmora {

class XmlErrorText {
public:
    // What went wrong in `doc`, which failed to parse, e.g. "element <cmd> is not closed
    // (expected </cmd> before the enclosing element ends)". The line is doc.ErrorLineNum().
    static std::string describe(const tinyxml2::XMLDocument& doc);
};

}  // namespace velmora
