// Whether an attribute text is a decimal integer, the only form the command configuration
// accepts for ids and types. Newer tinyxml2 releases also read hexadecimal such as "0x10";
// configurations written for devices must not depend on the tinyxml2 version the device has.
#pragma once

namespace velmora {

// True for optional white space, an optional sign, at least one digit, optional white space.
bool isDecimalText(const char* text);

}  // namespace velmora
