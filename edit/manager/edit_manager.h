#pragma once

#include "edit/manager/open_report.h"
#include "edit/model/edit.h"
#include "edit/model/edit_registry.h"
#include "platform/base/vector.h"
#include "platform/media/tv_standard.h"
#include "platform/notify/notifier.h"
#include "platform/notify/val_server.h"
#include "platform/services/network.h"

#include <functional>
#include <memory>
#include <span>

class projdb;

using CookieVec = Vector<cookie>;

/// The outcome of the project operations.
enum class eStatus { Ok = 0, NoProject = 1, NotFound = 2, NotWritable = 3 };

/// An edit with changes that are not on the disk, and why the last attempt to write it failed; a success when
/// none was made.
struct UnwrittenEdit {
    cookie item;
    Qx::Status why;
};

/// One place of the cache: an item and its edit. A null edit remembers that the item could not be opened.
struct EditCacheEntry {
    cookie item;
    EditPtr edit;
};

/// The one registry of open edits of a process. It finds an edit by its cookie, reads it when it is not
/// cached, falls back to its backups when its file is missing or unreadable, writes changed edits, keeps
/// their revisions, and tells the rest of the system when the project changes, changes are flushed, the cache
/// is dropped or an edit is deleted. What it leaves to others: reading and writing a file (`Edit`), the
/// numbered files beside one (`RevisionChain`), milestone copies (`MilestoneRing`), the project's records
/// (`projdb`).
///
/// All operations are static; the one instance exists for its roles towards others: it is the model's
/// `EditRegistry` and hears messages of other seats. It is made when the first edit is opened, unless the
/// application made one before, and shut down by `edit_exit`, which the library calls itself when the process
/// ends (`exit`, return from `main`): what is still open then is written, so that a program which forgets to
/// close loses nothing. A thread that holds an edit's section is waited for. After a shut-down opening yields
/// a null handle until another instance is made.
///
/// Threads: any thread may call anything. One recursive lock guards the cache, the project edit and every
/// write of an edit file made here; it is never held while an edit file is read, and finding an edit in the
/// cache takes a lock of its own for a few instructions. Openings of one item take
/// turns. An edit itself is not locked: who changes it while another thread flushes must hold its section, as
/// the flush does. Under an edit's section every operation may be called but leaving a project and closing
/// all edits. Threads that are inside one edit each and want the other's written, backed up or read again do
/// not wait for each other for ever: one is refused, with nothing changed. Observers are told under none of
/// the manager's locks.
///
/// Projects: what was opened for one project is never found from another, nor written into it. While a
/// project is being left, opening yields a null handle, which is not remembered.
///
/// Processes: what is written, renamed and deleted here is so under the project's `EditManagerLock`. A file
/// that another process put in an edit's place since it was read is never lost: it becomes an undo backup
/// when the edit is written.
///
/// Nothing here throws.
class QM_API edit_manager : public EditRegistry {
public:
    /// Destroys any manager there is (which must have been made with `new`), clears network mode and becomes
    /// the model's registry, with an empty cache. "backup_depth" (10, at least 1) is read here, and
    /// "edit_cache_size" (-1, no limit) at the first opening. For a user with the network right it hears the
    /// messages of the service that is in place: an edit that another seat stored is read again, one that it
    /// deleted leaves the cache.
    edit_manager();
    /// Shuts down: flushes when the crash flag is set, brings the project's records up to date if they are
    /// open and the platform agrees, calls the user interface's delete callback, closes every edit.
    ~edit_manager() override;

    [[nodiscard]] static edit_manager* theEditManager();
    /// Installs an instance (owned from then on) in the place of the present one, which is destroyed. Null
    /// only destroys.
    static void theEditManager(edit_manager* manager);

