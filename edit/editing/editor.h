#pragma once

#include "edit/editing/edit_module.h"
#include "edit/editing/edit_operation.h"
#include "edit/model/cel.h"

#include <map>
#include <memory>

/// Performs one editing operation (`edit_operation`) from a source module into a destination module, or
/// within the destination. The one way in is the static `apply`; an object lives for the length of one call.
///
/// What it owns: working out what an operation means for each channel, and seeing to all that goes with it:
/// channels that are missing, levels, effects bound to events, cues, groups, black, the clipboard edit, the
/// backup before, the description after. The changes themselves are those of `cel` and `AudLevelsCel`.
///
/// **Whole or not at all.** Every reason to refuse is found before the first change. A refused operation has
/// changed nothing: no edit, no file, no clipboard, no revision.
///
/// **Channels** correspond by kind (effects, video, audio) and by order among the selected ones of either
/// side. Where a source has more, and no channel of the kind is deselected in the destination, channels are
/// added for those that hold something; otherwise the surplus is left out. Where the destination has more, an
/// insert opens them with black, `ReplaceToEnd` ends them, and other operations leave them alone. An
/// operation that needs a source is refused when no selected channel of it goes anywhere.
///
/// **Shots.** A source that is a shot (`Edit::isShot`) is not copied but named: what is laid plays the shot,
/// by the shot's own times, with the levels and effects that the shot has. The content of any other source is
/// copied.
///
/// **Regions.** The source region of a channel is its own marked region, else the module's, else all that the
/// source holds, from its first event to its last. Regions of different channels keep their distance from one
/// another. The place in the destination is a channel's own mark, else the module's (earliest in, latest
/// out), else the current time (`EditModule::getMarkedPlace`). Marks that were set the wrong way round are
/// put in order, on both sides and for every operation. `SwapTracks` works on the module's marked region on
/// both channels. What the source does not have within its region is black. The lengths by which channels
/// move are worked out once for all of them, so that picture and sound stay in step to the sample however
/// many operations are done.
///
/// **Frames.** Unless `ExactTimes` is asked for, marks and the current time are rounded to whole frames,
/// those of the destination in the destination and those of the source in the source, and a region is whole
/// frames of the destination long. The cuts of a source whose frame rate is another one are moved to the
/// nearest frame of the destination; what plays at a time stays, each clip is trimmed or drawn out by less
/// than a frame, and one that is rounded to nothing is left out. `Result::notice` tells of it. Cuts of a
/// source of the same rate stay as they are, also those that lie between frames. Here '^' stands at the
/// frames of the destination and a cut lies between two of them:
///
///     aaabbbbb  ->  aaaabbbb
///     ^   ^   ^     ^   ^   ^
///
/// **Lengths.** `Lift`, `SwapTracks`, `CopyTrack` and `MoveTrack` change no channel's length. What ends with
/// the region ends with black, on an effects channel too; where a channel ends before the region does,
/// nothing is laid behind its end, and the operation is refused if anything but black would be left out so:
///
///                  [ ]                        [ ]
///     CopyTrack  AAA.BB  ->  AAA.BB         AAAABB    refused: the second channel ends
///                CCC         CCA            CCC       before what it would hold
///
/// **Black.** Video and audio channels are continuous: an operation that lays something behind a channel's
/// end fills up with black to it, gaps of what is laid become black, and where channels can change in length
/// all are as long as the longest afterwards. Adjacent black is merged where the operation made it, but for
/// black that an effect is bound to and where a cue is attached to an event that would go. Effects channels
/// keep their gaps and are not filled; black on one is no effect.
///
/// **Levels** go with their audio channel: what is laid brings its levels along, or those of its clips, and
/// what moves is heard as before. A levels channel is added where the source has levels and the destination
/// has none. `ReplaceMaterial` leaves the levels.
///
/// **Effects** bound to events, graphs in the edit's store under the event's stamp, are copied with the
/// events, all nodes of them. An event that is cut in two leaves both parts with a graph of their own, each
/// with its part of the keyframes. Inputs of what is copied to another edit name the channels there that
/// correspond; those that have none are not wired. What loses its event is noted in the edit's
/// `OrphanedComponentList`.
///
/// **Transitions** (edit/model/transition.h) stay while both their clips do. One that is cut through, that
/// something comes to lie beside, or a clip of which goes, is taken out first: the clip that stays plays on
/// alone to the cut, and `Result::notice` says so. A clip may be trimmed at the transition by a removal: the
/// transition then joins what is left of it. Here '-' is the transition of A and B:
///
///     AAAA----BBBB    Insert "cc" at 6    AAAAAAccBBBBBB
///     AAAA----BBBB    Remove [2, 4)       AA----BBBB
///     AAAA----BBBB    Remove [0, 4)       BBBBBBBB
///
/// **Cues** that are attached follow their events, by `SwapTracks` and `MoveTrack` also to the other channel,
/// and go with an event that goes; a cue that is attached to nothing stays where it is.
///
/// **Sync.** When an insert or a removal moves what channels hold by different amounts, each channel's
/// recorded sync loss changes by how much further it moved than the picture: the first video channel with
/// something behind the place, else the first audio channel. Channels without anything there lose nothing.
///
/// **Undo.** When the destination is an edit that the manager has in its cache, it is backed up first, and a
/// failure to do so refuses the operation. Without a manager, or for an edit that is not the manager's, the
/// operation works and cannot be undone by it.
///
/// **Clipboard.** What a removing or overwriting operation takes away is put, from time 0 on, into the
/// clipboard edit, which is backed up too, and "CLIPBOARD_USED" is set in the destination. The clipboard
/// stays as it is when it is the source or the destination itself, with `KeepClipboard`, and when there is no
/// manager to open it; where it cannot be opened, written or backed up the log says so and the operation goes
/// on.
///
/// The source may be the edit of the destination: the result is as if it had been copied first.
///
/// Observers of the destination's change description hear of an operation exactly once, when it is done.
/// Threads: one thread at a time for the edits involved, as for `Edit`. The destination's section is held
/// throughout, and the clipboard's while it is filled, so that the manager may save on another thread; who
/// shares the source holds that. Nothing here throws but when memory runs out.
class QM_API Editor {
public:
    /// Flags of `apply`, to be combined. Another bit refuses the operation.
    enum Flags : unsigned {
        ExactTimes = 1,    ///< marks, times and cuts as they are, not rounded to whole frames
        KeepClipboard = 2, ///< the clipboard edit stays as it is
        NoBackup = 4,      ///< no undo backup is made; implies `KeepClipboard`
        NoNewChannels = 8  ///< no channel is added: what would need one is left out
    };

