#pragma once

#include "edit/model/ce_handle.h"
#include "edit/model/channel_event.h"
#include "edit/model/editable.h"
#include "edit/model/event_array.h"
#include "edit/model/stamp_index.h"
#include "platform/base/status.h"
#include "platform/media/tv_standard.h"
#include "platform/store/streamable_layer.h"
#include "platform/store/text_file.h"

#include <functional>
#include <map>
#include <memory>
#include <span>

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
/// Representation: one contiguous array (`EventArray`); the in point of pair k lies at 2k, its out point at
/// 2k + 1. Pairs are in order of time and do not overlap; gaps are allowed; black is a pair whose strip is
/// the black cookie. Nothing keeps a pointer into the array across a change. Finding a time is a binary
/// search over the packed times of the in points; an operation on a region is a search and one block move. A
/// copy shares the array until one of the two is changed. Not thread-safe.
///
/// What plays at a time is read from the in point: its strip time there, plus the time since then multiplied
/// by its velocity. Every operation keeps the out point's strip time in agreement with that; the setters of
/// single fields change one field of one event, so whoever uses them does.
///
/// An operation that answers false or null has changed nothing.
///
/// An edit shares its cels (`Qx::Ptr`); what walks over one holds it too (`CelEventPair`), so that a channel
/// may be removed or get another cel meanwhile.
class QM_API cel : public StreamableLayer, public std::enable_shared_from_this<cel> {
public:
    using IdMap = std::map<IdStamp, IdStamp>;
    /// The stamp of an in point and that of each piece that was split from its pair.
    using Splits = std::multimap<IdStamp, IdStamp>;
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

    /// A deep copy, stamps included. The events are copied when either is changed, not before.
    [[nodiscard]] std::unique_ptr<cel> copy() const;
    /// Finishes a cel after loading: a last in point without an out point gets one at its own time, and all
    /// is checked. False, and the cel is empty, if the events are not consistent.
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
    /// point of the last in point. One within the tolerance of that, after it or before, is moved to it;
    /// one without a stamp gets a fresh one. False, changing nothing, for an event that does not follow or
    /// holds what no cel may (`kGreatestTime` and its like, a level that is no number, another kind than 1
    /// and 4).
    bool add_event(const channel_event& event);
    /// Appends or inserts a pair that plays `strip` from `stripTime` at [editTime, editTime + length). An end
    /// within the tolerance of a neighbour lies at it, and a length within it is none.
    /// Returns the in handle; an invalid one, with nothing changed, if the pair would overlap another, lie
    /// out of order, or have a length below zero. `insertEventPair` puts it before pair number `pair`.
    ce_handle appendEventPair(const cookie& strip, double stripTime, double editTime, double length);
    ce_handle insertEventPair(int pair, const cookie& strip, double stripTime, double editTime,
                              double length);

    [[nodiscard]] channel_event get_event(int index) const;
    /// In place; null for an index out of range. Lasts until the next change.
    [[nodiscard]] const channel_event* getChanEventPtr(int index) const {
        return index >= 0 && index < numEvents() ? m_events.data() + index : nullptr;
    }
    /// Overwrites one event in place, that one alone; its time becomes that of a neighbour within the
    /// tolerance. False if the result would not be consistent.
    bool setEvent(int index, const channel_event& event);
    /// Puts other pairs, in points and out points in turn, in the place of `count` pairs from `pair` on;
    /// nothing moves. `pair` may be the number of pairs, `count` and `events` nothing. False if the result
    /// would not be consistent.
    bool replacePairs(int pair, int count, std::span<const channel_event> events);
    /// @}

    /// \name Finding
    /// @{
    [[nodiscard]] ce_handle get_start_ceh() const;
    [[nodiscard]] ce_handle get_end_ceh() const;
    /// The event of some kinds (`ce_info` values, or'ed) that governs a time, by binary search. Kind 1: the
    /// in point of the last pair that starts at or before `time` (within the tolerance), whether it still
    /// plays or not. Kind 4: the first out point at or after `time`. Kind 7: the last event at or before
    /// `time`. Invalid if there is none.
    [[nodiscard]] ce_handle find_ceh(double time, int kinds) const;
    [[nodiscard]] ce_handle get_next_ceh(const ce_handle& from, int kinds) const;
    [[nodiscard]] int check_ceh(const ce_handle& handle) const;
    /// The handle of the event with a stamp, an in point before an out point; invalid if none. Linear.
    [[nodiscard]] ce_handle findId(const IdStamp& id, int hint = -1) const;
    /// @}

