// "list" and "show".
#include "facts/queue_files.h"
#include "facts/registrations.h"
#include "report/folder_text.h"
#include "verbs/verb.h"

#include <limits>

namespace VORK::FILEINDEXCTL {

namespace {

// All folders in the order asked for. The library is asked for everything and the page is cut here, because its
// descending order leaves the offset out and because it knows no filter by share.
std::vector<Json::Value> Sorted(const Arguments &arguments) {
    Json::Value page;
    ForgetErrors();
    const Json::Value nothingMore(Json::arrayValue);
    if (!IndexMgr::List(page, 0, std::numeric_limits<unsigned long>::max(), arguments.One("--sort"),
                        arguments.Has("--desc") ? "DESC" : "ASC", nothingMore)) {
        throw FailureOf(FILEINDEX::Folders());
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
Json::Value WithFacts(const Json::Value &record) {
    Folder folder;
    folder.Load(record["path"].asString(), record);
    Json::Value result = folder.asJson(ToArray({"status", "is_valid"}));
    Json::Value &status = result["additional"]["status"];
    if (status == "finished" && !IsQueueReadable(ShareOf(folder.path))) {
        status = Json::Value();  // the library takes a queue that it may not read for none
    }
    return result;
}

void TellPauses(const Json::Value &page, Output &output) try {
    const auto shares = PausedShares(SharesOf(PathsOf(page)));
    output.Data()["paused_shares"] = ToArray(shares);
    for (const auto &share : shares) {
        output.Note(PausedText(share));
    }
} catch (const Failure &failure) {
    output.Warn(std::string("which shares are paused cannot be told: ") + failure.what());
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

void ShowPaths(const Json::Value &page, Output &output) {
    for (const auto &path : PathsOf(page)) {
        output.Width() > 0 ? output.Line(path) : output.Raw(path + "\n");
    }
}

void ShowTable(const Json::Value &page, bool status, Output &output) {
    Rows rows = {{"PATH", "NAME", "MEDIA"}};
    if (status) {
        rows.front().emplace_back("STATUS");
    }
    for (const auto &record : page) {
        rows.push_back({record["path"].asString(), record["name"].asString(), MediaText(record)});
        if (status) {
            rows.back().push_back(StatusText(record["additional"]));
        }
    }
    output.Table(rows);
}

}  // namespace

ExitStatus ListFolders(const Arguments &arguments, Output &output) {
    const std::vector<Json::Value> records = Sorted(arguments);
    const bool status = arguments.Has("--status");
    const unsigned long offset = arguments.Number("--offset", 0);
    const std::size_t begin = std::min<std::size_t>(offset, records.size());
    const std::size_t count =
        std::min<std::size_t>(arguments.Number("--limit", records.size()), records.size() - begin);
    Json::Value page(Json::arrayValue);
    for (std::size_t i = begin; i < begin + count; ++i) {
        page.append(status ? WithFacts(records[i]) : FolderRecord(records[i]));
    }
    output.Data() =
        ToObject({{"total", ToNumber(records.size())}, {"offset", ToNumber(offset)}, {"folder", page}});
    TellPauses(page, output);
    if (page.empty()) {
        output.Note(WhyEmpty(arguments, records.size()));
    } else if (arguments.Has("--paths")) {
        ShowPaths(page, output);
    } else {
        ShowTable(page, status, output);
    }
    return ExitStatus::kDone;
}

ExitStatus ShowFolder(const Arguments &arguments, Output &output) {
    const Folders folders = ReadFolders();
    const Folder &folder = RequireFolder(arguments.One("PATH"), folders);
    const Json::Value record = WithFacts(folder.asJson());
    const std::string full = folder.GetFullPath();
    output.Data() = ToObject({{"folder", record}, {"full_path", full}});
    output.Facts({
        {"path", folder.path},
        {"name", folder.name},
        {"media", MediaText(record)},
        {"full path", full.empty() ? "none: the share \"" + ShareOf(folder.path) + "\" is away" : full},
        {"status", StatusText(record["additional"])},
    });
    return ExitStatus::kDone;
}

}  // namespace VORK::FILEINDEXCTL
