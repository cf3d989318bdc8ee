#pragma once

#include "edit/model/edit.h"
#include "platform/base/num_range.h"

#include <map>
#include <utility>

namespace Qx::MarkTypes {

/// Which mark is meant.
enum MarkType : int { InMark = 1, OutMark = 2 };

} // namespace Qx::MarkTypes

/// The context in which one side of an editing operation works: an edit, a current time, and for each channel
/// whether it is selected and where it is marked. A user interface keeps one for the source and one for the
/// destination; `Editor` works between the two.
///
/// A value: a copy has the same edit, by handle, and records of its own. It owns a handle of the edit, so the
/// edit stays open, and changes nothing in it. Not thread-safe.
///
/// Times and marks are seconds of edit time; one that is not set is `Qx::kNoTime`. A channel without a record
/// is selected and unmarked: there are records only for channels that are deselected or marked. Channels of
/// every list may be selected and marked, levels channels too (an operation takes those along with their
/// audio channel whatever they are).
class QM_API EditModule {
public:
    using Range = NumRange<double, Ordered>;

    /// How times are given: exactly, or, for any other value, rounded to whole frames of the current project
    /// (`Qx::frameRound`). A time that is not set stays so.
    enum Mode : int { ExactTimes = 1, WholeFrames = 2 };

    EditModule() = default;
    /// With the edit's own current time.
    explicit EditModule(const EditPtr& edit);
    /// Opens the edit of an item with behaviour 0; empty, with every mark unset, when that fails.
    explicit EditModule(const cookie& item);
    /// The same, with a current time and every channel marked in and out.
    EditModule(const cookie& item, double current, double in, double out);

    [[nodiscard]] const EditPtr& getEdit() const { return m_edit; }
    [[nodiscard]] double curTime(Mode mode = ExactTimes) const;
    /// Ignored for a time that is not finite; `Qx::kNoTime` unsets it.
    void setCurTime(double time);

    /// \name Selection
    /// The filters are those of `Edit::getChans`. Lists are appended to, in the order of the channel index.
    /// @{
    /// Does nothing for a stamp that names no channel of the edit.
    void selectChan(const IdStamp& chan, bool on);
    void selectChans(const Vector<IdStamp>& chans, bool on);
    void selectChans(bool on, Edit_Chan_Type type, Edit_Chan_SubType subtype);
    void selectAll(bool on) { selectChans(on, AnyChan, Edit_Chan_SubType::ANY); }
    /// True for a channel without a record; false for what names no channel of the edit.
    [[nodiscard]] bool isSelected(const IdStamp& chan) const;
    void getSelectedChans(Vector<IdStamp>& chans, Edit_Chan_Type type = AnyChan,
                          Edit_Chan_SubType subtype = Edit_Chan_SubType::ANY) const;
    /// Of exactly this type and subtype.
    void getSelectedChans(Vector<IdStamp>& chans, Edit::ChanType type) const;
    [[nodiscard]] unsigned getNumSelectedChans(Edit_Chan_Type type = AnyChan,
                                               Edit_Chan_SubType subtype = Edit_Chan_SubType::ANY) const;
    /// @}

    /// \name Marks
    /// Setters do nothing for what names no channel of the edit, for a time that is not finite and for a type
    /// that is none; `Qx::kNoTime` clears a mark.
    /// @{
    void setMarkTime(const IdStamp& chan, double time, Qx::MarkTypes::MarkType type);
    /// Both marks, in at the start.
    void setMarkTime(const IdStamp& chan, const Range& range);
    /// Both marks, in first.
    void setMarkTime(const IdStamp& chan, const std::pair<double, double>& times);
    /// `Qx::kNoTime` without an edit or a record and for another type.
    [[nodiscard]] double getMarkTime(const IdStamp& chan, Qx::MarkTypes::MarkType type) const;
    /// Of the module: the earliest in mark, or the latest out mark, of its selected channels.
    [[nodiscard]] double getMarkTime(Qx::MarkTypes::MarkType type) const;
    /// In and out mark.
    [[nodiscard]] std::pair<double, double> getMarkTimes(const IdStamp& chan) const;
    /// The place that a mark names for a channel, as operations take it: of the channel's own marks, else of
    /// those of the module's selected channels (the earliest in mark, the latest out mark), else the current
    /// time. Marks are put in order first, as `getMarkedRegion` does: of two, the earlier is the in mark
    /// whichever it was set as. Equal marks are one point. `Qx::kNoTime` if nothing is set; a null stamp asks
    /// for the module's.
    [[nodiscard]] double getMarkedPlace(const IdStamp& chan, Qx::MarkTypes::MarkType type) const;
    /// True if a selected channel has a mark, or one of the type.
    [[nodiscard]] bool isMarked() const;
    [[nodiscard]] bool isMarked(Qx::MarkTypes::MarkType type) const;
    /// True if the channel has a mark, selected or not.
    [[nodiscard]] bool isMarked(const IdStamp& chan) const;
    [[nodiscard]] bool isMarked(const IdStamp& chan, Qx::MarkTypes::MarkType type) const;
    void clearMarks(const IdStamp& chan);
    /// Sets a mark on every channel of the edit, selected or not; an unset time clears it on the selected
    /// ones.
    void markAllAt(double time, Qx::MarkTypes::MarkType type);
    void markAllAt(const Range& range);
    /// @}

