#include "host/device/profile/XmlErrorText.h"

#include <tinyxml2.h>

namespace velmora {

namespace {

// tinyxml2 names the element it was reading in its error text: "... XMLElement name=cmd".
std::string elementName(const tinyxml2::XMLDocument& doc) {
    const std::string text = doc.ErrorStr() != nullptr ? doc.ErrorStr() : "";
    const std::string marker = "name=";
    const size_t at = text.rfind(marker);
    if (at == std::string::npos) {
        return std::string();
    }
    std::string name = text.substr(at + marker.size());
    const size_t end = name.find_first_of(" \t\r\n");
    return end == std::string::npos ? name : name.substr(0, end);
}

}  // namespace

std::string XmlErrorText::describe(const tinyxml2::XMLDocument& doc) {
    using tinyxml2::XMLError;
    const std::string name = elementName(doc);
    const std::string element = name.empty() ? "an element" : "element <" + name + ">";
    switch (doc.ErrorID()) {
        case XMLError::XML_ERROR_FILE_NOT_FOUND:
        case XMLError::XML_ERROR_FILE_COULD_NOT_BE_OPENED:
        case XMLError::XML_ERROR_FILE_READ_ERROR:
            return "the file cannot be read";
        case XMLError::XML_ERROR_EMPTY_DOCUMENT:
            return "the file holds no XML element (expected a top-level element)";
        case XMLError::XML_ERROR_MISMATCHED_ELEMENT:
            return element + " is not closed (expected </" + (name.empty() ? "..." : name) +
                   "> before the enclosing element ends)";
        case XMLError::XML_ERROR_PARSING_ELEMENT:
            return element +
                   " is malformed (expected a name, attributes and '>' or '/>', or a matching "
                   "closing tag)";
        case XMLError::XML_ERROR_PARSING_ATTRIBUTE:
            return "an attribute of " + element +
                   " is malformed (expected name=\"value\" with the value in quotes)";
        case XMLError::XML_ERROR_PARSING_TEXT:
            return "text cannot be read (a stray '<' or '&'? write &lt; and &amp;)";
        case XMLError::XML_ERROR_PARSING_CDATA:
            return "a CDATA section is not closed (expected ']]>')";
        case XMLError::XML_ERROR_PARSING_COMMENT:
            return "a comment is not closed (expected '-->')";
        case XMLError::XML_ERROR_PARSING_DECLARATION:
            return "the <?xml ...?> declaration is malformed (expected '?>')";
        case XMLError::XML_ERROR_PARSING_UNKNOWN:
            return "unrecognised markup after '<!' (expected a comment <!-- -->)";
        default:
            return "the document is not well-formed XML";
    }
}

}  // namespace velmora
