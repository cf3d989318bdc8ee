#include "tools/qmedit/command_line.h"

#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/interrupts.h"

// The only source that reads it: it is slow to compile.
#include <CLI/CLI.hpp>

#include <sstream>

namespace {

constexpr const char* kFooter =
    "Edits go to the project given by --project DIR, else by $QMEDIT_PROJECT, else to ./quillmarch-project.\n"
    "Exit codes: 0 done, 1 failed, 2 wrong usage, 128 and more interrupted.\n"
    "'qmedit COMMAND --help' shows an example of each command.";

/// The command that a wrong command line was for, for the advice on help.
String commandOf(const CLI::App& app) {
    const auto chosen = app.get_subcommands();
    return chosen.empty() ? "qmedit" : "qmedit " + chosen.front()->get_name();
}

int reportUsage(const CLI::App& app, const CLI::ParseError& error) {
    if (error.get_exit_code() == 0) {
        std::ostringstream text;
        app.exit(error, text, text);
        writeOut(text.str());
        return finishOutput() ? kDone : kFailed;
    }
    reportError(String(error.what()) + "; see " + commandOf(app) + " --help");
    return kWrongUsage;
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
        declared->check(CLI::IsMember(option.choices));
    }
    if (option.check) {
        declared->check([&option](const std::string& value) -> std::string { return option.check(value); });
    }
    if (!option.excludes.empty()) {
        declared->excludes(option.excludes);
    }
}

} // namespace

int runCommandLine(const std::vector<Command>& commands, int count, char** arguments) {
    CLI::App app("Edits of the Quillmarch editor on the command line: import, look, check, undo.", "qmedit");
    app.set_version_flag("--version", "qmedit " QMEDIT_VERSION, "Print the version and exit");
    app.set_help_flag("-h,--help", "Print this help and exit");
    app.footer(kFooter);
    app.require_subcommand(0, 1);
    app.get_formatter()->column_width(28);
    app.get_formatter()->label("SUBCOMMAND", "COMMAND");
    app.get_formatter()->label("Subcommands", "Commands");
    app.get_formatter()->label("REQUIRED", "");

    const Command* chosen = nullptr;
    for (const Command& command : commands) {
        CLI::App* const declared = app.add_subcommand(command.name, command.summary);
        for (const CommandOption& option : command.options) {
            declareOption(*declared, option);
        }
        declared->footer(command.footer);
        declared->callback([&chosen, &command] { chosen = &command; });
    }
    try {
        app.parse(count, arguments);
    } catch (const CLI::ParseError& error) {
        return reportUsage(app, error);
    }
    if (chosen == nullptr) {
        reportError("name a command; see qmedit --help");
        return kWrongUsage;
    }
    interrupts::install();
    const int code = chosen->run();
    return interrupts::exitCode(
        finishOutput(code == kDone && interrupts::editsWereChanged()) ? code : static_cast<int>(kFailed));
}
