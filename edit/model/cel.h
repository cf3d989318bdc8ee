#pragma once

#include "edit/model/ce_handle.h"
#include "edit/model/channel_event.h"
#include "edit/model/editable.h"
#include "platform/base/status.h"
#include "platform/media/tv_standard.h"
#include "platform/store/streamable.h"
#include "platform/store/text_file.h"

#include <map>
#include <vector>

/// How `chequerboard` treats a fade at a cut.
enum class SoftCuts {
    Ignore, ///< fades do not widen a pair
    Keep    ///< a pair reaches as far as its fades
};

/// The content of one channel: a time-ordered list of events, an in point and its out point for each span of
/// material or black.
///
/// Owns its events, its channel information and its "changed since written" mark. It knows nothing of the
/// edit that it belongs to, of undo or of notification.
///
/// Representation: one contiguous array; the in point of pair k lies at 2k, its out point at 2k + 1. Pairs
/// are in order of time and do not overlap; gaps are allowed; black is a pair whose strip is the black
/// cookie. Nothing keeps a pointer into the array across a change. Finding a time is a binary search; an
/// operation on a region is a search and one block move. Not thread-safe.
///
/// An operation that answers false or null has changed nothing.
class QM_API cel : public Streamable {
public:
    using IdMap = std::map<IdStamp, IdStamp>;
    using Range = NumRange<double, Ordered>;

    /// \name What an event may hold: the greatest absolute edit time and strip time in seconds, and velocity
    /// @{
    static constexpr double kGreatestTime = 1e9;
    static constexpr double kGreatestStripTime = 1e12;
    static constexpr double kGreatestVelocity = 1e6;
    /// @}

    cel();
    ~cel() override;
    cel(const cel& other);
    cel& operator=(const cel& other) = delete;

    /// A deep copy, stamps included.
    [[nodiscard]] std::unique_ptr<cel> copy() const;
    /// Finishes a cel after loading: checks it, gives an open last pair nothing. False, and the cel is empty,
    /// if the events are not consistent.
    bool close();

    /// \name Events
    /// @{
    [[nodiscard]] int numEvents() const { return static_cast<int>(m_events.size()); }
    [[nodiscard]] int numPairs() const { return numEvents() / 2; }
    /// Changed since it was last written.
    [[nodiscard]] bool changed() const { return m_changed; }
    void setChanged(bool changed) { m_changed = changed; }
    /// Goes up with every change of the events: who keeps something worked out from them compares it.
    [[nodiscard]] uint64_t changeCount() const { return m_changeCount; }
    /// Room for `pairs` pairs is made ahead.
    void reserve(int pairs);

    /// Appends one event, while loading or building: an in point at or after the last out point, or the out
    /// point of the last in point. False, changing nothing, for an event that does not follow.
    bool add_event(const channel_event& event);
    /// Appends or inserts a pair that plays `strip` from `stripTime` at [editTime, editTime + length).
    /// Returns the in handle; an invalid one, with nothing changed, if the pair would overlap another, lie
    /// out of order, or have a length below zero. `insertEventPair` puts it before pair number `pair`.
    ce_handle appendEventPair(const cookie& strip, double stripTime, double editTime, double length);
    ce_handle insertEventPair(int pair, const cookie& strip, double stripTime, double editTime,
                              double length);

    [[nodiscard]] channel_event get_event(int index) const;
    /// In place; null for an index out of range. Lasts until the next change.
    [[nodiscard]] const channel_event* getChanEventPtr(int index) const {
        return index >= 0 && index < numEvents() ? &m_events[static_cast<size_t>(index)] : nullptr;
    }
    /// Overwrites one event in place. False if the result would not be consistent.
    bool setEvent(int index, const channel_event& event);
    /// @}

