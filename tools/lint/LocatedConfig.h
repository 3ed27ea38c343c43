// The command configuration as written, with the line of every element: a second tinyxml2
// pass over the file that the library's loader reads, kept only to put line numbers on what the
// loader and the conversion decide. It walks the same elements the loader walks (children of
// the top-level "policy", their children, their children) and judges nothing itself, except
// whether an "id" is decimal text, which the loader's own test keeps private.
//
// Built once per check; not thread safe.
#pragma once

#include <string>
#include <unordered_map>
#include <vector>

namespace tinyxml2 {
class XMLDocument;
}

namespace velmora {

// One parameter element: <name>text</name>.
struct LocatedParam {
    int line = 0;
    std::string name;
    bool hasText = false;  // tinyxml2's GetText() is not null: text is the first content
    std::string text;
};

// One action element of a command, with its parameter elements in document order.
struct LocatedAction {
    int line = 0;
    std::vector<LocatedParam> params;
};

// One command element, with all its action elements (also those past the third).
struct LocatedCommand {
    int line = 0;
    std::string element;  // tag name of the command element, any name goes
    bool hasIdAttribute = false;
    std::string idText;
    bool idIsDecimal = false;  // decimal integer text, the only kind the loader takes
    int id = 0;                // valid when idIsDecimal
    std::string name;          // "unknown" when the attribute is missing, as the loader says
    std::vector<LocatedAction> actions;
};

class LocatedConfig {
public:
    // Reads `path`. False when tinyxml2 cannot parse it; xmlError() and errorLine() tell why.
    bool load(const std::string& path);
    // The same on the configuration's text.
    bool parse(const std::string& text);

    const std::string& xmlError() const { return mXmlError; }
    int errorLine() const { return mErrorLine; }
    // Line of the top-level element: "policy" when it is one, else the one found instead; 0
    // when the document has no element at all.
    int rootLine() const { return mRootLine; }
    const std::string& rootName() const { return mRootName; }
    bool hasPolicy() const { return mHasPolicy; }
    const std::vector<LocatedCommand>& commands() const { return mCommands; }

    // The located command that defines `id` for the loader (the first one with it), or null.
    const LocatedCommand* firstWithId(int id) const;

private:
    bool read(const tinyxml2::XMLDocument& doc);

    std::string mXmlError;
    int mErrorLine = 0;
    int mRootLine = 0;
    std::string mRootName;
    bool mHasPolicy = false;
    std::vector<LocatedCommand> mCommands;
    // id -> index in mCommands of the first command with it: checks ask for every command.
    std::unordered_map<int, size_t> mFirstWithId;
};

}  // namespace velmora
