#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/managed_edit.h"
#include "tools/qmedit/revisions.h"

#include "edit/manager/revision_chain.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"

#include <algorithm>
#include <memory>

namespace {

struct RecoverArguments : EditArguments {
    std::string from;
};

const Revision* itself(const std::vector<Revision>& revisions) {
    const auto place = std::find_if(revisions.begin(), revisions.end(),
                                    [](const Revision& r) { return r.kind == Revision::Itself; });
    return place == revisions.end() ? nullptr : &*place;
}

Qx::Status failure(const Qx::FileError& error) {
    return error ? Qx::Status::failure(error.text()) : Qx::Status();
}

/// Puts a copy of one state in the edit's place. What is there becomes an undo backup, or a file set aside
/// when it is damaged; `kept` is its name afterwards, empty when there was none. On a failure the edit is as
/// it was, or kept under that name.
Qx::Status replaceBy(const cookie& item, const Revision& taken, const Revision* present, String& kept) {
    RevisionChain undo(item, RevisionChain::Undo, edit_manager::backupDepth());
    const String& file = undo.file();
    // Copied first: keeping the present state may move the one that is taken to another name.
    const String copy = file + kRecoveryCopy;
    if (Qx::Status copied = failure(Qx::copyFile(taken.path, copy)); !copied) {
        return copied;
    }
    Qx::Status status;
    if (present != nullptr && present->isSound()) {
        status = undo.push();
        kept = undo.path(1);
    } else if (present != nullptr) {
        status = findCorruptName(file, kept);
        if (status) {
            status = failure(Qx::fileSystem().rename(file, kept));
        }
    }
    if (status) {
        status = failure(Qx::fileSystem().rename(copy, file));
    }
    if (!status && !kept.empty() && Qx::askFile(file).isMissing()) {
        // What was there comes back. A failure is told of by the caller, who looks where it is.
        int restored = 0;
        static_cast<void>(present->isSound() ? undo.restoreNewest(restored).isOk()
                                             : !Qx::fileSystem().rename(kept, file));
    }
    if (!status) {
        static_cast<void>(Qx::fileSystem().remove(copy).code);
        return status;
    }
    const Qx::FileError error = Qx::fileSystem().syncFolder(Qx::folderOf(file));
    return failure(error);
}

/// Says why no state can be taken and what else can be done.
int reportNoneSound(const cookie& item, const std::vector<Revision>& revisions,
                    const ProjectSession& session) {
    if (revisions.empty()) {
        return failed(Qx::Status::failure("there is nothing of " + item.asString() + " in the project " +
                                          session.root() + "; 'qmedit list' shows the edits there are"));
    }
    const Revision* const present = itself(revisions);
    const String& file = present != nullptr ? present->path : revisions.front().path;
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
    const std::vector<Revision> revisions = revisionsOf(item);
    const Revision* const present = itself(revisions);
    if (present != nullptr && present->refused) {
        return failed(Qx::Status::failure("nothing was changed: " + present->path +
                                          " may be sound, but cannot be read here: " + present->damage));
    }
    const Revision* taken = nullptr;
    if (!arguments.from.empty()) {
        taken = asked(arguments.from, item, revisions);
        if (taken == nullptr) {
            return kFailed;
        }
    } else {
        taken = newestSound(revisions);
        const bool presentIsSound = present != nullptr && present->isSound();
        if (taken == nullptr && !presentIsSound) {
            return reportNoneSound(item, revisions, managed.session());
        }
        showCandidates(revisions);
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
    if (const Qx::Status replaced = replaceBy(item, *taken, present, kept); !replaced) {
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
              .form = "WHICH"}},
            "Example:\n  qmedit recover E0001000 --from M3\n\n"
            "Without --from the sound states are listed, and the newest is taken if the edit itself "
            "cannot be read. What the edit was is kept as an undo backup, or as CORRUPT if damaged.",
            [arguments] { return runRecover(*arguments); }};
}
