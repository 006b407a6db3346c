#include "script.h"

#include <algorithm>
#include <utility>

namespace fileindex_test {

Script &Script::Current() {
    static auto &script =
        *new Script;  // for ever: what runs at the end of a process calls the replaced functions too
    return script;
}

std::vector<std::string> Script::Finish() {
    std::vector<std::string> unused;
    for (const Rule &rule : rules_) {
        if (rule.seen < rule.fault.nth) {
            unused.push_back(rule.fault.call + " " + rule.fault.about);
        }
    }
    rules_.clear();
    return unused;
}

std::optional<Fault> Script::Take(std::string_view call, std::string_view about) {
    std::optional<Fault> taken;
    calls_.emplace_back(call, about);
    for (Rule &rule : rules_) {
        if (rule.fault.call != call || about.find(rule.fault.about) == std::string_view::npos) {
            continue;
        }
        ++rule.seen;
        if (!taken && rule.seen >= rule.fault.nth && rule.seen - rule.fault.nth < rule.fault.times) {
            taken = rule.fault;
        }
    }
    if (taken && taken->action) {
        taken->action();
        return std::nullopt;
    }
    return taken;
}

int Script::Calls(std::string_view call, std::string_view about) const {
    return static_cast<int>(std::count_if(calls_.begin(), calls_.end(), [&](const auto &made) {
        return made.first == call && made.second.find(about) != std::string::npos;
    }));
}

}  // namespace fileindex_test
