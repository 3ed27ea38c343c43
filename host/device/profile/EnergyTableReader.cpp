#include "host/device/profile/EnergyTableReader.h"

#include <tinyxml2.h>

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstdlib>

namespace velmora {

namespace {

bool wholeNumber(const char* text, long long* value) {
    if (text == nullptr || *text == '\0')
        return false;
    errno = 0;
    char* end = nullptr;
    const long long v = strtoll(text, &end, 10);
    if (*end != '\0' || errno == ERANGE)
        return false;
    *value = v;
    return true;
}

// A finite decimal number ("6", "0.25", "-3"); no hexadecimal, no inf or nan.
bool decimal(const char* text, double* value) {
    if (text == nullptr || *text == '\0')
        return false;
    for (const char* c = text; *c != '\0'; ++c) {
        if (!((*c >= '0' && *c <= '9') || *c == '.' || *c == '-' || *c == '+' || *c == 'e' ||
              *c == 'E'))
            return false;
    }
    char* end = nullptr;
    const double v = strtod(text, &end);
    if (*end != '\0' || !std::isfinite(v))
        return false;
    *value = v;
    return true;
}

std::string mwText(double mw) {
    char buf[32];
    snprintf(buf, sizeof(buf), "%g", mw);
    return buf;
}

}  // namespace

bool EnergyTableReader::fail(int line, const std::string& message) {
    mLine = line;
    mProblem = message;
    return false;
}

bool EnergyTableReader::read(const tinyxml2::XMLElement& element, EnergyTable* table) {
    const int line = element.GetLineNum();
    const char* id = element.Attribute("id");
    if (id == nullptr || *id == '\0')
        return fail(line, "<energy> needs an id=\"...\" naming a <frequencies> table");
    table->id = id;
    table->line = line;
    table->opps.clear();
    const auto domain = mFrequencies.find(table->id);
    if (domain == mFrequencies.end())
        return fail(line, "<energy id=\"" + table->id + "\"> names no <frequencies> table");
    const auto first = mTableLines.emplace(table->id, line);
    if (!first.second) {
        return fail(line, "energy table '" + table->id + "' is defined twice (first on line " +
                              std::to_string(first.first->second) + ")");
    }
    long long cpus = 0;
    if (!wholeNumber(element.Attribute("cpus"), &cpus) || cpus < 1 || cpus > 1024) {
        return fail(line, "energy table '" + table->id +
                              "' needs cpus=\"N\", the number of CPUs of the domain (1..1024)");
    }
    table->cpus = static_cast<int>(cpus);
    std::map<long long, int> oppLines;  // freq -> line of its <opp>, for a second one
    for (auto* e = element.FirstChildElement(); e != nullptr; e = e->NextSiblingElement()) {
        EnergyOpp opp;
        if (!readOpp(*e, *table, &opp))
            return false;
        const std::vector<long long>& steps = domain->second;
        if (!std::binary_search(steps.begin(), steps.end(), opp.freq)) {
            return fail(e->GetLineNum(), "OPP " + std::to_string(opp.freq) + " of energy table '" +
                                             table->id + "' is not an available frequency of '" +
                                             table->id + "'");
        }
        const auto twin = oppLines.emplace(opp.freq, e->GetLineNum());
        if (!twin.second) {
            return fail(e->GetLineNum(), "OPP " + std::to_string(opp.freq) + " of energy table '" +
                                             table->id + "' is listed twice (first on line " +
                                             std::to_string(twin.first->second) + ")");
        }
        if (!table->opps.empty() && opp.freq <= table->opps.back().freq) {
            return fail(e->GetLineNum(), "OPP " + std::to_string(opp.freq) + " of energy table '" +
                                             table->id + "' comes after " +
                                             std::to_string(table->opps.back().freq) +
                                             ": list the OPPs by increasing frequency");
        }
        if (!table->opps.empty() && opp.mw < table->opps.back().mw) {
            return fail(e->GetLineNum(),
                        "OPP " + std::to_string(opp.freq) + " of energy table '" + table->id +
                            "' draws " + mwText(opp.mw) + " mW, less than the " +
                            mwText(table->opps.back().mw) +
                            " mW of the OPP below it: power must not fall as frequency rises");
        }
        table->opps.push_back(opp);
    }
    for (long long freq : domain->second) {
        if (oppLines.count(freq) == 0) {
            return fail(line, "energy table '" + table->id + "' has no OPP for " +
                                  std::to_string(freq) +
                                  " (every available frequency of the domain needs one)");
        }
    }
    return true;
}

bool EnergyTableReader::readOpp(const tinyxml2::XMLElement& e, const EnergyTable& table,
                                EnergyOpp* opp) {
    if (std::string(e.Name()) != "opp") {
        return fail(e.GetLineNum(), "unknown element <" + std::string(e.Name()) +
                                        "> in energy table '" + table.id + "' (expected <opp>)");
    }
    if (!wholeNumber(e.Attribute("freq"), &opp->freq) || opp->freq <= 0 ||
        !decimal(e.Attribute("mw"), &opp->mw)) {
        return fail(e.GetLineNum(), "<opp> of energy table '" + table.id +
                                        "' needs freq=\"...\" (a whole number) and mw=\"...\" "
                                        "(a number of milliwatts)");
    }
    if (opp->mw < 0) {
        return fail(e.GetLineNum(), "OPP " + std::to_string(opp->freq) + " of energy table '" +
                                        table.id + "' has a negative power (" + mwText(opp->mw) +
                                        " mW)");
    }
    return true;
}

}  // namespace velmora
