#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/managed_edit.h"
#include "tools/qmedit/revision_text.h"

#include "edit/manager/recovery.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"

#include <algorithm>
#include <memory>

namespace {

struct RecoverArguments : EditArguments {
    std::string from;
};

/// Says why no state can be taken and what else can be done.
int reportNoneSound(const cookie& item, const RevisionList& list, const ProjectSession& session) {
    if (list.revisions.empty()) {
        return failed(Qx::Status::failure("there is nothing of " + item.asString() + " in the project " +
                                          session.root() + "; 'qmedit list' shows the edits there are"));
    }
    const Revision* const present = list.itself();
    const String& file = present != nullptr ? present->path : list.revisions.front().path;
    return failed(Qx::Status::failure("no state of " + item.asString() +
                                      " is sound, so nothing was changed; 'qmedit salvage " + file +
                                      " --into DIR' saves what is sound of a damaged file"));
}

/// The state that was asked for; null, with a report, when it is not there or cannot be taken.
const Revision* asked(const std::string& which, const cookie& item, const std::vector<Revision>& revisions) {
    for (const Revision& revision : revisions) {
        if (!String::equalNoCase(revision.which, which)) {
            continue;
        }
        if (revision.isSound()) {
            return &revision;
        }
        reportError("nothing was changed: " + revision.path + " is damaged (" + revision.damage +
                    "); 'qmedit salvage " + revision.path + " --into DIR' saves what is sound of it");
        return nullptr;
    }
    reportError("there is no state " + which + " of " + item.asString() + "; 'qmedit history " +
                item.asString() + "' shows those there are");
    return nullptr;
}

/// The sound states, on standard error unless they are the result.
void showCandidates(const std::vector<Revision>& revisions) {
    std::vector<Revision> sound = revisions;
    std::erase_if(sound, [](const Revision& revision) { return !revision.isSound(); });
    writeOut(revisionTable(sound, Console::forStandardOutput()));
}

int runRecover(const RecoverArguments& arguments) {
    ManagedEdit managed(arguments);
    if (const int code = managed.prepare(true); code != kDone) {
        return code;
    }
    const cookie& item = managed.item();
    const RevisionList list = revisionsOf(item);
    const bool isWhole = !reportUnanswered(list);
    const Revision* const present = list.itself();
    if (present != nullptr && present->refused) {
        return failed(Qx::Status::failure("nothing was changed: " + present->path +
                                          " may be sound, but cannot be read here: " + present->damage));
    }
    const Revision* taken = nullptr;
    if (!arguments.from.empty()) {
        taken = asked(arguments.from, item, list.revisions);
        if (taken == nullptr) {
            return kFailed;
        }
    } else {
        taken = list.newestSound();
        const bool presentIsSound = present != nullptr && present->isSound();
        if (taken == nullptr && !presentIsSound) {
            return !isWhole ? kFailed : reportNoneSound(item, list, managed.session());
        }
        showCandidates(list.revisions);
        if (!isWhole) {
            return failed(Qx::Status::failure("nothing was changed, as there may be a newer state; --from "
                                              "takes one of these"));
        }
        if (presentIsSound) {
            reportProgress("the edit is sound, so nothing was changed; --from takes another of these states");
            return kDone;
        }
    }
    if (taken->kind == Revision::Itself) {
        reportProgress("the edit is sound and stays as it is");
        return kDone;
    }
    String kept;
    if (const Qx::Status replaced = recoverEdit(item, list, *taken, kept); !replaced) {
        return failed(Qx::Status::failure(item.asString() + " was not recovered: " + replaced.reason() +
                                          (kept.empty() || !Qx::askFile(kept).isRegular() ||
                                                   Qx::askFile(getFilenameForCookie(item)).isRegular()
                                               ? String()
                                               : "; its state is kept as " + kept)));
    }
    writeOut(item.asString() + ": recovered from " + taken->which + ", last changed " +
             localTimeText(taken->time) + (kept.empty() ? String() : "; what it was is kept as " + kept) +
             "\n");
    return kDone;
}

} // namespace

Command recoverCommand() {
    const auto arguments = std::make_shared<RecoverArguments>();
    return {"recover",
            "Bring an edit back from a backup, a milestone or a file set aside",
            {cookieOption(arguments->item),
             projectOption(arguments->project),
             {.name = "--from",
              .value = &arguments->from,
              .help = "The state to take, as 'qmedit history' names it: U1, R1, M3, CORRUPT",
              .form = "WHICH",
              .completes = Completes::States}},
            "Example:\n  qmedit recover E0001000 --from M3\n\n"
            "Without --from the sound states are listed, and the newest is taken if the edit itself "
            "cannot be read. What the edit was is kept as an undo backup, or as CORRUPT if damaged.",
            [arguments] { return runRecover(*arguments); }};
}
