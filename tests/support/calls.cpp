// The library's functions by their names, for tables in which a call is a line.
#include "fixture.h"

#include <vork/share.h>

#include <array>
#include <filesystem>
#include <functional>
#include <map>
#include <set>
#include <string>
#include <type_traits>
#include <vector>

namespace fileindex_test {
namespace {

using Text = const std::string &;
using Function = std::function<std::string(Text)>;

std::string YesNo(bool yes) {
    return yes ? "yes" : "no";
}

/// A function that says yes or no.
Function Asks(bool (*function)()) {
    return [function](Text) { return YesNo(function()); };
}

template <typename Result, typename Parameter>
Function Asks(Result (*function)(Parameter)) {
    return [function](Text argument) {
        if constexpr (std::is_same_v<Parameter, const char *>) {
            return YesNo(function(argument.c_str()));
        } else if constexpr (std::is_same_v<Parameter, const Json::Value &>) {
            return YesNo(function(Parse(argument)));
        } else {
            return YesNo(function(argument));
        }
    };
}

template <typename Second>
Function Asks(bool (*function)(Text, Second)) {
    return [function](Text argument) {
        const Json::Value arguments = Parse(argument);
        return YesNo(function(arguments[0].asString(), arguments[1].as<std::decay_t<Second>>()));
    };
}

/// One question, asked in each way that there is: with the same answer, code and records.
template <typename... Questions>
Function Agree(Questions... questions) {
    return [=](Text argument) {
        std::set<std::string> answers;
        for (const Function &question : {Function(questions)...}) {
            std::string answer = question(argument);
            const std::string left = Left();
            answers.insert(answer.append(left.empty() ? "" : "; ").append(left));
        }
        return answers.size() == 1 ? *answers.begin() : "the ways to ask disagree";
    };
}

std::vector<Folder> Listed() {
    std::vector<Folder> folders;
    IndexMgr::List(folders);
    return folders;
}

/// The question for those who have the folders at hand.
Function AsksOfList(bool (*function)(Text, const std::vector<Folder> &)) {
    return [function](Text argument) { return YesNo(function(argument, Listed())); };
}

/// What a function fills in, and nothing when it fails.
template <typename Out>
Function Fills(bool (*function)(Out &, Text)) {
    return [function](Text argument) {
        Out out = "before";
        const bool filled = function(out, argument);
        EXPECT_TRUE(filled || out == Out("before")) << argument;
        return !filled ? "no" : Json::Value(out).isString() ? Json::Value(out).asString() : Print(out);
    };
}

Function LocationFrom(int (*get)(const char *, char *, int)) {
    return [get](Text share) -> std::string {
        std::array<char, 4096> path{};
        return get(share.c_str(), path.data(), path.size()) < 0 ? "no" : path.data();
    };
}

/// The report of a change of the stored folders.
template <typename Change>
Function Stores(const Change &change) {
    return [=](Text argument) {
        Folders store;
        Json::Value report = "done";
        return store.Load() && change(store, report, argument) && store.Save() ? Print(report) : "no";
    };
}

/// What is read of a status.conf of this text.
std::string DocumentOf(Text text) {
    WriteFile(kStatusConf, text);
    Document status;
    const bool loaded = status.Load();
    EXPECT_EQ(text, ReadFile(kStatusConf));
    std::filesystem::remove(kStatusConf);
    return loaded ? status.Text() : "no";
}

/// Calls below that are asked after a change of a file take its text as their argument; none leaves it as it is.
void GivenText(const char *file, Text text) {
    if (!text.empty()) {
        WriteFile(file, text);
    }
}

std::string PauseInfo(Text text) {
    GivenText(kStatusConf, text);
    long long resumeTime = 5;
    const bool told = StatusMgr::GetPauseInfo(resumeTime);
    EXPECT_TRUE(told || resumeTime == 5);
    return told ? std::to_string(resumeTime) : "no";
}

std::string Governor(Text path) {
    const Json::Value governor = GetMostSuitableCfg(Listed(), path);
    return governor.isObject() && governor.empty() ? "none" : Print(governor["path"]);
}

std::string PathsOfShare(Text share) {
    Folders store;
    std::vector<Folder> folders;
    EXPECT_TRUE(store.Load() && store.List(folders, share));
    std::string paths;
    for (const Folder &folder : folders) {
        paths += (paths.empty() ? "" : " ") + folder.path;
    }
    return paths;
}

/// One object, of one record after the other.
std::string LoadedFolder(Text records) {
    Folder folder;
    for (const Json::Value &record : Parse(records)) {
        EXPECT_TRUE(folder.Load(record[0].asString(), record[1]));
    }
    return Print(folder.asJson()) + " " + folder.GetFullPath();
}

std::string Additional(Text keys) {
    Folder folder;
    folder.Load("/photo/a", Json::Value());
    return Print(folder.asJson(Parse(keys))["additional"]);
}

bool ShareOf(std::string &out, Text fullPath) {
    std::string share = out;
    std::string path = out;
    const bool found = GetShareNamePathByFullPath(share, path, fullPath);
    out = found ? share + " " + path : share == path ? share : "half";
    return found;
}

bool GetStatus(std::string &out, Text /*unused*/) {
    return StatusMgr::GetStatus(out);
}

std::string IsIndexableShare(Text name) {
    _tag_VORKSHARE *share = nullptr;
    EXPECT_EQ(0, VORKShareGet(name.c_str(), &share));
    const bool indexable = CanShareBeIndexed(share);
    VORKShareFree(share);
    return YesNo(indexable);
}

/// The names on a page with what was asked for them, the total and the offset.
std::string Page(Text request) {
    const Json::Value how = Parse(request);
    Json::Value page = "before";
    if (!IndexMgr::List(page, how[0].asUInt64(), how[1].asUInt64(), how[2].asString(), how[3].asString(),
                        how[4])) {
        return page == "before" ? "no" : "no, but filled";
    }
    std::string text;
    for (const Json::Value &folder : page["folder"]) {
        EXPECT_EQ(7U, folder.size());
        text += folder["name"].asString() + (folder["additional"].empty() ? "" : Print(folder["additional"]));
    }
    return text + " " + page["total"].asString() + " " + page["offset"].asString();
}

std::string MemberOf(Text object) {
    std::string text = "before";
    bool flags[] = {false, true};
    const bool isText = RetrieveStringFromJsonObj(text, "key", Parse(object));
    const bool isFlag = RetrieveBoolFromJsonObj(flags[0], "key", Parse(object));
    EXPECT_EQ(isFlag, RetrieveBoolFromJsonObj(flags[1], "key", Parse(object)));
    EXPECT_EQ(isFlag, flags[0] == flags[1]);
    EXPECT_TRUE(isText || text == "before");
    return isText ? "text " + text : isFlag ? "flag " + YesNo(flags[0]) : "neither";
}

std::string FlagsOfA(Text text) {
    GivenText(kStatusConf, text);
    return "no space " + YesNo(StatusMgr::ShareIsNoSpace("a")) + ", reindex " +
           YesNo(StatusMgr::ShareIsNeedReindex("a")) + ", updated " + YesNo(StatusMgr::IsUpdated("a"));
}

/// Of everything, and of the folder /photo/a.
std::string Statuses(Text text) {
    GivenText(kStatusConf, text);
    std::string status = "no";
    StatusMgr::GetStatus(status);
    return status + ", " + StatusMgr::GetFolderStatus("/photo/a");
}

std::string StatusWithQueue(Text line) {
    GivenQueue(line + "\n");
    Script::Current().ClearJournal();
    return StatusMgr::GetFolderStatus("/photo/a");
}

std::string AddToQueue(Text line) {
    GivenQueue(line + "\n");
    Script::Current().ClearJournal();
    return YesNo(AddCustomEvent(1, "/vol1/photo/a", Json::Value()));
}

std::string SavedFolders(Text text) {
    GivenText(kFolderConf, text);
    Folders store;
    return YesNo(store.Load() && store.Save());
}

std::string Paused(Text hours) {
    return YesNo(StatusMgr::Pause(std::stoi(hours)));
}

const std::map<std::string, Function> kFunctions = {
    {"Add", Asks(IndexMgr::Add)},
    {"AddCustomEvent", [](Text path) { return YesNo(AddCustomEvent(1, path, Json::Value())); }},
    {"AddToQueue", AddToQueue},
    {"Additional", Additional},
    {"CanFullPathBeIndexed", Asks(CanFullPathBeIndexed)},
    {"CanPathBeIndexed", Asks(CanPathBeIndexed)},
    {"CanShareBeIndexed", IsIndexableShare},
    {"CleanShareIndexData", Asks(IndexMgr::CleanShareIndexData)},
    {"Delete", Asks(IndexMgr::Delete)},
    {"DeleteVorkNotifydCfg", Asks(IndexMgr::DeleteVorkNotifydCfg)},
    {"Document", DocumentOf},
    {"FILEIDXDBPathGet", LocationFrom(FILEIDXDBPathGet)},
    {"FILEIDXIsFullPathIndexed", Asks(FILEIDXIsFullPathIndexed)},
    {"FILEIDXQueuePathGet", LocationFrom(FILEIDXQueuePathGet)},
    {"FlagsOfA", FlagsOfA},
    {"Folder::Load", LoadedFolder},
    {"Folders::Delete", Stores([](auto &store, auto &report, Text path) { return store.Delete(report, path); })},
    {"Folders::List", PathsOfShare},
    {"Folders::Save", SavedFolders},
    {"Folders::Upsert",
     Stores([](auto &store, auto &report, Text folder) { return store.Upsert(report, Parse(folder)); })},
    {"Get", Fills<Json::Value>(IndexMgr::Get)},
    {"GetFolderStatus", StatusMgr::GetFolderStatus},
    {"GetFullPath", Fills<std::string>(GetFullPath)},
    {"GetMostSuitableCfg", Governor},
    {"GetPauseInfo", PauseInfo},
    {"GetShareNameByPath", Fills<std::string>(GetShareNameByPath)},
    {"GetShareNamePathByFullPath", Fills<std::string>(ShareOf)},
    {"GetStatus", Fills<std::string>(GetStatus)},
    {"IsDirExist", Asks(IsDirExist)},
    {"IsFileExist", Asks(IsFileExist)},
    {"IsFullPathIndexed", Agree(Asks<bool, Text>(IndexMgr::IsFullPathIndexed),
                                AsksOfList(IndexMgr::IsFullPathIndexed), Asks(FILEIDXIsFullPathIndexed))},
    {"IsPathContainIndexed",
     Agree(Asks<bool, Text>(IndexMgr::IsPathContainIndexed), AsksOfList(IndexMgr::IsPathContainIndexed))},
    {"IsPathIndexed", Agree(Asks<bool, Text>(IndexMgr::IsPathIndexed), AsksOfList(IndexMgr::IsPathIndexed),
                            Asks(FILEIDXIsPathIndexed))},
    {"IsShareIndexed", Agree(Asks(IndexMgr::IsShareIndexed), Asks(FILEIDXIsShareIndexed))},
    {"IsShareSpaceEnough", Asks(IsShareSpaceEnough)},
    {"IsSkipIndex", Asks(IsSkipIndex)},
    {"IsSystemPreservedFileName", Asks(IsSystemPreservedFileName)},
    {"List", Page},
    {"MemberOf", MemberOf},
    {"NotifyNoSpace", Asks(NotifyNoSpace)},
    {"Pause", Paused},
    {"Reindex", Asks(IndexMgr::Reindex)},
    {"ReplaceShareName", [](Text path) { return ReplaceShareName(path, "new"); }},
    {"Resume", Asks(StatusMgr::Resume)},
    {"SendCammandToDaemon", [](Text command) { return YesNo(SendCammandToDaemon(command, Json::Value())); }},
    {"Set", Asks(IndexMgr::Set)},
    {"SetUpdated", Asks(StatusMgr::SetUpdated)},
    {"ShareIsNoSpace", Asks(StatusMgr::ShareIsNoSpace)},
    {"SharePause", Asks(IndexMgr::SharePause)},
    {"ShareRemove", Asks(IndexMgr::ShareRemove)},
    {"ShareRename", Asks(IndexMgr::ShareRename)},
    {"ShareResume", Asks(IndexMgr::ShareResume)},
    {"ShareRevive", Asks(StatusMgr::ShareRevive)},
    {"ShareSetNeedReindex", Asks(StatusMgr::ShareSetNeedReindex)},
    {"ShareSetNoSpace", Asks(StatusMgr::ShareSetNoSpace)},
    {"StatusWithQueue", StatusWithQueue},
    {"Statuses", Statuses},
    {"StringStartWith", Asks(StringStartWith)},
    {"Update", [](Text path) { return YesNo(IndexMgr::Update(path, "anything")); }},
    {"Updater_zol60_beta2", Asks(Updater_zol60_beta2)},
    {"Upsert", Asks(IndexMgr::Upsert)},
    {"UpsertVorkNotifydCfg", Asks(IndexMgr::UpsertVorkNotifydCfg)},
};

}  // namespace

std::string Ask(const std::string &call) {
    const auto [name, argument] = Split(call);
    return kFunctions.at(name)(Decoded(argument));
}

std::set<std::string> FunctionNames() {
    std::set<std::string> names;
    for (const auto &[name, function] : kFunctions) {
        names.insert(name);
    }
    return names;
}

}  // namespace fileindex_test
