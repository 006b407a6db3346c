#include "script.h"

#include <algorithm>
#include <utility>

namespace fileindex_test {

Script &Script::Current() {
    static auto &script = *new Script;  // for ever: what runs at the end of a process calls us too
    return script;
}

std::vector<std::string> Script::Finish() {
    std::vector<std::string> unused;
    for (const Fault &fault : std::exchange(faults_, {})) {
        if (fault.seen < fault.nth) {
            unused.push_back(fault.call + " " + fault.about);
        }
    }
    return unused;
}

std::optional<Fault> Script::Take(std::string_view call, std::string_view about) {
    std::optional<Fault> taken;
    calls_.emplace_back(call, about);
    for (Fault &fault : faults_) {
        if (fault.call != call || about.find(fault.about) == std::string_view::npos) {
            continue;
        }
        ++fault.seen;
        if (!taken && fault.seen >= fault.nth && fault.seen - fault.nth < fault.times) {
            taken = fault;
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

void Script::Record(const std::string &effect) {
    std::string held;
    for (const std::string &lock : locks) {
        held += (held.empty() ? "[" : " ") + lock;
    }
    journal_.push_back(held + (held.empty() ? "" : "] ") + effect);
}

}  // namespace fileindex_test