    /// \name Opening and the cache
    /// A cached edit, or a failure that is remembered, costs one lookup, no file and no memory, and waits for
    /// nobody who writes, also with a limit to the cache. A failure is remembered only where it is one for
    /// certain: not while there are backups of the item, and not when the system, another process or a lack
    /// of memory kept its file from being read. `eOpenOrCreate` makes a fresh edit only then too. What lies
    /// at the edit's name and is no regular file (a symbolic link, a folder) is neither read nor replaced.
    /// @{
    [[nodiscard]] EditPtr open(const cookie& item, eEditOpenBehaviour behaviour) override;
    /// The same without an instance at hand.
    [[nodiscard]] static EditPtr openEdit(const cookie& item, eEditOpenBehaviour behaviour);
    /// The same, and `report` tells what was done. For a failure that is remembered it is the report of the
    /// opening that failed.
    [[nodiscard]] static EditPtr openEdit(const cookie& item, eEditOpenBehaviour behaviour,
                                          OpenReport& report);
    /// True if the edit is in memory.
    [[nodiscard]] static bool get_present(const cookie& item);
    /// How many items the cache has, remembered failures included.
    [[nodiscard]] static size_t numCached();
    /// With `limit` not -1 and at least `limit` entries: writes and drops the first edit, in the order of
    /// cookies, that nobody but the cache holds. At most one a call. An edit with changes that cannot be
    /// written, also because another process keeps the lock, stays, and the next one is tried. What
    /// "edit_cache_size" asks for at each opening is less: it waits for no thread and looks at some edits
    /// only, each time the next ones.
    static void limitEditCache(int limit);
    /// Drops an edit from the cache, unwritten, so that the next opening reads its file; forgets a remembered
    /// failure. Handles that others hold stay usable, but their edit is no longer the item's: changes to it
    /// are not written any more. Observers hear "editmanInvalidateCache" first. False if it was not there.
    static bool invalidateCache(const cookie& item);
    /// An edit's file was changed elsewhere: drops the edit and, with `reopen`, opens it again if it was in
    /// memory. Observers hear "editmanInvalidateCache" first. An edit with changes of its own is not dropped:
    /// what the file holds is kept as an undo backup at the next write.
    static void reloadRequest(const cookie& item, bool reopen);
    /// @}

    /// \name Writing
    /// @{
    /// Opens the edit and writes it if it was changed. False if it does not open or could not be written.
    static bool flush_edit(const cookie& item);
    /// Sends "editmanFlushChanges", so that editors push what they hold back into their edits, and then
    /// writes every changed edit, with milestones where they are due, and the project edit. Edits that could
    /// not be written stay on the dirty list. The clipboard edit goes last, and waits while another edit
    /// could not be written. True if all were written.
    static bool flush_changes();
    void addToDirtyList(const cookie& item) override;
    /// How many edits wait to be written.
    [[nodiscard]] static size_t numDirty();
    /// The edits that wait to be written, in the order of their cookies, with what kept them from it.
    [[nodiscard]] static Vector<UnwrittenEdit> unwrittenEdits();
    /// Writes every edit and empties the cache; one whose file became a backup and was not written since gets
    /// its file back. Edits that others hold are logged with their references, and
    /// changes to them are not written any more. One that could not be written is told of on standard output
    /// too.
    static void close_all_edits();
    /// @}

