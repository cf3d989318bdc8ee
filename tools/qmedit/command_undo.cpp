#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/managed_edit.h"

#include <memory>

Command undoCommand() {
    const auto arguments = std::make_shared<EditArguments>();
    return {"undo",
            "Take an edit back to its newest undo backup",
            {cookieOption(arguments->item), projectOption(arguments->project)},
            "Example:\n  qmedit undo E0001000\n\n"
            "What was undone is kept as a redo backup: 'qmedit redo' brings it back.",
            [arguments] { return stepRevision(*arguments, false); }};
}
