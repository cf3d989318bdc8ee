#pragma once

#include "edit/model/channel_group.h"
#include "edit/model/channel_types.h"
#include "edit/model/edit_chan_time_info.h"
#include "edit/model/edit_modification.h"
#include "edit/model/edit_ptr.h"
#include "edit/model/edit_types.h"
#include "platform/base/ptr.h"
#include "platform/base/status.h"
#include "platform/base/vector.h"
#include "platform/media/frame_rate.h"
#include "platform/notify/notifier.h"
#include "platform/store/dirtiable.h"

#include <atomic>
#include <memory>
#include <optional>
#include <vector>

// Whoever uses one of these includes the header that is named after it.
class AudCel;
class AudLevelsCel;
class ChannelGroupList;
class FXGraphNodeBase;
class LogAttributeMap;
class MediumRoll;
class QxUMID;
class TagBag;
class TextFile;
class VFXCel;
class VidCel;
class ce_handle;
class cel;
class configb;
class criticalSection;
class cue_list;
class edit_label;
struct EditUpgrade;
struct MediumRollIdent;
struct ShotVideoMetadata;
enum UserLabelType : int32_t;
enum class LogAttribute : uint32_t;
template <typename T>
class Tag;
template <typename T>
class ValServer;
namespace Qx::Ed2Support {
struct TVStd;
}

/// One edit in memory: a header of named properties and an ordered set of channels, each with its cel.
///
/// The class is the face that callers know; the work is done in parts with one job each: header accessors
/// (edit_header.cpp), the channel set (detail/channel_set.h), dirt, changes and notification
/// (edit_changes.cpp), cues, groups, the file (edit/persist). It owns its channels and objects; undo and the
/// cache of open edits are the manager's.
///
/// Threads: handles and `numConstructed` may be used from any thread at any time. Everything else takes no
/// lock: one edit is used by one thread at a time, and callers that share it hold `section()` around what
/// they do. Of the edit's own operations only the first fetch of the channel groups takes it. Different edits
/// are independent. Notifications run synchronously on the thread that makes a change; an observer may change
/// the edit, subscribe, unsubscribe, and drop the last handle (the edit then goes once everybody is told).
///
/// Answers: queries for an unknown index or stamp give `NO_CHAN`, the null stamp, a null cel, an empty text
/// or (`NoChan`, `INVALID`) and never fail otherwise. An operation that answers false, or a null stamp, or
/// `NO_CHAN`, has changed nothing.
///
/// Changes: a write of the header dirties the edit. The operations on channels, names, groups and cues either
/// record a change of their own (counted in "MOD_COUNT", described, dirtied, announced) or, where they are a
/// part of what a caller describes with `setChangeDescription`, dirty only; each says which. Where one has an
/// argument `notify`, that decides.
///
/// Read-only: what a save would lose is refused. While the edit is read-only, for the user or by its header,
/// and is no temporary one, the operations that change channels, groups and kept cues answer false with a
/// line in the log. Cels and levels are changed through their own operations, which know of no edit: ask
/// first.
class QM_API Edit : public Notifier, public Dirtiable {
public:
    /// Type and subtype of a channel; the default is "not found".
    struct ChanType {
        Edit_Chan_Type type = NoChan;
        Edit_Chan_SubType subtype = Edit_Chan_SubType::INVALID;
        bool operator==(const ChanType&) const = default;
    };
    /// Outcome of reading a file.
    enum ReadFileRC : int { kReadOk = 0, kReadFailed = 1 };
    /// What the header lets users do with the edit. The numbers live in files.
    enum Permissions : int { kPermissionsNone = 0, kPermissionsRead = 1, kPermissionsAll = 2 };

    /// The revision of the content that this library writes. It lives in files.
    static constexpr int kCurrentRevision = 602;
    /// The version of the program as headers name it.
    static constexpr const char* kProgramVersion = "11.1.0.0";
    /// The transfer code of an edit whose header names none.
    static constexpr int kDefaultTransfer = 3;

    /// An empty edit with the defaults of a new one; clean.
    Edit();
    /// An edit read from a file; `isBad()` tells whether it could be. See `readFile` and
    /// `readFromLegacyFile`.
    Edit(const WString& path, eEditOpenBehaviour behaviour);
    ~Edit() override;

    /// A deep copy: header, channels with their names, stamps, levels and sync losses, objects, groups, cues
    /// and times. Its cookie is invalid, so that no save of it can meet the original's file; it is clean, not
    /// temporary, and has no observers. Objects that cannot be read are left out and logged. The events of a
    /// channel are copied when either edit changes them; the two may be used on different threads.
    [[nodiscard]] EditPtr copy() const;

    /// How many edits were ever constructed in this process.
    [[nodiscard]] static uint64_t numConstructed();

    /// \name Handles (used by `EditPtr` alone)
    /// @{
    /// Both return the new count.
    int32_t incRefCount() { return m_refCount.fetch_add(1, std::memory_order_relaxed) + 1; }
    int32_t decRefCount() { return m_refCount.fetch_sub(1, std::memory_order_acq_rel) - 1; }
    [[nodiscard]] int32_t refCount() const { return m_refCount.load(); }
    /// @}

    /// \name Conversions
    /// @{
    /// The channel type for a kind of cookie; `NoChan` for a kind that stands for none.
    [[nodiscard]] static Edit_Chan_Type edit_chan_type_from_cookie_type(Cookie_Type kind);
    /// The channel type for an upper-case letter; `NoChan` for any other character.
    [[nodiscard]] static Edit_Chan_Type edit_chan_type_from_name(char letter);
    [[nodiscard]] static Edit_Chan_Type edit_chan_type_from_name(wchar_t letter);
    /// The letter of a channel; the subtype counts for control channels only.
    [[nodiscard]] static Edit_Chan_Letter edit_chan_letter_from_type(Edit_Chan_Type type,
                                                                     Edit_Chan_SubType subtype);
    /// "SUBTYPE:ALIAS" and so on, as the files write it.
    [[nodiscard]] static const char* subTypeText(Edit_Chan_SubType subtype);
    /// @}