    /// \name Times and strips
    /// @{
    [[nodiscard]] double get_start_time() const; ///< 0 for an empty cel
    [[nodiscard]] double get_end_time() const;   ///< 0 for an empty cel
    [[nodiscard]] double get_edit_time(const ce_handle& handle) const;
    /// Moves one event and changes nothing else of the pair: its strip time there and its velocity stay as
    /// they are. A time within the tolerance of a neighbour's is the neighbour's. Without `force` a move past
    /// a neighbour is refused (false); with it the event stops at the neighbour.
    bool set_edit_time(const ce_handle& handle, double time, bool force);
    [[nodiscard]] double get_strip_time(const ce_handle& handle,
                                        double editTime = Qx::kStripTimeAtEvent) const;
    /// What plays at an edit time; `Qx::kNoTime` and the invalid cookie where nothing does.
    [[nodiscard]] double get_strip_time(double editTime) const;
    /// Changes the strip time of one event alone: whoever slips a pair sets both ends. Ignored for a time
    /// that no event may hold.
    void set_strip_time(const ce_handle& handle, double time);
    [[nodiscard]] cookie get_strip_cookie(const ce_handle& handle) const;
    [[nodiscard]] cookie get_strip_cookie(double editTime) const;
    /// The occupied span, `Editable::invalidRange()` if there is none; with `fromZero` it starts at 0 at the
    /// latest.
    [[nodiscard]] Range getExtents(Editable::ExtentType type = Editable::Everything,
                                   bool fromZero = false) const;
    /// True if nothing but black and gaps lies in the range.
    [[nodiscard]] bool isEmpty(const Range& range) const;
    [[nodiscard]] bool isEmpty() const;
    /// @}

    /// \name Operations on regions
    /// Each is drawn before and after: one character a second, a letter for each source (upper case in the
    /// cel, lower case in the source of the operation), '.' for black, a blank for a gap, '|' a mark or,
    /// between two pairs of one source, a cut.
    ///
    /// What holds for all of them:
    /// - Marks are seconds. A mark within the tolerance (`Qx::kTimeTolerance`) of a cut means that cut, of
    ///   two the nearer, and what is joined there meets exactly. A pair of no length
    ///   belongs to the region that starts with it.
    ///
    /// - No operation leaves a piece or a gap shorter than the tolerance: what would be one, because a mark
    ///   means a cut beside it or a time was rounded, goes. (Times are doubles: at 1e9 s they lie a tenth of
    ///   the tolerance apart, so whatever moves there is rounded to that.)
    /// - A range that is no longer than the tolerance or both of whose marks mean one cut, a mark that is no
    ///   usable time (`kGreatestTime`), a null source, and a result that would reach past `kGreatestTime` are
    ///   refused; so is everything while the last pair is open (an in point added, its out point not).
    /// - Gaps are content: a gap of the source is a gap where it is laid. Past the end of a cel lies a gap,
    ///   so what is laid there leaves one, and nothing is filled with black; a region past the end is not
    ///   an error and the answer is true.
    ///
    /// - The source may be the cel itself: the result is as if it had been copied first.
    /// - Cutting a pair changes nothing of what is seen or heard in either piece: strip time and level at the
    ///   cut are those that the pair has there. The events at the cut have no fade; the fade at an end that
    ///   stays, stays. The `dmod` codes of the two ends go with the pieces' ends.
    /// - Stamps: a piece that is left of a pair keeps both of the pair's stamps, and so what is bound to
    ///   them. Where several pieces stay in the cel, the first keeps the in point's stamp, the last the out
    ///   point's, and the events at the cuts get fresh ones; `splits`, when given, receives the in point's
    ///   stamp and the fresh one of each further piece's in point, so that an effect can be bound to all.
    ///
    /// - Events that are copied out of a source get fresh stamps, but for one that shows a channel, whose
    ///   stamp is that channel's and stays; `ids` receives the stamp of each and the fresh one: of a pair
    ///   that several gaps took a piece of (`materialOnly`), that of the first piece, from which the others
    ///   count as split.
    ///
    /// - Velocity stays; the strip time of a piece's out point is where its in point and velocity lead.
    ///
    /// Cost: two binary searches, the events laid, and one pass over what follows if it moves. No allocation
    /// an event.
    /// @{

