#include "host/device/profile/KernelRules.h"

#include <algorithm>

#include "host/text/TextFile.h"

namespace velmora {

namespace {

std::string withUnit(long long value, const ValueRule& rule) {
    return std::to_string(value) + (rule.unit.empty() ? "" : " " + rule.unit);
}

}  // namespace

bool KernelRules::isDecimal(const std::string& text) {
    size_t digits = 0;
    size_t dots = 0;
    for (char c : text) {
        if (c >= '0' && c <= '9') {
            ++digits;
        } else if (c == '.') {
            ++dots;
        } else {
            return false;
        }
    }
    return digits > 0 && dots <= 1 && text.front() != '.' && text.back() != '.';
}

KernelRules::Outcome KernelRules::take(const NodeSpec& spec, const std::string& requested) {
    const ValueRule& rule = spec.rule;
    Outcome out;
    out.effective = requested;
    auto refuse = [&](const std::string& reason) {
        out.verdict = Verdict::kRefused;
        out.effective.clear();
        out.reason = reason;
        return out;
    };
    long long v = 0;
    switch (rule.type) {
        case ValueRule::Type::kAny:
            return out;
        case ValueRule::Type::kDecimal:
            return isDecimal(requested) ? out : refuse("'" + requested + "' is not a number");
        case ValueRule::Type::kChoices:
            if (std::find(rule.choices.begin(), rule.choices.end(), requested) ==
                rule.choices.end()) {
                return refuse("the device has no governor '" + requested + "'");
            }
            return out;
        case ValueRule::Type::kRange:
            if (!parseDecimalInteger(requested, &v)) {
                return refuse("'" + requested + "' is not a whole number");
            }
            if (v < rule.min || v > rule.max) {
                return refuse(requested + " is outside " + std::to_string(rule.min) + ".." +
                              std::to_string(rule.max));
            }
            return out;
        case ValueRule::Type::kSteps:
            break;
    }
    if (!parseDecimalInteger(requested, &v)) {
        return refuse("'" + requested + "' is not a whole number");
    }
    if (v < rule.min) {
        return refuse(requested + " is below the lowest frequency " + withUnit(rule.min, rule));
    }
    if (v > rule.max) {
        return refuse(requested + " is above the top frequency " + withUnit(rule.max, rule));
    }
    const auto above = std::lower_bound(rule.steps.begin(), rule.steps.end(), v);
    if (*above == v) {
        return out;
    }
    const long long up = *above;
    const long long down = *(above - 1);  // v > min, so a step below exists
    long long step = up;
    if (spec.kind == NodeKind::Cap || (spec.kind != NodeKind::Floor && v - down < up - v)) {
        step = down;
    }
    out.verdict = Verdict::kRounded;
    out.effective = std::to_string(step);
    return out;
}

}  // namespace velmora
