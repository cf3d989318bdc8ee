#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/completion.h"
#include "tools/qmedit/console.h"

#include <memory>

Command completionCommand() {
    const auto shell = std::make_shared<std::string>(); // the option writes to it
    return {"completion",
            "Print the completion script for a shell",
            {{.name = "SHELL",
              .value = shell.get(),
              .help = "The shell",
              .required = true,
              .choices = {"bash", "zsh", "fish"}}},
            "Example:\n  source <(qmedit completion bash)\n\n"
            "An installed qmedit has its scripts where the shells look for them.",
            [shell] {
                writeOut(completionScript(*shell));
                return static_cast<int>(kDone);
            }};
}

Command helpCommand() {
    const auto words = std::make_shared<std::vector<std::string>>();
    // Its arguments are taken before any command line is read.
    return {"help",
            "Tell what there is, or all of one command",
            {{.name = "COMMAND",
              .value = words.get(),
              .help = "The command, with its action where it has any",
              .completes = Completes::Commands}},
            "Example:\n  qmedit help show",
            [words] { return static_cast<int>(kDone); }};
}
