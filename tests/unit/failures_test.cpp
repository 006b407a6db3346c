// Every call that an operation makes of the platform, and of the system for its files and its socket, fails in
// turn. What comes of each is a line of failures.txt:
//
//   == Function argument | answer
//   given FACT                    see FileIndexTest::Given
//   1 step                        what the operation does undisturbed
//   call numbers | answer, code and records | steps done
//
// A thread that is cancelled in one of these calls leaves, with everything given back. The same request is then
// repeated; the line says so when that does not end like the undisturbed one. A call that has no line, a line that
// has no call and any other outcome are failures of the test.
#include "fixture.h"

#include <pthread.h>

#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <map>
#include <set>
#include <sstream>
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
    void Furnish() {
        GivenShare("photo");
        GivenShare("music", "/vol2/music");
        for (const char *directory : {"/vol1/photo", "/vol2/music"}) {
            fs::remove_all(std::string(directory) + "/@eaDir");
            fs::create_directories(std::string(directory) + "/a");
            fs::create_directories(std::string(directory) + "/b");
        }
        Platform::Current().searchOn = false;
        Given(R"(folder.conf {"/photo/a":{"document":true}})");
        Given(R"(status.conf {"no_space":{"music":true}})");
        Given(R"(queue {"event":1,"path":"/vol1/photo/a/x"})");
        std::for_each(given_.begin(), given_.end(), [this](auto &line) { Given(line); });
        Script::Current().now = 1700000000;
        Forget();
    }

    /// The steps by the numbers that they have undisturbed; those that are new in full.
    static std::string Done(const std::vector<std::string> &undisturbed) {
        std::vector<size_t> numbers;
        std::string others;
        auto rest = undisturbed;
        for (const std::string &step : Journal()) {
            const auto found = std::find(rest.begin(), rest.end(), step);
            if (found != rest.end()) {
                numbers.push_back(static_cast<size_t>(found - rest.begin()) + 1);
                found->clear();
            } else if (step.find("lock status") == std::string::npos) {
                others += " + " + step;
            }
        }
        if (undisturbed.empty() && others.empty()) {
            return "";  // a question
        }
        const bool all = numbers.size() == undisturbed.size();
        return " | " + (all ? "all" : numbers.empty() ? "none" : Ranges(numbers)) + others;
    }

    /// What comes of the operation when the fault has taken place.
    std::string With(const Fault &fault) {
        Furnish();
        Fail(fault);
        std::string outcome = AskAlone(call_);
        EXPECT_THAT(Script::Current().Finish(), IsEmpty());
        return outcome;
    }

    /// The thread of the operation is cancelled in the nth such call, so that the next cancellation point ends it.
    void CancelIn(const Call &call, int nth) {
        Furnish();
        Fail({.call = call.first, .about = call.second, .nth = nth, .action = [] {
                  ::pthread_cancel(::pthread_self());
              }});
        const auto descriptors = OpenDescriptors();
        pthread_t thread{};
        const auto body = [](void *test) -> void * { return Ask(static_cast<Failures *>(test)->call_), nullptr; };
        ASSERT_EQ(0, ::pthread_create(&thread, nullptr, body, this));
        ::pthread_join(thread, nullptr);
        EXPECT_EQ(descriptors, OpenDescriptors()) << call_ << ", " << call.first << " " << nth;
        EXPECT_FALSE(IsLocked(kFolderLock) || IsLocked(kStatusLock)) << call_ << ", " << call.first << " " << nth;
        EXPECT_EQ(0, Platform::Current().shareRecords) << call_;
        EXPECT_THAT(Script::Current().Finish(), IsEmpty());
        Left();
    }

    /// What became of the operation whose nth such call failed.
    std::string Outcome(const Call &call, size_t nth, const std::string &answer,
                        const std::vector<std::string> &steps, const std::string &list) {
        const int error = call.first == "flock" ? ENOLCK : EIO;
        std::string outcome = With({call.first, call.second, static_cast<int>(nth), 1, -1, error});
        outcome += Done(steps);
        const std::string again = Ask(call_);
        Left();
        if (again != answer || FolderConf() != list) {
            outcome += " | again: " + again + (FolderConf() == list ? "" : ", another list");
        }
        return outcome;
    }

    /// The part of failures.txt about an operation, as it is found to be.
    std::string Table() {
        Furnish();
        const std::string answer = Ask(call_);
        const std::string list = FolderConf();
        const std::vector<std::string> steps = Journal();
        std::string table = "== " + call_ + " | " + answer + "\n";
        for (const std::string &line : given_) {
            table += "given " + line + "\n";
        }
        for (size_t number = 1; number <= steps.size(); ++number) {
            table += std::to_string(number) + " " + steps[number - 1] + "\n";
        }
        const std::set<std::string> plain = {"CanPathBeIndexed", "IsSkipIndex", "IsShareSpaceEnough",
                                             "NotifyNoSpace"};
        const bool isWrapped = !plain.contains(Split(call_).first);  // those only ask the platform, which is C
        std::map<Call, size_t> counts;
        std::vector<std::pair<std::string, std::map<Call, std::vector<size_t>>>>
            outcomes;  // in order of appearance
        for (const Call &made : Script::Current().Calls()) {
            const Call call = KeyOf(made);
            if (call.first.empty()) {
                continue;
            }
            const size_t nth = ++counts[call];
            const std::string outcome = Outcome(call, nth, answer, steps, list);
            auto same =
                std::find_if(outcomes.begin(), outcomes.end(), [&](auto &o) { return o.first == outcome; });
            if (same == outcomes.end()) {
                same = outcomes.insert(same, {outcome, {}});
            }
            same->second[call].push_back(nth);
            const std::set<std::string> neverThrow = {"flock", "fstatat", "mkdirat"};
            if (kCanCancel) {
                CancelIn(call, static_cast<int>(nth));
            }
            if (!neverThrow.contains(call.first) && isWrapped) {
                const auto action = [] { throw std::runtime_error("thrown"); };  // ends in the operation
                EXPECT_NO_THROW(With(
                    {.call = call.first, .about = call.second, .nth = static_cast<int>(nth), .action = action}));
            }
        }
        for (const auto &[outcome, calls] : outcomes) {
            std::string line;
            for (const auto &[call, numbers] : calls) {
                line.append(line.empty() ? "" : ", ").append(call.first).append(call.second.empty() ? "" : " ");
                line.append(call.second).append(" ").append(Ranges(numbers));
            }
            table.append(line).append(" | ").append(outcome).append("\n");
        }
        return table;
    }

    std::string call_;
    std::vector<std::string> given_;
};

TEST_F(Failures, OfEachCallEndAsTheTableSays) {
    daemon_.Start();
    std::istringstream parts(ReadFile(TestPath("failures.txt")));
    std::string tables;
    for (std::string line; std::getline(parts, line);) {
        if (line.starts_with("== ")) {
            call_ = line.substr(3, line.find(" |") - 3);
            given_.clear();
        } else if (line.starts_with("given ")) {
            given_.push_back(line.substr(6));
        } else if (line.empty()) {
            tables += Table() + "\n";
        }
    }
    ExpectContent(TestPath("failures.txt"), tables);
}

}  // namespace
}  // namespace fileindex_test
