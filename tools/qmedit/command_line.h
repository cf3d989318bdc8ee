#pragma once

#include "platform/base/qx_string.h"

#include <functional>
#include <string>
#include <variant>
#include <vector>

/// What the values of a word or option are, for completion.
enum class Completes {
    Nothing,
    Files,
    Folders,
    Items,      ///< cookies and names of the project's edits
    States,     ///< of the edit that the command is for
    HeaderKeys, ///< of the edit that the command is for
    Operations, ///< of `apply`
    Rates,
    Colours, ///< of markers
    Commands
};

/// One word or option that a command takes.
struct CommandOption {
    /// "--to" for an option; capitals for a word that is known by its place, as in "COOKIE".
    std::string name;
    /// What it sets: a text, all the words that remain, or with `bool` whether the option stands there. It
    /// outlives the reading of the command line.
    std::variant<std::string*, std::vector<std::string>*, bool*> value;
    std::string help;
    /// How the value is written, for the help.
    std::string form = {};
    bool required = false;
    /// The values that are taken; empty for all.
    std::vector<std::string> choices = {};
    /// Why a value is not taken, or nothing.
    std::function<String(const std::string&)> check = {};
    /// The option it cannot stand beside.
    std::string excludes = {};
    Completes completes = Completes::Nothing;

    [[nodiscard]] bool isFlag() const { return std::holds_alternative<bool*>(value); }
    /// A word that is known by its place.
    [[nodiscard]] bool isPositional() const { return !name.starts_with("-"); }
    /// Takes all the words that remain.
    [[nodiscard]] bool isRepeated() const { return std::holds_alternative<std::vector<std::string>*>(value); }
};

/// What qmedit can do: a name, its options, and the work that is done with them.
struct Command {
    std::string name;
    std::string summary;
    std::vector<CommandOption> options;
    /// Below the options in the help: an example and what else must be known. Lines that begin with a blank
    /// stand as they are, the others are wrapped.
    std::string footer;
    /// Done once the options are set; returns an `ExitCode`. Empty for a command that is only the lead of its
    /// actions.
    std::function<int()> run;
    /// The commands behind a leading word: "add" of "marker add". They have no actions of their own.
    std::vector<Command> actions = {};
};

/// Commands that a person looks for in one place.
struct CommandGroup {
    std::string title;
    std::vector<Command> commands;
};

/// The command that the words name, with its action if they name one; null when they name none. `used` gets
/// how many words that took.
[[nodiscard]] const Command* findCommand(const std::vector<CommandGroup>& groups,
                                         const std::vector<String>& words, size_t& used);

/// Reads a command line and runs the command it names, or answers help, --version and --complete. What is
/// wrong is reported. Returns an `ExitCode`, which tells of standard output too.
int runCommandLine(const std::vector<CommandGroup>& groups, int count, char** arguments);

/// \name The long options that qmedit takes before a command, and beside every command's own
/// @{
inline constexpr const char* kOptionsOfProgram[] = {"--version", "--help"};
inline constexpr const char* kOptionOfEveryCommand = "--help";
/// @}