    /// Flags of `extract`.
    static constexpr unsigned KeepTimes = 1; ///< the part stays at its edit times instead of starting at 0

    /// The part between two edit times, as a cel of its own at 0. Stamps included: it is a copy of the part.
    ///
    ///        |   |
    ///     AAABB CCC    extract(3, 7)               BB C
    ///                  extract(3, 7, KeepTimes)       BB C
    ///
    /// Where nothing lies the part is empty. Null for a refused range, also for one whose end is not after
    /// its start. The channel information is not copied, the resolution is.
    [[nodiscard]] std::unique_ptr<cel> extract(double from, double to, unsigned flags = 0) const;

    /// Opens the cel at a time and lays a part of a source there; all that follows moves by the part's
    /// length.
    ///
    ///        at                                 source  ddee
    ///        |                                           ||
    ///     AAABBB    insert([1, 3), 3)         AAAdeBBB
    ///     AAAAAA                              AAAdeAAA      the pair is split
    ///     AA                                  AA de         past the end
    ///     (empty)                                de
    ///     AAABBB    insert([3, 6), 3)         AAAe  BBB     the source ends within its range
    bool insert(const cel* source, const Range& sourceRange, double at, IdMap& ids, Splits* splits = nullptr);

    /// Takes a region out; all that follows moves earlier by its length.
    ///
    ///       |  |
    ///     AAABBCC    remove([2, 5))    AACC
    ///     AAAAAAA                      AA|AA     the pair is split
    ///          BB                        BB      a gap goes too
    ///     A                            A         past the end: true, and nothing is changed
    bool remove(const Range& range, Splits* splits = nullptr);

    /// Overwrites from a time with a part of a source; nothing moves.
    ///
    ///       at                                  source  ddee
    ///       |                                            ||
    ///     AAABBB    replace([1, 3), 2)        AAdeBB
    ///     AAAAAA                              AAdeAA        the pair is split
    ///     AAA                                 AAde          reaches past the end
    ///     A                                   A de          past the end
    ///     AAABBB    replace([3, 5), 2)        AAe BB        a gap of the source overwrites too
    ///
    /// With `materialOnly` what is seen is the same, but for a gap, which plays black; and the events stay,
    /// with their stamps, levels, fades and codes. Pairs keep their bounds and are cut besides where the
    /// source is cut and at the ends of the region; those cuts are made as above. In gaps of the cel nothing
    /// stays, so the source is laid there as it is.
    ///
    ///       |                                            ||
    ///     AAABBB    replace([1, 3), 2, material)  AAdeBB      cut before d and after e,
    ///                                                         the ends of the region;
    ///                                                         between d and e lies the cut of A and B
    bool replace(const cel* source, const Range& sourceRange, double at, IdMap& ids,
                 bool materialOnly = false, Splits* splits = nullptr);

    /// Joins another cel on: its time 0 comes to lie at `at`. Refused if it would begin before this cel ends.
    ///
    ///     AAABB    weld("cc", 5)     AAABBcc
    ///              weld(" cc", 5)    AAABB cc
    ///              weld("cc", 4)     refused
    ///
    /// The events keep their stamps but for those that this cel has already, which become fresh ones: the
    /// parts that `extract` made weld together again. Pairs that play on through the joint stay two
    /// (`simplify`). Costs what is joined on, also in a row of welds; the first of a row, or after another
    /// change, costs one pass over the cel.
    bool weld(const cel* other, double at);

    /// A copy with `seconds` of black put before its first event ('S'), after its last ('E'), or both ('B').
    /// What is behind black at the start moves later by it.
    ///
    ///     AABB    (2, 'S')    ..AABB
    ///             (2, 'E')    AABB..
    ///             (1, 'B')    .AABB.
    ///      AA     (1, 'S')     .AA        the first event lies at 1
    ///     (empty) (1, 'B')    .|.
    ///
    /// 0 seconds give a plain copy; null for a negative number or another letter.
    [[nodiscard]] std::unique_ptr<cel> add_black_to_ends(int seconds, char ends) const;

