#include "tools/qmedit/command_line.h"

#include "tools/qmedit/commands.h"
#include "tools/qmedit/completion.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/help_text.h"
#include "tools/qmedit/interrupts.h"
#include "tools/qmedit/suggestion.h"

// The only source that reads it: it is slow to compile.
#include <CLI/CLI.hpp>

#include <algorithm>

namespace {

/// The command that a line was read for, and the words that name it.
struct Chosen {
    const Command* command = nullptr;
    String words = "qmedit";
};

Chosen chosenOf(const CLI::App& app, const std::vector<CommandGroup>& groups) {
    Chosen chosen;
    std::vector<String> names;
    for (const CLI::App* level = &app; !level->get_subcommands().empty();) {
        level = level->get_subcommands().front();
        names.emplace_back(level->get_name());
        chosen.words += " " + names.back();
    }
    size_t used = 0;
    chosen.command = findCommand(groups, names, used);
    return chosen;
}

std::vector<String> namesOf(const std::vector<Command>& commands) {
    std::vector<String> names;
    for (const Command& command : commands) {
        names.emplace_back(command.name);
    }
    return names;
}

std::vector<String> namesOf(const std::vector<CommandGroup>& groups) {
    std::vector<String> names;
    for (const CommandGroup& group : groups) {
        const std::vector<String> more = namesOf(group.commands);
        names.insert(names.end(), more.begin(), more.end());
    }
    return names;
}

/// What is wrong with a word that no command, action or option takes.
String unexpected(const String& word, const Chosen& chosen, const std::vector<CommandGroup>& groups) {
    const String help = "; see 'qmedit help" + String(chosen.words.substr(6)) + "'";
    if (word.starts_with("-")) {
        std::vector<String> options;
        if (chosen.command == nullptr) {
            options.assign(std::begin(kOptionsOfProgram), std::end(kOptionsOfProgram));
        } else {
            options = {kOptionOfEveryCommand};
            for (const CommandOption& option : chosen.command->options) {
                options.emplace_back(option.name);
            }
        }
        return "'" + chosen.words + "' has no option " + String(word.substr(0, word.find('='))) +
               didYouMean(word, options, help);
    }
    if (chosen.command == nullptr) {
        return "there is no command '" + word + "'" +
               didYouMean(word, namesOf(groups), "; 'qmedit help' shows those there are");
    }
    if (!chosen.command->actions.empty()) {
        return "'" + chosen.words + "' has no action '" + word + "'" +
               didYouMean(word, namesOf(chosen.command->actions), help);
    }
    return "'" + word + "' is one word too many for '" + chosen.words + "'" + help;
}

String missingValue(const Chosen& chosen, const String& what) {
    const String name = what.substr(0, what.find(':'));
    for (const CommandOption& option : chosen.command->options) {
        if (option.name == name) {
            return name + " needs a value" + (option.form.empty() ? "" : ", " + option.form);
        }
    }
    return what;
}

/// What is wrong with a command line, in the user's terms.
String usageError(const CLI::App& app, const std::vector<CommandGroup>& groups,
                  const CLI::ParseError& error) {
    const Chosen chosen = chosenOf(app, groups);
    const String what = error.what();
    const String help = "; see 'qmedit help" + String(chosen.words.substr(6)) + "'";
    if (dynamic_cast<const CLI::ExcludesError*>(&error) != nullptr) {
        const size_t verb = what.find(" excludes ");
        return what.substr(0, verb) + " cannot stand beside " + String(what.substr(verb + 10)) + help;
    }
    if (dynamic_cast<const CLI::RequiredError*>(&error) != nullptr && what.ends_with(" is required")) {
        return "'" + chosen.words + "' needs " + String(what.substr(0, what.size() - 12)) + help;
    }
    const bool isMissing =
        dynamic_cast<const CLI::ArgumentMismatch*>(&error) != nullptr && what.ends_with("missing");
    const String told = isMissing && chosen.command != nullptr ? missingValue(chosen, what) : what;
    return told.ends_with("?") ? told : String(told + help);
}

/// Answers help and --version, and reports what is wrong.
int answer(const CLI::App& app, const std::vector<CommandGroup>& groups, const CLI::ParseError& error) {
    const std::vector<std::string> rest = app.remaining(true);
    if (error.get_exit_code() != 0 || !rest.empty()) {
        reportError(rest.empty() ? usageError(app, groups, error)
                                 : unexpected(rest.front(), chosenOf(app, groups), groups));
        return kWrongUsage;
    }
    if (dynamic_cast<const CLI::CallForVersion*>(&error) != nullptr) {
        writeOut(String(error.what()) + "\n");
    } else {
        const int width = Console::forStandardOutput().width();
        const Chosen chosen = chosenOf(app, groups);
        writeOut(chosen.command == nullptr
                     ? programHelp(groups, width)
                     : commandHelp(*chosen.command, chosen.words.substr(0, chosen.words.rfind(' ')), width));
    }
    return finishOutput() ? kDone : kFailed;
}

CLI::Option* declareValue(CLI::App& app, const CommandOption& option) {
    if (bool* const* flag = std::get_if<bool*>(&option.value)) {
        return app.add_flag(option.name, **flag, option.help);
    }
    if (std::vector<std::string>* const* words = std::get_if<std::vector<std::string>*>(&option.value)) {
        return app.add_option(option.name, **words, option.help)->type_name(option.form);
    }
    return app.add_option(option.name, *std::get<std::string*>(option.value), option.help)
        ->type_name(option.form);
}

void declareOption(CLI::App& app, const CommandOption& option) {
    CLI::Option* const declared = declareValue(app, option)->required(option.required);
    if (!option.choices.empty()) {
        declared->check([&option](const std::string& value) -> std::string {
            const std::vector<String> known(option.choices.begin(), option.choices.end());
            if (std::find(known.begin(), known.end(), value) != known.end()) {
                return {};
            }
            String all;
            for (const String& choice : known) {
                all += (all.empty() ? "" : ", ") + choice;
            }
            return "'" + value + "' is none of " + all + didYouMean(value, known, {});
        });
    }
    if (option.check) {
        declared->check([&option](const std::string& value) -> std::string { return option.check(value); });
    }
    if (!option.excludes.empty()) {
        declared->excludes(option.excludes);
    }
}

void declare(CLI::App& app, const Command& command) {
    CLI::App* const declared = app.add_subcommand(command.name, command.summary);
    for (const CommandOption& option : command.options) {
        declareOption(*declared, option);
    }
    declared->require_subcommand(0, 1);
    for (const Command& action : command.actions) {
        declare(*declared, action);
    }
}

/// The arguments with "help WORD..." made "WORD... --help".
std::vector<std::string> withoutHelp(int count, char** arguments) {
    std::vector<std::string> words(arguments + std::min(count, 1), arguments + count);
    if (!words.empty() && words.front() == "help" && (words.size() < 2 || words[1] != "--help")) {
        words.erase(words.begin());
        words.emplace_back("--help");
    }
    return words;
}

} // namespace

