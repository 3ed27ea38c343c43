// Which domains a trace's `load` lines may name on a device: those of its <frequencies> tables
// that have an energy table. A load of another domain is a bad line, named with its file and
// line like the parser's own ("t.trace:4: load of 'cpu.mid': the device has no such domain
// (cpu.little, cpu.big, gpu, ddr)").
//
// Made from the device profile before the trace is read; read only afterwards.
#pragma once

#include <string>
#include <vector>

#include "tools/replay/TraceParser.h"

namespace velmora {

class DeviceProfile;

class LoadDomains {
public:
    explicit LoadDomains(const DeviceProfile& profile);

    // True when every domain of `call` (a load line; any other call passes) has an energy
    // table; otherwise false with `error` naming file:line and the first domain that has none.
    bool check(const TraceCall& call, std::string* error) const;

private:
    std::vector<std::string> mDomains;  // every <frequencies> id
    std::vector<std::string> mTables;   // those with an energy table
};

}  // namespace velmora