    /// The outcome of an operation. The default is that of one that did nothing.
    class QM_API Result {
    public:
        /// Where the destination's current time belongs: the end of what was laid, its start for the
        /// operations that work backwards, the place of a removal; for the others the module's own.
        [[nodiscard]] double curTime() const { return m_curTime; }
        /// False when the destination's marks mean nothing any more: after an insert or a removal.
        [[nodiscard]] bool markValid() const { return m_markValid; }
        /// True if a channel lost its sync.
        [[nodiscard]] bool syncLoss() const { return m_syncLoss; }
        /// The operation's own, or `kChansInserted` when channels were added.
        [[nodiscard]] EditModificationType notificationType() const { return m_type; }
        /// True if the operation was done.
        [[nodiscard]] bool valid() const { return m_type != kNoModification; }
        /// Why it was refused, with its kind: `BadArgument` for what the marks, channels or flags do not
        /// allow, `ReadOnly`, `Damaged` for a destination that could not be read; else why it could not be
        /// backed up. A success when it was done, and for the default.
        [[nodiscard]] const Qx::Status& status() const { return m_status; }
        /// Its sentence: one line for a person, empty when it was done.
        [[nodiscard]] const String& reason() const { return m_status.reason(); }
        /// What a person should know of an operation that was done: one line; empty when it was done just as
        /// asked. It tells that cuts were moved to whole frames (see Frames) and transitions taken out.
        [[nodiscard]] const String& notice() const { return m_notice; }

    private:
        friend class Editor;
        double m_curTime = Qx::kNoTime;
        bool m_markValid = true;
        bool m_syncLoss = false;
        EditModificationType m_type = kNoModification;
        Qx::Status m_status;
        String m_notice;
    };