    /// \name Identity and header
    /// Each accessor reads or writes one key of the header store; a missing key gives the default stated.
    /// Frame rate, revision, duration of the source, its medium and the transfer are cached: after writing
    /// their keys through `Opts` call `clear_cache_flags`.
    /// @{
    /// The item that the edit is; invalid for one that was not stored.
    [[nodiscard]] const cookie& get_cookie() const { return m_cookie; }
    void set_cookie(const cookie& item) { m_cookie = item; }
    [[nodiscard]] String get_cookie_str() const { return m_cookie.asString(); }
    /// The header store. A change to it dirties the edit.
    [[nodiscard]] configb& Opts() { return m_header; }
    [[nodiscard]] const configb& Opts() const { return m_header; }
    /// The edit's name, "NAME", UTF-8; empty. A new name records a change of type `kNameChanged`.
    [[nodiscard]] String getName() const;
    void setName(const String& name);

    /// "READ_ONLY"; false. Setting it dirties the edit once, so that the property is saved; from then on
    /// nothing does until it is taken away.
    [[nodiscard]] bool get_read_only() const;
    void set_read_only(bool readOnly);
    /// "IS_BACKUP", non-zero for a backup copy; 0.
    [[nodiscard]] int get_backup() const;
    void set_backup(int backup);
    /// "HIDDEN", non-zero for what is not shown to the user; 0.
    [[nodiscard]] int get_hidden() const;
    void set_hidden(int hidden);
    /// "SEARCH_EDIT", non-zero for the result of a search; 0.
    [[nodiscard]] int get_search_edit() const;
    void set_search_edit(int search);
    /// "ORIGINAL_MATERIAL", non-zero for what describes source material; 0. Setting it records the current
    /// user as the item's owner, unless somebody is already or the cookie is invalid.
    [[nodiscard]] int get_original_material() const;
    void set_original_material(int original);
    /// "ENTIRE_MEDIUM", non-zero for what covers a whole medium; 0. The question is answered from memory,
    /// which reading the edit's file and the setter fill. Setting it has the project record updated.
    [[nodiscard]] int get_entire_medium() const { return m_entireMedium; }
    void set_entire_medium(int entire);
    /// "UNDO_COOKIE" and "REDO_COOKIE", the items of the states before and after; the invalid cookie.
    [[nodiscard]] cookie get_undo_cookie() const;
    void set_undo_cookie(const cookie& item);
    [[nodiscard]] cookie get_redo_cookie() const;
    void set_redo_cookie(const cookie& item);
    /// "CREATION_TIME", seconds since 1970 in 32 bits; 0.
    [[nodiscard]] int getCreationTime() const;
    /// "CREATION_PROGRAM", a version; empty.
    [[nodiscard]] String getCreationProgram() const;
    /// Both become now and this program.
    void setCreationDetails();
    /// "MODIFICATION_TIME", seconds since 1970 in 32 bits; 0.
    [[nodiscard]] int getModificationTime() const;
    /// "MODIFICATION_PROGRAM", a version; empty.
    [[nodiscard]] String getModificationProgram() const;
    /// Both, and "MOD_TIME_V3", become now and this program.
    void setModificationDetails();
    /// "MOD_COUNT", how many changes were recorded; 0. Stays at the greatest signed 64-bit number.
    [[nodiscard]] uint64_t getModificationCount() const;
    void incModificationCount();
    /// "PERMISSIONS"; `kPermissionsAll`, also for a number that is none of them.
    [[nodiscard]] Permissions getPermissions() const;
    void setPermissions(Permissions permissions);
    /// "ED2_REVISION", the revision of the content; 1. Setting -1 removes the key.
    [[nodiscard]] int get_ed2_revision() const;
    void set_ed2_revision(int revision);
    /// "FRAME_RATE"; the project's, also for a code that is none. An edit of a revision below 501 takes it
    /// from its television standard ("tvtype") and, unless it is read-only, keeps it in the header; with a
    /// standard that is not known it has the project's. Setting an unknown rate does nothing.
    [[nodiscard]] Qx::FrameRate getFrameRate() const;
    void setFrameRate(Qx::FrameRate rate);
    /// Seconds a frame.
    [[nodiscard]] double get_frame_time() const;
    /// "SOURCE_MEDIUM_DURATION", seconds; `Qx::kNoTime`, also for a revision below 503.
    [[nodiscard]] double getSourceMediumDuration() const;
    void setSourceMediumDuration(double seconds);
    /// "SOURCE_MEDIUM", a medium code; the project's default.
    [[nodiscard]] int getSourceMedium() const;
    void setSourceMedium(int medium);
    /// "TRANSFER"; `kDefaultTransfer`.
    [[nodiscard]] int getTransfer() const;
    void setTransfer(int transfer);
    /// "ELAPSED_ORIGIN", seconds; 0.
    [[nodiscard]] double get_elapsed_time_origin() const;
    void set_elapsed_time_origin(double seconds);
    /// "EDIT_START", the timecode of edit time 0 in frames of the edit's rate from midnight; that of the
    /// elapsed time's origin.
    [[nodiscard]] int64_t getStartTimecode() const;
    void setStartTimecode(int64_t frames);
    /// The same in seconds, where an origin need not lie on a frame.
    [[nodiscard]] double getTimecodeOrigin() const;
    /// "DROP_FRAME", whether timecodes are counted in drop frame; `otherwise`, for a sequence the project's
    /// setting. False at a rate that has none.
    [[nodiscard]] bool isDropFrame(bool otherwise) const;
    void setDropFrame(bool dropFrame);
    /// "OWNER", the name of the user who made the edit, UTF-8; empty. With `notify` another owner records a
    /// change of type `kPropertiesChanged`.
    [[nodiscard]] String getOwner() const;
    void setOwner(const String& owner, bool notify);
    /// Drops what is cached of the header, so that the next question reads it.
    void clear_cache_flags();
    /// @}

    /// \name Kind of item
    /// @{
    /// What the item is, by its cookie and its header; not cached, the two are one question.
    [[nodiscard]] edit_log_type_t get_log_type() const;
    [[nodiscard]] edit_log_type_t log_type_get_m() const;
    /// The same, after forgetting what is derived from the header.
    edit_log_type_t redetermineLogType();
    /// Type 1, type 2.
    [[nodiscard]] bool isShot() const;
    [[nodiscard]] bool isEdit() const;
    /// A shot or a ghost of one.
    [[nodiscard]] bool is_original() const;
    /// An edit that was put together from a reel ("KEMROLL_TIME").
    [[nodiscard]] bool is_kemroll() const;
    /// "shot", "edit", "ghost", "magic", "reel", "FXT"; empty for no type.
    [[nodiscard]] static String log_type_string_get_ms(edit_log_type_t type);
    /// The inverse; "ghost" gives 3, any other text 0.
    [[nodiscard]] static edit_log_type_t getLogTypeFromString(std::string_view text);
    /// @}