    /// A copy whose edit times lie on the grid of the resolution, or on the project's frames if none is set,
    /// rounded to nearest. Here '^' is the grid and a cut lies between two of its points:
    ///
    ///     AAABBBBB    AAAABBBB
    ///     ^   ^   ^   ^   ^   ^
    ///
    /// Each end is trimmed or drawn out: what plays at an edit time that a pair still covers stays. A pair
    /// that is rounded to nothing is left out; cuts that lay on one another still do. A resolution within the
    /// tolerance leaves the times where they are. Null while the last pair is open, and if a time would be
    /// rounded past `kGreatestTime`.
    [[nodiscard]] std::unique_ptr<cel> quantise() const;

    /// A copy of the part that is played when something plays this cel as its strip: the moments from
    /// `stripIn` to `stripOut` on this cel's clock come to lie from `editIn` to `editOut`.
    ///
    ///        |   |
    ///     AAABBBBCC    rescale(0, 8, 3, 7, ...)    BBBBBBBB    at half the velocity
    ///     AAABBBBCC    rescale(0, 3, 2, 5, ...)    ABB
    ///     AAABBBBCC    rescale(0, 3, 5, 2, ...)    BBA         backwards: each pair in reverse
    ///     AAABBBBCC    rescale(0, 3, 4, 4, ...)    BBB         a freeze of one moment
    ///
    /// `stripIn` and `stripOut` are marks, as above; if both mean one time, it is a freeze. Strip times at
    /// the pairs' ends stay, velocities are multiplied by (stripOut - stripIn) / (editOut - editIn). Levels
    /// at the ends are multiplied by a line from `levelIn` at `editIn` to `levelOut` at `editOut`. Stamps are
    /// copied. With `quantiseResult` non-zero the result is quantised. Where nothing plays the copy is empty;
    /// a piece that would become shorter than the tolerance is left out. Null for times that are not usable,
    /// for an edit span that is not longer than the tolerance, and where a velocity would pass
    /// `kGreatestVelocity`.
    [[nodiscard]] std::unique_ptr<cel> rescale(double editIn, double editOut, double stripIn, double stripOut,
                                               double levelIn, double levelOut, int quantiseResult) const;

    /// The time quantum, seconds; 0 (the default) for none. A negative one or one that is no number is
    /// ignored.
    void set_resolution(double quantum);
    [[nodiscard]] double resolution() const { return m_resolution; }

    /// Flags of `chequerboard`.
    static constexpr int ChequerWiden =
        1; ///< pairs are lengthened to their reach, playing on beyond their cuts
    static constexpr int ChequerFill = 2; ///< gaps of the parts are filled with black up to this cel's end

    /// Deals the pairs of material out to as few parts as hold them without overlap: each goes to the first
    /// part that is free where it reaches. A pair reaches half of `overlap` seconds beyond either end, and
    /// with `SoftCuts::Keep` as far as its fades besides. Stamps are copied.
    ///
    ///     AABB.CC    overlap 0        AABB CC
    ///                overlap 1        AA   CC
    ///                                   BB
    ///     AABB.CC    overlap 4        AA            A reaches from -2 to 4, B from 0 to 6, C from 3 to 9
    ///                                   BB
    ///                                      CC
    ///
    /// Puts the parts, which the caller comes to own, into `parts` and their number into `numParts`, and
    /// returns that number. 0, with nothing made, if there is no material, if more than `maxParts` parts were
    /// needed, or for a negative overlap. With `ChequerWiden` no pair is lengthened to before time 0.
    int chequerboard(cel** parts, int& numParts, int maxParts, double overlap, int flags,
                     SoftCuts softCuts) const;

    /// Fills the channel with one pair of black from its end to `time`. False if it reaches that far already.
    bool fillToTime(double time);

    /// Merges pairs that touch. `MergeBlack`: black with black. `MergeThrough`: pairs of one source, velocity
    /// and code, the second going on where the first stops, at one level throughout and without a fade at the
    /// cut. The pair keeps the stamps of its two ends; what was bound to the in point at the cut is no longer
    /// bound, so whoever binds something says what may be merged: `mayMerge`, if given, is asked with the in
    /// points of two pairs that would be, each followed by its out point. False if there was nothing to
    /// merge.
    using MayMerge = std::function<bool(const channel_event* pair, const channel_event* next)>;
    bool simplify(Simplification::Type type, const MayMerge& mayMerge = nullptr);

