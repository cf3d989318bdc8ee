#include "tools/qmedit/commands.h"
#include "tools/qmedit/managed_edit.h"

#include <CLI/CLI.hpp>

#include <memory>

void addUndoCommand(CLI::App& app, CommandWork& work) {
    const auto arguments = std::make_shared<EditArguments>();
    CLI::App* command = app.add_subcommand("undo", "Take an edit back to its newest undo backup");
    addEditArguments(*command, *arguments);
    command->footer("Example:\n  qmedit undo E0001000\n\n"
                    "What was undone is kept as a redo backup: 'qmedit redo' brings it back.");
    command->callback([arguments, &work] { work = [arguments] { return stepRevision(*arguments, false); }; });
}