    /// \name Channels
    /// Indices run over effects, video, audio, then levels channels; they shift when channels come and go,
    /// stamps do not. A filter passes a channel when its type is `AnyChan` or shares a bit with the
    /// channel's, and its subtype is `ANY`, equals the channel's or shares a bit with it.
    /// @{
    /// The number of channels, of all or of those that pass a filter.
    [[nodiscard]] int getNumChans() const;
    [[nodiscard]] uint16_t getNumChans(Edit_Chan_Type type) const;
    [[nodiscard]] uint16_t getNumChans(Edit_Chan_Type type, Edit_Chan_SubType subtype) const;
    /// Stamp by index, and index by stamp.
    [[nodiscard]] IdStamp getId(int index) const;
    [[nodiscard]] int getIdx(const IdStamp& chan) const;
    /// Position, from 0, among the channels of the same list; `NO_CHAN` for no channel.
    [[nodiscard]] int getIndexWithinType(const IdStamp& chan) const;
    [[nodiscard]] int getIndexWithinType(int index) const;
    /// Type and subtype; (`NoChan`, `INVALID`) for a levels channel.
    [[nodiscard]] Edit_Chan_Type getChanType(int index) const;
    [[nodiscard]] Edit_Chan_SubType getChanSubtype(int index) const;
    [[nodiscard]] Edit_Chan_Type getChanType(const IdStamp& chan) const;
    [[nodiscard]] Edit_Chan_SubType getChanSubtype(const IdStamp& chan) const;
    [[nodiscard]] ChanType getChanTypeAndSubType(const IdStamp& chan) const;
    /// True if it names a channel of any list (`AnyChan`), one with a cel that is video or effects
    /// (`VideoChan`) or audio (`AudioChan`); false for every other type.
    [[nodiscard]] bool chanValid(int index, Edit_Chan_Type type = AnyChan) const;
    [[nodiscard]] bool chanValid(const IdStamp& chan, Edit_Chan_Type type = AnyChan) const;
    /// The first channel that passes the filter, or `NO_CHAN`.
    [[nodiscard]] int getFirstChan(Edit_Chan_Type type = AnyChan,
                                   Edit_Chan_SubType subtype = Edit_Chan_SubType::ANY) const;
    /// Moves `index` to the next channel that passes the filter, or to `NO_CHAN`, and returns it. Starts from
    /// `kBeforeFirstChan`.
    int getNextChan(int& index, Edit_Chan_Type type = AnyChan,
                    Edit_Chan_SubType subtype = Edit_Chan_SubType::ANY) const;
    /// Appends the channels that pass the filter, in order.
    void getChans(Vector<int>& chans, Edit_Chan_Type type = AnyChan,
                  Edit_Chan_SubType subtype = Edit_Chan_SubType::ANY) const;
    void getChans(Vector<IdStamp>& chans, Edit_Chan_Type type = AnyChan,
                  Edit_Chan_SubType subtype = Edit_Chan_SubType::ANY) const;
    /// The channel's cel, which the edit owns; null for a levels channel. By stamp it is the cached one, see
    /// `cacheCelForTrack`.
    [[nodiscard]] cel* getCel(const IdStamp& chan) const;
    [[nodiscard]] cel* get_edit_cel_p(int index) const;
    [[nodiscard]] cel* get_play_cel_p(int index) const { return get_edit_cel_p(index); }
    /// The channel's own cel, shared; null for a levels channel or no channel.
    [[nodiscard]] Qx::Ptr<cel> contentOf(const IdStamp& chan) const;
    /// True if both are channels, of one type.
    [[nodiscard]] bool sameType(const IdStamp& a, const IdStamp& b) const;
    /// True if the channel holds nothing but black, a levels channel no node; also for no channel.
    [[nodiscard]] bool isEmpty(int index) const;
    [[nodiscard]] bool isEmpty(const IdStamp& chan) const;
    /// True if every channel is.
    [[nodiscard]] bool isEmpty() const;
    /// The typed forms, sharing the channel's cel; invalid ones for an unknown stamp or another type.
    [[nodiscard]] VidCel getVidCel(const IdStamp& chan) const;
    [[nodiscard]] VFXCel getVFXCel(const IdStamp& chan) const;
    [[nodiscard]] AudCel getAudCel(const IdStamp& chan) const;
    [[nodiscard]] AudLevelsCel getLevelsCel(const IdStamp& chan) const;
    /// Changes the audio properties of a channel. With `notify`, another output or levels channel records a
    /// change of type `kLevelsChanged`, other cross-fades alone one of type `kFadesChanged`; in a shot or a
    /// ghost of one either is of type `kShotSoundChanged` and "editShotSound" is sent. False if it is none of
    /// the edit's, shares another cel than the channel's, or names a levels channel that is not there or is
    /// another audio channel's. A levels channel that is let go stays.
    bool setAudCel(const AudCel& audio, bool notify = true);

    /// Brings the levels of every audio channel up to the revision of their content
    /// (`AudLevelsCel::checkNodesRevision`). Records no change.
    void verifyAudioNodes();

    /// The channel's own name (UTF-8, may be empty), and the name shown: its own, else "FX1", "V1", "A2",
    /// "L1" by its place in its list.
    [[nodiscard]] String getChanName(const IdStamp& chan) const;
    [[nodiscard]] String getChanDisplayName(const IdStamp& chan) const;
    /// Another name records a change of type `kChanNameChanged`. False for an unknown stamp and for a text
    /// that is no UTF-8 or holds a line end or another control character.
    bool setChanName(const IdStamp& chan, const String& name);
    /// The first channel whose shown name is `name`, to the letter; the null stamp if none.
    [[nodiscard]] IdStamp getChanWithName(const String& name) const;
    /// A text about the material of the channel, kept with its cel; the setter dirties only. False for an
    /// unknown stamp.
    [[nodiscard]] String getMaterialInfo(const IdStamp& chan) const;
    bool setMaterialInfo(const IdStamp& chan, const String& text);

