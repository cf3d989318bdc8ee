#pragma once

#include "platform/base/qx_string.h"

#include <functional>
#include <string>
#include <variant>
#include <vector>

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
};

/// What qmedit can do: a name, its options, and the work that is done with them.
struct Command {
    std::string name;
    std::string summary;
    std::vector<CommandOption> options;
    /// Below the options in the help: an example and what else must be known.
    std::string footer;
    /// Done once the options are set; returns an `ExitCode`.
    std::function<int()> run;
};

/// Reads a command line and runs the command it names, or answers --help and --version. What is wrong is
/// reported. Returns an `ExitCode`, which tells of standard output too.
int runCommandLine(const std::vector<Command>& commands, int count, char** arguments);

/// The long options that qmedit takes before a command, and beside every command's own, as words.
inline constexpr const char* kOptionsOfProgram = "--version --help";
inline constexpr const char* kOptionsOfEveryCommand = "--help";
