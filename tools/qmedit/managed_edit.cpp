#include "tools/qmedit/managed_edit.h"

#include "tools/qmedit/console.h"
#include "tools/qmedit/revision_text.h"
#include "tools/qmedit/spare_room.h"

#include "edit/manager/revision_chain.h"
#include "edit/model/edit.h"
#include "edit/project/permissions_manager.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"
#include "platform/store/configb.h"

namespace {

/// How much larger than its file an edit may be written at most by a change of its header or cues.
constexpr uint64_t kGrowth = 65536;

RevisionChain chain(const cookie& item, RevisionChain::Kind kind) {
    return {item, kind, edit_manager::backupDepth()};
}

/// Tells of a backup that was opened in the place of an edit's file.
void reportRestored(const String& file, const OpenReport& report) {
    const String backup = String::format("undo backup %d was opened in its place", report.backup);
    if (report.wasMissing) {
        reportWarning(file + " was missing; " + backup);
        return;
    }
    const String& aside = report.setAside.front().path;
    reportWarning(file + " could not be read and was moved aside to " + aside + "; " + backup +
                  ". 'qmedit salvage " + aside + " --into DIR' saves what is sound of the damaged file");
}

void reportNotOpened(const cookie& item, const String& file, const OpenReport& report) {
    if (report.wasMissing || report.setAside.empty()) {
        reportError(report.status ? String(file + " could not be opened") : report.status.reason());
        return;
    }
    const String& aside = report.setAside.front().path;
    reportError(file + " could not be read and was moved aside to " + aside +
                "; no undo backup of it can be read. 'qmedit recover " + item.asString() +
                "' looks for milestones, 'qmedit salvage " + aside +
                " --into DIR' saves what is sound of the file");
}

String quotedChange(const String& change) {
    return change.empty() ? String("changes without a description") : "'" + change + "'";
}

} // namespace

ManagedEdit::ManagedEdit(const EditArguments& arguments)
    : m_arguments(arguments), m_session(arguments.project) {}

int ManagedEdit::prepare(bool mayBeGone) {
    if (const Qx::Status opened = m_session.openExisting(); !opened) {
        return failed(opened);
    }
    if (const Qx::Status locked = m_session.lockForWriting(); !locked) {
        return failed(locked);
    }
    m_session.manage();
    if (const Qx::Status found = m_session.findItem(m_arguments.item, m_item); !found) {
        return failed(found);
    }
    Vector<String> files;
    if (const Qx::Status listed = edit_manager::getEditFiles(m_item, files); !listed) {
        return failed(listed);
    }
    if (!mayBeGone && files.empty()) {
        EditPtr none;
        return failed(m_session.readEdit(m_item, none));
    }
    if (PermissionsManager::getReadOnly(m_item)) {
        return failed(Qx::Status::failure(m_item.asString() +
                                          " is marked read-only, so nothing was changed; have its owner take "
                                          "the mark off in the editor"));
    }
    return kDone;
}

bool openManaged(const cookie& item, EditPtr& edit, bool& wasRestored) {
    const String file = getFilenameForCookie(item);
    OpenReport report;
    const EditPtr opened = edit_manager::openEdit(item, eOpenExisting, report);
    if (!opened.valid()) {
        reportNotOpened(item, file, report);
        return false;
    }
    if (report.source == OpenReport::Source::Backup) {
        wasRestored = true;
        reportRestored(file, report);
    }
    edit = opened;
    return true;
}

String putFileBack(const cookie& item, EditPtr& edit) {
    edit.invalidate();
    if (!edit_manager::takeBackBackup(item)) {
        edit_manager::invalidateCache(item);
    }
    RevisionChain undo = chain(item, RevisionChain::Undo);
    int restored = 0;
    if (Qx::askFile(undo.file()).isMissing()) {
        static_cast<void>(undo.restoreNewest(restored).isOk());
    }
    return Qx::askFile(undo.file()).isRegular()
               ? String("the edit is as it was")
               : String("the edit is kept whole as its newest undo backup; 'qmedit recover " +
                        item.asString() + "' brings it back when there is room");
}

bool ManagedEdit::open(EditPtr& edit) {
    return openManaged(m_item, edit, m_wasRestored);
}

