// Captures everything the library logs through liblog, for assertions on log lines.
#pragma once

#include <android/log.h>

#include <string>
#include <vector>

namespace velmora {
namespace fake {

struct LogLine {
    int prio;
    std::string msg;
};

class LogCapture {
public:
    // Installs the capturing logger (idempotent) and forgets earlier lines.
    static void start();
    static void clear();
    static std::vector<LogLine> lines();
    // Number of captured lines with exactly this priority and text.
    static int count(int prio, const std::string& msg);
    static bool has(int prio, const std::string& msg) { return count(prio, msg) > 0; }
    // Number of lines whose text contains `part`, at any priority.
    static int countContaining(const std::string& part);
};

}  // namespace fake
}  // namespace velmora