    /// Inserts `count` empty channels, with fresh stamps, in one block.
    ///
    /// They go before channel `at` if `before` is true. If it is false they go behind it, as long as the
    /// channel that follows `at` is of the type and subtype asked for: before that one. In every other case,
    /// an `at` of `NO_CHAN` or in another list included, they go to the end of their list. With a `time`
    /// above 0 they are filled with black to it, with -1.0 to the edit's end.
    ///
    ///     V1 V2 A1   2 audio at 2 (A1), before      ->  V1 V2 A1' A2' A1
    ///     V1 V2 A1   1 video at 0 (V1), not before  ->  V1 V1' V2 A1
    ///     V1 V2 A1   1 video at 1 (V2), not before  ->  V1 V2 V3' A1
    ///
    /// With `notify`: a change of type `kChansInserted` naming the first new channel is recorded, the message
    /// "editChanAdded" is sent ("cookie type at count"), and the change is recorded again and announced, so
    /// that "MOD_COUNT" rises by two. Without it the edit becomes dirty only and the caller describes what it
    /// does. Cues of the channels behind are renumbered.
    ///
    /// False for a type and subtype that an edit does not hold, for a `count` of 0, for a time that is not
    /// finite or past `cel::kGreatestTime`, for a read-only edit, and where there would be more than 32 audio
    /// or 24 video channels or an index would reach `NO_CHAN` ("Too many audio channels for <...>" and so on
    /// in the log).
    bool insertChans(Edit_Chan_Type type, Edit_Chan_SubType subtype, int at, unsigned count, bool before,
                     bool notify, double time);
    /// Inserts one channel at the end of its list, as `insertChans` does. Returns the new index, or `NO_CHAN`
    /// on failure. The edit takes over `content` (null and 1 mean none) when it succeeds; observers find it
    /// in place.
    int addChan(Edit_Chan_Type type, cel* content = nullptr, bool notify = true,
                Edit_Chan_SubType subtype = Edit_Chan_SubType::NONE, bool unused = false, double time = 0);
    /// Removes one channel, an audio channel with its levels; its cues and its place in a group go too. With
    /// `notify`: a change of type `kChansRemoved` naming it is recorded, the message "editChanDeleted" is
    /// sent for each channel that went, levels first ("cookie type index count", with the index before the
    /// removal), and the change is recorded again and announced. The cel lives until everybody was told.
    /// False for an unknown stamp and for a read-only edit.
    bool removeChan(const IdStamp& chan, bool notify);
    /// Removes every channel, with one message of type `AnyChan` and index 0. False if there was none and for
    /// a read-only edit.
    bool removeChans(bool notify);
    /// Puts a cel (taken over on success) in the place of a channel's own. With `notify`, records a change of
    /// type `kEventsChanged`; for a sound channel of a shot see `setAudCel`. Attached cues follow to the
    /// events with the same stamps. False for a levels channel or no channel, or without a cel.
    bool set_edit_cel_p(int index, cel* content, bool notify = true);
    /// Makes `getCel` by stamp answer with a cel that the caller owns, until the channel gets another or
    /// goes; null ends it. No change of the edit. False for an unknown stamp or a levels channel.
    bool cacheCelForTrack(const IdStamp& chan, cel* content);
    /// Gives a channel another stamp, in its group and its pairing with levels too; dirties only. False if
    /// the stamp is null or taken.
    bool setChannelID(const IdStamp& chan, const IdStamp& newId);
    /// Adds a levels channel that shares the levels, and pairs it with an audio channel that has none. With
    /// `notify`, records a change of type `kLevelsChanged`; for a shot see `setAudCel`. It keeps its stamp
    /// unless that is null or taken. The null stamp on failure: no such audio channel, one that has levels,
    /// invalid ones, an index that would reach `NO_CHAN`.
    IdStamp addLevelsChan(const IdStamp& audio, const AudLevelsCel& levels, bool notify = true);
    /// Adds a channel that was read, at the end of its list, with its stamp, name and material text; an
    /// invalid or taken stamp is replaced by a fresh one, and the standard name of its place counts as none
    /// of its own. Records nothing and knows no limits: who reads checks those. The null stamp for a type
    /// that an edit does not hold, or without content.
    IdStamp setupEditChannel(ChanType type, Qx::Ptr<cel> content);
    /// Earliest start (`start` true) or latest end, in seconds, of the channels that hold anything; 0 without
    /// any. `withLevels` counts levels channels too.
    [[nodiscard]] double get_start_or_end_time(bool start, bool withLevels) const;
    [[nodiscard]] double getStartTime() const { return get_start_or_end_time(true, false); }
    [[nodiscard]] double getEndTime() const { return get_start_or_end_time(false, false); }
    /// Sync loss of a channel in seconds, 0 if none is recorded. With `notify`, another one records a change
    /// of type `kSyncChanged`. False for an unknown stamp or a number that is not finite.
    [[nodiscard]] double getSyncLoss(const IdStamp& chan) const;
    bool setSyncLoss(const IdStamp& chan, double seconds, bool notify = true);
    /// @}

    /// \name Current time and mark (seconds)
    /// An edit has one of each; the channel argument is accepted and not used. The setters dirty when the
    /// value changes and tell the observers of the change descriptions, with the time as the place of a
    /// change of type `kCurrentTimeChanged` or `kMarkChanged`. That is no change of what was edited: it is
    /// not counted, and the description of the last edit stays. The `_raw` forms do neither; a number that is
    /// not finite is ignored.
    /// @{
    [[nodiscard]] double get_current_time(int chan = NO_CHAN) const;
    void set_current_time(int chan, double time);
    void set_current_time_raw(int chan, double time);
    /// `Qx::kNoTime` when no mark is set.
    [[nodiscard]] double get_mark_time(int chan = NO_CHAN) const;
    void set_mark_time(int chan, double time);
    void set_mark_time_raw(int chan, double time);
    [[nodiscard]] bool mark_is_valid(int chan = NO_CHAN) const;
    void mark_invalidate(int chan = NO_CHAN);
    /// @}

