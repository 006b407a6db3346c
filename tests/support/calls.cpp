// The library's functions by their names, for tables in which a call is a line.
#include "fixture.h"

#include <vork/share.h>

#include <algorithm>
#include <array>
#include <filesystem>
#include <functional>
#include <map>
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

/// A function of one argument that says yes or no.
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

/// One question, asked in each way that there is.
template <typename... Questions>
Function Agree(Questions... questions) {
    return [=](Text argument) {
        const std::vector<std::string> answers = {questions(argument)...};
        const bool agree = std::equal(answers.begin() + 1, answers.end(), answers.begin());
        return agree ? answers.front() : "the ways to ask disagree";
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

/// A function of two arguments.
template <typename Second>
Function AsksOfTwo(bool (*function)(Text, Second)) {
    return [function](Text argument) {
        const Json::Value arguments = Parse(argument);
        return YesNo(function(arguments[0].asString(), arguments[1].as<std::decay_t<Second>>()));
    };
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
std::string Stored(const Change &change) {
    Folders store;
    Json::Value report = "done";
    return store.Load() && change(store, report) && store.Save() ? Print(report) : "no";
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

std::string PauseInfo(Text /*unused*/) {
    long long resumeTime = 5;
    const bool told = StatusMgr::GetPauseInfo(resumeTime);
    return (told ? "" : "no ") + std::to_string(resumeTime);
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
    return isText ? "text " + text : text + (isFlag ? ", flag " + YesNo(flags[0]) : "");
}

std::string FlagsOfA(Text /*unused*/) {
    return "no space " + YesNo(StatusMgr::ShareIsNoSpace("a")) + ", reindex " +
           YesNo(StatusMgr::ShareIsNeedReindex("a")) + ", updated " + YesNo(StatusMgr::IsUpdated("a"));
}

const std::map<std::string, Function> kFunctions = {
    {"Add", Asks(IndexMgr::Add)},
    {"AddCustomEvent", [](Text path) { return YesNo(AddCustomEvent(1, path, Json::Value())); }},
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
    {"Folders::Delete",
     [](Text path) { return Stored([&](auto &store, auto &report) { return store.Delete(report, path); }); }},
    {"Folders::List", PathsOfShare},
    {"Folders::Save", [](Text) { return Stored([](auto &, auto &) { return true; }); }},
    {"Folders::Upsert",
     [](Text folder) {
         return Stored([&](auto &store, auto &report) { return store.Upsert(report, Parse(folder)); });
     }},
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
    {"NotifyNoSpace", [](Text) { return YesNo(NotifyNoSpace()); }},
    {"Pause", [](Text hours) { return YesNo(StatusMgr::Pause(std::stoi(hours))); }},
    {"Reindex", Asks(IndexMgr::Reindex)},
    {"ReplaceShareName", [](Text path) { return ReplaceShareName(path, "new"); }},
    {"Resume", [](Text) { return YesNo(StatusMgr::Resume()); }},
    {"SendCammandToDaemon", [](Text command) { return YesNo(SendCammandToDaemon(command, Json::Value())); }},
    {"Set", Asks(IndexMgr::Set)},
    {"SetUpdated", Asks(StatusMgr::SetUpdated)},
    {"ShareIsNoSpace", Asks(StatusMgr::ShareIsNoSpace)},
    {"SharePause", Asks(IndexMgr::SharePause)},
    {"ShareRemove", Asks(IndexMgr::ShareRemove)},
    {"ShareRename", AsksOfTwo(IndexMgr::ShareRename)},
    {"ShareResume", Asks(IndexMgr::ShareResume)},
    {"ShareRevive", Asks(StatusMgr::ShareRevive)},
    {"ShareSetNeedReindex", AsksOfTwo(StatusMgr::ShareSetNeedReindex)},
    {"ShareSetNoSpace", AsksOfTwo(StatusMgr::ShareSetNoSpace)},
    {"StringStartWith", AsksOfTwo(StringStartWith)},
    {"Update", [](Text path) { return YesNo(IndexMgr::Update(path, "anything")); }},
    {"Updater_zol60_beta2", [](Text) { return YesNo(Updater_zol60_beta2()); }},
    {"Upsert", Asks(IndexMgr::Upsert)},
    {"UpsertVorkNotifydCfg", Asks(IndexMgr::UpsertVorkNotifydCfg)},
};

}  // namespace

std::string Ask(const std::string &call) {
    const auto [name, argument] = Split(call);
    return kFunctions.at(name)(Decoded(argument));
}

}  // namespace fileindex_test