Qx::Status ManagedEdit::change(EditPtr& edit, const String& what, const std::function<void(Edit&)>& apply) {
    const String file = getFilenameForCookie(m_item);
    if (edit->get_read_only()) {
        return Qx::Status::failure(Qx::StatusCode::ReadOnly,
                                   what + ": " + m_item.asString() + " is marked read-only in its header");
    }
    SpareRoom room;
    if (const Qx::Status taken = room.take(file, 2 * Qx::askFile(file).info().size + kGrowth); !taken) {
        return taken.retold(what + ": " + taken.reason());
    }
    if (const Qx::Status kept = edit_manager::backup_edit(m_item); !kept) {
        return kept.retold(what + ": " + kept.reason() + "; " + putFileBack(m_item, edit) +
                           "; see whether the project can be written and has room");
    }
    room.giveBack();
    if (apply) {
        apply(*edit);
    }
    // The backup was the edit's file: it is written again, so that other programs find the edit.
    edit->init_dirty();
    if (!edit_manager::flush_edit(m_item)) {
        const String cause = edit->lastFileError();
        return Qx::Status::failure(what + ", as " + file + " could not be written: " + cause + "; " +
                                   putFileBack(m_item, edit));
    }
    return {};
}

String undoText(const ManagedEdit& managed, std::optional<size_t> numRedo) {
    return "; " + countText(managed.numUndo()) + " to undo" +
           (numRedo == size_t{0} ? String()
                                 : "; " + countText(numRedo) +
                                       (numRedo == size_t{1} ? " redo backup went" : " redo backups went"));
}

namespace {

std::optional<size_t> numBackups(const cookie& item, RevisionChain::Kind kind) {
    std::vector<int> numbers;
    return chain(item, kind).numbers(numbers) ? std::optional(numbers.size()) : std::nullopt;
}

} // namespace

std::optional<size_t> ManagedEdit::numUndo() const {
    return numBackups(m_item, RevisionChain::Undo);
}

std::optional<size_t> ManagedEdit::numRedo() const {
    return numBackups(m_item, RevisionChain::Redo);
}

String countText(std::optional<size_t> count) {
    return count ? std::to_string(*count) : "an unknown number";
}

int stepRevision(const EditArguments& arguments, bool redo) {
    const char* const verb = redo ? "redo" : "undo";
    const char* const done = redo ? "redid" : "undid";
    ManagedEdit managed(arguments);
    if (const int code = managed.prepare(); code != kDone) {
        return code;
    }
    const cookie& item = managed.item();
    EditPtr edit;
    if (!managed.open(edit)) {
        return kFailed;
    }
    if (managed.wasRestored()) {
        return failed(Qx::Status::failure(String("nothing was ") + (redo ? "redone" : "undone") +
                                          ": look at the backup first ('qmedit show " + item.asString() +
                                          "'), then " + verb + " again"));
    }
    int number = 0;
    const Qx::Status found = chain(item, redo ? RevisionChain::Redo : RevisionChain::Undo).findNewest(number);
    if (!found) {
        return failed(found);
    }
    if (number == 0) {
        return failed(Qx::Status::failure(
            String("there is nothing to ") + verb + ": " + item.asString() + " has no " + verb + " backup; " +
            (redo ? "an undo makes one" : "'qmedit backup " + item.asString() + "' makes one")));
    }
    String change = changeText(ownChangeOf(std::as_const(*edit).Opts()));
    edit.invalidate();
    String notice;
    if (!(redo ? edit_manager::redoRequest(item, &notice) : edit_manager::undoRequest(item, &notice))) {
        return failed(Qx::Status::failure(item.asString() +
                                          " is as it was: its files could not be moved; see "
                                          "whether the project can be written (QMEDIT_LOG=1 tells more)"));
    }
    if (!notice.empty()) {
        reportWarning(notice);
    }
    edit = edit_manager::openEdit(item, eOpenExisting);
    if (redo && edit.valid()) {
        change = changeText(edit->getChangeDescription());
    }
    writeOut(item.asString() + ": " + done + " " + quotedChange(change) +
             String::format("; the edit is what %s backup %d was, last changed %s; %s to undo, %s to redo\n",
                            verb, number,
                            localTimeText(edit.valid() ? edit->getModificationTime() : 0).c_str(),
                            countText(managed.numUndo()).c_str(), countText(managed.numRedo()).c_str()));
    return kDone;
}
