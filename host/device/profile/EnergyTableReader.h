// Reads the <energy> elements of a device profile (EnergyTable.h) and checks each against the
// domain's available frequencies: every available frequency has exactly one <opp>, listed in
// increasing order, with a power that is not negative and does not fall as the frequency
// rises. The first problem ends the reading, with its line.
//
// Used by DeviceProfile::parse after the <frequencies> tables are read. Not thread safe.
#pragma once

#include <map>
#include <string>
#include <vector>

#include "host/device/ValueRule.h"
#include "host/device/profile/EnergyTable.h"

namespace tinyxml2 {
class XMLElement;
}

namespace velmora {

class EnergyTableReader {
public:
    // `frequencies`: each <frequencies> id with its available frequencies, ascending.
    explicit EnergyTableReader(const std::map<std::string, std::vector<long long>>& frequencies)
        : mFrequencies(frequencies) {}

    // Reads one <energy> element into `table`. False at the first problem (line(), problem()).
    bool read(const tinyxml2::XMLElement& element, EnergyTable* table);

    int line() const { return mLine; }
    const std::string& problem() const { return mProblem; }

private:
    bool fail(int line, const std::string& message);
    bool readOpp(const tinyxml2::XMLElement& element, const EnergyTable& table, EnergyOpp* opp);

    const std::map<std::string, std::vector<long long>>& mFrequencies;
    std::map<std::string, int> mTableLines;  // id -> line of its <energy>, for a second one
    int mLine = 0;
    std::string mProblem;
};

}  // namespace velmora