    /// Non-zero if the events are consistent: in and out points paired, in order, each at the time of the one
    /// ahead or beyond the tolerance from it, every field one that a cel may hold, stamps set.
    [[nodiscard]] int is_good_cel() const;
    /// @}

    /// \name Channel information kept with the cel
    /// @{
    void editChannelInfo(String name, const IdStamp& id, String subType, String materialInfo);
    [[nodiscard]] const String& editChannelName() const { return m_name; }
    [[nodiscard]] const IdStamp& editChannelId() const { return m_id; }
    [[nodiscard]] const String& editChannelSubType() const { return m_subType; }
    [[nodiscard]] const String& editChannelMaterialInfo() const { return m_materialInfo; }
    /// The channel's name, with its stamp in brackets and the number of events if asked for: "V1", "V1
    /// (stamp) [4 events]".
    [[nodiscard]] String hierarchyName(bool withId, bool withEvents) const;
    /// @}

    /// \name Forms
    /// @{
    /// Packed: the channel information, the resolution, the number of events, filling (`setAlignment`, 8; not
    /// in revision 1), the events as they lie in memory. A last in point without an out point is not packed.
    void pack(PStream& stream) const override;
    /// Checks all that is read before it changes anything; `changed()` is false afterwards. Many events stay
    /// where they lie if the stream's bytes are kept (`PStream::keeper`), until the cel is changed.
    void unpack(PStream& stream) override;
    [[nodiscard]] std::unique_ptr<Streamable> clone(BuilderType type = BuilderType::Copy) const override;

    /// Appends the cel's lines of a legacy text: resolution, material text and every field of every event,
    /// one event a line, so that `buildFrom` makes the same bits again. Name, stamp and subtype stand in the
    /// line of the channel. The form is docs/ed2-format.md. Times are written in seconds whatever the
    /// standard.
    void writeToED2(TextFile& file, Qx::Ed2Support::TVStd standard) const;
    /// Reads those lines from line `first` on; `after`, if it is given, becomes the line behind them. A
    /// failure names the line (from 1) and what is wrong with it, and leaves the cel and `after` as they
    /// were.
    Qx::Status buildFrom(const TextFile& file, unsigned first, unsigned* after = nullptr);
    /// @}

private:
    friend class ce_handle;
    static const Form kForm;

    void changedNow() {
        m_changed = true;
        ++m_changeCount;
    }

    /// Time of the event ahead of place `at`, and that of the first from there on; without such an event a
    /// time beyond all that an event may have.
    [[nodiscard]] double timeBefore(size_t at) const {
        return at > 0 ? m_events[at - 1].editTime : -Qx::kNoTime;
    }
    [[nodiscard]] double timeFrom(size_t at) const {
        return at < m_events.size() ? m_events[at].editTime : Qx::kNoTime;
    }

    EventArray m_events;
    String m_name;
    IdStamp m_id;
    String m_subType;
    String m_materialInfo;
    double m_resolution = 0;
    bool m_changed = false;
    uint64_t m_changeCount = 0;
    StampIndex m_stamps; ///< for `weld`
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

inline void ce_handle::increment(int kinds) {
    if (m_cel == nullptr) {
        return;
    }
    const int at = m_index < 0 ? -1 : m_index;
    const int end = m_cel->numEvents();
    const bool ins = (kinds & CE_IN_POINT) != 0;
    const bool outs = (kinds & CE_OUT_POINT) != 0;
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

inline void ce_handle::decrement(int kinds) {
    if (m_cel == nullptr) {
        return;
    }
    const int end = m_cel->numEvents();
    const int at = m_index > end ? end : m_index;
    const bool ins = (kinds & CE_IN_POINT) != 0;
    const bool outs = (kinds & CE_OUT_POINT) != 0;
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
    const channel_event* content = m_cel != nullptr ? m_cel->getChanEventPtr(m_index) : nullptr;
    return content != nullptr ? content->editTime : 0;
}
