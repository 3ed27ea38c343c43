// Text form of one scheduler-group level table, as the debug dump shows it.
//
// Stateless; called by SchedLevelManager's dump, which reads its tables without the manager's
// lock, so the printer must not insert into the table it is given.
#pragma once

#include <utils/String8.h>

#include <map>

namespace velmora {

class EasGroupPrinter {
public:
    // Appends "group=<label> value=<level>" lines: the hmp group alone in hmp mode, otherwise
    // the eight EAS groups in dump order. A group missing from `table` prints as 0.
    static void print(const std::map<int, int>& table, bool hmpMode, android::String8& out);
};

}  // namespace velmora