    /// \name Revisions
    /// The code of the backups is `RevisionChain`, of the milestones `MilestoneRing`.
    /// @{
    /// Makes an undo backup of the edit's present state: what the edit is in memory, also when its file went
    /// bad or was replaced meanwhile. The edit stays in memory; its file goes until it is written next. An
    /// edit whose file is missing because it was not changed since its last backup is written first, so that
    /// every call leaves one more file. What could be redone is deleted, last. Fails for an edit that is
    /// read-only (`ReadOnly`), does not open (with the kind that `openEdit` reports), is being dropped or
    /// whose section cannot be had (`Locked`), or whose files could not be written or moved (with what the
    /// system said): the edit is under its name and both chains are as they were, but what could be redone
    /// may be gone when a deletion or the last sync failed.
    static Qx::Status backup_edit(const cookie& item);
    /// Takes back what the last `backup_edit` did to the files of an edit that was not written since, because
    /// it could not be: the edit's file comes back under its name, what could be redone into its chain. The
    /// edit in memory, with its changes, is dropped. (A backup beyond the depth that went stays away.) False,
    /// with nothing changed, when there is nothing to take back or the file cannot be moved.
    static bool takeBackBackup(const cookie& item);
    /// True if there is an undo backup in the depth, or right behind it where a deeper chain was kept before;
    /// also when that could not be told.
    [[nodiscard]] static bool undoExists(const cookie& item);
    /// True if there is a redo backup 1; also when that could not be told.
    [[nodiscard]] static bool redoExists(const cookie& item);
    /// Steps back or forward one revision; the clipboard edit goes with it where the revision used it. The
    /// edit's file becomes the revision's, byte for byte, and the edit is read again into another object. A
    /// revision that is damaged is set aside as ".CORRUPT" and the next one taken, if there is one that is
    /// sound. Observers hear "editmanInvalidateCache" after the moves, and those who watch either object are
    /// told of the step. The edit then gets the owner that it had and, through
    /// `Edit::setChangeDescription`, the description of the change that was undone, inverted, or of the one
    /// that was redone: it is dirty and counts one change more. Fails, with everything as it was, if there is
    /// no such revision (`NotFound`; for a redo: no backup 1), none is sound (`Damaged`; `Refused` when one
    /// could not be read, or a later version of this program wrote it), the edit is read-only for the user (`ReadOnly`), another thread has it (`Locked`), a file could not be written
    /// or moved (with what the system said), or the revision does not open.
    /// `notice`, when given, receives a sentence when the clipboard edit should have gone with it and could
    /// not; it is left empty otherwise.
    static Qx::Status undoRequest(const cookie& item, String* notice = nullptr);
    static Qx::Status redoRequest(const cookie& item, String* notice = nullptr);
    /// Delete backup `keep` + 1, `keep` + 2, ... up to the depth, and stop at the first that is not there or
    /// cannot be deleted.
    static void delete_redo_edits(const cookie& item, int keep);
    static void delete_backup_edits(const cookie& item, int keep);
    [[nodiscard]] static int backupDepth();
    /// @}

    /// \name Deleting
    /// @{
    /// Deletes an edit's file with all its backups, after the notices: the backups first, so that what is
    /// left by a crash is the edit or nothing, never an older state in its place. False for one that is
    /// read-only or in use by others than the cache, unless `force`, for one that has no files, and when a
    /// file could not be removed: the edit is there still, without those of its backups that could be
    /// removed. Other seats are told. Milestones stay, and what was set aside as ".CORRUPT"; no new edit gets
    /// the cookie.
    static bool delete_edit_file_and_backups(const cookie& item, bool force);
    /// The same for many, of which those that can be deleted are: all notices come first, then the folder is
    /// gone through once. True if all were deleted.
    static bool deleteEditFilesAndBackups(const CookieVec& items, bool force);
    /// The paths of an edit's file and all its backups that are there, the file first, then undo, then redo.
    /// Fails, leaving `files`, when the system could not tell.
    static Qx::Status getEditFiles(const cookie& item, Vector<String>& files);
    /// The same; empty also when the system could not tell, which is logged.
    [[nodiscard]] static Vector<String> getEditFiles(const cookie& item);
    /// Tells the edit's observers, and those of "editDeleted", that it is about to go. A hidden edit's
    /// deletion is told only with the setting "notify_hidden_deleted".
    static void issuePreDeletionNotifications(const cookie& item);
    /// An edit was deleted at another seat: notices, then it leaves the cache unwritten.
    static void handleNetDelete(const cookie& item);
    /// @}

