// The XML command configuration loader.
//
// The loading functions are the library's own: they choose the file (the cloud copy for the
// current build, else the device's customisation copy), parse it with tinyxml2 into RawXmlData
// chains and hand those to createActionMap, which the platform layer supplies by deriving from
// this class (createVelmoraLoadXml). A loader object lives for one load; it keeps no state.
// Virtual slot order is part of the binary interface.
#pragma once

#include <cstdint>

#include "config/Action.h"
#include "config/RawXmlData.h"
#include "platform/VelmoraExport.h"

namespace tinyxml2 {
class XMLElement;
}

// Exported: the platform layer derives its loader from this class.
class VELMORA_EXPORT VelmoraLoadXml {
public:
    // Converts the raw records into a new map of Action chains, or returns null. Must not keep
    // pointers into `rawMap`: the caller frees the records after the call.
    virtual ActionMap* createActionMap(RawXmlDataMap& rawMap) = 0;
    virtual ~VelmoraLoadXml() = default;

    // Loads the configuration and converts it. Returns a new map owned by the caller, or null.
    ActionMap* loadXmlMap();
    // Loads the cloud copy for the current build into `rawMap`. 0 loaded, -1 otherwise.
    int32_t getCloudUpdateVelmoraConfig(RawXmlDataMap* rawMap);
    // Parses one file into `rawMap`. 0 loaded, 2 null argument or XML error, 3 no "policy"
    // element at the top level or no child in it.
    int32_t innerLoad(const char* path, RawXmlDataMap* rawMap);
    // Command level: `element` and each following sibling. The first definition of an id wins.
    void parseCmdInfo(tinyxml2::XMLElement* element, RawXmlDataMap* rawMap);
    // Action level: up to three child elements of `cmdElement`, chained after `head`.
    void iterRawXmlDatas(RawXmlData* head, tinyxml2::XMLElement* cmdElement);
    // Parameter level: `element` and its following siblings into `record`. False when one has
    // no tag name or no text.
    bool parseRawXmlDataInfo(RawXmlData* record, tinyxml2::XMLElement* element);

    // Frees every chain of `rawMap` and empties it.
    static void freeRawXmlDataMap(RawXmlDataMap* rawMap);
};

// Supplied by the platform layer: a new loader owned by the caller, or null.
VelmoraLoadXml* createVelmoraLoadXml();
