#include "command_line/parser.h"

#include "command_line/handlers.h"
#include "report/failure.h"

#include <CLI/CLI.hpp>

#include <algorithm>
#include <iterator>
#include <numeric>
#include <utility>

namespace VORK::FILEINDEXCTL {

namespace {

constexpr const char *kAbout = "fileindexctl - which folders are indexed, and how far indexing is";
constexpr std::size_t kHelpWidth = 104;

std::string Footer() {
    std::string text = "Exit status:";
    std::size_t width = text.size();
    for (const auto &meaning : kExitMeanings) {
        const std::string item =
            std::to_string(static_cast<int>(meaning.status)) + " " + std::string(meaning.words);
        const bool last = &meaning == &std::end(kExitMeanings)[-1];
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

std::size_t Distance(std::string_view left, std::string_view right) {
    std::vector<std::size_t> row(right.size() + 1);
    std::iota(row.begin(), row.end(), 0);
    for (std::size_t i = 0; i < left.size(); ++i) {
        std::size_t diagonal = std::exchange(row[0], i + 1);
        for (std::size_t j = 0; j < right.size(); ++j) {
            const std::size_t changed = diagonal + (left[i] == right[j] ? 0 : 1);
            diagonal = row[j + 1];
            row[j + 1] = std::min({changed, row[j] + 1, diagonal + 1});
        }
    }
    return row.back();
}

// The word that was meant, as a question; empty when none is near.
std::string Meant(std::string_view word, const std::vector<std::string_view> &words) {
    constexpr std::size_t kNear = 2;
    const auto nearest = std::min_element(words.begin(), words.end(), [&](const auto &left, const auto &right) {
        return Distance(word, left) < Distance(word, right);
    });
    const bool isNear = nearest != words.end() && Distance(word, *nearest) <= std::min(kNear, word.size() / 2);
    return isNear ? "; did you mean " + Quoted(std::string(*nearest)) + "?" : std::string();
}

// Why the first words name no command; empty when they do.
std::string UnknownCommand(const std::vector<std::string> &words) {
    std::string group;
    for (const auto &word : words) {
        std::vector<std::string_view> known;
        for (const auto &command : Commands()) {
            if (command.group == group || group.empty()) {
                known.push_back(command.group == group ? command.name : command.group);
            }
        }
        if (std::find(known.begin(), known.end(), word) == known.end()) {
            group.append(group.empty() ? "" : " ").append(word);
            return "there is no command " + Quoted(group) + Meant(word, known);
        }
        if (!group.empty() || HelpOfGroup(word).empty()) {
            break;
        }
        group = word;
    }
    return {};
}

Failure UsageFailure(const std::string &text) {
    return {ExitStatus::kUsage, text + (text.ends_with("?") ? "" : "; see \"fileindexctl --help\"")};
}

class Parser {
public:
    Parser() : app_(kAbout, "fileindexctl") {
        app_.footer(Footer());
        app_.require_subcommand(1);
        AddJson(app_);
        app_.set_version_flag(std::string(kVersion.name), FILEINDEXCTL_VERSION, std::string(kVersion.help));
        for (const auto &command : Commands()) {
            AddCommand(command);
        }
    }

    Invocation Run(int argc, const char *const argv[]) {
        const auto own = SplitOff(argc, argv);
        try {
            app_.parse(static_cast<int>(own.size()), own.data());
        } catch (const CLI::CallForHelp &) {
            return {nullptr, {}, false, app_.help()};
        } catch (const CLI::CallForVersion &) {
            return {nullptr, {}, false, FILEINDEXCTL_VERSION "\n"};
        } catch (const CLI::ParseError &error) {
            throw UsageFailure(Explain(error, own));
        }
        return invocation_;
    }

private:
    // The part of the line that is for this program. Of what is after an option that takes the rest, the first
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
        return std::ranges::any_of(Commands(), [&](const Command &command) {
            return std::ranges::any_of(command.parameters, [&](const Parameter &parameter) {
                return parameter.takes == Takes::kRest && parameter.name == word;
            });
        });
    }

    // In the order of the line; the parser's own text has them the other way round.
    static std::string Unexpected(const std::vector<std::string> &words) {
        const std::string text = words.size() == 1 ? "The following argument was not expected:"
                                                   : "The following arguments were not expected:";
        return text + " " + CLI::detail::join(words, " ");
    }

    // A word that is no command is not what the parser complains about first.
    std::string Explain(const CLI::ParseError &error, const std::vector<const char *> &line) const {
        std::vector<std::string> words(line.begin() + 1, line.end());
        std::erase_if(words, [](const std::string &word) { return word.starts_with("-"); });
        std::string unknown = UnknownCommand(words);
        if (!unknown.empty()) {
            return unknown;
        }
        const auto left = app_.remaining(true);
        const bool isOption = !left.empty() && left.front().starts_with("-");
        const bool isUnexpected = error.get_exit_code() == static_cast<int>(CLI::ExitCodes::ExtrasError);
        return (isUnexpected ? Unexpected(left) : error.what()) +
               (isOption ? Meant(left.front(), OptionsThere()) : std::string());
    }

    // Those of the command that was named.
    std::vector<std::string_view> OptionsThere() const {
        std::vector<std::string_view> options = {kJson.name, kHelp.name};
        for (const auto &[command, app] : commands_) {
            for (const auto &parameter : command->parameters) {
                if (app->parsed() && parameter.IsOption()) {
                    options.push_back(parameter.name);
                }
            }
        }
        return options;
    }

    CLI::App &ParentOf(const Command &command) {
        if (command.group.empty()) {
            return app_;
        }
        if (commands_.back().first->group == command.group) {
            return *commands_.back().second->get_parent();
        }
        CLI::App *group = app_.add_subcommand(std::string(command.group), std::string(HelpOfGroup(command.group)));
        return *group->require_subcommand(1)->fallthrough();
    }

    void AddJson(CLI::App &app) {
        app.add_flag(std::string(kJson.name), invocation_.json, std::string(kJson.help));
    }

    void AddCommand(const Command &command) {
        CLI::App &parent = ParentOf(command);
        CLI::App *app = parent.add_subcommand(std::string(command.name), std::string(command.help));
        app->fallthrough();
        AddJson(*app);
        if (command.hidden) {
            app->group("");
        }
        for (const auto &parameter : command.parameters) {
            AddParameter(*app, parameter);
        }
        app->final_callback([this, &command] { invocation_.command = &command; });
        commands_.emplace_back(&command, app);
    }

    void AddParameter(CLI::App &app, const Parameter &parameter) {
        const bool isMany = parameter.takes == Takes::kMany;
        const std::string letter(parameter.letter);
        const std::string name = (letter.empty() ? letter : letter + ",") + std::string(parameter.name);
        CLI::Option *option = app.add_option(
            name,
            [this, &parameter](const CLI::results_t &values) {
                const bool isRest = parameter.takes == Takes::kRest && !rest_.empty();
                invocation_.arguments.Set(parameter.name, isRest ? rest_ : values);
                return true;
            },
            std::string(parameter.help));
        if (parameter.takes == Takes::kNothing) {
            option->multi_option_policy(CLI::MultiOptionPolicy::TakeLast)->expected(0);
            return;
        }
        option->type_name(std::string(parameter.IsOption() ? parameter.value : ""))
            ->required(parameter.IsRequired());
        option->expected(1, isMany ? CLI::detail::expected_max_vector_size : 1);
        option->allow_extra_args(isMany);
        if (parameter.takes == Takes::kNumber) {
            option->check(CheckNumber);
        }
        if (!parameter.choices.empty()) {
            option->check(
                CLI::IsMember(std::vector<std::string>(parameter.choices.begin(), parameter.choices.end())));
        }
    }

    CLI::App app_;
    Invocation invocation_;
    std::vector<std::string> rest_;
    std::vector<std::pair<const Command *, CLI::App *>> commands_;
};

}  // namespace

Invocation Parse(int argc, const char *const argv[]) {
    return Parser().Run(argc, argv);
}

// As with --help after the words.
ExitStatus ShowHelp(const Arguments &arguments, Output &output) {
    std::vector<std::string> given = arguments.All("COMMAND");
    given.insert(given.end(), arguments.All("WORD").begin(), arguments.All("WORD").end());
    const std::string unknown = UnknownCommand(given);
    if (!unknown.empty()) {
        throw UsageFailure(unknown);
    }
    std::vector<const char *> words = {"fileindexctl"};
    for (const auto &word : given) {
        words.push_back(word.c_str());
    }
    words.push_back("--help");
    const std::string help = Parse(static_cast<int>(words.size()), words.data()).help;
    output.Data()["help"] = help;
    output.Raw(help);
    return ExitStatus::kDone;
}

}  // namespace VORK::FILEINDEXCTL
