#include "report/output.h"

#include "base/json/document.h"
#include "report/screen.h"

#include <unistd.h>

#include <cstdio>
#include <cstdlib>

namespace VORK::FILEINDEXCTL {

namespace {

bool MayColour() {
    const char *noColour = std::getenv("NO_COLOR");
    return Screen::IsUsable() && (noColour == nullptr || *noColour == '\0');
}

void Print(std::FILE *stream, std::string_view text) {
    std::fwrite(text.data(), 1, text.size(), stream);
}

void Complain(std::string_view kind, const std::string &text) {
    std::fflush(stdout);  // so that a log that takes both streams keeps their order
    Print(stderr, "fileindexctl: " + std::string(kind) + Printable(text) + "\n");
}

}  // namespace

Output::Output(bool json)
    : json_(json),
      colour_(MayColour()),
      width_(isatty(STDOUT_FILENO) != 0 ? Screen::Width() : 0),
      data_(Json::objectValue) {}

void Output::Line(const std::string &text, Colour colour) {
    static constexpr const char *kCodes[] = {"", "\033[32m", "\033[31m", "\033[2m"};
    const bool painted = colour_ && colour != Colour::kPlain;
    Raw((painted ? kCodes[static_cast<int>(colour)] : "") + Printable(text) + (painted ? "\033[0m\n" : "\n"));
}

void Output::Raw(std::string_view text) {
    if (!json_) {
        Print(stdout, text);
    }
}

void Output::Table(const Rows &rows) {
    for (const auto &line : Align(rows, width_)) {
        Line(line);
    }
}

void Output::Facts(const Rows &rows) {
    for (const auto &line : Align(rows, 0)) {
        Line(line);
    }
}

bool Output::Flush() {
    return std::fflush(stdout) == 0 && std::ferror(stdout) == 0;
}

bool Output::EndSample() {
    if (json_) {
        PrintDocument(ExitStatus::kDone);
        data_ = Json::Value(Json::objectValue);
        warnings_.clear();
    }
    sampled_ = true;
    return Flush();
}

void Output::PrintDocument(ExitStatus status) {
    Json::Value document(Json::objectValue);
    document["schema"] = 1;
    document["ok"] = status == ExitStatus::kDone || (status == ExitStatus::kNo && !data_.isMember("error"));
    document["data"] = data_;
    document["warnings"] = ToArray(warnings_);
    Print(stdout, FormatDocument(document, ""));
}

void Output::Warn(const std::string &text) {
    warnings_.push_back(text);
    Complain("warning: ", text);
}

void Output::Note(const std::string &text) {
    if (!json_) {
        Complain("", text);
    }
}

void Output::Error(ExitStatus status, const std::string &text) {
    data_["error"]["status"] = static_cast<int>(status);
    data_["error"]["message"] = text;
    Complain("", text);
}

ExitStatus Output::Conclude(ExitStatus status, const std::string &trouble) {
    if (status != ExitStatus::kDone) {
        Error(status, trouble);
    }
    return status;
}

ExitStatus Output::Finish(ExitStatus status) {
    if (json_ && (!sampled_ || data_.isMember("error"))) {
        PrintDocument(status);
    }
    if (Flush() && std::fclose(stdout) == 0) {  // some file systems tell only then
        return status;
    }
    Complain("", "the output could not be written");
    return status == ExitStatus::kDone || status == ExitStatus::kNo ? ExitStatus::kCannotSave : status;
}

}  // namespace VORK::FILEINDEXCTL
