// The messages of the server's own log that tell what the host asked, recognised by their text:
//
//   velmoraEvent cmdId=4099, payload=0        an event (only while debug logging is on)
//   velmoraEvent cmdId=20230                  an event without payload
//   setConfig clientId=1, tagLen=3, tags[0]=2, configs[0]=1497600
//                                             one pair of a client request (always logged)
//   velmoraGetConfig tagLen=3                 a query (debug logging on); the tags are not logged
//   client may rebooted, clean special scene set, cmdId is 20224
//                                             the host's client restarted (always logged)
//   dump parameter is NULL!                   a dump the server turned down (and the other
//                                             warnings of the dump)
//
// Everything else of the tag is the server's own business (errors, the host layer's notes).
#pragma once

#include <string>

namespace velmora {

struct ServerMessage {
    enum class Kind { kOther, kEvent, kSetConfigPair, kGetConfig, kClientRestart, kDumpRejected };

    Kind kind = Kind::kOther;
    int cmdId = 0;  // event, client restart
    bool hasPayload = false;
    int payload = 0;
    int clientId = 0;  // setconfig pair
    int tagLen = 0;    // setconfig pair, getconfig
    int index = 0;     // setconfig pair: which pair of the request
    int tag = 0;
    int config = 0;

    // Recognises `text`; kind kOther when it is none of the lines above or is malformed (a
    // pair whose index is outside its request, a query without tags).
    static ServerMessage parse(const std::string& text);
};

}  // namespace velmora
