#include "config/VelmoraLoadXml.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <tinyxml2.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <string>

#include "compat/BoundedString.h"
#include "config/DecimalText.h"
#include "platform/PlatformImports.h"
#include "platform/VelmoraLog.h"

#ifndef VELMORA_CLOUD_CONFIG_DIR
#define VELMORA_CLOUD_CONFIG_DIR "/data/vendor/orvane"
#endif

namespace {

constexpr size_t kPathBufferSize = 128;
constexpr const char* kIncrementalProperty = "ro.build.version.incremental";
constexpr const char* kCloudConfigFormat =
    VELMORA_CLOUD_CONFIG_DIR "/cloud_cust_velmora_config_%s.xml";
constexpr const char* kCustConfigSuffix = "xml/velmora_config_cust.xml";
// A command keeps at most this many action elements; later ones are ignored.
constexpr int kMaxActionsPerCommand = 3;
// A command configuration is tens of kilobytes. tinyxml2 holds the whole text and its tree in
// memory, so a larger file (a runaway cloud copy, a wrong path) is refused before it is read.
constexpr long long kMaxConfigBytes = 16LL * 1024 * 1024;

// readConfigText's refusal of a file over kMaxConfigBytes (already logged); not a tinyxml2 code.
constexpr int kTooLarge = -1;

// Reads the whole configuration at `path` into `text` through one descriptor: its size is taken
// with fstat and the read stops one byte past the limit, so a file that grows in between is
// refused too. tinyxml2::XML_SUCCESS, kTooLarge, or the tinyxml2 error LoadFile would report
// (not found, read error).
int readConfigText(const char* path, std::string* text) {
    const int fd = open(path, O_RDONLY | O_CLOEXEC);
    if (fd < 0) {
        return tinyxml2::XML_ERROR_FILE_NOT_FOUND;
    }
    int result = tinyxml2::XML_SUCCESS;
    struct stat info;
    if (fstat(fd, &info) != 0) {
        result = tinyxml2::XML_ERROR_FILE_READ_ERROR;
    } else if (static_cast<long long>(info.st_size) > kMaxConfigBytes) {
        VLOGE("configuration file %s is too large: %lld bytes, at most %lld", path,
              static_cast<long long>(info.st_size), kMaxConfigBytes);
        result = kTooLarge;
    } else {
        text->resize(static_cast<size_t>(info.st_size) + 1);
        size_t got = 0;
        while (result == tinyxml2::XML_SUCCESS) {
            if (got == text->size()) {
                if (text->size() > static_cast<size_t>(kMaxConfigBytes)) {
                    VLOGE("configuration file %s is too large: grew past %lld bytes while read",
                          path, kMaxConfigBytes);
                    result = kTooLarge;
                    break;
                }
                text->resize(std::min(2 * text->size(), static_cast<size_t>(kMaxConfigBytes) + 1));
            }
            const ssize_t n = read(fd, &(*text)[got], text->size() - got);
            if (n < 0 && errno == EINTR) {
                continue;
            }
            if (n < 0) {
                result = tinyxml2::XML_ERROR_FILE_READ_ERROR;
            } else if (n == 0) {
                break;
            } else {
                got += static_cast<size_t>(n);
            }
        }
        text->resize(got);
    }
    close(fd);
    return result;
}

// Reads an integer attribute written in decimal (see DecimalText.h).
bool queryDecimalAttribute(const tinyxml2::XMLElement* element, const char* name, int* out) {
    return velmora::isDecimalText(element->Attribute(name)) &&
           element->QueryIntAttribute(name, out) == tinyxml2::XML_SUCCESS;
}

}  // namespace

void VelmoraLoadXml::freeRawXmlDataMap(RawXmlDataMap* rawMap) {
    if (rawMap == nullptr) {
        return;
    }
    for (auto& entry : *rawMap) {
        RawXmlData* record = entry.second;
        while (record != nullptr) {
            RawXmlData* next = record->next;
            delete record;
            record = next;
        }
    }
    rawMap->clear();
}

ActionMap* VelmoraLoadXml::loadXmlMap() {
    RawXmlDataMap rawMap;
    ActionMap* result = nullptr;

    if (getCloudUpdateVelmoraConfig(&rawMap) != 0) {
        char path[kPathBufferSize] = {0};
        if (get_one_cfg_file(kCustConfigSuffix, 0, path) == nullptr) {
            VLOGE("velmora_config_cust.xml is not exit or file is invalid!");
            freeRawXmlDataMap(&rawMap);
            return nullptr;
        }
        VLOGD("switch to velmora config file : %s.", path);
        const int32_t ret = innerLoad(path, &rawMap);
        if (ret != 0) {
            VLOGE("get velmora_config_cust.xml failed!,ret:%d", ret);
            freeRawXmlDataMap(&rawMap);
            return nullptr;
        }
    }

    // No second fallback here: a cloud copy that loads but holds no valid command hides the
    // customisation copy on purpose.
    if (rawMap.empty()) {
        VLOGE("empty rawXmlDataMap!!");
    } else {
        result = createActionMap(rawMap);
    }
    freeRawXmlDataMap(&rawMap);
    return result;
}

