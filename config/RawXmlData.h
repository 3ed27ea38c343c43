// One action of one command as read from the XML command configuration, before the platform
// layer's conversion turns it into an Action. A command is a chain: a head record (type 0, no
// parameters) followed by one record per accepted action element, linked through `next`.
// Raw records live only during one load; the destructor does not follow `next`.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include "platform/VelmoraExport.h"

// Exported: the platform's loader conversion reads these records.
class VELMORA_EXPORT RawXmlData {
public:
    int32_t cmdId = 0;
    int32_t type = 0;                 // the action element's "type" attribute, 0 when absent
    std::string name;                 // the command's "name" attribute, "unknown" when absent
    std::vector<std::string> names;   // parameter element tag names, in document order
    std::vector<std::string> values;  // their texts, index for index with `names`
    RawXmlData* next = nullptr;
};

using RawXmlDataMap = std::map<int32_t, RawXmlData*>;
