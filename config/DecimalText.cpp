#include "config/DecimalText.h"

#include <ctype.h>

namespace velmora {

bool isDecimalText(const char* text) {
    if (text == nullptr) {
        return false;
    }
    const char* p = text;
    while (isspace(static_cast<unsigned char>(*p))) {
        ++p;
    }
    if (*p == '+' || *p == '-') {
        ++p;
    }
    if (!isdigit(static_cast<unsigned char>(*p))) {
        return false;
    }
    while (isdigit(static_cast<unsigned char>(*p))) {
        ++p;
    }
    while (isspace(static_cast<unsigned char>(*p))) {
        ++p;
    }
    return *p == '\0';
}

}  // namespace velmora
