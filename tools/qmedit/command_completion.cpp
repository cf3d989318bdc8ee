#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"

#include <memory>

namespace {

/// The long options of a command, as words.
String optionWords(const Command& command) {
    String words = kOptionsOfEveryCommand;
    for (const CommandOption& option : command.options) {
        if (option.name.starts_with("--")) {
            words += " " + option.name;
        }
    }
    return words;
}

/// A bash function made from the declared commands and options, so that it cannot differ from them.
String bashCompletion(const std::vector<Command>& all) {
    String commands;
    String options;
    for (const Command& command : all) {
        commands += " " + command.name;
        options += "        " + command.name + ") options='" + optionWords(command) + "' ;;\n";
    }
    return R"bash(# bash completion for qmedit; use it with: source <(qmedit completion bash)
_qmedit_cookies() {
    local project=() i
    for ((i = 1; i < COMP_CWORD; i++)); do
        [[ ${COMP_WORDS[i]} == --project ]] && project=(--project "${COMP_WORDS[i + 1]/#\~/$HOME}")
    done
    "${COMP_WORDS[0]}" list "${project[@]}" 2>/dev/null | while read -r cookie rest; do
        [[ $cookie =~ ^[A-Z][0-9A-Z]{7}$ ]] && printf '%s\n' "$cookie"
    done
}

_qmedit_states() {
    local project=() item='' i
    for ((i = 1; i < COMP_CWORD; i++)); do
        [[ ${COMP_WORDS[i]} == --project ]] && project=(--project "${COMP_WORDS[i + 1]/#\~/$HOME}")
        [[ ${COMP_WORDS[i]^^} =~ ^[A-Z][0-9A-Z]{7}$ ]] && item=${COMP_WORDS[i]}
    done
    "${COMP_WORDS[0]}" history "$item" "${project[@]}" 2>/dev/null | while read -r which rest; do
        [[ $which =~ ^(U|R|M|CORRUPT)[.0-9]*$ ]] && printf '%s\n' "$which"
    done
}

_qmedit() {
    local current=${COMP_WORDS[COMP_CWORD]} previous=${COMP_WORDS[COMP_CWORD - 1]} command='' options='' i
    COMPREPLY=()
    for ((i = 1; i < COMP_CWORD; i++)); do
        case ${COMP_WORDS[i]} in
        --project | --into | --rate | --type | --from | --to | --channels) ((i++)) ;;
        -*) ;;
        *) command=${COMP_WORDS[i]}; break ;;
        esac
    done
    case $previous in
    --project | --into)
        mapfile -t COMPREPLY < <(compgen -d -- "$current")
        compopt -o filenames 2>/dev/null
        return ;;
    --rate) mapfile -t COMPREPLY < <(compgen -W '23.976 24 25 29.97 30 47.952 48 50 59.94 60' -- "$current"); return ;;
    --from)
        [[ $command == recover ]] && options=$(_qmedit_states) || options=$(_qmedit_cookies)
        mapfile -t COMPREPLY < <(compgen -W "$options" -- "${current^^}")
        return ;;
    --to) mapfile -t COMPREPLY < <(compgen -W "$(_qmedit_cookies)" -- "${current^^}"); return ;;
    --type) mapfile -t COMPREPLY < <(compgen -W 'edit shot ghost magic reel FXT' -- "$current"); return ;;
    esac
    case $command in
        '') options=')bash" +
           String(kOptionsOfProgram) + commands + "' ;;\n" + options + R"bash(    esac
    if [[ $current == -* || -z $command ]]; then
        mapfile -t COMPREPLY < <(compgen -W "$options" -- "$current")
        return
    fi
    case $command in
    import | salvage)
        mapfile -t COMPREPLY < <(compgen -f -- "$current")
        compopt -o filenames 2>/dev/null ;;
    show | header | export | verify | diff | history | backup | undo | redo | recover | delete) mapfile -t COMPREPLY < <(compgen -W "$(_qmedit_cookies)" -- "${current^^}") ;;
    completion) mapfile -t COMPREPLY < <(compgen -W bash -- "$current") ;;
    esac
}
complete -F _qmedit qmedit
)bash";
}

} // namespace

Command completionCommand() {
    const auto shell = std::make_shared<std::string>(); // the option writes to it
    return {"completion",
            "Print the completion script for a shell",
            {{.name = "SHELL",
              .value = shell.get(),
              .help = "The shell: bash",
              .required = true,
              .choices = {"bash"}}},
            "Example:\n  source <(qmedit completion bash)",
            [shell] {
                writeOut(bashCompletion(allCommands()));
                return static_cast<int>(kDone);
            }};
}
