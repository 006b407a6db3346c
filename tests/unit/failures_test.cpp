// Every call that an operation makes of the platform, and of the system for its files and its socket, fails in
// turn. What comes of each is a line of failures.txt:
//
//   == operation: answer
//   1 step                        what the operation does undisturbed
//   call numbers | answer, code and records | steps done
//
// The same request is then repeated; the line says so when that does not end like the undisturbed one. A call that
// has no line, a line that has no call and any other outcome are failures of the test.
#include "fixture.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <functional>
#include <map>
#include <set>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

using Path = const std::string &;

std::string YesNo(bool yes) {
    return yes ? "yes" : "no";
}

/// A request of one string, as a row.
template <typename Result, typename Parameter>
std::function<std::string()> Ask(Result (*function)(Parameter), const char *argument) {
    return [=] { return YesNo(function(argument)); };
}

std::string LocationFrom(int (*get)(const char *, char *, int)) {
    std::array<char, 4096> path{};
    return get("photo", path.data(), path.size()) < 0 ? "no" : path.data();
}

const std::pair<const char *, std::function<std::string()>> kOperations[] = {
    {"Upsert",
     [] { return YesNo(IndexMgr::Upsert(Parse(R"([{"path":"/photo/a","video":true},{"path":"/music/c"}])"))); }},
    {"Delete", [] { return YesNo(IndexMgr::Delete(Parse(R"(["/photo/a","/music"])"))); }},
    {"Delete of the last", [] { return YesNo(IndexMgr::Delete(Parse(R"(["/photo/a"])"))); }},
    {"Reindex", [] { return YesNo(IndexMgr::Reindex(Parse(R"(["/photo/a","/music","/photo/a"])"))); }},
    {"Update", [] { return YesNo(IndexMgr::Update("/photo/a", "anything")); }},
    {"Get",
     [] {
         Json::Value folder;
         return IndexMgr::Get(folder, "/photo/a") ? folder["path"].asString() : "no";
     }},
    {"List",
     [] {
         Json::Value page;
         const bool listed = IndexMgr::List(page, 0, 9, "name", "ASC", Parse(R"(["status"])"));
         return listed ? page["folder"][0]["additional"]["status"].asString() : "no";
     }},
    {"IsFullPathIndexed", Ask<bool, Path>(IndexMgr::IsFullPathIndexed, "/vol1/photo/a")},
    {"ShareRename", [] { return YesNo(IndexMgr::ShareRename("photo", "music")); }},
    {"ShareRemove", Ask(IndexMgr::ShareRemove, "photo")},
    {"ShareRemove of the last", Ask(IndexMgr::ShareRemove, "photo")},
    {"SharePause", Ask(IndexMgr::SharePause, "photo")},
    {"ShareResume", Ask(IndexMgr::ShareResume, "photo")},
    {"CleanShareIndexData", Ask(IndexMgr::CleanShareIndexData, "photo")},
    {"UpsertVorkNotifydCfg", Ask(IndexMgr::UpsertVorkNotifydCfg, "photo")},
    {"DeleteVorkNotifydCfg", Ask(IndexMgr::DeleteVorkNotifydCfg, "photo")},
    {"Updater_zol60_beta2 of none", [] { return YesNo(Updater_zol60_beta2()); }},
    {"Updater_zol60_beta2", [] { return YesNo(Updater_zol60_beta2()); }},
    {"Pause", [] { return YesNo(StatusMgr::Pause(2)); }},
    {"Resume", [] { return YesNo(StatusMgr::Resume()); }},
    {"ShareRevive", Ask(StatusMgr::ShareRevive, "music")},
    {"ShareSetNoSpace", [] { return YesNo(StatusMgr::ShareSetNoSpace("photo", true)); }},
    {"ShareSetNeedReindex", [] { return YesNo(StatusMgr::ShareSetNeedReindex("photo", true)); }},
    {"SetUpdated", Ask(StatusMgr::SetUpdated, "once")},
    {"ShareIsNoSpace", Ask(StatusMgr::ShareIsNoSpace, "music")},
    {"GetStatus",
     [] {
         std::string status;
         return StatusMgr::GetStatus(status) ? status : "no";
     }},
    {"GetFolderStatus", [] { return StatusMgr::GetFolderStatus("/photo/a"); }},
    {"CanPathBeIndexed", Ask(CanPathBeIndexed, "/photo/a")},
    {"IsSkipIndex", Ask(IsSkipIndex, "/vol1/photo/a")},
    {"IsShareSpaceEnough", Ask(IsShareSpaceEnough, "photo")},
    {"AddCustomEvent", [] { return YesNo(AddCustomEvent(1, "/vol1/photo/a", Json::Value())); }},
    {"SendCammandToDaemon", [] { return YesNo(SendCammandToDaemon("x", Json::Value())); }},
    {"NotifyNoSpace", [] { return YesNo(NotifyNoSpace()); }},
    {"FILEIDXQueuePathGet", [] { return LocationFrom(FILEIDXQueuePathGet); }},
    {"FILEIDXDBPathGet", [] { return LocationFrom(FILEIDXDBPathGet); }},
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
    for (const char *file : {"folder.conf", "status.conf", "folder.lock", "status.lock", "_queue"}) {
        if ((name == "open" || name == "write" || name == "flock") && about.find(file) != std::string::npos) {
            return {name, file};
        }
    }
    return {};
}

