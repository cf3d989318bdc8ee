#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/interrupts.h"
#include "tools/qmedit/log_json.h"
#include "tools/qmedit/project_session.h"

#include "platform/services/files.h"

#include <algorithm>
#include <memory>

namespace {

struct UpgradeArguments {
    std::vector<std::string> items;
    String project;
    bool dryRun = false;
    bool json = false;
};

/// What is said of one edit; nothing of one that is current.
String told(const UpgradedEdit& edit, const Console& console) {
    if (edit.outcome == UpgradedEdit::Current) {
        return {};
    }
    String out = edit.item.asString() + "  ";
    if (edit.outcome == UpgradedEdit::Failed) {
        return out + console.inked(Console::Ink::Error, "NOT UPGRADED") +
               ", its file is as it was: " + console.safe(edit.status.reason()) + "\n";
    }
    const bool isWhole = edit.upgrade.notDone.empty();
    out += isWhole ? String(outcomeText(edit.outcome))
                   : console.inked(Console::Ink::Error, "NOT UPGRADED") + ", its file is as it was";
    out += String::format(", revision %d to %d", edit.upgrade.from, edit.upgrade.to);
    out += edit.kept.empty() ? "\n" : "; the old file is " + console.safe(Qx::fileNameOf(edit.kept)) + "\n";
    for (const String& line : isWhole ? edit.upgrade.done : edit.upgrade.notDone) {
        out += "    " + console.safe(line) + "\n";
    }
    return out;
}

String summary(const std::vector<UpgradedEdit>& edits) {
    const auto count = [&edits](UpgradedEdit::Outcome outcome) {
        return std::count_if(edits.begin(), edits.end(),
                             [&](const UpgradedEdit& edit) { return edit.outcome == outcome; });
    };
    const auto would = count(UpgradedEdit::WouldUpgrade);
    const auto upgraded = count(UpgradedEdit::Upgraded);
    const auto current = count(UpgradedEdit::Current);
    const auto others = std::ssize(edits) - would - upgraded - current;
    return String::format("%zu edit%s: ", edits.size(), edits.size() == 1 ? "" : "s") +
           (would > 0 ? String::format("%td would be upgraded", would)
                      : String::format("%td upgraded", upgraded)) +
           String::format(", %td current, %td not upgraded\n", current, others);
}

/// The edits that were asked for, else all of the project. Fails for one that is not there.
Qx::Status chosenItems(const UpgradeArguments& arguments, const ProjectSession& session,
                       std::vector<cookie>& items) {
    std::vector<cookie> all;
    if (Qx::Status listed = itemsToUpgrade(all); !listed || arguments.items.empty()) {
        items = std::move(all);
        return listed;
    }
    for (const cookie& item : items) {
        if (std::find(all.begin(), all.end(), item) == all.end()) {
            return Qx::Status::failure(Qx::StatusCode::NotFound, "there is no file of " + item.asString() +
                                                                     " in the project " + session.root() +
                                                                     "; 'qmedit list' shows those there are");
        }
    }
    return {};
}

int runUpgrade(const UpgradeArguments& arguments) {
    std::vector<cookie> items;
    ProjectSession session(arguments.project);
    Qx::Status ready = session.openExisting();
    for (const std::string& text : arguments.items) {
        if (ready) {
            ready = session.findItem(text, items.emplace_back());
        }
    }
    if (ready && !arguments.dryRun) {
        ready = session.lockForWriting();
    }
    if (ready) {
        ready = chosenItems(arguments, session, items);
    }
    if (!ready) {
        return failed(ready);
    }
    session.manage();
    const Console console = Console::forStandardOutput();
    std::vector<UpgradedEdit> edits;
    int code = kDone;
    for (const cookie& item : items) {
        const UpgradedEdit& edit = edits.emplace_back(upgradeEdit(item, arguments.dryRun));
        if (edit.outcome == UpgradedEdit::NotWhole || edit.outcome == UpgradedEdit::Failed) {
            code = kFailed;
        }
        if (!arguments.json) {
            writeOut(told(edit, console));
        }
    }
    const String line = summary(edits);
    writeOut(arguments.json ? upgradesJson(edits) : line);
    setOutcome(line);
    return code;
}

} // namespace

Command upgradeCommand() {
    const auto arguments = std::make_shared<UpgradeArguments>();
    return {"upgrade",
            "Bring edit files of older revisions up to date",
            {{.name = "COOKIE", .value = &arguments->items, .help = "Only these edits"},
             projectOption(arguments->project),
             {.name = "--dry-run",
              .value = &arguments->dryRun,
              .help = "Say what would be done and write nothing"},
             jsonOption(arguments->json, "Write JSON: an array of edits with what was done")},
            "Example:\n  qmedit upgrade --dry-run --project ~/feature\n\n"
            "The old file is kept as undo backup 1. A file that cannot be upgraded whole is not touched; the "
            "exit code is 1 if there is any.",
            [arguments] { return runUpgrade(*arguments); }};
}