const Command* findCommand(const std::vector<CommandGroup>& groups, const std::vector<String>& words,
                           size_t& used) {
    used = 0;
    for (const CommandGroup& group : groups) {
        for (const Command& command : group.commands) {
            if (words.empty() || command.name != words.front()) {
                continue;
            }
            used = 1;
            for (const Command& action : command.actions) {
                if (words.size() > 1 && action.name == words[1]) {
                    used = 2;
                    return &action;
                }
            }
            return &command;
        }
    }
    return nullptr;
}

int runCommandLine(const std::vector<CommandGroup>& groups, int count, char** arguments) {
    std::vector<std::string> words = withoutHelp(count, arguments);
    if (!words.empty() && words.front() == kCompleteWord) {
        words.erase(words.begin());
        writeOut(completionsFor(groups, {words.begin(), words.end()}));
        return finishOutput() ? kDone : kFailed;
    }
    CLI::App app("", "qmedit");
    app.set_version_flag("--version", "qmedit " QMEDIT_VERSION, "Print the version and exit");
    app.set_help_flag("-h,--help", "Print this help and exit");
    app.require_subcommand(0, 1);
    for (const CommandGroup& group : groups) {
        for (const Command& command : group.commands) {
            declare(app, command);
        }
    }
    try {
        std::reverse(words.begin(), words.end());
        app.parse(words);
    } catch (const CLI::ParseError& error) {
        return answer(app, groups, error);
    }
    const Chosen chosen = chosenOf(app, groups);
    if (chosen.command == nullptr) {
        reportError("name a command; 'qmedit help' shows those there are");
        return kWrongUsage;
    }
    if (!chosen.command->run) {
        reportError("'" + chosen.words + "' needs a word that says what to do; see 'qmedit help " +
                    chosen.command->name + "'");
        return kWrongUsage;
    }
    interrupts::install();
    const int code = chosen.command->run();
    return interrupts::exitCode(
        finishOutput(code == kDone && interrupts::editsWereChanged()) ? code : static_cast<int>(kFailed));
}