    /// \name Dirt
    /// @{
    /// Makes the edit dirty without asking or telling anybody.
    void init_dirty();
    /// The dirty flag, or the header store's dirty mark.
    [[nodiscard]] bool get_dirty() const;
    /// To dirty: refused with a line in the log for an edit that is read-only, for the user or by its header.
    /// An edit that was clean tells other machines that the user changes it (in network mode, unless it is of
    /// log type 2) and goes onto the registry's dirty list. To clean: the flag and the header's mark go.
    void set_dirty(bool dirty);
    /// `get_dirty`, or with `deep` a channel whose content changed since it was written.
    [[nodiscard]] bool isDirty(bool deep) const;
    /// True if a save has something to do and may do it: the edit is dirty, neither temporary nor
    /// write-suppressed, and not read-only for the user. Where writing is suppressed or not allowed to the
    /// user the edit becomes clean.
    bool needsToBeWritten();
    /// The header store changed: dirties the edit.
    void onConfigbDirty() override;
    /// A temporary edit is never written.
    void setTemporary(bool temporary) { m_temporary = temporary; }
    [[nodiscard]] bool isTemporary() const { return m_temporary; }
    /// Neither is one whose writing is suppressed; see `needsToBeWritten`.
    void setWriteSuppressed(bool suppressed) { m_writeSuppressed = suppressed; }
    [[nodiscard]] bool isWriteSuppressed() const { return m_writeSuppressed; }
    /// While set, other machines are not told when the edit becomes dirty: for changes that come from them.
    void setNetworkNotificationSuppressed(bool suppressed) { m_networkSuppressed = suppressed; }
    [[nodiscard]] bool isNetworkNotificationSuppressed() const { return m_networkSuppressed; }
    /// @}

    /// \name Changes and notification
    /// Messages go through the edit's own `Notifier`; their text begins with the cookie's.
    /// @{
    /// Records a change: it becomes the current description, published to observers with `notify`; where the
    /// description before was of another type (and not the initial one) the current one then is `kSeveral`.
    /// The description and the count of changes go into the header and the edit becomes dirty, but not for a
    /// read-only edit or the type `kTransient`; `kEditDeleted` is written and does not dirty. Edit operations
    /// and changes of channels, name and properties have the project record updated first.
    void setChangeDescription(const EditModification& modification, bool notify);
    void setChangeDescription(EditModificationType type, bool notify);
    /// The description in the header; one of type `kNotDescribed` without any that reads.
    [[nodiscard]] EditModification getChangeDescription() const;
    /// Starts describing afresh: the current description is the initial one and the header has none. Neither
    /// announced nor dirtying.
    void resetChangeDescription();
    /// Where observers follow the current description.
    [[nodiscard]] ValServer<EditModification>& getChangeDescriptionServer() { return m_changes; }
    /// Sends "editDelete" and records a change of type `kEditDeleted`.
    void notifyEditDelete();
    /// Send "impendingRevChange" and "revChange", with the number of `type` behind the cookie.
    void notifyImpendingRevisionChange(RevisionChangeType type);
    void notifyRevisionChange(RevisionChangeType type);
    /// Sends "editShotSound" with the channel's stamp behind the cookie: what the operations of the edit do
    /// for a shot, and whoever changes the cels or levels of one.
    void notifyShotSoundAltered(const IdStamp& chan);
    /// The types of the messages, interned when the library loads. "editChanged" is for its users to send.
    [[nodiscard]] static NotifyMsgType getEditChangedNotifyMsgType();
    [[nodiscard]] static NotifyMsgType getEditDeleteNotifyMsgType();
    [[nodiscard]] static NotifyMsgType getChanAddedNotifyMsgType();
    [[nodiscard]] static NotifyMsgType getChanDeletedNotifyMsgType();
    [[nodiscard]] static NotifyMsgType getShotSoundAlteredNotifyMsgType();
    [[nodiscard]] static NotifyMsgType getImpendingRevChangeMsgType();
    [[nodiscard]] static NotifyMsgType getRevChangeMsgType();
    /// @}

    /// \name Debugging and sharing
    /// @{
    /// Extra lines in the log about this edit; at first the process-wide default.
    [[nodiscard]] bool debugMode() const { return m_debug; }
    void setDebugMode(bool on) { m_debug = on; }
    static void setDefaultDebugMode(bool on);
    /// For callers that share the edit between threads.
    [[nodiscard]] criticalSection& section() const { return m_section; }
    /// @}

    /// \name File (defined in edit/persist)
    /// @{
    /// Reads the item's file, or one by its path, in the place of what the edit holds. The objects of a file
    /// are those of docs/edit-file.md. On failure the edit has no channels, `isBad()` and `lastFileError()`
    /// tells why; only a failed upgrade of an older revision leaves what was read. A path that is not named
    /// after an item fails at once and deliberately leaves the edit flagged as loading, one reference held.
    /// A new, empty store gives one empty video channel.
    ReadFileRC read_file(const cookie& item, eEditOpenBehaviour behaviour);
    ReadFileRC readFile(const WString& path, eEditOpenBehaviour behaviour);
    /// Why the last read or write failed: one sentence with the path, empty after a success.
    [[nodiscard]] const String& lastFileError() const { return m_fileStatus.reason(); }
    /// The same with its kind.
    [[nodiscard]] const Qx::Status& lastFileStatus() const { return m_fileStatus; }
    /// Writes the edit to the file of its cookie, or to a path that is named after it. True only when the
    /// file was stored; its marks of change are cleared then. False, with the old file whole and the edit as
    /// dirty as before, when nothing is to be written, a write is running, the edit could not be read again
    /// (no channels, too many) or the disk refuses.
    bool write_file();
    bool write_file(const WString& path);
    /// Writes a form: 1 by `write_file`, 4 the legacy text. Other forms are not written: false. True when the
    /// file holds the edit as it is, for form 1 also one that was read from, or written to, this very path
    /// and is unchanged since; `lastFileError` tells of a failure.
    bool writeToFile(const WString& path, QxEditFileType type);
    /// Writes or reads the legacy text, docs/ed2-format.md, which holds the first video channel and the audio
    /// channels. A failed write leaves the file as it was; a failed read leaves no channels.
    bool writeToLegacyFile(const WString& path);
    bool readFromLegacyFile(const WString& path);
    /// The sections of the legacy text; its form is docs/ed2-format.md. The writers append to a text, the
    /// readers search it. `writeED2Config` returns the television standard it wrote, `writeED2Cels` the
    /// number of channels. `readED2Cels` fails, naming the line, for a section that does not read and for too
    /// many channels; the edit then has the channels read before it.
    Qx::Ed2Support::TVStd writeED2Config(TextFile& file) const;
    unsigned writeED2Cels(TextFile& file, Qx::Ed2Support::TVStd standard) const;
    Qx::Status readED2Cels(const TextFile& file);
    void writeED2Cues(TextFile& file) const;
    void readED2Cues(const TextFile& file);
    /// True until a read succeeds, for an edit that was made to be read.
    [[nodiscard]] bool isBad() const { return m_bad; }
    [[nodiscard]] bool isLoading() const { return m_loading; }
    /// What reading the edit did to bring it up to date; null if it was current.
    [[nodiscard]] const EditUpgrade* lastUpgrade() const { return m_upgrade.get(); }
    [[nodiscard]] size_t getNumStoredObjects() const;
    /// The objects bound to the edit.
    [[nodiscard]] TagBag& objectStore() { return m_store; }
    /// The object bound under a stamp, as a `T`: an effect node unless another class is named. The tag names
    /// nothing when there is none, it cannot be read or it is of another class.
    template <typename T = FXGraphNodeBase>
    [[nodiscard]] Tag<T> openObject(const IdStamp& id) const {
        return Tag<T>(m_store, id);
    }
    /// The effect node bound to an event, whatever channel that is on; a tag that names nothing for an invalid
    /// handle and an event without one.
    [[nodiscard]] Tag<FXGraphNodeBase> getVideoNodeForEvent(const ce_handle& event) const;
    /// @}

