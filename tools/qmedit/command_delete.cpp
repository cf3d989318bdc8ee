#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/interrupts.h"
#include "tools/qmedit/managed_edit.h"
#include "tools/qmedit/revision_text.h"

#include "edit/inspect/usage.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"

#include <memory>

namespace {

struct DeleteArguments : EditArguments {
    bool force = false;
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

int runDelete(const DeleteArguments& arguments) {
    ManagedEdit managed(arguments);
    if (const int code = managed.prepare(); code != kDone) {
        return code;
    }
    const cookie& item = managed.item();
    if (!arguments.force) {
        String players;
        if (const Qx::Status looked = findPlayers(managed.session(), item, players); !looked) {
            return failed(looked);
        }
        if (!players.empty()) {
            return failed(Qx::Status::failure(item.asString() + " was not deleted: it is played by " +
                                              players + "; --force deletes it all the same"));
        }
    }
    EditPtr edit;
    const bool isRead = managed.session().readEdit(item, edit).isOk();
    const Vector<String> files = edit_manager::getEditFiles(item);
    String names;
    for (const String& file : files) {
        names += " " + Qx::fileNameOf(file);
    }
    reportProgress("deleting " + item.asString() + (isRead ? " '" + edit->getName() + "'" : String()) + ":" +
                   names);
    edit.invalidate();
    if (!edit_manager::delete_edit_file_and_backups(item, false)) {
        const Vector<String> left = edit_manager::getEditFiles(item);
        return failed(Qx::Status::failure(
            left.size() == files.size()
                ? item.asString() + " could not be deleted and is as it was; see whether the project can be "
                                    "written (QMEDIT_LOG=1 tells more)"
                : String::format("%zu of %zu files of ", left.size(), files.size()) + item.asString() +
                      " could not be deleted; see whether they can be written, and delete it again"));
    }
    reportRest(item);
    writeOut(item.asString() +
             String::format(": deleted with %zu file%s\n", files.size(), files.size() == 1 ? "" : "s"));
    return kDone;
}

} // namespace

Command deleteCommand() {
    const auto arguments = std::make_shared<DeleteArguments>();
    return {"delete",
            "Delete an edit with all its backups",
            {cookieOption(arguments->item),
             projectOption(arguments->project),
             {.name = "--force",
              .value = &arguments->force,
              .help = "Also a shot that an edit of the project plays"}},
            "Example:\n  qmedit delete E0001000\n\n"
            "There is no way back but by milestones, which stay.",
            [arguments] { return runDelete(*arguments); }};
}
