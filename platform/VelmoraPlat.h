// The platform object: the library's handle on the closed platform layer.
//
// A platform layer derives from it and hands out instances through getPlat(). The server owns
// the object from then on; the object owns the command parser stored in mParserPtr (deleted by
// this destructor) but not the executor, which belongs to the platform layer.
// Field and virtual slot order are part of the binary interface.
#pragma once

class PerfExecutor;
class VelmoraParser;
class VelmoraServer;

class VelmoraPlat {
public:
    VelmoraPlat() = default;
    // Deletes the parser held in mParserPtr.
    virtual ~VelmoraPlat();
    // Prepares the platform once the parser holds the configuration. 0 means success; any other
    // value is returned from VelmoraServer::init unchanged.
    virtual int initialize();

    VelmoraParser* mParserPtr = nullptr;  // owned from the moment init stores it
    PerfExecutor* mExecutorPtr = nullptr;  // may be null; read afresh at every use
    VelmoraServer* mServerPtr = nullptr;   // back-pointer set by VelmoraServer::init
};

// Supplied by the platform layer: a new platform object owned by the caller, or null.
VelmoraPlat* getPlat();