    /// Performs an operation. `source` is not looked at by operations that need none.
    static Result apply(const EditModule& source, const EditModule& destination, edit_operation op,
                        unsigned flags = 0);

    /// \name What an operation is (the functions of edit_operation.h)
    /// @{
    [[nodiscard]] static edit_operation getCoreEditOperation(edit_operation op) {
        return ::getCoreEditOperation(op);
    }
    [[nodiscard]] static bool editOpRequiresSourceAndDest(edit_operation op) {
        return ::editOpRequiresSourceAndDest(op);
    }
    [[nodiscard]] static bool editOpIsInterTrack(edit_operation op) { return ::editOpIsInterTrack(op); }
    [[nodiscard]] static bool editOpIsBackwards(edit_operation op) { return ::editOpIsBackwards(op); }
    [[nodiscard]] static bool editOpAffectsTrackSync(edit_operation op) {
        return ::editOpAffectsTrackSync(op);
    }
    [[nodiscard]] static bool editOpCanAffectTrackLength(edit_operation op) {
        return ::editOpCanAffectTrackLength(op);
    }
    [[nodiscard]] static bool editOpRequiresClipboard(edit_operation op) {
        return ::editOpRequiresClipboard(op);
    }
    /// @}
    /// True if the present revision of an edit put something into the clipboard edit.
    [[nodiscard]] static bool wasClipboardUsed(const EditPtr& edit);

    Editor(const Editor&) = delete;
    Editor& operator=(const Editor&) = delete;

private:
    class EditOpPerformer;
    struct Target;
    struct Step;
    struct Plan;
    class Planner;
    class CueFollower;
    class ObjectFollower;
    using SrcToDestChanMap = std::map<IdStamp, IdStamp>;

    explicit Editor(unsigned flags);
    ~Editor();

    Result applyInternal(const EditModule& source, const EditModule& destination, edit_operation op);
    /// False with `m_refusal` set; nothing was changed then.
    bool doPreEditTasks(const EditModule& source, edit_operation op);
    bool makePlan(const EditModule& source, edit_operation op);
    bool backUp();
    void autoAddTracks();
    void autoAddLevels();
    void autoCreateTrackGroups(const EditModule& source);
    void tellOfClipboard(const char* what);
    void doClipboardEditing(edit_operation op);
    void performEdit(const EditModule& source, edit_operation op, Result& result);
    void performEdit(edit_operation op, Result& result);
    void perform(edit_operation op, Result& result);
    void makeChanges(edit_operation op, CueFollower& cues, ObjectFollower& objects);
    void padTracksWithBlack(edit_operation op);
    void simplifyBlack();
    void noteTouched(const IdStamp& chan, const cel::Range& span);
    void verifyTracks();
    [[nodiscard]] bool recordInterTrackSyncLosses();
    [[nodiscard]] static bool stereoscopicExpansionRequired(const EditModule& source,
                                                            const EditModule& destination, edit_operation op);
    void doPostEditTasks(Result& result);
    [[nodiscard]] static bool checkMarks(const EditModule& module) { return module.getEdit().valid(); }
    /// Adds a channel with content to an edit; its stamp, or the null one.
    static IdStamp setCel(Edit& edit, Edit::ChanType type, std::unique_ptr<cel> content);
    [[nodiscard]] cel* celOf(const IdStamp& chan) const;
    [[nodiscard]] static EditPtr openClipboard();

    unsigned m_flags;
    EditModule m_destination; ///< the working copy
    EditPtr m_source;         ///< the edit whose objects are copied with its events
    SrcToDestChanMap m_map;
    std::unique_ptr<Plan> m_plan;
    std::map<IdStamp, cel::Range> m_touched; ///< where the content of channels was changed
    Vector<IdStamp> m_added;
    size_t m_numLevelsAdded = 0;
    IdStamp m_firstLevelsAdded;
    EditModificationType m_type = kNoModification;
    bool m_clipboardReady = false;
    Qx::Status m_refusal;
    String m_notice;
    String m_clipboardNotice;
    String m_effectsNotice;
};
