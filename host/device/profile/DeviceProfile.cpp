#include "host/device/profile/DeviceProfile.h"

#include <tinyxml2.h>

#include <algorithm>
#include <cstdlib>
#include <map>
#include <sstream>

#include "host/device/profile/EnergyTableReader.h"
#include "host/device/profile/XmlErrorText.h"
#include "host/text/TextFile.h"

namespace velmora {

// Text of examples/device/example-device.xml, compiled in by CMake (DefaultDeviceProfile.cpp).
extern const char* const kDefaultDeviceProfileText;

namespace {

std::vector<std::string> words(const char* text) {
    std::vector<std::string> out;
    std::istringstream in(text != nullptr ? text : "");
    std::string word;
    while (in >> word) {
        out.push_back(word);
    }
    return out;
}

bool toKind(const std::string& text, NodeKind* kind) {
    static const std::map<std::string, NodeKind> kKinds = {
        {"floor", NodeKind::Floor},
        {"cap", NodeKind::Cap},
        {"value", NodeKind::Value},
        {"text", NodeKind::Text},
    };
    auto it = kKinds.find(text);
    if (it == kKinds.end()) {
        return false;
    }
    *kind = it->second;
    return true;
}

// Reads one profile; the first problem ends it, with the line in `mProblem`.
class ProfileReader {
public:
    bool fail(int line, const std::string& message) {
        mLine = line;
        mProblem = message;
        return false;
    }

    bool readTables(const tinyxml2::XMLElement& root) {
        for (auto* e = root.FirstChildElement(); e != nullptr; e = e->NextSiblingElement()) {
            const std::string what = e->Name();
            const char* id = e->Attribute("id");
            if (what == "frequencies" || what == "governors") {
                if (id == nullptr || *id == '\0') {
                    return fail(e->GetLineNum(), "<" + what + "> needs an id=\"...\"");
                }
                ValueRule rule;
                rule.table = id;
                rule.type =
                    what == "frequencies" ? ValueRule::Type::kSteps : ValueRule::Type::kChoices;
                for (const auto& word : words(e->GetText())) {
                    long long v = 0;
                    if (what == "governors") {
                        rule.choices.push_back(word);
                    } else if (parseDecimalInteger(word, &v) && v > 0) {
                        rule.steps.push_back(v);
                    } else {
                        return fail(e->GetLineNum(), "frequency '" + word + "' of table '" + id +
                                                         "' is not a positive whole number");
                    }
                }
                if (rule.steps.empty() && rule.choices.empty()) {
                    return fail(e->GetLineNum(), "table '" + std::string(id) + "' is empty");
                }
                std::sort(rule.steps.begin(), rule.steps.end());
                if (!rule.steps.empty()) {
                    rule.min = rule.steps.front();
                    rule.max = rule.steps.back();
                }
                const char* unit = e->Attribute("unit");
                rule.unit = unit != nullptr ? unit : "";
                mTables[what + ":" + id] = rule;
                if (what == "frequencies") {
                    if (mSteps.count(id) == 0)
                        mDomains.push_back(id);
                    mSteps[id] = rule.steps;
                }
            } else if (what == "levels") {
                if (!e->Attribute("min") || !e->Attribute("max") ||
                    !parseDecimalInteger(e->Attribute("min"), &mLevels.min) ||
                    !parseDecimalInteger(e->Attribute("max"), &mLevels.max) ||
                    mLevels.min > mLevels.max) {
                    return fail(e->GetLineNum(),
                                "<levels> needs whole numbers min=\"...\" max=\"...\", min <= max");
                }
                mLevels.type = ValueRule::Type::kRange;
                mLevels.table = "levels";
            } else if (what != "node" && what != "energy") {
                return fail(e->GetLineNum(), "unknown element <" + what +
                                                 "> (expected <frequencies>, <governors>, "
                                                 "<levels>, <energy> or <node>)");
            }
        }
        return true;
    }

    bool readRule(const tinyxml2::XMLElement& e, const std::string& allowed, ValueRule* rule) {
        const size_t dots = allowed.find("..");
        long long lo = 0;
        long long hi = 0;
        if (allowed.empty()) {
            return true;
        }
        if (allowed == "decimal") {
            rule->type = ValueRule::Type::kDecimal;
        } else if (allowed == "levels") {
            if (mLevels.type != ValueRule::Type::kRange) {
                return fail(e.GetLineNum(), "allowed=\"levels\" needs a <levels> element");
            }
            *rule = mLevels;
        } else if (dots != std::string::npos && parseDecimalInteger(allowed.substr(0, dots), &lo) &&
                   parseDecimalInteger(allowed.substr(dots + 2), &hi) && lo <= hi) {
            rule->type = ValueRule::Type::kRange;
            rule->min = lo;
            rule->max = hi;
        } else {
            auto it = mTables.find(allowed);
            if (it == mTables.end()) {
                return fail(e.GetLineNum(),
                            "allowed=\"" + allowed +
                                "\" names no table (expected frequencies:ID, governors:ID, "
                                "levels, decimal or MIN..MAX)");
            }
            *rule = it->second;
        }
        return true;
    }

