// Every call that an operation makes of the platform, and of the system for its files and its socket, fails in
// turn; failures.txt has what comes of each, and says at its head how it reads.
//
// After each the same request is repeated, and its row says so when that does not end like the undisturbed one.
// The code below also sees that nothing stays locked, open or half written, that an exception ends in the
// operation, and that a thread that is cancelled in the call leaves with everything given back.
#include "fixture.h"

#include <pthread.h>

#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <map>
#include <set>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

// A thread that is cancelled ends the process in a check of the address sanitizer's own runtime.
#ifdef __SANITIZE_ADDRESS__
constexpr bool kCanCancel = false;
#else
constexpr bool kCanCancel = true;
#endif

const struct Operation {
    std::string call;
    std::vector<std::string> given = {};
} kOperations[] = {
    {R"(Upsert [{"path":"/photo/a","video":true},{"path":"/music/c"}])"},
    {R"(Delete ["/photo/a","/music"])",
     {R"(folder.conf {"/music":{"audio":true},"/photo/a":{"document":true},"/photo/b":{"photo":true}})"}},
    {R"(Delete ["/photo/a"])", {"search on"}},
    {R"(Reindex ["/photo/a","/music","/photo/a"])",
     {R"(folder.conf {"/music":{"audio":true},"/photo/a":{"document":true}})"}},
    {"Update /photo/a"},
    {"Get /photo/a"},
    {R"(List [0,9,"name","ASC",["status"]])"},
    {"FILEIDXIsFullPathIndexed /vol1/photo/a"},
    {R"(ShareRename ["photo","music"])"},
    {"ShareRemove photo", {"search on"}},
    {"SharePause photo"},
    {"ShareResume photo"},
    {"Updater_zol60_beta2", {"folder.conf {}"}},
    {"Updater_zol60_beta2"},
    {"Pause 2"},
    {"Resume"},
    {"ShareRevive music"},
    {R"(ShareSetNoSpace ["photo",true])"},
    {R"(ShareSetNeedReindex ["photo",true])"},
    {"SetUpdated once"},
    {"ShareIsNoSpace music"},
    {"GetStatus"},
    {"IsSkipIndex /vol1/photo/a"},
    {"IsShareSpaceEnough photo"},
    {"AddCustomEvent /vol1/photo/a"},
};

/// "1-3,5" for 1, 2, 3, 5.
std::string Ranges(const std::vector<size_t> &numbers) {
    std::string text;
    for (size_t i = 0; i < numbers.size(); ++i) {
        const bool follows = i > 0 && numbers[i] == numbers[i - 1] + 1;
        const bool goesOn = i + 1 < numbers.size() && numbers[i + 1] == numbers[i] + 1;
        if (!follows || !goesOn) {
            text += (text.empty() ? "" : follows ? "-" : ",") + std::to_string(numbers[i]);
        }
    }
    return text;
}

/// A call by its function and, for those of the system, the file: what is counted together.
using Call = std::pair<std::string, std::string>;

/// Nothing for a call that is none of the platform's and of no file that matters.
Call KeyOf(const Call &made) {
    const auto &[name, about] = made;
    if (name.starts_with("V") || name.starts_with("Monitor") || name == "connect") {
        return {name, ""};
    }
    const std::set<std::string> ofFiles = {"open", "openat", "mkdirat", "fstatat", "write", "flock"};
    for (const char *file :
         {"folder.conf", "status.conf", "folder.lock", "status.lock", "_queue", "indexdb", "@eaDir"}) {
        if (ofFiles.contains(name) && about.find(file) != std::string::npos) {
            return {name, file};
        }
    }
    return {};
}

class Failures : public FileIndexTest {
protected:
    /// What is stored, without the marks of lost events: these are steps of their own.
    struct State {
        std::string list;
        Json::Value status;
    };

    static State Stored() {
        State state = {FolderConf(), Parse(StatusConf())};
        state.status.removeMember("need_reindex");
        return state;
    }

    void Furnish() {
        for (const char *directory : {"/vol1/photo", "/vol2/music"}) {
            fs::remove_all(std::string(directory) + "/@eaDir");
            fs::create_directories(std::string(directory) + "/b");
        }
        Platform::Current().searchOn = false;
        Given(R"(folder.conf {"/photo/a":{"document":true}})");
        Given(R"(status.conf {"no_space":{"music":true}})");
        Given(R"(queue {"event":1,"path":"/vol1/photo/a/x"})");
        std::for_each(operation_.given.begin(), operation_.given.end(), [this](auto &line) { Given(line); });
        Script::Current().now = 1700000000;
        Forget();
    }

    /// The steps by the numbers that they have undisturbed; those that are new in full, a save without the
    /// content.
    std::string Done() const {
        std::vector<size_t> numbers;
        std::string others;
        auto rest = steps_;
        for (const std::string &step : Script::Current().Journal()) {
            const auto found = std::find(rest.begin(), rest.end(), step);
            if (found != rest.end()) {
                numbers.push_back(static_cast<size_t>(found - rest.begin()) + 1);
                found->clear();
            } else {
                others += " + " + step.substr(0, step.find(".conf {"));
            }
        }
        if (steps_.empty() && others.empty()) {
            return "";  // a question
        }
        const bool all = numbers.size() == steps_.size();
        return " | " + (all ? "all" : numbers.empty() ? "none" : Ranges(numbers)) + others;
    }

