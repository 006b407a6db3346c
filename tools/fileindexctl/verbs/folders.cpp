#include "command_line/handlers.h"
#include "facts/paths.h"
#include "facts/queue_files.h"
#include "facts/registrations.h"
#include "report/failure.h"
#include "report/folder_text.h"
#include "report/text.h"

#include <fileindex/folders.h>
#include <fileindex/index_mgr.h>
#include <fileindex/indexability.h>
#include <fileindex/status_mgr.h>

#include <algorithm>
#include <limits>
#include <string>

namespace VORK::FILEINDEXCTL {

namespace {

using VORK::FILEINDEX::Folder;

// All folders in the order asked for. The library is asked for everything and the page is cut here, because its
// descending order leaves the offset out and because it knows no filter by share.
std::vector<Json::Value> Sorted(const Arguments &arguments) {
    Json::Value page;
    ForgetErrors();
    const Json::Value nothingMore(Json::arrayValue);
    if (!VORK::FILEINDEX::IndexMgr::List(page, 0, std::numeric_limits<unsigned long>::max(),
                                         arguments.One("--sort"), arguments.Has("--desc") ? "DESC" : "ASC",
                                         nothingMore)) {
        throw FailureOf(VORK::FILEINDEX::Folders());
    }
    std::vector<Json::Value> records(page["folder"].begin(), page["folder"].end());
    if (arguments.Has("--share")) {
        const std::string share = arguments.One("--share");
        std::erase_if(records,
                      [&](const Json::Value &record) { return ShareOf(record["path"].asString()) != share; });
    }
    return records;
}

// Facts are computed for the page alone: each of them reads a queue.
Json::Value WithFacts(Json::Value record) {
    Folder folder;
    folder.Load(record["path"].asString(), record);
    Json::Value keys(Json::arrayValue);
    keys.append("status");
    keys.append("is_valid");
    Json::Value result = folder.asJson(keys);
    Json::Value &status = result["additional"]["status"];
    if (status == "finished" && !IsQueueReadable(ShareOf(folder.path))) {
        status = Json::Value();  // the library takes a queue that it may not read for none
    }
    return result;
}

void ShowTable(const Json::Value &page, bool status, Output &output) {
    std::vector<std::vector<std::string>> rows = {{"PATH", "NAME", "MEDIA"}};
    if (status) {
        rows.front().emplace_back("STATUS");
    }
    for (const auto &record : page) {
        rows.push_back({record["path"].asString(), record["name"].asString(), MediaText(record)});
        if (status) {
            rows.back().push_back(StatusText(record["additional"]));
        }
    }
    for (const auto &line : Align(rows, output.Width())) {
        output.Line(line);
    }
}

void TellPauses(const Json::Value &page, Output &output) {
    std::set<std::string> shares;
    for (const auto &record : page) {
        shares.insert(ShareOf(record["path"].asString()));
    }
    try {
        shares = PausedShares(shares);
        output.Data()["paused_shares"] = ToArray({shares.begin(), shares.end()});
        for (const auto &share : shares) {
            output.Note(PausedText(share));
        }
    } catch (const Failure &failure) {
        output.Warn(std::string("which shares are paused cannot be told: ") + failure.what());
    }
}

// A share without folders may also be one that is not there.
std::string WhyEmpty(const Arguments &arguments, std::size_t total) {
    if (total > 0) {
        return "no folder on this page";
    }
    if (!arguments.Has("--share")) {
        return "no folder is indexed";
    }
    RequireShare(arguments.One("--share"));
    return "no folder of the share " + Quoted(arguments.One("--share")) + " is indexed";
}

}  // namespace

ExitStatus ListFolders(const Arguments &arguments, Output &output) {
    std::vector<Json::Value> records = Sorted(arguments);
    const std::size_t total = records.size();
    const unsigned long offset = arguments.Number("--offset", 0);
    const std::size_t begin = std::min<std::size_t>(offset, total);
    const std::size_t count = std::min<std::size_t>(arguments.Number("--limit", total), total - begin);

    Json::Value page(Json::arrayValue);
    for (std::size_t i = begin; i < begin + count; ++i) {
        page.append(arguments.Has("--status") ? WithFacts(records[i]) : FolderRecord(records[i]));
    }
    output.Data()["total"] = static_cast<Json::UInt64>(total);
    output.Data()["offset"] = static_cast<Json::UInt64>(offset);
    output.Data()["folder"] = page;
    TellPauses(page, output);
    if (page.empty()) {
        output.Note(WhyEmpty(arguments, total));
        return ExitStatus::kDone;
    }
    if (arguments.Has("--paths")) {
        for (const auto &record : page) {
            const std::string path = record["path"].asString();
            output.Width() > 0 ? output.Line(path) : output.Raw(path + "\n");
        }
        return ExitStatus::kDone;
    }
    ShowTable(page, arguments.Has("--status"), output);
    return ExitStatus::kDone;
}

ExitStatus ShowFolder(const Arguments &arguments, Output &output) {
    const Folders folders = ReadFolders();
    const Folder &folder = RequireFolder(arguments.One("PATH"), folders);
    const Json::Value record = WithFacts(folder.asJson());
    const std::string full = folder.GetFullPath();
    output.Data()["folder"] = record;
    output.Data()["full_path"] = full;
    const std::vector<std::vector<std::string>> rows = {
        {"path", folder.path},
        {"name", folder.name},
        {"media", MediaText(record)},
        {"full path", full.empty() ? "none: the share \"" + ShareOf(folder.path) + "\" is away" : full},
        {"status", StatusText(record["additional"])},
    };
    for (const auto &line : Align(rows, 0)) {
        output.Line(line);
    }
    return ExitStatus::kDone;
}

}  // namespace VORK::FILEINDEXCTL
