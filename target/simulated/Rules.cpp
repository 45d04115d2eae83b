// The form of the texts about broken rules, and the bounded log of them.

#include "target/simulated/Rules.h"

#include <fmt/format.h>

namespace target {

void Refuse(const char* ruleName, const std::string& why) {
    throw RuleBroken(fmt::format("{} [{}]", why, ruleName));
}

void RuleLog::Record(const char* ruleName, const std::string& what) {
    Record(fmt::format("{} [{}]", what, ruleName));
}

void RuleLog::Record(const std::string& text) {
    if (texts_.size() < kTextsMax) texts_.push_back(text);
}

}  // namespace target