    /// \name Finding
    /// @{
    [[nodiscard]] ce_handle get_start_ceh() const;
    [[nodiscard]] ce_handle get_end_ceh() const;
    /// The event of a kind that governs a time. Kind 1: the in point of the last pair that starts at or
    /// before `time` (within the tolerance), whether it still plays or not. Kind 4: the first out point at or
    /// after `time`. Kind 7: the last event at or before `time`. Invalid if there is none.
    [[nodiscard]] ce_handle find_ceh(double time, ce_info kind) const;
    [[nodiscard]] ce_handle get_next_ceh(const ce_handle& from, ce_info kind) const;
    [[nodiscard]] int check_ceh(const ce_handle& handle) const;
    /// The handle of the event with a stamp, an in point before an out point; invalid if none. Linear.
    [[nodiscard]] ce_handle findId(const IdStamp& id, int hint = -1) const;
    /// @}

    /// \name Times and strips
    /// @{
    [[nodiscard]] double get_start_time() const; ///< 0 for an empty cel
    [[nodiscard]] double get_end_time() const;   ///< 0 for an empty cel
    [[nodiscard]] double get_edit_time(const ce_handle& handle) const;
    /// Moves one event. Without `force` a move past a neighbour is refused (false); with it the event stops
    /// at the neighbour.
    bool set_edit_time(const ce_handle& handle, double time, bool force);
    [[nodiscard]] double get_strip_time(const ce_handle& handle,
                                        double editTime = Qx::kStripTimeAtEvent) const;
    /// What plays at an edit time; `Qx::kNoTime` and the invalid cookie where nothing does.
    [[nodiscard]] double get_strip_time(double editTime) const;
    void set_strip_time(const ce_handle& handle, double time);
    [[nodiscard]] cookie get_strip_cookie(const ce_handle& handle) const;
    [[nodiscard]] cookie get_strip_cookie(double editTime) const;
    [[nodiscard]] Range getExtents(Editable::ExtentType type = Editable::Everything,
                                   bool fromZero = false) const;
    /// True if nothing but black and gaps lies in the range.
    [[nodiscard]] bool isEmpty(const Range& range) const;
    [[nodiscard]] bool isEmpty() const;
    /// @}

    /// \name Operations on regions
    /// The contract of each is drawn below: one character a second, a letter for each source, '.' for black,
    /// a blank for a gap, '|' a mark.
    /// @{
    /// A flag of `extract`.
    static constexpr unsigned KeepTimes = 1; ///< the part stays at its edit times instead of starting at 0
    [[nodiscard]] std::unique_ptr<cel> extract(double from, double to, unsigned flags = 0) const;
    bool insert(const cel* source, const Range& sourceRange, double at, IdMap& ids, IdMap* splits = nullptr);
    bool remove(const Range& range, IdMap* splits = nullptr);
    /// With `materialOnly` the events of the destination stay, stamps, fades and levels too, and only what
    /// they play changes.
    bool replace(const cel* source, const Range& sourceRange, double at, IdMap& ids,
                 bool materialOnly = false, IdMap* splits = nullptr);
    bool weld(const cel* other, double at);
    [[nodiscard]] std::unique_ptr<cel> add_black_to_ends(int seconds, char ends) const;
    [[nodiscard]] std::unique_ptr<cel> quantise() const;
    [[nodiscard]] std::unique_ptr<cel> rescale(double editIn, double editOut, double stripIn, double stripOut,
                                               double levelIn, double levelOut, int quantiseResult) const;
    void set_resolution(double quantum);
    [[nodiscard]] double resolution() const { return m_resolution; }
    /// Flags of `chequerboard`.
    static constexpr int ChequerWiden = 1; ///< the pairs of the parts are lengthened to their reach
    static constexpr int ChequerFill = 2;  ///< the gaps of the parts are filled with black
    int chequerboard(cel** parts, int& numParts, int maxParts, double overlap, int flags,
                     SoftCuts softCuts) const;
    /// Fills the channel with black from its end to `time`. False if it reaches that far already.
    bool fillToTime(double time);
    bool simplify(Simplification::Type type);
    /// Non-zero if the events are consistent: in and out points paired, in order, finite, stamps set.
    [[nodiscard]] int is_good_cel() const;
    /// @}

    /// \name Channel information kept with the cel
    /// @{
    void editChannelInfo(String name, const IdStamp& id, String subType, String materialInfo);
    [[nodiscard]] const String& editChannelName() const { return m_name; }
    [[nodiscard]] const IdStamp& editChannelId() const { return m_id; }
    [[nodiscard]] const String& editChannelSubType() const { return m_subType; }
    [[nodiscard]] const String& editChannelMaterialInfo() const { return m_materialInfo; }
    [[nodiscard]] String hierarchyName(bool withId, bool withEvents) const;
    /// @}

