// Frequency-client manager (skeleton: the full tables and merge rules land with their own change).
#pragma once

#include <utils/String8.h>

class VelmoraPlat;

class FreqClientManager {
public:
    explicit FreqClientManager(VelmoraPlat* plat);
    virtual ~FreqClientManager();

    // Client request (onOff null) or event request (id >= 4, onOff pointing at 0 or -1).
    int doPerfSetConfig(int id, int tagLen, const int* tags, const int* configs, const int* onOff);
    void dumpFreqList(android::String8& out);

    VelmoraPlat* mPlatPtr;
};

FreqClientManager* getFreqClient(VelmoraPlat* plat);
