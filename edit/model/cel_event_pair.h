#pragma once

#include "edit/model/cel.h"
#include "edit/model/channel_types.h"
#include "edit/model/edit_ptr.h"
#include "platform/base/ptr.h"

class FXGraphNodeBase;
template <typename T>
class Tag;

/// One pair of a channel: an in point, its out point, and the edit and channel that they belong to.
///
/// Holds the edit, so that it stays open, and the cel, so that a walk which an observer interrupts goes on to
/// the end over the cel that it began with, also when the channel was removed or has got another; `idx` then
/// tells that. A cel that nothing shares (one on the stack) is not held and must outlive the pair. Copying
/// costs a count of each. The handles name events by index: after a change of the cel they name whatever
/// events have those indices. A pair is valid when both handles are. Every query of an invalid pair answers
/// the value given with it. Not thread-safe.
class QM_API CelEventPair {
public:
    using Range = cel::Range;
    using StripRange = NumRange<double, Unordered>;

    /// Which span `editRange` and `stripRange` report. A letter stands for a second of source, '<' and '>'
    /// for the fades of the second pair:
    ///
    ///     AAA|BBBB|CC
    ///       <<    >
    ///
    ///     CutToCut     [3, 7)
    ///     WithFades    [1, 8)
    enum RangeType {
        CutToCut = 0, ///< from the in point to the out point
        WithFades = 1 ///< widened by the fade of the in point before it and that of the out point after it
    };

    CelEventPair() = default;
    /// The pair whose in point governs `time` in a bare cel (`cel::find_ceh`), whether it plays there or not.
    /// The stamp stays null. A null cel gives an invalid pair.
    CelEventPair(const EditPtr& edit, cel* content, double time);
    /// The pair that begins with `in`. The stamp stays null.
    CelEventPair(const EditPtr& edit, cel* content, const ce_handle& in);
    /// The pair of an event, in or out point, on a channel. A null edit gives an invalid pair.
    CelEventPair(const EditPtr& edit, const ce_handle& event, int chanIdx);
    CelEventPair(const EditPtr& edit, const ce_handle& event, const IdStamp& chan);
    /// The pair that plays at `time` on a channel; an invalid one where none does.
    CelEventPair(const EditPtr& edit, const IdStamp& chan, double time);
    CelEventPair(const EditPtr& edit, int chanIdx, double time);

    /// \name Queries
    /// @{
    [[nodiscard]] bool valid() const { return m_in.valid() != 0 && m_out.valid() != 0; }
    [[nodiscard]] ce_handle inH() const { return m_in; }
    [[nodiscard]] ce_handle outH() const { return m_out; }
    /// Index of the in event; -1 for a pair that has none.
    [[nodiscard]] int getCelIdx() const { return m_in.index(); }
    /// Index of the channel; `NO_CHAN` for an invalid pair or one without an edit.
    [[nodiscard]] int idx() const;
    [[nodiscard]] const IdStamp& trackId() const { return m_chan; }
    /// Stamp of the object bound to the in event; null for an invalid pair.
    [[nodiscard]] IdStamp getObjectID() const { return valid() ? m_in.getEffectGraph() : IdStamp(); }
    [[nodiscard]] const EditPtr& getEdit() const { return m_edit; }
    [[nodiscard]] cel* getCel() const { return m_in.get_its_cel(); }
    /// Seconds; `Qx::kNoPairTime` for an invalid pair.
    [[nodiscard]] double editTime() const { return valid() ? m_in.get_edit_time() : Qx::kNoPairTime; }
    [[nodiscard]] double endEditTime() const { return valid() ? m_out.get_edit_time() : Qx::kNoPairTime; }
    [[nodiscard]] double stripTime() const;
    [[nodiscard]] double endStripTime() const;
    /// A default cookie for an invalid pair.
    [[nodiscard]] cookie stripCookie() const;
    /// Seconds; 0 for an invalid pair.
    [[nodiscard]] double length() const { return valid() ? endEditTime() - editTime() : 0.0; }
    [[nodiscard]] bool isZeroLength() const;
    /// `NoChan` and `INVALID` for what names no channel of the edit.
    [[nodiscard]] Edit_Chan_Type getChanType() const;
    [[nodiscard]] Edit_Chan_SubType getChanSubType() const;
    /// Quarter-frames; 0 for an invalid pair.
    [[nodiscard]] uint16_t getAudioFadeInQFrames() const;
    [[nodiscard]] uint16_t getAudioFadeOutQFrames() const;
    /// The effect node bound to the pair, by the stamp of its in event. Names nothing when there is none. The
    /// edit owns the node.
    [[nodiscard]] Tag<FXGraphNodeBase> getEffectHandle() const;
    /// `Editable::invalidRange()` for an invalid pair.
    [[nodiscard]] Range editRange(RangeType type = CutToCut) const;
    /// Strip times at the ends of `editRange`, the start's first: a reverse span starts above its end. Both
    /// `Qx::kNoTime` for an invalid pair.
    [[nodiscard]] StripRange stripRange(RangeType type = CutToCut) const;
    /// @}

