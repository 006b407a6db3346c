/// \file
/// Where a command's results go: lines for people, or one JSON document for programs.
///
/// Data goes to stdout, everything else to stderr. The document is
/// {"schema": 1, "ok": BOOL, "data": ..., "warnings": [TEXT, ...]}; after a failure "data" holds what was done and
/// {"error": {"status": N, "message": TEXT}}. A question that is answered "no" is ok.
///
/// What people read is made printable here, whether on a terminal or not: names of files and texts of other
/// programs may hold what a terminal obeys.
#pragma once

#include "report/exit_status.h"
#include "report/json.h"
#include "report/text.h"

#include <string>
#include <string_view>
#include <vector>

namespace VORK::FILEINDEXCTL {

enum class Colour { kPlain, kGood, kBad, kDim };

class Output {
public:
    explicit Output(bool json);

    bool IsJson() const { return json_; }

    /// The width of the terminal on stdout, 0 when it is none: then nothing is shortened or coloured.
    unsigned Width() const { return width_; }

    /// One line of data for people, coloured when stdout is a terminal that can do it and the user did not forbid
    /// it; left out of JSON.
    void Line(const std::string &text, Colour colour = Colour::kPlain);

    /// A table with a head, not wider than the terminal.
    void Table(const Rows &rows);

    /// Names and what stands for them, left whole.
    void Facts(const Rows &rows);

    /// Has the lines so far shown, before a question. False when they cannot be written.
    bool Flush();

    /// For a command that goes on and on: ends one of its samples, in JSON a document of its own on one line. The
    /// data begin anew, and no document is written at the end. False as above.
    bool EndSample();

    /// Data for other programs in a form of its own, every byte as it is; left out of JSON.
    void Raw(std::string_view text);

    /// What programs get as "data"; not shown to people.
    Json::Value &Data() { return data_; }

    /// Something the user should know although the command goes on.
    void Warn(const std::string &text);

    /// A remark for people on stderr; left out of JSON.
    void Note(const std::string &text);

    /// Why the command failed.
    void Error(ExitStatus status, const std::string &text);

    /// The status to end with: unless it is kDone, says why.
    ExitStatus Conclude(ExitStatus status, const std::string &trouble);

    /// Writes the document and makes sure that everything has left; the status to end with.
    ExitStatus Finish(ExitStatus status);

private:
    void PrintDocument(ExitStatus status);

    bool json_;
    bool sampled_ = false;
    bool colour_;
    unsigned width_;
    Json::Value data_;
    std::vector<std::string> warnings_;
};

}  // namespace VORK::FILEINDEXCTL