    /// \name Labels and rolls (edit_labels.cpp)
    /// A label says which number of a film or tape stands at a time of the edit; a roll says what is written on
    /// the can that such numbers count along. Both are read out of the header when they are first asked for
    /// ("LABEL%d", "MEDIUMROLL%d"); what does not read is logged and kept in the header. After writing these
    /// keys through `Opts` call `clear_cache_flags`. Setters refuse a read-only edit, put the change into the
    /// header at once and record a change of type `kPropertiesChanged`; what they are asked to set and is
    /// there already is no change, and true.
    /// @{
    static constexpr size_t kMostLabels = 16;
    static constexpr size_t kMostRolls = 8;
    /// The labels, in the order of the header. Valid until the next change of labels.
    [[nodiscard]] const std::vector<edit_label>& labels() const;
    /// The first label of a kind (or of any) on a roll; a roll number of 0 stands for any. Of the primary
    /// medium it is, in want of one of its own, the first label of that kind on any roll. An edit that keeps
    /// no timecode of itself answers with its start timecode, in its own frames or in 24. Not valid when there
    /// is none.
    [[nodiscard]] edit_label get_label_(UserLabelType type, const MediumRollIdent& roll) const;
    /// Adds a label, or puts it in the place of the one of its kind on its roll. False for one that is not
    /// valid, or is one too many.
    bool setLabel(const edit_label& wanted);
    /// False if there is no label of exactly this kind on exactly this roll.
    bool removeLabel(UserLabelType type, const MediumRollIdent& roll);
    /// Gives the edit those labels of a new edit that it does not have: its own timecode, in its frames (roll
    /// 8, 1) and in 24 (roll 14, 1), both by its start timecode. They follow when that changes. False if it
    /// has them.
    bool give_new_edit_all_its_labels();
    /// The rolls, in the order of the header; none for an edit of a revision below 160. Valid until the next
    /// change of rolls.
    [[nodiscard]] const std::vector<MediumRoll>& rolls() const;
    /// What is written on a roll; empty when the edit has no such roll.
    [[nodiscard]] String get_reelid(const MediumRollIdent& roll) const;
    /// Adds the roll when the edit has none such and the text is not empty. False for a text that no reel id
    /// can be (`MediumRoll`), for a medium or number that is none, for one roll too many, and for one of the
    /// first two rolls while these have the edit's own reel id.
    bool set_reelid(const MediumRollIdent& roll, const String& text);
    /// "reelid", the reel that the material as such is on; the first two rolls have it too. Empty.
    [[nodiscard]] String get_Natural_reelid() const;
    /// False for a text that no reel id can be.
    bool set_Natural_reelid(const String& text);
    /// @}

    /// \name Log attributes and origin (defined in edit/material)
    /// @{
    /// What the edit says of a log attribute: the header's text, else what follows from its labels, times and
    /// kind; empty when it says nothing.
    [[nodiscard]] String getAttribute(LogAttribute attribute) const;
    /// Writes a user's text for an attribute into the header, a reel through `set_Natural_reelid`. Texts are
    /// cut at 1 MiB. False, changing nothing, for an attribute that users cannot change or that is not kept
    /// in the header, for a reel that cannot be one, and for a read-only edit.
    bool setAttribute(LogAttribute attribute, const String& text);
    /// The same for many: all of them or none. Together they are one change of type `kPropertiesChanged`
    /// (`kNameChanged` for the name alone), which is announced; nothing is when every text is there already.
    bool setAttributes(const LogAttributeMap& attributes);
    /// The identifier of the material that a channel came from; one that is not valid if none is kept.
    [[nodiscard]] QxUMID getTrackOriginInfo_UMID(const IdStamp& chan) const;
    /// Keeps it with the channel; one that is not valid takes it away. Another one records a change of type
    /// `kPropertiesChanged`. False for an unknown stamp and a read-only edit.
    bool setTrackOriginInfo(const IdStamp& chan, const QxUMID& umid);
    /// What is known of a shot's pictures, "SHOT_VIDEO"; not valid if nothing. The setter writes the header.
    [[nodiscard]] ShotVideoMetadata getShotVideoMetadata() const;
    void setShotVideoMetadata(const ShotVideoMetadata& metadata);
    /// @}

    /// \name Cues (edit_cues.cpp)
    /// A *cel cue* is one that was brought in from the material of an event: attached and not kept in the
    /// file. The operations here that change cues record a change of type `kCuesChanged` with notification;
    /// changes through `get_cues` are recorded by whoever makes them.
    /// @{
    [[nodiscard]] cue_list& get_cues() { return m_cues; }
    [[nodiscard]] const cue_list& get_cues() const { return m_cues; }
    /// Whether the cel cues are loaded and shown. The setters record no change.
    [[nodiscard]] bool get_cel_cues_loaded() const { return m_celCuesLoaded; }
    void set_cel_cues_loaded(bool loaded) { m_celCuesLoaded = loaded; }
    /// Removes the cel cues. False if there was none.
    bool delete_all_cel_cues();
    /// Removes the cel cues and marks them as not loaded. False if there was none.
    bool cel_cues_off();
    /// Removes the cues of a channel, by index; all of them for a negative one or `kAnyCueChan`. False if
    /// there was none.
    bool deleteCues(int chan);
    /// Removes one cue, by its place in the list. False if there is none.
    bool deleteCue(size_t index);
    /// Lets the attached cues follow their events, after cels were changed. False if none had to move.
    bool updateCues();
    /// Attaches the cues to the channels' cels, after loading or when cels were replaced. Records no change.
    void convertCues();
    /// The channel numbers of cues at or after `firstChan` move by `count`, for channels that were inserted
    /// there. Records no change: it is a part of the insertion's.
    void shuffleCueChans(int firstChan, int count);
    /// Puts the cues that are kept in the file into the object store, under "CueId".
    void storeCues();
    /// Takes the stored cues over in the place of the edit's own; those read from a file follow their events
    /// after `convertCues`. Without any the edit has none. False, changing nothing, when what is stored
    /// cannot be read.
    bool retrieveCues();
    /// @}