    /// What comes of the operation when the fault has taken place.
    std::string With(const Fault &fault) {
        Furnish();
        const State before = Stored();
        Fail(fault);
        std::string outcome = AskAlone(operation_.call);
        EXPECT_THAT(Script::Current().Finish(), IsEmpty());
        const State now = Stored();
        EXPECT_TRUE(now.list == before.list || now.list == after_.list) << now.list;
        EXPECT_TRUE(now.status == before.status || now.status == after_.status) << Print(now.status);
        return outcome;
    }

    /// The thread of the operation is cancelled in the nth such call, so that the next cancellation point ends it.
    void CancelIn(const Call &call, int nth) {
        SCOPED_TRACE(operation_.call + ", " + call.first + " " + std::to_string(nth));
        Furnish();
        Fail({.call = call.first, .about = call.second, .nth = nth, .action = [] {
                  ::pthread_cancel(::pthread_self());
              }});
        const auto descriptors = OpenDescriptors();
        pthread_t thread{};
        const auto body = [](void *call) -> void * { return Ask(*static_cast<std::string *>(call)), nullptr; };
        ASSERT_EQ(0, ::pthread_create(&thread, nullptr, body, &operation_.call));
        ::pthread_join(thread, nullptr);
        EXPECT_EQ(descriptors, OpenDescriptors());
        EXPECT_FALSE(IsLocked(kFolderLock) || IsLocked(kStatusLock));
        EXPECT_EQ(0, Platform::Current().shareRecords);
        EXPECT_THAT(Script::Current().Finish(), IsEmpty());
        Left();
    }

    /// What became of the operation whose nth such call failed.
    std::string Outcome(const Call &call, int nth) {
        const int error = call.first == "flock" ? ENOLCK : EIO;
        std::string outcome = With({.call = call.first, .about = call.second, .nth = nth, .error = error});
        outcome += Done();
        const std::string again = Ask(operation_.call);
        Left();
        if (again != answer_ || FolderConf() != after_.list) {
            outcome += " | again: " + again + (FolderConf() == after_.list ? "" : ", another list");
        }
        return outcome;
    }

    void ThrowIn(const Call &call, int nth) {
        const std::set<std::string> neverThrow = {"flock", "fstatat", "mkdirat"};
        const std::set<std::string> plain = {"IsSkipIndex", "IsShareSpaceEnough"};  // only ask the platform, in C
        if (!neverThrow.contains(call.first) && !plain.contains(Split(operation_.call).first)) {
            const auto action = [] { throw std::runtime_error("thrown"); };
            EXPECT_NO_THROW(With({.call = call.first, .about = call.second, .nth = nth, .action = action}));
        }
    }

    /// The part of failures.txt about an operation, as it is found to be.
    std::string Table(const Operation &operation) {
        SCOPED_TRACE(operation.call);
        operation_ = operation;
        Furnish();
        answer_ = Ask(operation_.call);
        after_ = Stored();
        steps_ = Script::Current().Journal();
        std::string table = "\n== " + operation_.call + " | " + answer_ + "\n";
        for (const std::string &line : operation_.given) {
            table += "given " + line + "\n";
        }
        for (size_t number = 1; number <= steps_.size(); ++number) {
            table += std::to_string(number) + " " + steps_[number - 1] + "\n";
        }
        std::map<Call, size_t> counts;
        std::vector<std::pair<std::string, std::map<Call, std::vector<size_t>>>>
            outcomes;  // in order of appearance
        for (const Call &made : Script::Current().Calls()) {
            const Call call = KeyOf(made);
            if (call.first.empty()) {
                continue;
            }
            const size_t nth = ++counts[call];
            const std::string outcome = Outcome(call, static_cast<int>(nth));
            auto same =
                std::find_if(outcomes.begin(), outcomes.end(), [&](auto &o) { return o.first == outcome; });
            if (same == outcomes.end()) {
                same = outcomes.insert(same, {outcome, {}});
            }
            same->second[call].push_back(nth);
            if (kCanCancel) {
                CancelIn(call, static_cast<int>(nth));
            }
            ThrowIn(call, static_cast<int>(nth));
        }
        for (const auto &[outcome, calls] : outcomes) {
            if (outcome == answer_ + (steps_.empty() ? "" : " | all")) {
                continue;
            }
            std::string line;
            for (const auto &[call, numbers] : calls) {
                line.append(line.empty() ? "" : ", ").append(call.first).append(call.second.empty() ? "" : " ");
                line.append(call.second).append(" ").append(Ranges(numbers));
            }
            table.append(line).append(" | ").append(outcome).append("\n");
        }
        return table;
    }

    Operation operation_;
    std::string answer_;
    State after_;
    std::vector<std::string> steps_;
};

TEST_F(Failures, OfEachCallEndAsTheTableSays) {
    daemon_.Start();
    const std::string before = ReadFile(TestPath("failures.txt"));
    std::string tables = before.substr(0, before.find("\n== "));  // the head
    for (const Operation &operation : kOperations) {
        tables += Table(operation);
    }
    ExpectContent(TestPath("failures.txt"), tables);
}

}  // namespace
}  // namespace fileindex_test
