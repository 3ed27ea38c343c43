// The findings of one configuration check, printed compiler style:
//
//   path/to/config.xml:12: warning: unknown parameter <big_mn>, left out
//   path/to/config.xml:4: note: the first definition of command 4099 is here
//
// Owned by the check of one file; not thread safe. Findings are printed in line order (stable,
// so findings on one line keep the order in which they were made); a note attached to a finding
// follows it wherever its own line is.
#pragma once

#include <ostream>
#include <string>
#include <vector>

namespace velmora {

enum class Severity { kNote, kWarning, kError };

struct Diagnostic {
    int line = 0;  // 1-based; 0 for findings about the file as a whole
    Severity severity = Severity::kNote;
    std::string message;
    std::vector<Diagnostic> notes;  // printed right after this finding
    std::string explanation;        // the server's rule behind it, printed with --explain
};

class Diagnostics {
public:
    // Exit statuses of the checker.
    static constexpr int kClean = 0;
    static constexpr int kWarningsAsErrors = 1;
    static constexpr int kErrors = 2;

    explicit Diagnostics(std::string path) : mPath(std::move(path)) {}

    void error(int line, const std::string& message) { add(line, Severity::kError, message); }
    void warning(int line, const std::string& message) { add(line, Severity::kWarning, message); }
    void note(int line, const std::string& message) { add(line, Severity::kNote, message); }
    // Attaches a note to the finding made last. REQUIRES: at least one finding was made.
    void attachNote(int line, const std::string& message);
    // Gives the finding made last the text --explain prints under it: why the server does
    // what the finding says. REQUIRES: at least one finding was made.
    void explain(const std::string& text) { mFindings.back().explanation = text; }

    int errorCount() const { return count(Severity::kError); }
    int warningCount() const { return count(Severity::kWarning); }
    const std::vector<Diagnostic>& all() const { return mFindings; }

    // Prints every finding, in line order, one per line; with `explanations`, each finding's
    // explanation follows it, indented.
    void print(std::ostream& out, bool explanations = false) const;
    // kErrors when there is an error, kWarningsAsErrors when there are warnings and `werror`,
    // else kClean. Notes never change the status.
    int exitStatus(bool werror) const;

private:
    void add(int line, Severity severity, const std::string& message);
    int count(Severity severity) const;
    void printOne(std::ostream& out, const Diagnostic& finding) const;

    std::string mPath;
    std::vector<Diagnostic> mFindings;
};

// "error", "warning" or "note".
const char* severityName(Severity severity);

}  // namespace velmora
