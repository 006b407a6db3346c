#include "command_line/handlers.h"
#include "facts/configuration.h"
#include "facts/daemon.h"
#include "facts/paths.h"
#include "facts/queue.h"
#include "report/gaps.h"
#include "report/text.h"

#include <algorithm>
#include <map>
#include <utility>
#include <vector>

namespace VORK::FILEINDEXCTL {

namespace {

using Labels = std::vector<std::pair<const char *, std::string>>;

struct Metric {
    const char *name;
    const char *help;
    std::vector<std::pair<Labels, long long>> samples{};

    void Add(const Labels &labels, long long value) { samples.emplace_back(labels, value); }
};

// Points in time rather than ages, which would be wrong as soon as they are stored.
struct Metrics {
    Metric folders = {"fileindex_folders", "Indexed folders."};
    Metric present = {"fileindex_share_present", "Whether the share is there (1) or away (0)."};
    Metric noSpace = {"fileindex_share_no_space", "Whether the share is marked as out of space."};
    Metric needReindex = {"fileindex_share_need_reindex", "Whether the share waits to be reindexed whole."};
    Metric events = {"fileindex_queue_events", "Events that wait for fileindexd."};
    Metric malformed = {"fileindex_queue_malformed_lines", "Lines of the queue that are no events."};
    Metric taken = {"fileindex_queue_taken", "Whether an earlier queue, taken away, lies beside the queue."};
    Metric oldest = {"fileindex_queue_oldest_timestamp_seconds",
                     "When the oldest event was queued; time() minus this is its age."};
    Metric paused = {"fileindex_paused", "Whether indexing is paused."};
    Metric pauseEnd = {"fileindex_pause_end_timestamp_seconds", "When the pause ends, if it has an end."};
    Metric daemon = {"fileindex_daemon_up", "Whether fileindexd accepts connections."};

    std::vector<const Metric *> All() const {
        return {&folders, &present, &noSpace, &needReindex, &events, &malformed,
                &taken,   &oldest,  &paused,  &pauseEnd,    &daemon};
    }
};

// Few values, whatever stands in a queue: each would be a time series of its own.
const char *KindOf(unsigned type) {
    switch (type) {
        case kReindexEvent:
            return "reindex";
        case kSettingEvent:
            return "settings";
        case kRenameEvent:
            return "rename";
        default:
            return "other";
    }
}

void MeasureQueue(const std::string &share, const Backlog &backlog, Metrics &metrics) {
    const Labels label = {{"share", share}};
    std::map<std::string, long long> kinds = {{"reindex", 0}, {"settings", 0}, {"rename", 0}, {"other", 0}};
    for (const auto &[type, count] : backlog.events) {
        kinds[KindOf(type)] += static_cast<long long>(count);
    }
    for (const auto &[kind, count] : kinds) {
        metrics.events.Add({{"share", share}, {"event", kind}}, count);
    }
    metrics.malformed.Add(label, static_cast<long long>(backlog.malformed));
    metrics.taken.Add(label, backlog.hasTemporary ? 1 : 0);
    if (backlog.oldest) {
        metrics.oldest.Add(label, *backlog.oldest);
    }
}

void MeasureShare(const std::string &share, Metrics &metrics, Gaps &gaps) {
    bool isPresent = true;
    try {
        const auto backlog = ReadBacklog(share, "");
        isPresent = backlog.has_value();
        if (backlog) {
            MeasureQueue(share, *backlog, metrics);
        }
    } catch (const Failure &failure) {
        gaps.AddQueue(share, failure);
    }
    metrics.present.Add({{"share", share}}, isPresent ? 1 : 0);
}

Metrics Measure(Gaps &gaps) {
    Metrics metrics;
    const StatusSettings status = StoredStatus();
    std::map<std::string, long long> shares;
    for (const auto &folder : ReadFolders()) {
        ++shares[ShareOf(folder.path)];
    }
    for (const auto &[share, count] : shares) {
        metrics.folders.Add({{"share", share}}, count);
        MeasureShare(share, metrics, gaps);
    }
    for (const auto *flagged : {&status.noSpace, &status.needReindex}) {
        for (const auto &share : *flagged) {
            shares.try_emplace(share, 0);
        }
    }
    for (const auto &[share, count] : shares) {
        metrics.noSpace.Add({{"share", share}}, static_cast<long long>(status.noSpace.count(share)));
        metrics.needReindex.Add({{"share", share}}, static_cast<long long>(status.needReindex.count(share)));
    }
    metrics.paused.Add({}, status.resumeTime >= 0 ? 1 : 0);
    if (status.resumeTime > 0) {
        metrics.pauseEnd.Add({}, status.resumeTime);
    }
    if (const auto listens = ProbeDaemon().listens) {
        metrics.daemon.Add({}, *listens ? 1 : 0);
    }
    return metrics;
}

// A server would refuse the whole page for one value that is not UTF-8, and people look at it too.
std::string LabelText(const std::string &value) {
    std::string text;
    for (std::size_t begin = 0; begin <= value.size();) {
        const std::size_t end = std::min(value.find('\n', begin), value.size());
        for (const char character : Printable(value.substr(begin, end - begin))) {
            text += character == '\\' || character == '"' ? "\\" : "";
            text += character;
        }
        text += end < value.size() ? "\\n" : "";
        begin = end + 1;
    }
    return text;
}

std::string SampleText(const Metric &metric, const Labels &labels, long long value) {
    std::string text;
    for (const auto &[name, label] : labels) {
        text += (text.empty() ? "{" : ",") + std::string(name) + "=\"" + LabelText(label) + "\"";
    }
    return metric.name + text + (text.empty() ? " " : "} ") + std::to_string(value);
}

void Show(const Metric &metric, Output &output) {
    const std::string name = metric.name;
    output.Line("# HELP " + name + " " + metric.help);
    output.Line("# TYPE " + name + " gauge");
    Json::Value entry(Json::objectValue);
    entry["name"] = name;
    entry["type"] = "gauge";
    entry["help"] = metric.help;
    for (const auto &[labels, value] : metric.samples) {
        output.Line(SampleText(metric, labels, value));
        Json::Value sample(Json::objectValue);
        sample["labels"] = Json::Value(Json::objectValue);
        for (const auto &[label, text] : labels) {
            sample["labels"][label] = text;
        }
        sample["value"] = static_cast<Json::Int64>(value);
        entry["sample"].append(sample);
    }
    output.Data()["metric"].append(entry);
}

}  // namespace

ExitStatus ShowMetrics(const Arguments & /*arguments*/, Output &output) {
    Gaps gaps;
    const Metrics metrics = Measure(gaps);
    for (const Metric *metric : metrics.All()) {
        if (!metric->samples.empty()) {
            Show(*metric, output);
        }
    }
    return gaps.Report(output);
}

}  // namespace VORK::FILEINDEXCTL