    /// \name Project
    /// @{
    /// Closes the present project and makes `project` the current one: its folder must be there, or with
    /// behaviours 1 and 2 is made. Its settings become those of `Qx::currentProject`. Observers hear
    /// "editmanProjectChanged". `NoProject` for a cookie that names no project and without a root folder,
    /// `NotFound` for one that is not there or does not read, `NotWritable` for one that cannot be made;
    /// nothing has changed then.
    static eStatus set_current_project(const cookie& project, eEditOpenBehaviour behaviour);
    /// Ok if a project is current. When the application has set another one meanwhile, the edits of the one
    /// before are written to their own folder and closed, and that one is adopted.
    static eStatus check_current_project(eEditOpenBehaviour behaviour);
    /// Flushes, tells observers of "editmanExitProject", closes every edit and the project's records. Nothing
    /// when another thread is leaving the project.
    static void exitProject();
    /// The same; `lost` gets the edits that could not be written.
    static void exitProject(Vector<UnwrittenEdit>& lost);
    /// The edit of the project's own cookie, opened or made when it is first asked for; null without a
    /// project. Valid until the edits are closed.
    [[nodiscard]] static Edit* get_current_project();
    [[nodiscard]] static cookie get_current_project_cookie();
    /// True if the project has no edit file.
    [[nodiscard]] static bool projectIsEmpty();
    [[nodiscard]] static String getProjectName(const cookie& project);
    [[nodiscard]] static Qx::Ed2Support::TVStd getProjectTvStd(const cookie& project);
    /// One line for people: name, rate, number of edits.
    [[nodiscard]] static String getProjectSummary(const cookie& project);
    /// The next free edit cookie; invalid when none can be had. `taken` are cookies that must not be handed
    /// out, neither here nor later (`CookieAllocator`).
    [[nodiscard]] static cookie new_edit(std::span<const cookie> taken = {});
    /// @}

    /// \name The project's records
    /// @{
    [[nodiscard]] static bool getProjDBValue(const String& key, String& value,
                                             const cookie& project = invalid_cookie);
    static bool setProjDBValue(const String& key, const String& value);
    /// The records of the current project; null without one. Opened on first use.
    [[nodiscard]] static projdb* get_projdb();
    /// Makes the records say what the files say. `progress` hears done and total and may answer false to
    /// interrupt. False if it was interrupted or could not be done.
    static bool update_projdb(const std::function<bool(size_t done, size_t total)>& progress = nullptr);
    void updateProjdbRec(const cookie& item, bool create) override;
    /// @}

    /// \name Followed values
    /// @{
    [[nodiscard]] static ValServer<cookie>& getFocusEditServer();
    [[nodiscard]] static cookie getFocusEditCookie();
    static void setFocusEditCookie(const cookie& item);
    [[nodiscard]] static ValServer<cookie>& getSourceEditServer();
    [[nodiscard]] static cookie getSourceEditCookie();
    static void setSourceEditCookie(const cookie& item);
    [[nodiscard]] static ValServer<cookie>& getRecordEditServer();
    [[nodiscard]] static cookie getRecordEditCookie();
    static void setRecordEditCookie(const cookie& item);
    [[nodiscard]] static ValServer<bool>& getMixerBypassServer();
    static void setMixerBypass(bool bypass);
    /// @}

    /// \name Notifications
    /// The text of a message is the cookie's text where it is about one item.
    /// @{
    [[nodiscard]] static NotifyMsgType projChangedMsgType();
    [[nodiscard]] static NotifyMsgType projExitMsgType();
    [[nodiscard]] static NotifyMsgType flushChangesMsgType();
    [[nodiscard]] static NotifyMsgType invalidateCacheMsgType();
    [[nodiscard]] static NotifyMsgType editDeletedMsgType();
    [[nodiscard]] static Qx::Ptr<Qx::Guard> registerNotification(NotifyMsgType type,
                                                                 Notifier::Listener listener);
    static void deregisterNotification(Qx::Ptr<Qx::Guard>& subscription) { subscription.reset(); }
    /// @}

    /// \name Memory reclamation
    /// @{
    /// Drops unreferenced edits until none is left.
    virtual void limitUsage();
    /// Drops at most one.
    virtual void purge();
    virtual void reportUsage();
    /// @}

    /// Called with true when the manager shuts down, so that a user interface can let go of its edits.
    static void setUiDeleteFn(std::function<void(bool)> callback);
    /// Asked at shut-down whether the project's records shall be brought up to date. Without one they are
    /// not.
    static void setConfirmUpdateFn(std::function<bool()> callback);

private:
    std::shared_ptr<Qx::Network::Service> m_service;
    std::shared_ptr<void> m_listening; ///< to other seats, for a user with the network right
};

/// The library's exit hook: reports and destroys the manager, which writes what is open. After a crash it
/// says what was open. The library calls it when the process ends, unless the application did or the process
/// is a copy (`fork`) of the one that opened the edits; calling it again does no harm.
QM_API void edit_exit();
