#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/edit_json.h"
#include "tools/qmedit/managed_edit.h"
#include "tools/qmedit/revision_text.h"

#include <memory>

namespace {

struct HistoryArguments : EditArguments {
    bool json = false;
};

int runHistory(const HistoryArguments& arguments) {
    cookie item;
    ProjectSession session(arguments.project);
    if (const Qx::Status opened = session.openExisting(); !opened) {
        return failed(opened);
    }
    if (const Qx::Status found = session.findItem(arguments.item, item); !found) {
        return failed(found);
    }
    session.manage();
    const RevisionList list = revisionsOf(item);
    const bool isWhole = !reportUnanswered(list);
    const std::vector<Revision>& revisions = list.revisions;
    if (revisions.empty()) {
        return !isWhole
                   ? kFailed
                   : failed(Qx::Status::failure("there is no edit " + item.asString() + " in the project " +
                                                session.root() + "; 'qmedit list' shows those there are"));
    }
    writeOut(arguments.json ? historyJson(item, revisions)
                            : revisionTable(revisions, Console::forStandardOutput()));
    return isWhole ? kDone : kFailed;
}

} // namespace

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
