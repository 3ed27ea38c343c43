// The platform object: the library's handle on the closed platform layer.
//
// A platform layer derives from it and hands out instances through getPlat(). The server owns
// the object from then on; the object owns the command parser stored in mParserPtr (deleted by
// this destructor) but not the executor, which belongs to the platform layer.
// Field and virtual slot order are part of the binary interface.
//
// The class itself is the platform layer's too: on a device the vendor's library defines its
// members, so libvelmora.so defines none of them and emits neither its vtable nor its typeinfo
// (it only calls through the vtable and deletes). Our own platform layers (host/, tests/fakes/,
// bench/) define the two members next to their getPlat().
#pragma once

class PerfExecutor;
class VelmoraParser;
class VelmoraServer;

class VelmoraPlat {
public:
    VelmoraPlat() = default;
    // Deletes the parser held in mParserPtr. Defined by the platform layer.
    virtual ~VelmoraPlat();
    // Prepares the platform once the parser holds the configuration. 0 means success; any other
    // value is returned from VelmoraServer::init unchanged. Defined by the platform layer.
    virtual int initialize();

    VelmoraParser* mParserPtr = nullptr;  // owned from the moment init stores it
    PerfExecutor* mExecutorPtr = nullptr;  // may be null; read afresh at every use
    VelmoraServer* mServerPtr = nullptr;   // back-pointer set by VelmoraServer::init
};

// Supplied by the platform layer: a new platform object owned by the caller, or null.
VelmoraPlat* getPlat();
