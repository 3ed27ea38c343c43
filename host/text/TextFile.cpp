#include "host/text/TextFile.h"

#include <cerrno>
#include <cstdlib>
#include <fstream>
#include <sstream>

namespace velmora {

bool TextFile::read(const std::string& path, std::string* text) {
    std::ifstream file(path, std::ios::binary);
    if (!file) {
        return false;
    }
    std::stringstream content;
    content << file.rdbuf();
    if (file.bad()) {
        return false;
    }
    *text = content.str();
    return true;
}

int TextFile::parseFile(const std::string& path, const char* what,
                        const std::function<int(const std::string& text)>& parse,
                        std::string* error) {
    std::string text;
    if (!read(path, &text)) {
        if (error != nullptr)
            *error = path + ": cannot open " + what;
        return -1;
    }
    return parse(text);
}

bool TextFile::write(const std::string& path, const std::function<void(std::ostream&)>& fill,
                     std::string* error) {
    std::ofstream file(path, std::ios::trunc);
    if (!file) {
        if (error != nullptr)
            *error = "cannot write " + path;
        return false;
    }
    fill(file);
    file.close();
    if (!file) {
        if (error != nullptr)
            *error = "write failed: " + path;
        return false;
    }
    return true;
}

bool parseDecimalInteger(const std::string& text, long long* value) {
    if (text.empty()) {
        return false;
    }
    errno = 0;
    char* end = nullptr;
    const long long v = strtoll(text.c_str(), &end, 10);
    if (*end != '\0' || errno == ERANGE) {
        return false;
    }
    *value = v;
    return true;
}

}  // namespace velmora