int32_t VelmoraLoadXml::getCloudUpdateVelmoraConfig(RawXmlDataMap* rawMap) {
    char version[VELMORA_PROPERTY_VALUE_MAX] = {0};
    if (property_get(kIncrementalProperty, version, "") < 1) {
        VLOGE("get property %s failed!", kIncrementalProperty);
        return -1;
    }
    char path[kPathBufferSize] = {0};
    if (snprintf_s(path, kPathBufferSize, kPathBufferSize - 1, kCloudConfigFormat, version) < 0) {
        VLOGE("get file path failed!");
        return -1;
    }
    VLOGD("switch to cloud update config file : %s.", path);
    const int32_t ret = innerLoad(path, rawMap);
    if (ret != 0) {
        VLOGE("get cloud velmora_config_cust.xml failed!,ret:%d", ret);
        return -1;
    }
    return 0;
}

int32_t VelmoraLoadXml::innerLoad(const char* path, RawXmlDataMap* rawMap) {
    if (path == nullptr || rawMap == nullptr) {
        return 2;
    }
    // The limit is checked on the descriptor that is then read, so a file replaced or grown
    // after the check cannot get past it. A file cut short while it is read (a copy being
    // replaced in place) fails to parse, and the caller keeps the configuration in force.
    std::string text;
    const int error = readConfigText(path, &text);
    if (error == kTooLarge) {
        return 2;
    }
    tinyxml2::XMLDocument doc(true);
    if (error == tinyxml2::XML_SUCCESS) {
        doc.Parse(text.data(), text.size());
    }
    const int parseError = error != tinyxml2::XML_SUCCESS ? error : doc.ErrorID();
    if (parseError != 0) {
        VLOGE("LoadFile error, path:%s, error code:%d", path, parseError);
        return 2;
    }
    tinyxml2::XMLElement* policy = doc.FirstChildElement("policy");
    if (policy == nullptr) {
        return 3;
    }
    tinyxml2::XMLElement* first = policy->FirstChildElement();
    if (first == nullptr) {
        return 3;
    }
    parseCmdInfo(first, rawMap);
    return 0;
}

void VelmoraLoadXml::parseCmdInfo(tinyxml2::XMLElement* element, RawXmlDataMap* rawMap) {
    for (; element != nullptr; element = element->NextSiblingElement()) {
        int id = 0;
        if (!queryDecimalAttribute(element, "id", &id)) {
            continue;
        }
        if (rawMap->count(id) != 0) {
            VLOGE("multi-cmdId exist! we choose the first one, cmdId=%d", id);
            continue;
        }
        RawXmlData* head = new RawXmlData();
        head->cmdId = id;
        const char* name = element->Attribute("name");
        head->name = name != nullptr ? name : "unknown";
        iterRawXmlDatas(head, element);
        (*rawMap)[id] = head;
    }
}

void VelmoraLoadXml::iterRawXmlDatas(RawXmlData* head, tinyxml2::XMLElement* cmdElement) {
    RawXmlData* tail = head;
    int seen = 0;
    for (tinyxml2::XMLElement* child = cmdElement->FirstChildElement();
         child != nullptr && seen < kMaxActionsPerCommand; child = child->NextSiblingElement()) {
        ++seen;  // rejected actions count towards the limit too
        RawXmlData* record = new RawXmlData();
        record->cmdId = head->cmdId;
        record->name = head->name;
        int type = 0;
        if (queryDecimalAttribute(child, "type", &type)) {
            record->type = type;
        }
        if (parseRawXmlDataInfo(record, child->FirstChildElement())) {
            tail->next = record;
            tail = record;
        } else {
            delete record;
        }
    }
}

bool VelmoraLoadXml::parseRawXmlDataInfo(RawXmlData* record, tinyxml2::XMLElement* element) {
    for (; element != nullptr; element = element->NextSiblingElement()) {
        const char* name = element->Name();
        const char* text = element->GetText();
        if (name == nullptr || text == nullptr) {
            VLOGE("xml name or value is NULL!");
            return false;
        }
        record->names.emplace_back(name);
        record->values.emplace_back(text);
    }
    return true;
}
