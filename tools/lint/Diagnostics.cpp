#include "tools/lint/Diagnostics.h"

#include <algorithm>

namespace velmora {

const char* severityName(Severity severity) {
    switch (severity) {
        case Severity::kError:
            return "error";
        case Severity::kWarning:
            return "warning";
        case Severity::kNote:
            break;
    }
    return "note";
}

void Diagnostics::add(int line, Severity severity, const std::string& message) {
    Diagnostic finding;
    finding.line = line;
    finding.severity = severity;
    finding.message = message;
    mFindings.push_back(std::move(finding));
}

void Diagnostics::attachNote(int line, const std::string& message) {
    Diagnostic note;
    note.line = line;
    note.severity = Severity::kNote;
    note.message = message;
    mFindings.back().notes.push_back(std::move(note));
}

int Diagnostics::count(Severity severity) const {
    return static_cast<int>(
        std::count_if(mFindings.begin(), mFindings.end(),
                      [&](const Diagnostic& d) { return d.severity == severity; }));
}

void Diagnostics::printOne(std::ostream& out, const Diagnostic& finding) const {
    out << mPath << ':';
    if (finding.line > 0) {
        out << finding.line << ':';
    }
    out << ' ' << severityName(finding.severity) << ": " << finding.message << '\n';
}

void Diagnostics::print(std::ostream& out, bool explanations) const {
    std::vector<const Diagnostic*> ordered;
    ordered.reserve(mFindings.size());
    for (const auto& finding : mFindings) {
        ordered.push_back(&finding);
    }
    std::stable_sort(ordered.begin(), ordered.end(),
                     [](const Diagnostic* a, const Diagnostic* b) { return a->line < b->line; });
    for (const Diagnostic* finding : ordered) {
        printOne(out, *finding);
        for (const auto& note : finding->notes) {
            printOne(out, note);
        }
        if (explanations && !finding->explanation.empty()) {
            out << "    " << finding->explanation << '\n';
        }
    }
}

int Diagnostics::exitStatus(bool werror) const {
    if (errorCount() > 0) {
        return kErrors;
    }
    if (werror && warningCount() > 0) {
        return kWarningsAsErrors;
    }
    return kClean;
}

}  // namespace velmora