    bool readNodes(const tinyxml2::XMLElement& root, std::vector<NodeSpec>* nodes) {
        for (auto* e = root.FirstChildElement("node"); e != nullptr;
             e = e->NextSiblingElement("node")) {
            NodeSpec node;
            node.line = e->GetLineNum();
            const char* key = e->Attribute("key");
            const char* path = e->Attribute("path");
            const char* kind = e->Attribute("kind");
            if (key == nullptr || path == nullptr || kind == nullptr) {
                return fail(node.line, "<node> needs key=\"...\", kind=\"...\" and path=\"...\"");
            }
            node.key = key;
            node.path = path;
            if (!toKind(kind, &node.kind)) {
                return fail(node.line, "node '" + node.key + "' has kind \"" + kind +
                                           "\" (expected floor, cap, value or text)");
            }
            if (node.path.empty() || node.path[0] == '/' ||
                node.path.find("..") != std::string::npos) {
                return fail(node.line,
                            "node '" + node.key + "' needs a path relative to the device root");
            }
            const char* seed = e->Attribute("seed");
            node.seed = seed != nullptr ? seed : "";
            const char* allowed = e->Attribute("allowed");
            if (!readRule(*e, allowed != nullptr ? allowed : "", &node.rule)) {
                return false;
            }
            const char* unit = e->Attribute("unit");
            if (unit != nullptr) {
                node.rule.unit = unit;
            }
            const auto first = mKeyLines.emplace(node.key, node.line);
            if (!first.second) {
                return fail(node.line, "node '" + node.key + "' is defined twice (first on line " +
                                           std::to_string(first.first->second) + ")");
            }
            nodes->push_back(node);
        }
        return true;
    }

    // The energy tables, after readTables().
    bool readEnergy(const tinyxml2::XMLElement& root, std::vector<EnergyTable>* tables) {
        EnergyTableReader reader(mSteps);
        for (auto* e = root.FirstChildElement("energy"); e != nullptr;
             e = e->NextSiblingElement("energy")) {
            EnergyTable table;
            if (!reader.read(*e, &table))
                return fail(reader.line(), reader.problem());
            tables->push_back(std::move(table));
        }
        return true;
    }

    int mLine = 0;
    std::string mProblem;
    ValueRule mLevels;
    std::vector<std::string> mDomains;  // <frequencies> ids in order

private:
    std::map<std::string, ValueRule> mTables;  // "frequencies:ID" or "governors:ID"
    std::map<std::string, int> mKeyLines;      // node key -> its line, for a second definition
    std::map<std::string, std::vector<long long>> mSteps;  // frequencies id -> ascending
};

}  // namespace

const DeviceProfile& DeviceProfile::builtIn() {
    static const DeviceProfile* profile = [] {
        auto* p = new DeviceProfile();
        std::string error;
        // The text is the example profile of this source tree, checked by the tests.
        p->parse(kDefaultDeviceProfileText, kBuiltInOrigin, &error);
        return p;
    }();
    return *profile;
}

int DeviceProfile::parse(const std::string& text, const std::string& origin, std::string* error) {
    mName.clear();
    mNodes.clear();
    mDomains.clear();
    mEnergy.clear();
    mOrigin = origin;
    auto report = [&](int line, const std::string& message) {
        if (error != nullptr)
            *error = origin + ":" + std::to_string(line) + ": " + message;
        mNodes.clear();
        mDomains.clear();
        mEnergy.clear();
        return -1;
    };
    tinyxml2::XMLDocument doc;
    if (doc.Parse(text.c_str(), text.size()) != tinyxml2::XML_SUCCESS) {
        return report(doc.ErrorLineNum(), XmlErrorText::describe(doc));
    }
    const tinyxml2::XMLElement* root = doc.RootElement();
    if (root == nullptr || std::string(root->Name()) != "device") {
        return report(root != nullptr ? root->GetLineNum() : 1,
                      "the top-level element must be <device>");
    }
    const char* name = root->Attribute("name");
    mName = name != nullptr ? name : "";
    ProfileReader reader;
    std::vector<NodeSpec> nodes;
    std::vector<EnergyTable> energy;
    if (!reader.readTables(*root) || !reader.readEnergy(*root, &energy) ||
        !reader.readNodes(*root, &nodes)) {
        return report(reader.mLine, reader.mProblem);
    }
    if (nodes.empty()) {
        return report(root->GetLineNum(), "<device> has no <node>");
    }
    mNodes = std::move(nodes);
    mDomains = std::move(reader.mDomains);
    mEnergy = std::move(energy);
    mLevelMin = reader.mLevels.min;
    mLevelMax = reader.mLevels.max;
    return 0;
}

int DeviceProfile::load(const std::string& path, std::string* error) {
    return TextFile::parseFile(
        path, "device profile", [&](const std::string& text) { return parse(text, path, error); },
        error);
}

const NodeSpec* DeviceProfile::find(const std::string& key) const {
    for (const auto& node : mNodes) {
        if (node.key == key) {
            return &node;
        }
    }
    return nullptr;
}

const EnergyTable* DeviceProfile::energyTable(const std::string& id) const {
    for (const auto& table : mEnergy) {
        if (table.id == id)
            return &table;
    }
    return nullptr;
}

}  // namespace velmora
