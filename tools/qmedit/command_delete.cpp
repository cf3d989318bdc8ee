#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/deletion.h"
#include "tools/qmedit/interrupts.h"
#include "tools/qmedit/managed_edit.h"
#include "tools/qmedit/revision_text.h"

#include "edit/inspect/usage.h"
#include "platform/services/files.h"

#include <memory>

namespace {

struct DeleteArguments : EditArguments {
    bool force = false;
    bool dryRun = false;
    bool yes = false;
};

/// Why an edit is still wanted: another one plays it, or may play it as nobody can read that. Empty if none
/// does.
Qx::Status findPlayers(ProjectSession& session, const cookie& item, String& players) {
    std::vector<ListedEdit> listed;
    std::vector<String> others;
    if (Qx::Status status = session.list(listed, others); !status) {
        return status;
    }
    std::vector<cookie> edits;
    for (const ListedEdit& edit : listed) {
        // A shot plays its own media, nothing of the project.
        if (edit.type != "shot") {
            edits.push_back(edit.item);
        }
    }
    bool isCancelled = false;
    const auto cancelled = [&isCancelled] { return isCancelled = interrupts::noted(); };
    const auto read = [&session](const cookie& edit, EditPtr& to) { return session.readEdit(edit, to); };
    for (const ItemUser& user : findUsers(item, edits, read, cancelled)) {
        players += (players.empty() ? "" : ", ") + user.edit.asString() +
                   (user.problem.empty() ? "" : " (which cannot be read, so that it may play it)");
    }
    return isCancelled ? Qx::Status::failure("nothing was deleted") : Qx::Status();
}

/// Tells of what the deletion leaves.
void reportRest(const cookie& item) {
    const RevisionList list = revisionsOf(item);
    const std::vector<Revision>& rest = list.revisions;
    reportUnanswered(list);
    if (!rest.empty()) {
        reportProgress(String::format("left in place (milestones and files set aside): %zu; 'qmedit history ",
                                      rest.size()) +
                       item.asString() + "' shows them, 'qmedit recover " + item.asString() +
                       "' brings the edit back from them");
    }
}

/// Says what goes, on standard error.
String goingText(const ProjectSession& session, const cookie& item) {
    EditPtr edit;
    const bool isRead = session.readEdit(item, edit).isOk();
    String text = item.asString() + (isRead ? " '" + edit->getName() + "'" : String()) + ":";
    for (const String& file : edit_manager::getEditFiles(item)) {
        text += " " + Qx::fileNameOf(file);
    }
    return text;
}

/// Fails where an edit plays the item, or may.
Qx::Status checkUnplayed(ProjectSession& session, const DeleteArguments& arguments, const cookie& item) {
    String players;
    if (Qx::Status looked = arguments.force ? Qx::Status() : findPlayers(session, item, players); !looked) {
        return looked;
    }
    return players.empty() ? Qx::Status()
                           : Qx::Status::failure(item.asString() + " was not deleted: it is played by " +
                                                 players + "; --force deletes it all the same");
}

/// Shows what would go, and asks unless that was answered with --yes. Nobody else is kept waiting meanwhile:
/// what is asked here is looked at again under the writers' lock.
int showAndAsk(const DeleteArguments& arguments, bool& isMeant) {
    ProjectSession session(arguments.project);
    cookie item;
    Qx::Status status = session.openExisting();
    if (status) {
        status = session.findItem(arguments.item, item);
    }
    if (status && edit_manager::getEditFiles(item).empty()) {
        EditPtr none;
        status = session.readEdit(item, none);
    }
    if (status) {
        status = checkUnplayed(session, arguments, item);
    }
    if (!status) {
        return failed(status);
    }
    reportProgress((arguments.dryRun ? "would delete " : "deleting ") + goingText(session, item));
    isMeant = !arguments.dryRun && (arguments.yes || confirmed("Delete it?"));
    return isMeant || arguments.dryRun ? kDone : failed(Qx::Status::failure("nothing was deleted"));
}

int runDelete(const DeleteArguments& arguments) {
    bool isMeant = false;
    if (const int code = showAndAsk(arguments, isMeant); code != kDone || !isMeant) {
        return code;
    }
    ManagedEdit managed(arguments);
    if (const int code = managed.prepare(); code != kDone) {
        return code;
    }
    const cookie& item = managed.item();
    if (const Qx::Status unplayed = checkUnplayed(managed.session(), arguments, item); !unplayed) {
        return failed(unplayed);
    }
    const size_t count = edit_manager::getEditFiles(item).size();
    if (const Qx::Status deleted = deleteKeeping(managed.session(), item, arguments.force); !deleted) {
        return failed(deleted);
    }
    reportRest(item);
    writeOut(item.asString() + String::format(": deleted with %zu file%s\n", count, count == 1 ? "" : "s"));
    return kDone;
}

} // namespace

Command deleteCommand() {
    const auto arguments = std::make_shared<DeleteArguments>();
    return {
        "delete",
        "Delete an edit with all its backups",
        {cookieOption(arguments->item),
         projectOption(arguments->project),
         {.name = "--force",
          .value = &arguments->force,
          .help = "Also a shot that an edit of the project plays, and where no milestone can be made"},
         dryRunOption(arguments->dryRun),
         yesOption(arguments->yes)},
        "Example:\n  qmedit delete E0001000\n\n"
        "Its backups go too. Milestones stay, and its present state becomes one: 'qmedit recover' brings it "
        "back.",
        [arguments] { return runDelete(*arguments); }};
}
