// "metrics": the state as Prometheus reads it.
#include "facts/configuration.h"
#include "facts/daemon.h"
#include "facts/queue.h"
#include "report/gaps.h"
#include "verbs/verb.h"

#include <map>
#include <utility>

namespace VORK::FILEINDEXCTL {

namespace {

using Labels = std::vector<std::pair<const char *, std::string>>;

struct Metric {
    std::string name;
    const char *help;
    std::vector<std::pair<Labels, long long>> samples{};
};

class Metrics {
public:
    template <typename Value>
    void Add(std::string_view name, const Labels &labels, Value value) {
        const auto found =
            std::find_if(list_.begin(), list_.end(), [&](const Metric &metric) { return metric.name == name; });
        found->samples.emplace_back(labels, static_cast<long long>(value));
    }

    const std::vector<Metric> &All() const { return list_; }

private:
    // Points in time rather than ages, which would be wrong as soon as they are stored.
    std::vector<Metric> list_ = {
        {"fileindex_folders", "Indexed folders."},
        {"fileindex_share_present", "Whether the share is there (1) or away (0)."},
        {"fileindex_share_no_space", "Whether the share is marked as out of space."},
        {"fileindex_share_need_reindex", "Whether the share waits to be reindexed whole."},
        {"fileindex_queue_events", "Events that wait for fileindexd."},
        {"fileindex_queue_malformed_lines", "Lines of the queue that are no events."},
        {"fileindex_queue_taken", "Whether an earlier queue, taken away, lies beside the queue."},
        {"fileindex_queue_oldest_timestamp_seconds",
         "When the oldest event was queued; time() minus this is its age."},
        {"fileindex_paused", "Whether indexing is paused."},
        {"fileindex_pause_end_timestamp_seconds", "When the pause ends, if it has an end."},
        {"fileindex_daemon_up", "Whether fileindexd accepts connections."},
    };
};

void MeasureQueue(const std::string &share, const Backlog &backlog, Metrics &metrics) {
    // Few values, whatever stands in a queue: each would be a time series of its own.
    std::map<std::string, unsigned long> kinds = {{"other", backlog.Total()}};
    for (const unsigned type : {kReindexEvent, kSettingEvent, kRenameEvent}) {
        const auto found = backlog.events.find(type);
        const unsigned long count = found == backlog.events.end() ? 0 : found->second;
        kinds[EventName(type)] = count;
        kinds["other"] -= count;
    }
    for (const auto &[kind, count] : kinds) {
        metrics.Add("fileindex_queue_events", {{"share", share}, {"event", kind}}, count);
    }
    const Labels label = {{"share", share}};
    metrics.Add("fileindex_queue_malformed_lines", label, backlog.malformed);
    metrics.Add("fileindex_queue_taken", label, backlog.hasTemporary);
    if (backlog.oldest) {
        metrics.Add("fileindex_queue_oldest_timestamp_seconds", label, *backlog.oldest);
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
    metrics.Add("fileindex_share_present", {{"share", share}}, isPresent);
}

Metrics Measure(Gaps &gaps) {
    Metrics metrics;
    const StatusSettings status = StoredStatus();
    std::map<std::string, long long> shares;
    for (const auto &folder : ReadFolders()) {
        ++shares[ShareOf(folder.path)];
    }
    for (const auto &[share, count] : shares) {
        metrics.Add("fileindex_folders", {{"share", share}}, count);
        MeasureShare(share, metrics, gaps);
    }
    for (const auto *flagged : {&status.noSpace, &status.needReindex}) {
        for (const auto &share : *flagged) {
            shares.try_emplace(share, 0);
        }
    }
    for (const auto &[share, count] : shares) {
        metrics.Add("fileindex_share_no_space", {{"share", share}}, status.noSpace.count(share));
        metrics.Add("fileindex_share_need_reindex", {{"share", share}}, status.needReindex.count(share));
    }
    metrics.Add("fileindex_paused", {}, status.resumeTime >= 0);
    if (status.resumeTime > 0) {
        metrics.Add("fileindex_pause_end_timestamp_seconds", {}, status.resumeTime);
    }
    if (const auto listens = ProbeDaemon().listens) {
        metrics.Add("fileindex_daemon_up", {}, *listens);
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

void Show(const Metric &metric, Output &output) {
    output.Line("# HELP " + metric.name + " " + metric.help);
    output.Line("# TYPE " + metric.name + " gauge");
    Json::Value samples(Json::arrayValue);
    for (const auto &[labels, value] : metric.samples) {
        std::string text;
        Json::Value object(Json::objectValue);
        for (const auto &[name, label] : labels) {
            text += (text.empty() ? "{" : ",") + std::string(name) + "=\"" + LabelText(label) + "\"";
            object[name] = label;
        }
        output.Line(metric.name + text + (text.empty() ? " " : "} ") + std::to_string(value));
        samples.append(ToObject({{"labels", object}, {"value", ToNumber(value)}}));
    }
    output.Data()["metric"].append(
        ToObject({{"name", metric.name}, {"type", "gauge"}, {"help", metric.help}, {"sample", samples}}));
}

}  // namespace

ExitStatus ShowMetrics(const Arguments & /*arguments*/, Output &output) {
    Gaps gaps;
    const Metrics metrics = Measure(gaps);
    for (const auto &metric : metrics.All()) {
        if (!metric.samples.empty()) {
            Show(metric, output);
        }
    }
    return gaps.Report(output);
}

}  // namespace VORK::FILEINDEXCTL
