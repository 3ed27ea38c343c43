#include "platform/VelmoraPlat.h"

#include "config/VelmoraParser.h"

VelmoraPlat::~VelmoraPlat() {
    delete mParserPtr;
    mParserPtr = nullptr;
}

int VelmoraPlat::initialize() {
    return 0;
}
