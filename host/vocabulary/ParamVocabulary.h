// The parameter vocabulary of the XML command configuration: which parameter element names the
// host layer understands and how one raw action record becomes an Action.
//
//   duration                         the action's duration in ms (0 when absent)
//   little_min little_max            tags 1, 2   (kHz)
//   big_min big_max                  tags 4, 5   (kHz)
//   gpu_min gpu_max                  tags 7, 8   (Hz)
//   ddr_min                          tag 10      (Hz, left to the platform by on/off actions)
//   ipa_switch_temp ipa_control_temp ipa_sustainable_power   tags 17, 18, 19
//   fork_on_big                      tag 20
//   group_hmp, group_boost, group_vip, group_top_app, group_root, group_foreground,
//   group_system_background, group_key_background, group_background   tags 50..58
//   priority                         tag 101 (scene priority)
//   tag_<n>                          tag n, for anything without a name
//
// Governor scenes (4224..4352) and memory latency (20480, 20481) carry string pairs instead:
// every parameter except duration travels as (name, text); the names understood there are
// priority, the names above, little_governor, big_governor, gpu_governor,
// mem_latency_ratio_b and mem_latency_ratio_l. Anything not understood is logged and left out.
// Stateless; thread safe.
#pragma once

#include <string>
#include <vector>

#include "config/Action.h"
#include "config/RawXmlData.h"
#include "config/Tags.h"

namespace velmora {

class ParamVocabulary {
public:
    // Most pairs an action keeps (the on/off path carries at most this many).
    static constexpr int kMaxPairs = kMaxEventPairs;

    // Integer tag of a parameter name, or -1.
    static int tagForName(const std::string& name);
    // Node key of a text parameter name (governors, memory-latency ratios), or "".
    static std::string textNodeForName(const std::string& name);
    // Every parameter name understood (with the text-pair names when `stringPairs`), for
    // did-you-mean suggestions; "duration" included.
    static std::vector<std::string> names(bool stringPairs);
    // True when `cmdId` carries its parameters as string pairs.
    static bool usesStringPairs(int cmdId);
    // Strict decimal integer (optional sign, surrounding blanks allowed).
    static bool parseInt(const std::string& text, int* value);

    // A new Action for one raw record; never null. Logs every parameter left out.
    static Action* toAction(const RawXmlData& record);
};

}  // namespace velmora
