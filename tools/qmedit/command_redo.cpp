#include "tools/qmedit/commands.h"
#include "tools/qmedit/managed_edit.h"

#include <CLI/CLI.hpp>

#include <memory>

void addRedoCommand(CLI::App& app, CommandWork& work) {
    const auto arguments = std::make_shared<EditArguments>();
    CLI::App* command = app.add_subcommand("redo", "Take back an undo of an edit");
    addEditArguments(*command, *arguments);
    command->footer("Example:\n  qmedit redo E0001000\n\n"
                    "What the edit was before is kept as an undo backup.");
    command->callback([arguments, &work] { work = [arguments] { return stepRevision(*arguments, true); }; });
}
