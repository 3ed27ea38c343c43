// The host layer's XML loader: the library's loading functions plus the conversion of raw
// records into Action chains with the parameter vocabulary of ParamVocabulary.h.
//
// Created per load by createVelmoraLoadXml(); holds no state.
#pragma once

#include "config/VelmoraLoadXml.h"

namespace velmora {

class HostLoadXml : public VelmoraLoadXml {
public:
    // A new map: for every command a head record (cmdId, name, duration -1, no pairs) followed
    // by one record per raw action record, in document order. Never null.
    ActionMap* createActionMap(RawXmlDataMap& rawMap) override;
};

}  // namespace velmora
