// Warnings about a trace's calls that are valid but surely not meant, printed before the replay
// starts: placeholders the importer left unedited (the first few, then how many more, each with
// its line and what to fill in), events of commands the configuration lacks, launch-policy names
// the server never asks for. Once per command or name, where it is first used.
#pragma once

#include <cstdio>
#include <string>

class VelmoraServer;

namespace velmora {

class TraceSurvey;

class CallWarnings {
public:
    // Everything above about `survey`'s calls, against the configuration `server` loaded.
    static void print(const TraceSurvey& survey, const VelmoraServer& server,
                      const std::string& tracePath, FILE* err);

private:
    static void placeholders(const TraceSurvey& survey, const std::string& tracePath, FILE* err);
};

}  // namespace velmora
