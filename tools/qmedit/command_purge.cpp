#include "tools/qmedit/column_table.h"
#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/deletion.h"
#include "tools/qmedit/edit_json.h"
#include "tools/qmedit/project_session.h"

#include "edit/inspect/usage.h"
#include "edit/project/permissions_manager.h"

#include <algorithm>
#include <memory>

namespace {

struct PurgeArguments {
    String project;
    bool dryRun = false;
    bool yes = false;
    bool force = false;
    bool json = false;
};

/// The shots of the project that nothing plays, in order of their cookies.
Qx::Status findShots(ProjectSession& session, bool force, std::vector<ListedEdit>& unused) {
    std::vector<ListedEdit> listed;
    std::vector<String> others;
    if (Qx::Status status = session.list(listed, others); !status) {
        return status;
    }
    std::vector<cookie> shots;
    std::vector<cookie> edits;
    for (const ListedEdit& entry : listed) {
        const bool isShot = entry.damage.empty() && entry.type == "shot";
        if (!isShot) {
            edits.push_back(entry.item);
        } else if (!PermissionsManager::getReadOnly(entry.item)) {
            shots.push_back(entry.item);
        }
    }
    const UnusedItems found = findUnused(shots, edits, interrupts::noted);
    for (const String& problem : found.unread) {
        reportWarning(problem);
    }
    if (!found.unread.empty() && !force) {
        return Qx::Status::failure(Qx::StatusCode::Damaged,
                                   "nothing was deleted: what cannot be read may play any shot; --force "
                                   "goes by what can be read");
    }
    std::erase_if(listed, [&](const ListedEdit& entry) {
        return std::find(found.items.begin(), found.items.end(), entry.item) == found.items.end();
    });
    unused = std::move(listed);
    return {};
}

void show(const std::vector<ListedEdit>& shots) {
    const Console console = Console::forStandardOutput();
    for (const ListedEdit& shot : shots) {
        writeOut(shot.item.asString() + "  " + console.safe(shot.name) + "\n");
    }
}

String shotsText(size_t count) {
    return String::format("%zu shot%s", count, count == 1 ? "" : "s");
}

/// Deletes what was shown, under the writers' lock, but for what came to be played since.
int deleteShots(const PurgeArguments& arguments, const std::vector<ListedEdit>& shown) {
    ProjectSession session(arguments.project);
    if (const Qx::Status opened = session.openExisting(); !opened) {
        return failed(opened);
    }
    if (const Qx::Status locked = session.lockForWriting(); !locked) {
        return failed(locked);
    }
    session.manage();
    std::vector<ListedEdit> unused;
    if (const Qx::Status found = findShots(session, arguments.force, unused); !found) {
        return failed(found);
    }
    size_t deleted = 0;
    for (const ListedEdit& shot : shown) {
        const bool isUnused = std::any_of(unused.begin(), unused.end(),
                                          [&](const ListedEdit& entry) { return entry.item == shot.item; });
        if (interrupts::noted()) {
            break;
        }
        if (const Qx::Status gone = isUnused ? deleteKeeping(session, shot.item) : Qx::Status(); !gone) {
            reportError(gone.reason());
        } else if (isUnused) {
            ++deleted;
        }
    }
    writeOut(shotsText(deleted) + " deleted\n");
    return deleted == shown.size() ? kDone : kFailed;
}

int runPurge(const PurgeArguments& arguments) {
    std::vector<ListedEdit> unused;
    {
        ProjectSession session(arguments.project);
        if (const Qx::Status opened = session.openExisting(); !opened) {
            return failed(opened);
        }
        if (const Qx::Status found = findShots(session, arguments.force, unused); !found) {
            return failed(found);
        }
    }
    if (arguments.json) {
        writeOut(listJson(unused));
    } else {
        show(unused);
    }
    if (arguments.dryRun || unused.empty()) {
        reportProgress(unused.empty() ? String("every shot is played by an edit or a state of one")
                                      : shotsText(unused.size()) + " would be deleted");
        return kDone;
    }
    if (!arguments.yes && !confirmed("Delete " + shotsText(unused.size()) + "?")) {
        return failed(Qx::Status::failure("nothing was deleted"));
    }
    return deleteShots(arguments, unused);
}

} // namespace

Command purgeCommand() {
    const auto arguments = std::make_shared<PurgeArguments>();
    return {"purge",
            "Delete the shots that nothing plays",
            {projectOption(arguments->project),
             jsonOption(arguments->json, "Write the shots as JSON"),
             dryRunOption(arguments->dryRun),
             yesOption(arguments->yes),
             {.name = "--force",
              .value = &arguments->force,
              .help = "Also where an edit, or a state of one, cannot be read and so may play any shot"}},
            "Example:\n  qmedit purge --dry-run\n\n"
            "A shot that only a backup or a milestone plays stays, so that undo finds it. A shot that was "
            "deleted is kept as a milestone: 'qmedit recover COOKIE' brings it back.",
            [arguments] { return runPurge(*arguments); }};
}