    /// True for one edit and the same two handles.
    bool operator==(const CelEventPair& other) const {
        return m_edit == other.m_edit && m_in == other.m_in && m_out == other.m_out;
    }
    /// True if both pairs are valid and this one's in index is at most the other's.
    bool operator<=(const CelEventPair& other) const {
        return valid() && other.valid() && m_in.index() <= other.m_in.index();
    }

    /// \name Tests, with the tolerance of `Qx::kTimeTolerance`; false for an invalid pair
    /// @{
    /// True if the pair begins at `from`, ends at `to`, or either end lies inside the other span. The start
    /// is compared with `from` alone and the end with `to` alone.
    [[nodiscard]] bool overlaps(double from, double to) const;
    [[nodiscard]] bool overlaps(const CelEventPair& other) const;
    /// The start belongs to the pair, the end does not (`Qx::timeIsConsideredToBeInRegion`).
    [[nodiscard]] bool containsEditTime(double time) const;
    /// True if both ends agree.
    [[nodiscard]] bool coincidesWith(const Range& range) const;
    [[nodiscard]] bool coincidesWith(double a, double b) const { return coincidesWith(Range(a, b)); }
    [[nodiscard]] bool coincidesWith(const CelEventPair& other) const;
    /// @}

    /// \name Changes
    /// @{
    /// Moves the out point to `length` seconds after the in point, or to the nearest time that its neighbours
    /// allow, and gives it the strip time that the pair reaches there. The in point stays.
    void resize(double length);
    /// Gives both events a strip.
    void setStripCookie(const cookie& strip);
    void invalidate();
    /// @}

    /// \name Stepping
    /// Neither allocates nor touches a count (a postfix step copies the pair, which does).
    /// @{
    /// To the next pair; false past the last one, which leaves the handles one step past the end.
    bool inc() {
        m_in.increment(CE_IN_POINT);
        m_out.increment(CE_OUT_POINT);
        return m_out.get_its_cel() != nullptr && m_out.index() < m_out.get_its_cel()->numEvents();
    }
    /// To the pair before; false before the first one.
    bool dec() {
        m_in.decrement(CE_IN_POINT);
        m_out.decrement(CE_OUT_POINT);
        return m_in.get_its_cel() != nullptr && m_in.index() >= 0;
    }
    CelEventPair& operator++() {
        inc();
        return *this;
    }
    CelEventPair& operator--() {
        dec();
        return *this;
    }
    CelEventPair operator++(int);
    CelEventPair operator--(int);
    /// @}

protected:
    /// Takes the pair of an event, keeping edit and channel; an invalid event invalidates the pair.
    void setPair(const ce_handle& event);

private:
    void findAt(double time);
    void hold();

    EditPtr m_edit;
    IdStamp m_chan;
    ce_handle m_in;
    ce_handle m_out;
    Qx::Ptr<const cel> m_held; ///< the cel of the handles, if anything shares it
};
