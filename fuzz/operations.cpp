// A sequence of operations on the library and on a model in memory: after each of them folder.conf, status.conf,
// the queues and the daemon's commands are those of the model.

#include "json/text.h"
#include "model.h"
#include "names.h"
#include "support.h"

#include <fileindex/index_mgr.h>
#include <fileindex/status_mgr.h>

#include <fuzzer/FuzzedDataProvider.h>

#include <iterator>
#include <string>

namespace {

using namespace fileindex_fuzz;  // NOLINT(google-build-using-namespace): this is their program
using VORK::FILEINDEX::IndexMgr;
using VORK::FILEINDEX::StatusMgr;
namespace names = VORK::FILEINDEX::internal;

constexpr const char *kPaths[] = {"/a", "/a/d", "/a/d/e", "/a/dd", "/b", "/b/d", "/photo/d", "/ro", "/away/d"};
constexpr const char *kNames[] = {"a", "b", "photo", "ro", "away"};
constexpr const char *kMarkers[] = {"upgrade_1", "upgrade_2"};

Json::Value SomeRecord(FuzzedDataProvider &input) {
    Json::Value record(Json::objectValue);
    record["path"] = input.PickValueInArray(kPaths);
    for (const char *flag : names::kMediaKeys) {
        if (input.ConsumeBool()) {
            record[flag] = input.ConsumeBool();
        }
    }
    if (input.ConsumeBool()) {
        record["name"] = input.ConsumeRandomLengthString(8);
    }
    return record;
}

Json::Value SomePaths(FuzzedDataProvider &input, std::size_t choices) {
    Json::Value paths(Json::arrayValue);
    for (auto left = input.ConsumeIntegralInRange(0, 3); left > 0; --left) {
        paths.append(kPaths[input.ConsumeIntegralInRange<std::size_t>(0, choices - 1)]);
    }
    return paths;
}

bool StepFolders(FuzzedDataProvider &input, Model &model, int operation) {
    Json::Value request(Json::arrayValue);
    switch (operation) {
        case 0:
            for (auto left = input.ConsumeIntegralInRange(0, 3); left > 0; --left) {
                request.append(SomeRecord(input));
            }
            return IndexMgr::Upsert(request) == model.Upsert(request);
        case 1:
            request = SomePaths(input, std::size(kPaths) - 1);  // a share that is away has no event: see the tests
            return IndexMgr::Delete(request) == model.Delete(request);
        case 2:
            request = SomePaths(input, std::size(kPaths));
            return IndexMgr::Reindex(request) == model.Reindex(request);
        case 3: {
            const std::string from = input.PickValueInArray(kNames);
            const std::string to = input.PickValueInArray(kNames);
            return IndexMgr::ShareRename(from, to) == model.ShareRename(from, to);
        }
        default: {
            const std::string share = input.PickValueInArray(kNames);
            return IndexMgr::ShareRemove(share) == model.ShareRemove(share);
        }
    }
}

bool StepStatus(FuzzedDataProvider &input, Model &model, int operation) {
    const std::string share = input.PickValueInArray(kNames);
    const bool set = input.ConsumeBool();
    switch (operation) {
        case 0:
            model.Command("pause", "resume_time", 0);
            model.status["resume_time"] = 0;
            return StatusMgr::Pause(0) && !StatusMgr::Pause(-1);
        case 1:
            model.Command("resume");
            model.status["resume_time"] = -1;
            return StatusMgr::Resume();
        case 2:
            model.SetFlag("no_space", share, set);
            return StatusMgr::ShareSetNoSpace(share, set) && StatusMgr::ShareIsNoSpace(share) == set;
        case 3:
            model.SetFlag("need_reindex", share, set);
            return StatusMgr::ShareSetNeedReindex(share, set) && StatusMgr::ShareIsNeedReindex(share) == set;
        case 4:
            model.SetFlag("no_space", share, false);
            model.Command("revive_share_worker", "share_name", share);
            return StatusMgr::ShareRevive(share);
        case 5: {
            const std::string marker = input.PickValueInArray(kMarkers);
            model.status[marker] = true;
            return StatusMgr::SetUpdated(marker) && StatusMgr::IsUpdated(marker);
        }
        default: {
            const bool known = share != "away";
            model.Command("delete_share_worker", "share_name", share);
            return IndexMgr::SharePause(share) == known;
        }
    }
}

Json::Value FileAsJson(const char *path) {
    Json::Value document(Json::objectValue);
    const std::string text = ReadWhole(path);
    Require(text.empty() || names::JsonReader().Parse(text, document), "a broken file", text);
    return document;
}

void Compare(const char *what, const Json::Value &is, const Json::Value &expected) {
    Require(is == expected, what, "\nis       " + names::ToString(is) + "\nexpected " + names::ToString(expected));
}

Json::Value QueueAsJson(const std::string &share) {
    Json::Value lines(Json::arrayValue);
    const std::string text = ReadWhole(QueueOf(share));
    for (std::size_t begin = 0, end = 0; begin < text.size(); begin = end + 1) {
        end = text.find('\n', begin);
        Json::Value line;
        Require(end != std::string::npos && names::JsonReader().Parse(text.substr(begin, end - begin), line),
                "a broken line", text);
        lines.append(line);
    }
    return lines;
}

void CompareAll(Model &model) {
    Compare("folder.conf differs", FileAsJson(names::kFolderConf), model.folders);
    Compare("status.conf differs", FileAsJson(names::kStatusConf), model.status);
    for (const std::string share : kShares) {
        Compare("a queue differs", QueueAsJson(share), model.QueueOfShare(share));
    }
    Json::Value commands(Json::arrayValue);
    for (const Json::Value &command : TakeCommands()) {
        commands.append(command);
    }
    Compare("the commands differ", commands, model.TakeCommands());
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
    ResetMachine();
    FuzzedDataProvider input(data, size);
    Model model;
    const LeakCheck leaks;
    constexpr int kMaxSteps = 16;
    for (int step = 0; step < kMaxSteps && input.remaining_bytes() > 0; ++step) {
        const int operation = input.ConsumeIntegralInRange(0, 11);
        constexpr int kFolderOperations = 5;
        const bool agreed = operation < kFolderOperations
                                ? StepFolders(input, model, operation)
                                : StepStatus(input, model, operation - kFolderOperations);
        Require(agreed, "the answer differs", std::to_string(operation));
        CompareAll(model);
    }
    return 0;
}
