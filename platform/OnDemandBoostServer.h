// The launch-policy server of the device, supplied by its own library.
//
// The server asks it for the duration that the "cold" (cold start) and "winswitch" (window
// switch) launch policies currently prescribe. Nothing here is virtual: the layout is the
// policy library's.
#pragma once

class OnDemandBoostServer {
public:
    static OnDemandBoostServer* getInstance();
    // Duration prescribed by the named policy, or -1 when it prescribes none.
    int getPolicy(const char* name);
};
