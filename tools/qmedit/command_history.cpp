#include "tools/qmedit/column_table.h"
#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/edit_json.h"
#include "tools/qmedit/managed_edit.h"
#include "tools/qmedit/revisions.h"

#include <memory>

namespace {

struct HistoryArguments : EditArguments {
    bool json = false;
};

std::vector<String> cells(const Revision& revision, const Console& console) {
    return {console.safe(revision.which), localTimeText(revision.time), String(std::to_string(revision.size)),
            revision.isSound() ? String(std::to_string(revision.modifications)) : String("-"),
            revision.isSound() ? (revision.change.empty() ? String("-") : console.safe(revision.change))
                               : "damaged: " + console.safe(revision.damage)};
}

int runHistory(const HistoryArguments& arguments) {
    cookie item;
    if (!readCookie(arguments.item, item)) {
        return kWrongUsage;
    }
    ProjectSession session(arguments.project);
    if (const Qx::Status opened = session.openExisting(); !opened) {
        return failed(opened);
    }
    session.manage();
    const std::vector<Revision> revisions = revisionsOf(item);
    if (revisions.empty()) {
        return failed(Qx::Status::failure("there is no edit " + item.asString() + " in the project " +
                                          session.root() + "; 'qmedit list' shows those there are"));
    }
    writeOut(arguments.json ? historyJson(item, revisions)
                            : revisionTable(revisions, Console::forStandardOutput()));
    return kDone;
}

} // namespace

String revisionTable(const std::vector<Revision>& revisions, const Console& console) {
    constexpr bool rightAligned[] = {false, false, true, true, false};
    ColumnTable table({"which", "changed", "bytes", "count", "last change"}, rightAligned);
    for (const Revision& revision : revisions) {
        table.add(cells(revision, console), !revision.isSound()                 ? Console::Ink::Warning
                                            : revision.kind == Revision::Itself ? Console::Ink::Bold
                                                                                : Console::Ink::None);
    }
    return table.text(console, false);
}

Command historyCommand() {
    const auto arguments = std::make_shared<HistoryArguments>();
    return {"history",
            "List the states of an edit: its backups, milestones, damaged files",
            {cookieOption(arguments->item), projectOption(arguments->project),
             jsonOption(arguments->json, "Write JSON: an object with the states")},
            "Example:\n  qmedit history E0001000\n\n"
            "Newest first: what redo brings back (R), the edit, what undo goes back to (U), then "
            "milestones (M) and what was set aside as CORRUPT. 'qmedit recover' takes one of them.",
            [arguments] { return runHistory(*arguments); }};
}
