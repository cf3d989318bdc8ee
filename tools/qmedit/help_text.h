#pragma once

#include "tools/qmedit/command_line.h"

/// The help of qmedit, wrapped to a width in columns.

/// What qmedit is and its commands, by groups.
[[nodiscard]] String programHelp(const std::vector<CommandGroup>& groups, int width);

/// How a command is used: its words, its options, an example. `lead` is what stands before its name, "qmedit"
/// or "qmedit marker".
[[nodiscard]] String commandHelp(const Command& command, const String& lead, int width);