    /// \name Channel groups (edit_channel_groups.cpp)
    /// Operations that change groups record a change of type `kGroupsChanged` with notification.
    /// @{
    /// The edit's groups, opened or made on first use; null when the stored ones cannot be read, which then
    /// stay in the file as they are. Lives as long as the edit, or until that is read again or the list goes
    /// from the object store. A change made through the pointer is saved but not recorded. The list may name
    /// what is no channel of the edit, as another program's file may: the questions below pass that over.
    [[nodiscard]] ChannelGroupList* retrieveGroupsList() const;
    /// The default grouping of a shot; null if none is stored.
    [[nodiscard]] ChannelGroupList* retrieveDefaultGroupsList() const;
    /// Ties channels into one group, in the given order; where one is in a group already, that group's
    /// members come in its place and that group goes. What is no channel's stamp is left out, and no group is
    /// made of fewer than two. `chans` may be a group's own members. False, changing nothing, for fewer than
    /// two stamps or without a list.
    bool groupChannels(const Vector<IdStamp>& chans, ChannelGroup::eType type);
    /// Dissolves the channel's group. False if it is in none.
    bool ungroupChannels(const IdStamp& chan);
    /// Removes every group. False only without a list.
    bool ungroupAllChannels();
    /// Takes a channel out of its group; a group left with one member dissolves. False if it is in none.
    bool removeFromGroup(const IdStamp& chan);
    [[nodiscard]] bool isGrouped(const IdStamp& chan) const;
    /// Appends the members of a channel's group, or the channel itself when it is in none; nothing for what
    /// is no channel of the edit, and of the members too.
    void getGroupContainingChan(const IdStamp& chan, Vector<IdStamp>& members) const;
    /// The first and last member of a channel's group that is a channel of the edit, or, where none is, the
    /// first and last. The stamp itself when it is in no group.
    [[nodiscard]] IdStamp getFirstInGroup(const IdStamp& chan) const;
    [[nodiscard]] IdStamp getLastInGroup(const IdStamp& chan) const;
    [[nodiscard]] bool isFirstInGroup(const IdStamp& chan) const { return getFirstInGroup(chan) == chan; }
    [[nodiscard]] bool isLastInGroup(const IdStamp& chan) const { return getLastInGroup(chan) == chan; }
    /// The number of groups; the type is accepted and not used.
    [[nodiscard]] unsigned numGroups(Edit_Chan_Type type = AnyChan) const;
    /// Null for an index out of range. Valid until the next change of groups.
    [[nodiscard]] const ChannelGroup* getTrackGroup(unsigned index) const;
    /// True if both are in one and the same group.
    [[nodiscard]] bool sameGroup(const IdStamp& a, const IdStamp& b) const;
    /// True if both are in groups, of equal type and size.
    [[nodiscard]] bool similarGroups(const IdStamp& a, const IdStamp& b) const;
    /// A name for the channel's group from its members' letters and numbers in group order, runs joined:
    /// "A1-A4", "V1,A1-A2". With `withType` a group that is not plain has its kind before it:
    /// "Stereo A1-A2". The channel's own for one that is in no group; empty for what is no channel.
    [[nodiscard]] String getGroupName(const IdStamp& chan, bool withType) const;
    /// The same with the channels' own names where they have them: "Boom,A2-A3".
    [[nodiscard]] String getGroupDisplayName(const IdStamp& chan, bool withType) const;
    /// True only for a shot (log type 1) with at least one default group.
    [[nodiscard]] bool isDefaultGroupingPresent() const;
    /// The shot's default groups, as far as their channels exist, take the place of its groups. False,
    /// changing nothing, when no default grouping is present.
    bool applyDefaultGrouping();
    /// The shot's groups become its default grouping; without groups it has none. False for what is no shot,
    /// when that is its default grouping already, and when a stored one cannot be read, which then stays.
    bool updateDefaultGroupingForShot();
    /// Turns the header text "CHAN_GRPS" of older files into groups and removes it.
    void updateChannelGroups();
    /// The "CHAN_GRPS" text; empty if there is none.
    [[nodiscard]] String getGroupTextFromED2() const;
    /// @}

    /// The channels, in a file of their own; not for callers.
    class ChannelSet;

private:
    friend class EditFile;
    struct StoredCels;

    void init();
    bool store(const WString& path);
    bool retrieve();
    void updateHeaderBeforeWrite();
    void m_load_edit_bits_from_header();
    void getInfoFromHeader();
    /// Ends the lending of the cels to the object store. Afterwards the edit alone owns them.
    void extractCelsFromStore(bool written) noexcept;

    /// \name Upgrades
    /// The steps that bring an edit of an older revision, or one from a legacy text, to the current model.
    /// Each repairs what it can, notes what it did in `lastUpgrade`, and none fails the read; what it could
    /// not bring up to date is noted too and logged.
    /// @{
    /// Runs the steps that the edit's revision asks for. False if it is current.
    bool doEditConversions();
    /// Starts the notes of an upgrade.
    void beginUpgrade(int from);
    void noteUpgrade(String what);
    void noteNotUpgraded(const char* step, const String& what);
    /// A shot gets the picture format that its standard had in the project's line structure, 4:2:2 packed.
    void updateLegacyFormat(const Qx::Ed2Support::TVStd& standard);
    /// Removes effects channels in which nothing but black lies; they were hidden and carried no effect.
    /// Effects channels with content stay.
    void removeHiddenFXTracks();
    /// Gives channel stamps, levels channels included, the magic type of a channel; the other bits stay
    /// unless that stamp is taken. Events that show such a channel follow.
    void utilizeMagicIdStampsForChannelIds();
    /// The nodes that stood for material in effect graphs are made from the events themselves: objects that
    /// are stored under the stamps of events of material go.
    void makeMaterialNodesTransient();
    /// Every event gets an identity of its own; a log line tells how many were given.
    void validateUTRIDs();
    /// Turns level ramps of clips into nodes of a levels channel, in an edit without levels channels.
    void removeShotSoundRamps();
    /// Every audio event plays at speed 1.
    void initialiseAudioVarispeeds();
    /// The timecode of a third sound roll becomes that of the second where the primary medium has none, and
    /// edits and their ghosts get the labels of a new edit.
    void updateLegacyFileLabels();
    /// Maps times from the rate that a standard named to the one that it stands for, all channels or none, and
    /// sets the source medium; of a shot also its duration and how fast its sound plays.
    void updateLegacyFrameRate(const Qx::Ed2Support::TVStd& standard);
    void updateLegacyMedium(const Qx::Ed2Support::TVStd& standard);
    /// Effects of older revisions would be replaced. They stay as they are.
    void replaceLegacyEffects();
    /// @}