class Failures : public FileIndexTest, public testing::WithParamInterface<size_t> {
protected:
    void Furnish() {
        GivenShare("photo");
        GivenShare("music", "/vol2/music");
        for (const char *directory : {"/vol1/photo", "/vol2/music"}) {
            fs::remove_all(std::string(directory) + "/@eaDir");
            fs::create_directories(std::string(directory) + "/a");
            fs::create_directories(std::string(directory) + "/b");
        }
        const std::string name = kOperations[GetParam()].first;
        std::vector<std::string> folders = {FolderRecord("/photo/a", "", "d"), FolderRecord("/music", "", "a"),
                                            FolderRecord("/photo/b", "", "p")};
        folders.resize(name.ends_with(" of none")                   ? 0
                       : name == "Delete"                           ? 3
                       : name == "Reindex" || name == "ShareRemove" ? 2
                                                                    : 1);
        Platform::Current().searchOn = name.ends_with(" of the last");
        GivenFolders(folders);
        GivenStatusConf(R"({"no_space":{"music":true}})");
        GivenQueue("photo", "{\"event\":1,\"path\":\"/vol1/photo/a/x\"}\n");
        Script::Current().now = 1700000000;
        Script::Current().ClearJournal();
        Left();
    }
    static std::string Run() { return kOperations[GetParam()].second(); }

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

    /// An exception out of the nth such call ends in the operation, which gives everything back.
    void Throw(const Call &call, size_t nth) {
        Furnish();
        const auto descriptors = OpenDescriptors();
        Fail({.call = call.first, .about = call.second, .nth = static_cast<int>(nth), .action = [] {
                  throw std::runtime_error("thrown");
              }});
        EXPECT_NO_THROW(Run()) << call.first << nth;
        Left();
        EXPECT_FALSE(IsLocked(kFolderLock) || IsLocked(kStatusLock));
        EXPECT_EQ(descriptors, OpenDescriptors());
        EXPECT_THAT(Script::Current().Finish(), IsEmpty());
    }

    /// What became of the operation whose nth such call failed.
    std::string Outcome(const Call &call, size_t nth, const std::string &answer,
                        const std::vector<std::string> &steps, const std::string &list) {
        Furnish();
        const auto descriptors = OpenDescriptors();
        Fail({.call = call.first,
              .about = call.second,
              .nth = static_cast<int>(nth),
              .error = call.first == "flock" ? ENOLCK : EIO});
        const std::string result = Run();
        const std::string left = Left();
        std::string outcome = result + (left.empty() ? "" : " " + left) + Done(steps);
        EXPECT_FALSE(IsLocked(kFolderLock) || IsLocked(kStatusLock));
        EXPECT_EQ(descriptors, OpenDescriptors());
        EXPECT_THAT(Script::Current().Finish(), IsEmpty());
        const std::string again = Run();
        Left();
        if (again != answer || FolderConf() != list) {
            outcome += " | again: " + again + (FolderConf() == list ? "" : ", another list");
        }
        return outcome;
    }
};

/// The operation's part of failures.txt.
std::string Expected(const std::string &operation) {
    const char *sources = std::getenv("SOURCE_DIR");
    const std::string text =
        ReadFile(std::string(sources != nullptr ? sources : ".") + "/tests/unit/failures.txt");
    const size_t begin = text.find("== " + operation + ":");
    return begin == std::string::npos ? "" : text.substr(begin, text.find("\n\n", begin) + 1 - begin);
}

TEST_P(Failures, OfEachCallEndAsTheTableSays) {
    const std::string name = kOperations[GetParam()].first;
    daemon_.Start();
    Furnish();
    const std::string answer = Run();
    const std::string list = FolderConf();
    const std::vector<std::string> steps = Journal();
    std::string table = "== " + name + ": " + answer + "\n";
    for (size_t number = 1; number <= steps.size(); ++number) {
        table += std::to_string(number) + " " + steps[number - 1] + "\n";
    }
    const std::set<std::string> plain = {"CanPathBeIndexed", "IsSkipIndex", "IsShareSpaceEnough", "NotifyNoSpace"};
    const bool isWrapped = !plain.contains(name);  // those only ask the platform, which is C
    std::map<Call, size_t> counts;
    std::vector<std::pair<std::string, std::map<Call, std::vector<size_t>>>> outcomes;  // in order of appearance
    for (const Call &made : Script::Current().Calls()) {
        const Call call = KeyOf(made);
        if (call.first.empty()) {
            continue;
        }
        const size_t nth = ++counts[call];
        const std::string outcome = Outcome(call, nth, answer, steps, list);
        auto same = std::find_if(outcomes.begin(), outcomes.end(), [&](auto &o) { return o.first == outcome; });
        if (same == outcomes.end()) {
            same = outcomes.insert(same, {outcome, {}});
        }
        same->second[call].push_back(nth);
        if (call.first != "flock" && isWrapped) {
            Throw(call, nth);
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
    EXPECT_EQ(Expected(name), table) << table;
}

INSTANTIATE_TEST_SUITE_P(Of, Failures, testing::Range(size_t{0}, std::size(kOperations)), [](const auto &info) {
    std::string name = kOperations[info.param].first;
    std::erase(name, ' ');
    return name;
});

}  // namespace
}  // namespace fileindex_test
