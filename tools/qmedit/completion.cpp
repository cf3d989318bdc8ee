#include "tools/qmedit/completion.h"

#include "tools/qmedit/project_session.h"
#include "tools/qmedit/safe_text.h"

#include "edit/editing/edit_operation.h"
#include "edit/manager/revisions.h"
#include "edit/model/edit.h"
#include "interchange/marker_colour.h"
#include "platform/store/configb.h"

#include <completion_scripts.h>

namespace {

/// A line to be completed, taken apart.
struct Line {
    String current;
    String project; ///< the value of --project
    String item;    ///< the first word that names an edit
};

/// The answer: lines that fit what was typed.
class Answer {
public:
    explicit Answer(const String& typed) : m_typed(typed.lower()) {}

    void add(const String& word, const String& meaning = {}) {
        if (!word.empty() && word.lower().starts_with(m_typed) && safe_text::escaped(word) == word) {
            m_text += word + (meaning.empty() ? "" : "\t" + safe_text::escaped(meaning)) + "\n";
        }
    }
    void directive(const char* line) { m_text = String(line) + "\n"; }
    [[nodiscard]] bool isFor(std::string_view beginning) const { return m_typed.starts_with(beginning); }
    [[nodiscard]] bool isForAnything() const { return m_typed.empty(); }
    [[nodiscard]] const String& text() const { return m_text; }

private:
    String m_typed;
    String m_text;
};

/// Names too, once one was begun.
void addItems(ProjectSession& session, Answer& answer) {
    std::vector<ListedEdit> edits;
    std::vector<String> others;
    static_cast<void>(session.list(edits, others).isOk());
    for (const ListedEdit& edit : edits) {
        answer.add(edit.item.asString(), edit.name);
        if (!answer.isForAnything()) {
            answer.add(edit.name, edit.item.asString());
        }
    }
}

void addStates(const cookie& item, Answer& answer) {
    for (const Revision& revision : revisionsOf(item).revisions) {
        if (revision.kind != Revision::Itself) {
            answer.add(revision.which, revision.change);
        }
    }
}

void addHeaderKeys(const ProjectSession& session, const cookie& item, Answer& answer) {
    EditPtr edit;
    if (session.readEdit(item, edit)) {
        for (const String& key : std::as_const(*edit).Opts().keys()) {
            answer.add(key);
        }
    }
}

/// What only the project can tell.
void addFromProject(Completes what, const Line& line, Answer& answer) {
    ProjectSession session(line.project);
    cookie item;
    if (!session.exists() || !session.openExisting()) {
        return;
    }
    if (what == Completes::Items) {
        addItems(session, answer);
    } else if (session.findItem(line.item, item)) {
        if (what == Completes::States) {
            addStates(item, answer);
        } else {
            addHeaderKeys(session, item, answer);
        }
    }
}

void addOperations(Answer& answer) {
    for (int i = 1; i < kNumEditOperations; ++i) {
        // With hyphens, as the manual has them.
        String name;
        for (const char c : std::string_view(editOperationName(static_cast<edit_operation>(i)))) {
            const bool isUpper = c >= 'A' && c <= 'Z';
            name += (isUpper && !name.empty() ? "-" : "") + String(1, c).lower();
        }
        answer.add(name);
    }
}

void addCommands(const std::vector<CommandGroup>& groups, Answer& answer) {
    for (const CommandGroup& group : groups) {
        for (const Command& command : group.commands) {
            answer.add(command.name, command.summary);
        }
    }
}

void addValues(const CommandOption& option, const std::vector<CommandGroup>& groups, const Line& line,
               Answer& answer) {
    for (const std::string& choice : option.choices) {
        answer.add(choice);
    }
    switch (option.completes) {
    case Completes::Nothing:
        return;
    case Completes::Files:
        answer.directive(kCompleteFiles);
        return;
    case Completes::Folders:
        answer.directive(kCompleteFolders);
        return;
    case Completes::Operations:
        addOperations(answer);
        return;
    case Completes::Rates:
        for (const char* const rate : kFrameRates) {
            answer.add(rate);
        }
        return;
    case Completes::Colours:
        for (int code = 1; !interchange::markerColourName(code).empty(); ++code) {
            answer.add(String(interchange::markerColourName(code)));
        }
        return;
    case Completes::Commands:
        addCommands(groups, answer);
        return;
    case Completes::Items:
    case Completes::States:
    case Completes::HeaderKeys:
        addFromProject(option.completes, line, answer);
        return;
    }
}

const CommandOption* optionNamed(const Command& command, const String& name) {
    for (const CommandOption& option : command.options) {
        if (option.name == name) {
            return &option;
        }
    }
    return nullptr;
}

/// The word at a place among those that are known by their place; null where there is none.
const CommandOption* positional(const Command& command, size_t place) {
    for (const CommandOption& option : command.options) {
        if (option.isPositional() && (place-- == 0 || option.isRepeated())) {
            return &option;
        }
    }
    return nullptr;
}

/// Completes a word behind a command; `words` are those between.
void completeArgument(const Command& command, const std::vector<CommandGroup>& groups,
                      const std::vector<String>& words, Line& line, Answer& answer) {
    const CommandOption* pending = nullptr; // whose value comes next
    size_t place = 0;
    for (const String& word : words) {
        const CommandOption* const here = pending != nullptr      ? pending
                                          : word.starts_with("-") ? nullptr
                                                                  : positional(command, place);
        if (pending == nullptr && word.starts_with("-")) {
            const CommandOption* const option = optionNamed(command, word);
            pending = option != nullptr && !option->isFlag() ? option : nullptr;
            continue;
        }
        place += pending == nullptr ? 1 : 0;
        pending = nullptr;
        if (here != nullptr && here->name == "--project") {
            line.project = word;
        } else if (here != nullptr && here->completes == Completes::Items && line.item.empty()) {
            line.item = word.substr(0, word.find('@'));
        }
    }
    if (pending != nullptr) {
        addValues(*pending, groups, line, answer);
    } else if (answer.isFor("-")) {
        for (const CommandOption& option : command.options) {
            if (!option.isPositional()) {
                answer.add(option.name, option.help);
            }
        }
        answer.add(kOptionOfEveryCommand);
    } else if (const CommandOption* const word = positional(command, place); word != nullptr) {
        addValues(*word, groups, line, answer);
    }
}

} // namespace

String completionsFor(const std::vector<CommandGroup>& groups, std::vector<String> words) {
    Line line;
    if (!words.empty()) {
        line.current = words.back();
        words.pop_back();
    }
    Answer answer(line.current);
    size_t used = 0;
    const Command* const command = findCommand(groups, words, used);
    if (command != nullptr) {
        if (words.size() == used) {
            for (const Command& action : command->actions) {
                answer.add(action.name, action.summary);
            }
        }
        words.erase(words.begin(), words.begin() + static_cast<std::ptrdiff_t>(used));
        completeArgument(*command, groups, words, line, answer);
    } else if (words.empty() && answer.isFor("-")) {
        for (const char* const option : kOptionsOfProgram) {
            answer.add(option);
        }
    } else if (words.empty()) {
        addCommands(groups, answer);
    }
    return answer.text();
}

String completionScript(const String& shell) {
    return shell == "bash"   ? kBashCompletion
           : shell == "zsh"  ? kZshCompletion
           : shell == "fish" ? kFishCompletion
                             : "";
}