    /// \name Labels and rolls in the header
    /// @{
    /// What was read of them; in a file of its own.
    struct Labels;
    void build_labels() const;
    void read_labels_from_config() const;
    /// Writes the labels that are marked to be saved. Nothing for an edit without a cookie, or a magic one
    /// other than black and the clipboard. `revision` is the one that is written.
    void write_labels_to_config(int revision);
    void build_rolls() const;
    void write_rolls_to_config();
    [[nodiscard]] edit_label ownTimecode(const MediumRollIdent& roll) const;
    bool putLabel(const edit_label& wanted);
    /// Writes the reel id, in the rolls that have it too.
    void putNaturalReelid(const String& text);
    void labelsChanged();
    /// The start timecode is another: labels that tell it follow.
    void ownTimecodeChanged();
    /// Drops what was read of the header; with `all` also what is not in it yet.
    void dropLabels(bool all);
    /// @}

    [[nodiscard]] bool isReadOnlyForUser() const;
    /// Read-only for the user or by its header.
    [[nodiscard]] bool isReadOnly() const;

    /// While one lives, changes of the header do not dirty the edit.
    class QuietHeader {
    public:
        explicit QuietHeader(Edit& edit) : m_edit(edit) { ++m_edit.m_quietHeader; }
        ~QuietHeader();
        QuietHeader(const QuietHeader&) = delete;
        QuietHeader& operator=(const QuietHeader&) = delete;

    private:
        Edit& m_edit;
    };

    /// Holds the edit while observers are told, if anybody holds it: one of them may drop the last handle.
    class KeepAlive {
    public:
        explicit KeepAlive(Edit& edit);

    private:
        EditPtr m_handle;
    };

    /// \name The gate through which every operation records its change
    /// Nothing is recorded while the edit is initialised or loaded.
    /// @{
    /// A change of its own: counted, described, dirtied, announced with `notify`.
    void recordChange(const EditModification& change, bool notify);
    /// A part of a greater change, which its caller describes: dirtied only.
    void recordUndescribed();
    /// The one or the other, of one channel; and the same of a channel that is heard.
    void recordChangeOf(EditModificationType type, const IdStamp& chan, bool notify);
    void soundChanged(EditModificationType type, const IdStamp& chan, bool notify);
    /// Another current time or mark: dirtied and announced, but neither counted nor described.
    void announcePosition(const EditModification& change);
    /// True, with a line in the log, where a change would be lost because the edit is read-only. Asked last,
    /// when nothing else stands against the change.
    [[nodiscard]] bool refusesChange() const;
    void warnOfReadOnly() const;
    /// @}
    void announceDirt();
    void writeDescription();
    void updateProjectRecord();
    void sendChannelMessage(NotifyMsgType message, Edit_Chan_Type type, int index, int count);

    void initHeader();
    /// Forgets what was derived from the header or the channels.
    void dropDerivedValues();

    /// `wanted`, or a fresh stamp where it is null or taken.
    [[nodiscard]] IdStamp usableStamp(const IdStamp& wanted) const;
    [[nodiscard]] size_t insertionPosition(Edit_Chan_Type type, Edit_Chan_SubType subtype, int at,
                                           bool before) const;
    /// `insertChans`, with content (taken over) for a single channel. Returns the first new stamp, or null.
    IdStamp insertChannels(ChanType type, int at, unsigned count, bool before, bool notify, double time,
                           cel* content);
    [[nodiscard]] static bool isGivenCel(const cel* content);

    /// A channel that had an index goes, or is gone: it leaves its group, in the groups and the default ones,
    /// its cues go and those of the channels after it are renumbered. To be called while its cel exists.
    void channelRemoved(const IdStamp& chan, int index);
    /// The same of all channels at once.
    void allChannelsRemoved();
    /// A channel's stamp changes: its groups follow.
    void channelRenamed(const IdStamp& from, const IdStamp& to);
    /// A channel's cel is replaced: its cues follow to the events with the same stamps.
    void celReplaced(const cel* from, cel* to);
    void cuesChanged();
    void groupsChanged();

    /// What the edit is made of, each in a header of its own.
    struct Parts;

    std::atomic<int32_t> m_refCount{0};
    std::unique_ptr<Parts> m_parts;
    configb& m_header;
    std::unique_ptr<ChannelSet> m_channels;
    cookie m_cookie;
    double m_currentTime = 0;
    double m_markTime; ///< set by `init`
    bool m_dirty = false;
    bool m_initialising = false;
    bool m_temporary = false;
    bool m_writeSuppressed = false;
    bool m_bad = false;
    bool m_loading = false;
    bool m_writing = false;
    bool m_debug = false;
    bool m_networkSuppressed = false;
    int m_quietHeader = 0;
    int m_entireMedium = 0;
    mutable Qx::FrameRate m_frameRate;
    mutable bool m_frameRateValid = false;
    mutable uint32_t m_revision = UINT32_MAX;
    mutable std::optional<int> m_sourceMedium;
    mutable std::optional<int> m_transfer;
    mutable double m_sourceMediumDuration; ///< set with the header
    cue_list& m_cues;
    bool m_celCuesLoaded = false;
    TagBag& m_store;
    std::shared_ptr<StoredCels> m_storedCels; ///< which cel the store holds under which name
    static constexpr uint64_t kNeverFound = UINT64_MAX;
    mutable std::atomic<ChannelGroupList*> m_groups{nullptr};
    mutable std::atomic<uint64_t> m_groupsFoundAt{kNeverFound}; ///< the store's departures at the time
    mutable std::unique_ptr<Labels> m_labels;
    std::shared_ptr<EditUpgrade> m_upgrade;
    ValServer<EditModification>& m_changes;
    Qx::Status m_fileStatus;
    criticalSection& m_section;
};