    /// \name Forms
    /// @{
    [[nodiscard]] const char* layerName() const override;
    [[nodiscard]] const char* shortLayerName() const override;
    [[nodiscard]] uint8_t revisionMajor() const override { return m_major; }
    [[nodiscard]] uint8_t revisionMinor() const override { return m_minor; }
    void revisionMajor(uint8_t major) override { m_major = major; }
    void revisionMinor(uint8_t minor) override { m_minor = minor; }
    /// Packed: the channel information, the resolution, the number of events, the events as they lie in
    /// memory.
    void pack(PStream& stream) const override;
    void unpack(PStream& stream) override;
    [[nodiscard]] std::unique_ptr<Streamable> clone(BuilderType type = BuilderType::Copy) const override;

    /// Appends the cel's lines of a legacy text: resolution, material text and every field of every event,
    /// one event a line, so that `buildFrom` makes the same bits again. Name, stamp and subtype stand in the
    /// line of the channel. The form is docs/ed2-format.md. Times are written in seconds whatever the
    /// standard.
    void writeToED2(TextFile& file, Qx::Ed2Support::TVStd standard) const;
    /// Reads those lines from line `first` on. A failure names the line (from 1) and what is wrong with it,
    /// and leaves the cel as it was.
    Qx::Status buildFrom(const TextFile& file, unsigned first);
    /// @}

private:
    friend class ce_handle;

    void changedNow() {
        m_changed = true;
        ++m_changeCount;
    }

    std::vector<channel_event> m_events;
    String m_name;
    IdStamp m_id;
    String m_subType;
    String m_materialInfo;
    double m_resolution = 0;
    uint8_t m_major = 1;
    uint8_t m_minor = 0;
    bool m_changed = false;
    uint64_t m_changeCount = 0;
};

// Stepping and reading a handle is what every walk over a channel does for each pair, so it is inline.

inline int ce_handle::valid() const {
    return m_cel != nullptr && m_cel->getChanEventPtr(m_index) != nullptr ? 1 : 0;
}

inline ce_handle ce_handle::matching_in_ceh() const {
    return valid() != 0 ? ce_handle(m_cel, m_index & ~1) : ce_handle(m_cel, -1);
}

inline ce_handle ce_handle::matching_out_ceh() const {
    return valid() != 0 ? ce_handle(m_cel, m_index | 1) : ce_handle(m_cel, -1);
}

inline void ce_handle::increment(ce_info kind) {
    if (m_cel == nullptr) {
        return;
    }
    const int at = m_index < 0 ? -1 : m_index;
    const int end = m_cel->numEvents();
    const bool ins = (kind & CE_IN_POINT) != 0;
    const bool outs = (kind & CE_OUT_POINT) != 0;
    int to = end;
    if (ins && outs) {
        to = at + 1;
    } else if (ins) {
        to = (at + 2) & ~1;
    } else if (outs) {
        to = (at + 1) | 1;
    }
    m_index = to < end ? to : end;
}

inline void ce_handle::decrement(ce_info kind) {
    if (m_cel == nullptr) {
        return;
    }
    const int end = m_cel->numEvents();
    const int at = m_index > end ? end : m_index;
    const bool ins = (kind & CE_IN_POINT) != 0;
    const bool outs = (kind & CE_OUT_POINT) != 0;
    int to = -1;
    if (ins && outs) {
        to = at - 1;
    } else if (ins) {
        to = (at - 1) & ~1;
    } else if (outs) {
        to = ((at - 2) | 1);
    }
    m_index = at <= 0 || to < 0 ? -1 : to;
}

inline ce_handle& ce_handle::operator++() {
    increment(CE_ANY);
    return *this;
}

inline ce_handle& ce_handle::operator--() {
    decrement(CE_ANY);
    return *this;
}

inline double ce_handle::get_edit_time() const {
    const channel_event* its = m_cel != nullptr ? m_cel->getChanEventPtr(m_index) : nullptr;
    return its != nullptr ? its->editTime : 0;
}
