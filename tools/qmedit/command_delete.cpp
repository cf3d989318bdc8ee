#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/interrupts.h"
#include "tools/qmedit/managed_edit.h"
#include "tools/qmedit/revisions.h"

#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"

#include <algorithm>
#include <memory>

namespace {

struct DeleteArguments : EditArguments {
    bool force = false;
};

bool plays(const ProjectSession& session, const cookie& sequence, const cookie& item) {
    EditPtr edit;
    if (!session.readEdit(sequence, edit)) {
        return false;
    }
    const EditReport report = reportOf(*edit, {});
    return std::any_of(report.sources.begin(), report.sources.end(),
                       [&](const SourceReport& source) { return source.strip == item; });
}

/// Why an edit is still wanted: another one plays it, or may play it as nobody can read that. Empty if none
/// does.
Qx::Status findPlayers(ProjectSession& session, const cookie& item, String& players) {
    std::vector<ListedEdit> edits;
    std::vector<String> others;
    if (Qx::Status listed = session.list(edits, others); !listed) {
        return listed;
    }
    for (const ListedEdit& edit : edits) {
        if (interrupts::noted()) {
            return Qx::Status::failure("nothing was deleted");
        }
        // A shot plays its own media, nothing of the project.
        if (edit.item == item || edit.type == "shot") {
            continue;
        }
        const bool unknown = !edit.damage.empty();
        if (unknown || plays(session, edit.item, item)) {
            players += (players.empty() ? "" : ", ") + edit.item.asString() +
                       (unknown ? " (which cannot be read, so that it may play it)" : "");
        }
    }
    return {};
}

/// Tells of what the deletion leaves.
void reportRest(const cookie& item) {
    const std::vector<Revision> rest = revisionsOf(item);
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
