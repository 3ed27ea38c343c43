// One parsed command: what the server dispatches and the platform executes.
//
// The parser holds one chain of records per command id (a head record standing for the command,
// then one record per alternative, linked through mNext). Callers never use the parser's
// records directly: they copy one into an Action of their own under the parser's read lock.
// Parameters are integer (tag, value) pairs in mTagValues or string (key, value) pairs in
// mParams, both stored flat; mParamNum counts the pairs of whichever vector the command uses.
//
// Field order and the virtual destructor are part of the binary interface with the closed
// platform components. The destructor never follows mNext: chains are freed by walking them.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include "platform/VelmoraExport.h"

// Exported: the platform's loader conversion builds Action chains and its executor reads them.
class VELMORA_EXPORT Action {
public:
    // Default record: cmdId -1, empty name, duration -1 (nothing to do), no parameters.
    Action() = default;
    // Record with `paramNum` string pairs taken from the first 2 * paramNum entries of
    // `params`. REQUIRES: paramNum >= 0 and params.size() >= 2 * paramNum.
    Action(int32_t cmdId, std::string name, int32_t duration, int32_t paramNum,
           std::vector<std::string> params);
    virtual ~Action() = default;

    int32_t mCmdId = -1;
    std::string mName;
    int32_t mDuration = -1;
    int32_t mParamNum = 0;
    std::vector<int32_t> mTagValues;  // tag at 2i, value at 2i+1
    std::vector<std::string> mParams;  // key at 2i, value at 2i+1
    Action* mNext = nullptr;           // not owned by this record
};

using ActionMap = std::map<int32_t, Action*>;

namespace velmora {

// Deletes `head` and every record after it, following mNext. Null is allowed.
void deleteActionChain(Action* head);

}  // namespace velmora
