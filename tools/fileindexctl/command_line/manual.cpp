// The manual page: man/fileindexctl.1.in with what comes from the table of commands.
#include "command_line/command.h"
#include "command_line/handlers.h"
#include "command_line/texts.h"
#include "report/exit_status.h"

namespace VORK::FILEINDEXCTL {

namespace {

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

std::string CommandSections() {
    std::string text = ".Bl -tag -width Ds\n";
    for (const auto &command : Commands()) {
        text += command.hidden ? "" : Section(command);
    }
    return text + ".El\n";
}

std::string ExitStatuses() {
    std::string text = ".Bl -tag -width Ds -compact\n";
    for (const auto &meaning : kExitMeanings) {
        text += ".It " + std::to_string(static_cast<int>(meaning.status)) + "\n" + Sentence(meaning.sentence);
    }
    return text + ".El\n";
}

void Replace(std::string &text, std::string_view mark, const std::string &replacement) {
    text.replace(text.find(mark), mark.size(), replacement);
}

}  // namespace

ExitStatus WriteManual(const Arguments & /*arguments*/, Output &output) {
    std::string page(kManualPage);
    Replace(page, ".\\\" COMMANDS\n", CommandSections());
    Replace(page, ".\\\" EXIT STATUS\n", ExitStatuses());
    output.Data()["page"] = page;
    output.Raw(page);
    return ExitStatus::kDone;
}

}  // namespace VORK::FILEINDEXCTL
