#include "command_line/command.h"
#include "command_line/handlers.h"

namespace VORK::FILEINDEXCTL {

namespace {

constexpr std::string_view kSortFields[] = {"path", "name", "document", "audio", "video", "photo"};

constexpr Parameter kMedia = {"--media", Takes::kOne, "KINDS",
                              "what to index: document, audio, video and photo, with commas between; all; none"};
constexpr Parameter kName = {"--name", Takes::kOne, "NAME", "the name that people are shown"};

constexpr Parameter kWait = {
    "--wait", Takes::kNumber, "SECONDS",
    "how long to keep trying while another program holds a lock (default 5; 0 tries once); "
    "then exit status 75"};

constexpr Parameter kList[] = {
    {"--share", Takes::kOne, "SHARE", "only the folders of this share"},
    {"--sort", Takes::kOne, "FIELD", "order by path (if not given), name or a kind of file", kSortFields},
    {"--desc", Takes::kNothing, "", "in descending order"},
    {"--offset", Takes::kNumber, "N", "leave out the first N"},
    {"--limit", Takes::kNumber, "N", "show at most N"},
    {"--status", Takes::kNothing, "", "add how far indexing is; reads the queues"},
    {"--paths", Takes::kNothing, "", "only the paths, as they are, each on a line"},
};
constexpr Parameter kPath = {"PATH", Takes::kOne, "", "the indexed folder: /SHARE/..."};
constexpr Parameter kFolder[] = {kPath};
constexpr Parameter kAdd[] = {
    {"PATH", Takes::kOne, "PLACE", "the folder: /SHARE/..."},
    {"--name", Takes::kOne, "NAME", "the name that people are shown; if not given, the last part of the path"},
    {"--media", Takes::kOne, "KINDS",
     "what to index: document, audio, video and photo, with commas between; all (if not given); none"},
    {"--force", Takes::kNothing, "", "also a folder that is yet to come"},
    kWait,
};
constexpr Parameter kSet[] = {kPath, kName, kMedia, kWait};
constexpr Parameter kYes = {"--yes", Takes::kNothing, "", "delete without asking"};
constexpr Parameter kRemove[] = {
    {"PATH", Takes::kMany, "", "indexed folders"},
    {"--force", Takes::kNothing, "", "also folders whose share is away"},
    kYes,
    kWait,
};
constexpr Parameter kQuestion[] = {{"PATH", Takes::kOne, "ENTRY", "a share path (/SHARE/...) or a full path"}};
constexpr Parameter kPause[] = {
    {"TIME", Takes::kOptional, "", "for how long: 8h or 8, 90m, 1h30m, 2d; 0 or nothing: without an end"},
    {"--until", Takes::kOne, "HH:MM", "until this local time comes next: 07:00 or 7:00"},
    kWait,
    {"--run", Takes::kRest, "COMMAND ...",
     "while this command, the rest of the line, runs; its exit status is kept; SIGKILL leaves the pause behind, "
     "and of several runs at once the first to begin ends it for all"},
};
constexpr Parameter kStatus[] = {
    {"PATH", Takes::kOptional, "", "only this indexed folder"},
    {"--share", Takes::kOne, "SHARE", "only this share"},
    {"--watch", Takes::kNothing, "",
     "show it again and again, with the rate and an estimate; one line for each look when not on a terminal"},
    {"--interval", Takes::kNumber, "SECONDS", "with --watch: how often; 2 if not given"},
};
constexpr Parameter kDoctor[] = {
    {"--fix", Takes::kNothing, "",
     "mend what doctor can: shows each change first and keeps copies of files; configuration that is another's is "
     "given to root, a lock file that is another's is removed and made anew"},
    {"--yes", Takes::kNothing, "", "mend without asking"},
    kWait,
};
constexpr Parameter kReindex[] = {{"PATH", Takes::kMany, "PLACE", "share paths in or of indexed folders"}, kWait};
constexpr Parameter kRevive[] = {{"SHARE", Takes::kMany, "", "names of shares"}, kWait};
constexpr Parameter kShareName = {"SHARE", Takes::kOne, "", "the name of the share"};
constexpr Parameter kShare[] = {kShareName};
constexpr Parameter kShareRename[] = {
    {"OLD", Takes::kOne, "", "the name that the share had"},
    {"NEW", Takes::kOne, "", "the name that the share has now"},
    {"--yes", Takes::kNothing, "",
     "without asking, overwrite settings of folders that are indexed under both names"},
    kWait,
};
constexpr Parameter kShareRemove[] = {kShareName, kYes, kWait};
constexpr Parameter kShareClean[] = {kShareName, kYes};
constexpr Parameter kOneShare = {"SHARE", Takes::kOptional, "", "only this share"};
constexpr Parameter kMonitorShow[] = {kOneShare};
constexpr Parameter kMonitorRefresh[] = {kOneShare, kWait};
constexpr Parameter kResume[] = {kWait};
constexpr Parameter kQueueShow[] = {kOneShare, {"--limit", Takes::kNumber, "N", "show at most N events"}};
constexpr Parameter kQueueCount[] = {kOneShare};
constexpr std::string_view kShells[] = {"bash", "zsh", "fish"};
constexpr Parameter kCompletion[] = {{"SHELL", Takes::kOne, "", "the shell that reads it", kShells}};
constexpr Parameter kHelpWords[] = {
    {"COMMAND", Takes::kOptional, "", "the command, or the first word of one that has two"},
    {"WORD", Takes::kOptional, "", "its second word"},
};
constexpr Parameter kOffer[] = {
    {"--line", Takes::kRest, "WORD ...", "the words so far; the last is the one to complete"}};
constexpr Parameter kExport[] = {
    {"--output", Takes::kOne, "FILE", "write this file, whole or not at all", {}, "-o"},
};
constexpr Parameter kImport[] = {
    {"FILE", Takes::kOne, "", "what \"export\" wrote; - is the standard input"},
    {"--dry-run", Takes::kNothing, "", "only say what would be done"},
    {"--replace", Takes::kNothing, "", "also remove the folders that are not in the file"},
    kYes,
    kWait,
};
constexpr Parameter kMigrate[] = {
    {"--dry-run", Takes::kNothing, "", "only say what would be done"},
    {"--yes", Takes::kNothing, "", "also go on with shares that are paused, without asking"},
};

constexpr struct {
    std::string_view name;
    std::string_view help;
} kGroups[] = {{"share", "Keep the index in step with a share"},
               {"monitor", "What is watched for changes"},
               {"queue", "What waits for fileindexd"}};

constexpr Command kCommands[] = {
    {"", "list", "Show the indexed folders", kList, ListFolders},
    {"", "show", "Show one indexed folder", kFolder, ShowFolder},
    {"", "add", "Have a folder indexed; the first folder restarts the file-sharing service", kAdd, AddFolder},
    {"", "set", "Change an indexed folder; without options, tell everybody about it again", kSet, SetFolder},
    {"", "remove", "Stop indexing folders; the last one restarts the file-sharing service", kRemove,
     RemoveFolders},
    {"", "check", "Would the path be found in the index? If not, exit status 1 and the reason", kQuestion,
     CheckPath},
    {"", "contains", "Does an indexed folder lie at or under the path?", kQuestion, ContainsFolder},
    {"", "governs", "Which indexed folders cover the path, and whose settings hold for it?", kQuestion,
     GoverningFolder},
    {"", "explain", "Why a path is indexed or not, rule by rule; exit status 1 if it may not be", kQuestion,
     ExplainPath},
    {"", "status", "How far indexing is, and what waits", kStatus, ShowStatus},
    {"", "doctor", "Find out what is wrong; --fix mends it; exit status 1 while something is (notes do not count)",
     kDoctor, ExamineSystem},
    {"", "pause", "Pause indexing", kPause, PauseIndexing},
    {"", "resume", "Go on with indexing", kResume, ResumeIndexing},
    {"", "reindex", "Have paths indexed again", kReindex, ReindexPaths},
    {"", "revive", "Go on with shares that were out of space", kRevive, ReviveShares},
    {"share", "rename", "Move the indexed folders of a share that was renamed", kShareRename, RenameShare},
    {"share", "remove", "Forget the indexed folders of a share; the last one restarts the file-sharing service",
     kShareRemove, RemoveShare},
    {"share", "pause", "Stop the worker and the monitor of a share", kShare, PauseShare},
    {"share", "resume", "Start the monitor and the worker of a share again", kShare, ResumeShare},
    {"share", "clean", "Delete the queue and the index database of a share", kShareClean, CleanShare},
    {"monitor", "show", "Compare what is watched with what should be", kMonitorShow, ShowMonitor},
    {"monitor", "refresh", "Register what should be watched; a paused share only when it is named",
     kMonitorRefresh, RefreshMonitors},
    {"queue", "show", "Show the events that wait, the oldest first", kQueueShow, ShowQueue},
    {"queue", "count", "Count the events that wait", kQueueCount, CountQueue},
    {"", "metrics", "Write what can be measured in the text format of Prometheus", {}, ShowMetrics},
    {"", "export", "Write folders and status as one JSON document", kExport, ExportConfiguration},
    {"", "import", "Bring folders and status into the state that a document holds", kImport, ImportConfiguration},
    {"", "completion", "Write what completes command lines in a shell", kCompletion, WriteCompletion},
    {"", "help", "Show what there is, or what a command takes", kHelpWords, ShowHelp},
    {"", "manual", "Write the manual page", {}, WriteManual, true},
    {"", "offer", "Write the words that may follow on a command line", kOffer, OfferWords, true},
    {"", "migrate",
     "Bring everything into line with the folders after an upgrade; switches search on; the file-sharing service "
     "learns of it at its next start",
     kMigrate, Migrate},
};

}  // namespace

std::span<const Command> Commands() {
    return kCommands;
}

std::string FullName(const Command &command) {
    return (command.group.empty() ? "" : std::string(command.group) + " ") + std::string(command.name);
}

std::string_view HelpOfGroup(std::string_view group) {
    for (const auto &row : kGroups) {
        if (row.name == group) {
            return row.help;
        }
    }
    return {};
}

}  // namespace VORK::FILEINDEXCTL
