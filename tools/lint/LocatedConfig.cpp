#include "tools/lint/LocatedConfig.h"

#include "config/DecimalText.h"
#include "host/device/profile/XmlErrorText.h"

#include <ctype.h>
#include <tinyxml2.h>

namespace velmora {

namespace {

LocatedAction locateAction(const tinyxml2::XMLElement* element) {
    LocatedAction action;
    action.line = element->GetLineNum();
    for (const tinyxml2::XMLElement* param = element->FirstChildElement(); param != nullptr;
         param = param->NextSiblingElement()) {
        LocatedParam located;
        located.line = param->GetLineNum();
        located.name = param->Name() != nullptr ? param->Name() : "";
        const char* text = param->GetText();
        located.hasText = text != nullptr;
        located.text = text != nullptr ? text : "";
        action.params.push_back(std::move(located));
    }
    return action;
}

LocatedCommand locateCommand(const tinyxml2::XMLElement* element) {
    LocatedCommand command;
    command.line = element->GetLineNum();
    command.element = element->Name() != nullptr ? element->Name() : "";
    const char* id = element->Attribute("id");
    command.hasIdAttribute = id != nullptr;
    command.idText = id != nullptr ? id : "";
    // The same two steps as the loader: the text must be decimal, then tinyxml2 converts it.
    command.idIsDecimal = id != nullptr && isDecimalText(id) &&
                          element->QueryIntAttribute("id", &command.id) == tinyxml2::XML_SUCCESS;
    const char* name = element->Attribute("name");
    command.name = name != nullptr ? name : "unknown";
    for (const tinyxml2::XMLElement* action = element->FirstChildElement(); action != nullptr;
         action = action->NextSiblingElement()) {
        command.actions.push_back(locateAction(action));
    }
    return command;
}

}  // namespace

bool LocatedConfig::load(const std::string& path) {
    // Entity processing on, like the loader, so that texts compare equal.
    tinyxml2::XMLDocument doc(true);
    doc.LoadFile(path.c_str());
    return read(doc);
}

bool LocatedConfig::parse(const std::string& text) {
    tinyxml2::XMLDocument doc(true);
    doc.Parse(text.data(), text.size());
    return read(doc);
}

bool LocatedConfig::read(const tinyxml2::XMLDocument& doc) {
    if (doc.Error()) {
        mXmlError = XmlErrorText::describe(doc);
        mErrorLine = doc.ErrorLineNum();
        return false;
    }
    const tinyxml2::XMLElement* root = doc.FirstChildElement("policy");
    mHasPolicy = root != nullptr;
    if (root == nullptr) {
        root = doc.FirstChildElement();
    }
    if (root == nullptr) {
        return true;
    }
    mRootLine = root->GetLineNum();
    mRootName = root->Name() != nullptr ? root->Name() : "";
    if (!mHasPolicy) {
        return true;
    }
    for (const tinyxml2::XMLElement* element = root->FirstChildElement(); element != nullptr;
         element = element->NextSiblingElement()) {
        mCommands.push_back(locateCommand(element));
        const LocatedCommand& command = mCommands.back();
        if (command.idIsDecimal) {
            mFirstWithId.emplace(command.id, mCommands.size() - 1);  // kept when already there
        }
    }
    return true;
}

const LocatedCommand* LocatedConfig::firstWithId(int id) const {
    auto it = mFirstWithId.find(id);
    return it != mFirstWithId.end() ? &mCommands[it->second] : nullptr;
}

}  // namespace velmora
