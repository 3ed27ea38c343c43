#include "freq/FreqClientManager.h"

FreqClientManager::FreqClientManager(VelmoraPlat* plat) : mPlatPtr(plat) {}
FreqClientManager::~FreqClientManager() = default;

int FreqClientManager::doPerfSetConfig(int, int, const int*, const int*, const int*) {
    return -1;
}

void FreqClientManager::dumpFreqList(android::String8&) {}

FreqClientManager* getFreqClient(VelmoraPlat* plat) {
    return new FreqClientManager(plat);
}