    /// \name Regions
    /// @{
    /// The span of the regions of the selected channels that have records; both ends unset if there is none.
    [[nodiscard]] Range getMarkedRegion(Mode mode) const;
    /// A channel's own, with the module's current time.
    [[nodiscard]] Range getMarkedRegion(const IdStamp& chan, Mode mode) const;
    /// From in to out; from the one mark that is set, or from both if they are equal, to the current time;
    /// both ends unset if neither is set.
    [[nodiscard]] static Range getMarkedRegion(double in, double out, double current, Mode mode);
    /// The marked region of a channel as times of its source material: what the material's clock shows where
    /// the region starts and where it ends, in order (a reverse pair plays from the greater to the lesser).
    /// Both ends unset if the region is, where nothing or black plays at its start, and where the pair that
    /// plays there ends before the region does: then no one span of material is meant.
    [[nodiscard]] Range getSourceRegion(const IdStamp& chan, Mode mode) const;
    /// That of the first selected channel, in the order of the channel index, that has one; a channel without
    /// a mark takes the module's marked region.
    [[nodiscard]] Range getSourceRegion(Mode mode) const;
    /// @}

    /// \name Between modules
    /// Channels of two edits correspond when they are of one type and subtype and have one place among those:
    /// the third audio channel corresponds to the third audio channel.
    /// @{
    /// Gives the destination the marks of the source's corresponding channels, moved so that the start of the
    /// source's marked region comes to lie at `time`, else (`Qx::kNoTime`) at the destination's current time.
    /// What corresponds to no marked channel becomes unmarked. Does nothing without both edits, a region and
    /// a time.
    static void makeSimilarMarks(const EditModule& source, EditModule& destination, double time);
    /// Selects in the destination what corresponds to the source's selected channels, and nothing else. Does
    /// nothing without both edits.
    static void makeSimilarTrackSelections(const EditModule& source, EditModule& destination);
    /// @}

    /// Removes the records whose channel is gone, and those that say no more than none would.
    void verify();
    [[nodiscard]] size_t numRecords() const { return m_records.size(); }

private:
    struct Record {
        double in = Qx::kNoTime;
        double out = Qx::kNoTime;
        bool selected = true;
        [[nodiscard]] bool marked() const { return in != Qx::kNoTime || out != Qx::kNoTime; }
        [[nodiscard]] double markInOrder(Qx::MarkTypes::MarkType type) const;
    };

    [[nodiscard]] const Record* record(const IdStamp& chan) const;
    [[nodiscard]] Range sourceRegionFor(const IdStamp& chan, const Range& region) const;
    [[nodiscard]] IdStamp correspondingTo(const EditModule& other, const IdStamp& chan) const;

    EditPtr m_edit;
    double m_current = Qx::kNoTime;
    std::map<IdStamp, Record> m_records; ///< the order of the stamps is that of `IdStamp::compare`
};

/// Prepares the audio channels of a module for an operation: each selected one that ends before the edit does
/// is filled with silence to the edit's end. Dirties the edit only: the caller describes what it does.
/// Returns how many channels were filled; 0, with nothing changed, without an edit or for a read-only one.
QM_API unsigned autoInitAudioTracks(EditModule& module);
/// Gives each selected audio channel that has no levels channel one with the levels that its clips have, and
/// brings levels of an older revision up to date. Returns how many channels were changed; dirties and refuses
/// as the other does.
QM_API unsigned autoInitAudioLevelsTracks(EditModule& module);
