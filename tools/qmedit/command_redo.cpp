#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/managed_edit.h"

#include <memory>

Command redoCommand() {
    const auto arguments = std::make_shared<EditArguments>();
    return {"redo",
            "Take back an undo of an edit",
            {cookieOption(arguments->item), projectOption(arguments->project)},
            "Example:\n  qmedit redo E0001000\n\n"
            "What the edit was before is kept as an undo backup.",
            [arguments] { return stepRevision(*arguments, true); }};
}
