#include "command.h"
#include "handlers.h"

#include <array>

namespace fileindexctl {

namespace {

constexpr std::string_view kSortFields[] = {"path", "name", "document", "audio", "video", "photo"};

constexpr Parameter kMedia = {"--media", Arity::One, "KINDS",
                              "what to index: document, audio, video and photo, with commas between; all; none"};
constexpr Parameter kName = {"--name", Arity::One, "NAME", "the name that people are shown"};

constexpr Parameter kList[] = {
    {"--share", Arity::One, "SHARE", "only the folders of this share"},
    {"--sort", Arity::One, "FIELD", "order by path (if not given), name or a kind of file", false, kSortFields},
    {"--desc", Arity::Flag, "", "in descending order"},
    {"--offset", Arity::One, "N", "leave out the first N", true},
    {"--limit", Arity::One, "N", "show at most N", true},
    {"--status", Arity::Flag, "", "add how far indexing is; reads the queues"},
};
constexpr Parameter kFolder[] = {{"PATH", Arity::One, "", "the indexed folder: /SHARE/..."}};
constexpr Parameter kAdd[] = {
    {"PATH", Arity::One, "", "the folder: /SHARE/..."},
    {"--name", Arity::One, "NAME", "the name that people are shown; if not given, the last part of the path"},
    {"--media", Arity::One, "KINDS",
     "what to index: document, audio, video and photo, with commas between; all (if not given); none"},
};
constexpr Parameter kSet[] = {{"PATH", Arity::One, "", "the indexed folder: /SHARE/..."}, kName, kMedia};
constexpr Parameter kQuestion[] = {{"PATH", Arity::One, "", "a share path (/SHARE/...) or a full path"}};
constexpr Parameter kPause[] = {
    {"HOURS", Arity::Optional, "", "for how long: 8h or 8; 0 or nothing: without an end"},
    {"--until", Arity::One, "HH:MM", "until this local time comes next"},
};

constexpr Command kCommands[] = {
    {"", "list", "Show the indexed folders", kList, ListFolders},
    {"", "show", "Show one indexed folder", kFolder, ShowFolder},
    {"", "add", "Have a folder indexed", kAdd, AddFolder},
    {"", "set", "Change an indexed folder; without options, tell everybody about it again", kSet, SetFolder},
    {"", "check", "Is the path indexed?", kQuestion, CheckPath},
    {"", "pause", "Pause indexing", kPause, PauseIndexing},
    {"", "resume", "Go on with indexing", {}, ResumeIndexing},
};

}  // namespace

std::span<const Command> Commands() {
    return kCommands;
}

std::span<const Group> Groups() {
    return {};
}

}  // namespace fileindexctl
