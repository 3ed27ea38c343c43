// Test loader: converts raw XML records into Action chains with a small vocabulary.
//   <duration>N</duration>   the action's mDuration (0 when absent)
//   <tN>V</tN>               integer pair (N, V), e.g. <t51>10</t51>
//   <s_KEY>V</s_KEY>         string pair (KEY, V), e.g. <s_priority>40</s_priority>
// A record may use integer or string pairs; mParamNum counts the pairs of the kind it uses.
#pragma once

#include "config/VelmoraLoadXml.h"

namespace velmora {
namespace fake {

class FakeLoadXml : public VelmoraLoadXml {
public:
    ActionMap* createActionMap(RawXmlDataMap& rawMap) override;
};

}  // namespace fake
}  // namespace velmora
