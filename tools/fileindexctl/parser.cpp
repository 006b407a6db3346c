#include "parser.h"

#include "failure.h"

#include <CLI/CLI.hpp>

#include <map>
#include <utility>

namespace fileindexctl {

namespace {

constexpr const char *kAbout = "fileindexctl - which folders are indexed, and how far indexing is";
constexpr std::size_t kHelpWidth = 104;

std::string Footer() {
    std::string text = "Exit status:";
    std::size_t width = text.size();
    for (const auto &meaning : ExitMeanings()) {
        const std::string item =
            std::to_string(static_cast<int>(meaning.status)) + " " + std::string(meaning.words);
        const bool last = &meaning == &ExitMeanings().back();
        const bool breaks = width + item.size() + 2 > kHelpWidth;
        text += (breaks ? "\n" : " ") + item + (last ? "." : ",");
        width = (breaks ? 0 : width + 1) + item.size() + 1;
    }
    return text;
}

// Checked as text, so that what is read later is digits only and fits.
std::string CheckNumber(const std::string &text) {
    const bool digits = !text.empty() && text.find_first_not_of("0123456789") == std::string::npos;
    return digits && text.size() <= 18 ? std::string() : "a number of 0 or more is expected, not \"" + text + "\"";
}

class Parser {
public:
    Parser() : app_(kAbout, "fileindexctl") {
        app_.footer(Footer());
        app_.require_subcommand(1);
        app_.add_flag("--json", json_, "one JSON document on the standard output");
        app_.set_version_flag("--version", FILEINDEXCTL_VERSION, "show the version");
        for (const auto &command : Commands()) {
            AddCommand(command);
        }
    }

    Invocation Run(int argc, const char *const argv[]) {
        Invocation invocation;
        const auto own = SplitOff(argc, argv);
        try {
            app_.parse(static_cast<int>(own.size()), own.data());
        } catch (const CLI::CallForHelp &) {
            invocation.help = app_.help();
            return invocation;
        } catch (const CLI::CallForVersion &) {
            invocation.help = std::string(FILEINDEXCTL_VERSION) + "\n";
            return invocation;
        } catch (const CLI::ParseError &error) {
            throw Failure(ExitStatus::Usage, Explain(error) + "; see \"fileindexctl --help\"");
        }
        invocation.json = json_;
        for (const auto &[command, app] : commands_) {
            if (app->parsed()) {
                invocation.command = command;
                invocation.arguments = ArgumentsOf(*command, *app);
            }
        }
        return invocation;
    }

private:
    // The part of the line that is for this program. Of what is behind an option that takes the rest, the first
    // word stays there, so that the option has a value.
    std::vector<const char *> SplitOff(int argc, const char *const argv[]) {
        std::vector<const char *> own;
        for (int i = 0; i < argc && rest_.empty(); ++i) {
            own.push_back(argv[i]);
            if (i + 1 < argc && TakesRest(argv[i])) {
                rest_.assign(argv + i + 1, argv + argc);
                own.push_back(argv[i + 1]);
            }
        }
        return own;
    }

    static bool TakesRest(std::string_view word) {
        for (const auto &command : Commands()) {
            for (const auto &parameter : command.parameters) {
                if (parameter.takes == Takes::Rest && parameter.name == word) {
                    return true;
                }
            }
        }
        return false;
    }

    // A word that is no command is not what the parser complains about first.
    std::string Explain(const CLI::ParseError &error) const {
        const auto words = app_.remaining(true);
        if (words.empty() || words.front().starts_with("-")) {
            return error.what();
        }
        const auto parsed = app_.get_subcommands();
        if (parsed.empty()) {
            return "there is no command \"" + words.front() + "\"";
        }
        const bool inGroup = groups_.count(parsed.front()->get_name()) > 0;
        const bool unknown = inGroup && parsed.front()->get_subcommands().empty();
        return unknown ? "there is no command \"" + parsed.front()->get_name() + " " + words.front() + "\""
                       : error.what();
    }

    CLI::App &ParentOf(const Command &command) {
        if (command.group.empty()) {
            return app_;
        }
        CLI::App *&group = groups_[command.group];
        if (group == nullptr) {
            group = app_.add_subcommand(std::string(command.group), std::string(HelpOfGroup(command.group)));
            group->require_subcommand(1)->fallthrough();
        }
        return *group;
    }

    void AddCommand(const Command &command) {
        CLI::App &parent = ParentOf(command);
        CLI::App *app = parent.add_subcommand(std::string(command.name), std::string(command.help));
        app->fallthrough();
        if (command.hidden) {
            app->group("");
        }
        for (const auto &parameter : command.parameters) {
            AddParameter(*app, parameter);
        }
        commands_.emplace_back(&command, app);
    }

    static void AddParameter(CLI::App &app, const Parameter &parameter) {
        const std::string letter(parameter.letter);
        const std::string name = (letter.empty() ? letter : letter + ",") + std::string(parameter.name);
        const std::string help(parameter.help);
        if (parameter.takes == Takes::Nothing) {
            app.add_flag_callback(
                name, [] {}, help);
            return;
        }
        CLI::Option *option = app.add_option(name, CLI::callback_t([](const auto &) { return true; }), help);
        option->type_name(std::string(parameter.value))->required(parameter.IsRequired());
        option->expected(1, parameter.takes == Takes::Many ? CLI::detail::expected_max_vector_size : 1);
        option->allow_extra_args(parameter.takes == Takes::Many);
        if (parameter.takes == Takes::Number) {
            option->check(CheckNumber);
        }
        if (!parameter.choices.empty()) {
            option->check(
                CLI::IsMember(std::vector<std::string>(parameter.choices.begin(), parameter.choices.end())));
        }
    }

    Arguments ArgumentsOf(const Command &command, const CLI::App &app) const {
        Arguments arguments;
        for (const auto &parameter : command.parameters) {
            const CLI::Option *option = app.get_option(std::string(parameter.name));
            if (option->count() == 0) {
                continue;
            }
            const bool flag = parameter.takes == Takes::Nothing;
            const bool rest = parameter.takes == Takes::Rest && !rest_.empty();
            arguments.Set(parameter.name, flag ? std::vector<std::string>() : rest ? rest_ : option->results());
        }
        return arguments;
    }

    CLI::App app_;
    bool json_ = false;
    std::vector<std::string> rest_;
    std::map<std::string_view, CLI::App *> groups_;
    std::vector<std::pair<const Command *, CLI::App *>> commands_;
};

}  // namespace

Invocation Parse(int argc, const char *const argv[]) {
    return Parser().Run(argc, argv);
}

}  // namespace fileindexctl
