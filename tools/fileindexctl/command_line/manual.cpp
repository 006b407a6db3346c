// The manual page in mdoc, made from the command table.
#include "command_line/command.h"
#include "command_line/completion.h"
#include "command_line/handlers.h"
#include "report/exit_status.h"

namespace VORK::FILEINDEXCTL {

namespace {

constexpr const char *kHead = R"(.Dd November 22, 2026
.Dt FILEINDEXCTL 1
.Os libfileindex
.Sh NAME
.Nm fileindexctl
.Nd which folders are indexed, and how far indexing is
.Sh SYNOPSIS
.Nm
.Op Fl -json
.Ar command
.Op Ar argument ...
.Nm
.Fl -help | Fl -version
.Sh DESCRIPTION
The daemon fileindexd builds a search index of the files in a server's shares.
.Nm
tells it which folders to index, pauses it, says how far it has got and why a file is not found.
.Pp
A folder is named by its share path, which begins with the name of the share:
.Pa /photo/2015
lies in the share
.Dq photo .
The questions
.Cm check , contains , governs
and
.Cm explain
also take full paths,
.Pa /vol1/photo/2015 .
.Pp
.Cm check
looks at the folder whose settings hold, at the rules that
.Cm explain
shows, at the way down from that folder, and at the kind of the file, which is told from the extension of its name; a file
of none of the four kinds is known by its name only.
.Cm governs
compares the text of paths and nothing else, as the library does.
.Pp
A change is saved first, then everybody is told.
Each step is listed with what became of it; when a step fails, the steps after it are not reached, and the message says how
to go on.
What deletes or overwrites asks first on a terminal, and needs
.Fl -yes
without one.
.Pp
With the first folder, search is switched on in the file-sharing service, with the last one off, and the service is
restarted for it.
A line on the standard error says so before it is done.
.Pp
Data goes to the standard output, everything else to the standard error.
Each command takes these:
.Bl -tag -width Ds
.It Fl -json
Write one JSON document to the standard output:
.Ql {\(dqschema\(dq: 1, \(dqok\(dq: true, \(dqdata\(dq: {...}, \(dqwarnings\(dq: [...]} .
.It Fl -help
Show what the command takes.
.El
.Sh COMMANDS
.Bl -tag -width Ds
)";

constexpr const char *kSurroundings = R"(.Sh THE EXPORTED DOCUMENT
What
.Cm export
writes is one JSON object:
.Bl -tag -width "version"
.It Cm version
The number 1.
.It Cm folder
As in
.Xr fileindex-folder.conf 5 .
.It Cm status
As in
.Xr fileindex-status.conf 5 ;
a pause that has ended is written as none.
.El
.Pp
.Cm import
takes this document, and also what
.Cm export Fl -json
writes.
It checks all of it before anything is changed, and names the member at fault.
Of a record, what is absent is empty or false; a part of the document that is absent is not touched; a member that nobody
knows, or that is given twice, is refused.
.Pp
Folders that are new or differ are saved and announced as by
.Cm add
and
.Cm set .
Folders that the document lacks stay, unless
.Fl -replace
is given: then they are removed as by
.Cm remove .
The status is brought into the state of the document: marking a share as out of space notifies the administrators, taking
the mark back revives the share, and markers are set, but none is taken back.
What is so already is not done again, so a second import does nothing.
After a failure in the middle,
.Cm migrate
tells everybody again what is saved.
.Sh ENVIRONMENT
.Bl -tag -width NO_COLOR
.It Ev NO_COLOR
If set and not empty, nothing is coloured on a terminal.
.It Ev TERM
If unset or
.Ql dumb ,
nothing is coloured on a terminal, and
.Fl -watch
writes lines.
.It Ev TZ
The time zone in which times are read and shown.
.El
.Sh FILES
.Bl -tag -width Ds
.It Pa /usr/vork/etc/fileindex/folder.conf
The indexed folders.
.It Pa /usr/vork/etc/fileindex/status.conf
The pause, and the flags of shares.
.It Pa /tmp/fileidx_cfg_folder.lock , Pa /tmp/fileidx_cfg_status.lock
Their locks.
.It Pa SHARE/@eaDir/VORK@file_index_queue
The event queue of a share.
.It Pa /var/run/fileindexd.sock
The socket of the daemon.
.It Pa /usr/vork/etc/platform.conf
The shares (Linux platform only).
.It Pa /usr/vork/etc/vorknotifyd/registrations.json
What is watched for changes (Linux platform only).
.El
)";

constexpr const char *kTail = R"(.Sh EXAMPLES
Have a folder indexed, photos and films only:
.Pp
.Dl fileindexctl add /photo/2015 --name Holiday --media photo,video
.Pp
Pause until the next morning:
.Pp
.Dl fileindexctl pause --until 07:00
.Pp
Pause while something else needs the disks; 127 means that it was not found, 126 that it could not be run:
.Pp
.Dl fileindexctl pause --run backup --all
.Pp
Move the configuration to another machine; the first command on it only looks:
.Pp
.Dl fileindexctl export -o fileindex.json
.Dl fileindexctl import fileindex.json --dry-run
.Dl fileindexctl import fileindex.json --replace
.Pp
Hand the metrics to a collector that reads files:
.Pp
.Dl fileindexctl metrics > fileindex.prom.new &&
.Dl mv fileindex.prom.new fileindex.prom
.Pp
Complete command lines in this shell:
.Pp
.Dl source <(fileindexctl completion bash)
.Sh SEE ALSO
.Xr libfileindex 3 ,
.Xr fileindex-folder.conf 5 ,
.Xr fileindex-platform.conf 5 ,
.Xr fileindex-queue 5 ,
.Xr fileindex-status.conf 5 ,
.Xr fileindex-daemon 7
)";

// No word is taken for a request or a macro, nor a dash for a hyphen.
std::string Escaped(std::string_view text) {
    std::string result;
    for (const char character : text) {
        switch (character) {
            case '\\':
                result += "\\e";
                break;
            case '-':
                result += "\\-";
                break;
            case '"':
                result += "\\(dq";
                break;
            default:
                result += character;
        }
    }
    return result;
}

// A sentence on a line of its own, as it stands in the table: without a full stop, unless it has parts.
std::string Sentence(std::string_view text) {
    const bool closed = text.ends_with('.') || text.ends_with('?');
    const char first = text.empty() ? ' ' : text.front();
    return std::string(first == '.' || first == '\'' ? "\\&" : "") + Escaped(text) + (closed ? "\n" : ".\n");
}

std::string Capital(std::string_view text) {
    std::string result(text);
    if (!result.empty() && result.front() >= 'a' && result.front() <= 'z') {
        result.front() = static_cast<char>(result.front() - 'a' + 'A');
    }
    return result;
}

std::string Option(const Parameter &parameter) {
    const std::string value = parameter.value.empty() ? "" : " Ar " + std::string(parameter.value);
    const std::string letter =
        parameter.letter.empty() ? "" : "Fl " + std::string(parameter.letter.substr(1)) + value + " , ";
    return letter + "Fl -" + std::string(parameter.name.substr(2)) + value;
}

std::string Synopsis(const Command &command) {
    std::string line = ".It Cm " + FullName(command);
    for (const auto &parameter : command.parameters) {
        if (parameter.IsOption()) {
            Parameter shown = parameter;
            shown.letter = {};
            line += " Oo " + Option(shown) + " Oc";
            continue;
        }
        line += parameter.IsRequired() ? " Ar " : " Oo Ar ";
        line += parameter.name;
        line += parameter.takes == Takes::kMany ? " ..." : "";
        line += parameter.IsRequired() ? "" : " Oc";
    }
    return line + "\n";
}

std::string Section(const Command &command) {
    std::string text = Synopsis(command) + Sentence(command.help);
    if (command.parameters.empty()) {
        return text;
    }
    text += ".Bl -tag -width Ds -compact\n";
    for (const auto &parameter : command.parameters) {
        text += ".It " + (parameter.IsOption() ? Option(parameter) : "Ar " + std::string(parameter.name)) + "\n";
        text += Sentence(Capital(parameter.help));
        std::string choices;
        for (const auto &choice : parameter.choices) {
            choices += (choices.empty() ? "" : ", ") + std::string(choice);
        }
        text += choices.empty() ? "" : "One of " + choices + ".\n";
    }
    return text + ".El\n";
}

}  // namespace

ExitStatus WriteManual(const Arguments & /*arguments*/, Output &output) {
    std::string page = kHead;
    for (const Command *command : OfferedCommands()) {
        page += Section(*command);
    }
    page += ".El\n" + std::string(kSurroundings) + ".Sh EXIT STATUS\n.Bl -tag -width Ds -compact\n";
    for (const auto &meaning : ExitMeanings()) {
        page += ".It " + std::to_string(static_cast<int>(meaning.status)) + "\n" + Sentence(meaning.sentence);
    }
    page += ".El\n" + std::string(kTail);
    output.Data()["page"] = page;
    output.Raw(page);
    return ExitStatus::kDone;
}

}  // namespace VORK::FILEINDEXCTL
