#include "tools/qmedit/help_text.h"

#include "tools/qmedit/safe_text.h"

#include <algorithm>

namespace {

/// Where the explanations begin, and the least that is left between a name and its explanation.
constexpr int kColumn = 28;
constexpr int kGap = 2;

/// "  NAME      explanation", wrapped at the column of the explanations.
String row(const String& name, const String& explanation, int width) {
    const int used = safe_text::columns(name) + kGap;
    String out = "  " + name;
    out += used + kGap > kColumn ? String("\n") + String(kColumn, ' ')
                                 : String(static_cast<size_t>(kColumn - used), ' ');
    return out + safe_text::wrapped(explanation, width, kColumn, kColumn) + "\n";
}

/// "--rate FPS", "COOKIE", "[KEY]".
String signature(const CommandOption& option) {
    if (option.isPositional()) {
        return option.name + (option.isRepeated() ? "..." : "");
    }
    String form = option.form;
    if (form.empty() && !option.isFlag()) {
        form = "TEXT";
    }
    return option.name + (form.empty() ? "" : " " + form);
}

String explanation(const CommandOption& option) {
    String text = option.help;
    for (size_t i = 0; i < option.choices.size(); ++i) {
        text += (i == 0 ? ": " : i + 1 < option.choices.size() ? ", " : " or ") + option.choices[i];
    }
    return text;
}

/// "qmedit show COOKIE [OPTIONS]".
String usage(const Command& command, const String& lead) {
    String text = "Usage: " + lead + " " + command.name;
    bool hasOptional = false;
    for (const CommandOption& option : command.options) {
        if (option.isPositional() || option.required) {
            text += " " + (option.required ? signature(option) : String("[" + signature(option) + "]"));
        } else {
            hasOptional = true;
        }
    }
    if (!command.actions.empty()) {
        text += " ACTION ...";
    }
    return text + (hasOptional ? " [OPTIONS]" : "") + "\n";
}

/// Paragraphs wrapped, and lines that begin with a blank as they are.
String wrappedLines(const String& text, int width) {
    String out;
    for (const String& line : text.split('\n', false)) {
        out += (line.starts_with(" ") ? line : safe_text::wrapped(line, width, 0, 0)) + "\n";
    }
    return out;
}

} // namespace

String programHelp(const std::vector<CommandGroup>& groups, int width) {
    String out = "qmedit: edits of the Quillmarch editor on the command line\n\n"
                 "Usage: qmedit COMMAND [WORDS] [OPTIONS]\n";
    for (const CommandGroup& group : groups) {
        out += "\n" + group.title + "\n";
        for (const Command& command : group.commands) {
            out += row(command.name, command.summary, width);
        }
    }
    out += "\n" + wrappedLines("'qmedit help COMMAND' tells all of a command, with an example.\n"
                               "A command works on the project given by --project DIR, else by "
                               "$QMEDIT_PROJECT, else on ./quillmarch-project. Where it asks for a COOKIE, "
                               "the name of an edit or shot will do.\n"
                               "Exit codes: 0 done, 1 failed, 2 wrong usage, 128 and more interrupted.",
                               width);
    return out;
}

String commandHelp(const Command& command, const String& lead, int width) {
    String out = wrappedLines(command.summary, width) + "\n" + usage(command, lead) + "\n";
    for (const Command& action : command.actions) {
        out += row(action.name, action.summary, width);
    }
    for (const bool positional : {true, false}) {
        for (const CommandOption& option : command.options) {
            if (option.isPositional() == positional) {
                out += row(signature(option), explanation(option), width);
            }
        }
    }
    out += row("-h, --help", "Print this help and exit", width);
    return command.footer.empty() ? out : out + "\n" + wrappedLines(command.footer, width);
}
