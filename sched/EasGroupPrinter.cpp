#include "sched/EasGroupPrinter.h"

#include "sched/SchedLevelManager.h"

namespace velmora {

namespace {

struct GroupLabel {
    int tag;
    const char* label;  // padded to one width so that the values line up
};

constexpr GroupLabel kHmpLabel = {VELMORA_TAG_GROUP_HMP, "hmp,              "};
// The order is fixed for the readers of the dump and is deliberately not tag order:
// key-background (57) comes before system-background (56).
constexpr GroupLabel kEasLabels[] = {
    {VELMORA_TAG_GROUP_BOOST, "boost,            "},
    {VELMORA_TAG_GROUP_VIP, "vip,              "},
    {VELMORA_TAG_GROUP_TOP_APP, "top-app,          "},
    {VELMORA_TAG_GROUP_ROOT, "root,             "},
    {VELMORA_TAG_GROUP_FOREGROUND, "foreground,       "},
    {VELMORA_TAG_GROUP_KEY_BACKGROUND, "key-background,   "},
    {VELMORA_TAG_GROUP_SYSTEM_BACKGROUND, "system-background,"},
    {VELMORA_TAG_GROUP_BACKGROUND, "background,       "},
};

void printGroup(const std::map<int, int>& table, const GroupLabel& group, android::String8& out) {
    const auto it = table.find(group.tag);
    out.appendFormat("group=%s value=%d\n", group.label, it != table.end() ? it->second : 0);
}

}  // namespace

void EasGroupPrinter::print(const std::map<int, int>& table, bool hmpMode, android::String8& out) {
    if (hmpMode) {
        printGroup(table, kHmpLabel, out);
        return;
    }
    for (const GroupLabel& group : kEasLabels) {
        printGroup(table, group, out);
    }
}

}  // namespace velmora
