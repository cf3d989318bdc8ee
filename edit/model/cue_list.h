#pragma once

#include "edit/model/cel.h"
#include "edit/model/cue_point.h"
#include "platform/store/streamable_layer.h"
#include "platform/store/taggable.h"

#include <utility>
#include <vector>

/// The cues of an edit: an ordered sequence, held by value, in the order in which they were added until
/// `sort`. It knows nothing of the edit, of dirt or of notification; `Edit`'s own operations on cues record
/// the change.
///
/// Cues that are kept in the edit file should stand first: the legacy text form writes as many cues from the
/// front as there are kept ones.
///
/// Attached cues point into cels that the list does not own, and so do those of a copy: see `cue_point`.
/// Channel arguments: a negative channel or `kAnyCueChan` matches every channel. Not thread-safe.
class QM_API cue_list : public StreamableLayer, public Taggable {
public:
    cue_list() : StreamableLayer(kForm) {}
    cue_list(const cue_list&) = default;
    cue_list& operator=(const cue_list&) = default;
    ~cue_list() override;

    [[nodiscard]] const TagTypeId& tagTypeId() const override;

    /// \name Cues
    /// @{
    /// Appends a copy; the list is not sorted.
    void add_cue_point(const cue_point& cue);
    /// Appends a cue built from its parts (see `cue_point`). False for a time that is not finite.
    bool add_cue_point(const char* text, double time, int chan, int code, const Vector<cel*>& cels,
                       bool attach);
    /// The number of cues whose flag word contains every bit of `flags`; all of them for 0.
    [[nodiscard]] size_t get_num_cue_points(int flags) const;
    /// The `i`-th cue, from 0, among those whose flag word contains every bit of `flags`; null when there is
    /// none. Valid until a cue is added or removed.
    [[nodiscard]] const cue_point* get_cue_point(size_t i, int flags) const;
    [[nodiscard]] cue_point* get_cue_point(size_t i, int flags);
    /// False when there is no such cue.
    bool delete_cue_point(size_t i);
    void delete_all_cues() { m_cues.clear(); }
    /// Removes the cues for which `gone(place, cue)` is true, asked of each once, in order; the order of the
    /// others stays. Returns how many went.
    template <typename Predicate>
    size_t delete_cues_if(Predicate gone) {
        size_t kept = 0;
        for (size_t i = 0; i < m_cues.size(); ++i) {
            if (!gone(i, std::as_const(m_cues[i]))) {
                if (kept != i) {
                    m_cues[kept] = std::move(m_cues[i]);
                }
                ++kept;
            }
        }
        const size_t removed = m_cues.size() - kept;
        m_cues.erase(m_cues.end() - static_cast<std::ptrdiff_t>(removed), m_cues.end());
        return removed;
    }
    /// Removes every cue whose flag word contains every bit of `flags` on a channel; the order of the others
    /// stays. Returns how many went.
    size_t delete_matching_cues(int flags, int chan);
    /// The channel numbers at or after `firstChan` move by `count` and stay within 0 to 65534;
    /// `kAnyCueChan` stays.
    void shuffleChans(int firstChan, int count);
    /// @}

    /// \name Times
    /// @{
    /// Orders the cues by edit time; cues of one time keep their order.
    void sort();
    /// Adds `seconds` to every edit time and second time. False, changing nothing, when one would not be
    /// finite.
    bool slide(double seconds);
    /// Follows the events: non-zero if any cue changed. Cues whose events shifted together are found without
    /// a search.
    int update_edit_time();
    void update_strip_time();
    /// Maps the times when the cels were mapped from one rate to another: edit and second times become
    /// time * editFactor + editOffset, strip times of attached cues time * stripFactor + stripOffset. The
    /// caller then re-attaches (`convert`, `rebindCel`) where cels were replaced. False, changing nothing,
    /// when a time would not be finite.
    bool rescale(double editFactor, double stripFactor, double editOffset = 0, double stripOffset = 0);
    /// @}

    /// \name Cels
    /// @{
    /// Re-attaches every cue to the cels of an edit, by channel index; see `cue_point::convert`.
    void convert(const Vector<cel*>& cels);
    /// The cues that are attached to `from` become attached to the events of `to` with the same stamps, or
    /// lose their event where `to` is null or has none.
    void rebindCel(const cel* from, cel* to);
    /// A cel goes: the cues attached to it lose their event.
    void dropCel(const cel* gone) { rebindCel(gone, nullptr); }
    /// The same for the cels for which `gone(cel)` is true.
    template <typename Predicate>
    void dropCels(Predicate gone) {
        for (cue_point& cue : m_cues) {
            if (gone(std::as_const(cue).event().get_its_cel())) {
                cue.m_event = ce_handle();
            }
        }
    }
    /// The same for all cels. `convert` finds the events again, first by their stamps.
    void dropCels() {
        dropCels([](const cel*) { return true; });
    }
    /// @}

    /// \name Lists from lists
    /// @{
    /// A new list of the cues of a channel between two times, the first included, the second not; they keep
    /// their order and move by -`from`, so that the part begins at 0. Its cues are unattached. Empty when
    /// `to` is not after `from`.
    ///
    ///     ..1...2..3....   from 4 to 9   ->  ..2..3
    [[nodiscard]] std::unique_ptr<cue_list> extract(double from, double to, int chan) const;
    /// The same for a part that was cut out of a channel with `cel::extract`: the attached cues are attached
    /// to `part`'s events that play the same strip, where there are such.
    [[nodiscard]] std::unique_ptr<cue_list> extract(double from, double to, int chan, cel* part) const;
    /// Merges copies of another list's cues in and sorts the result, at one time this list's first. With a
    /// `chan` of 0 or more they are all put on that channel. A cue that is there already, of the same text,
    /// edit time (within the tolerance), channel and code, is not added again: merging a list twice is
    /// merging it once. A null list, or this one, adds nothing.
    void overlay(const cue_list* other, int chan);
    /// @}

    /// \name Forms
    /// @{
    /// Packed: a count, per cue a revision byte (1) and the cue, and a signed 32-bit 0 as terminator.
    void pack(PStream& stream) const override;
    /// A wrong count, a revision from the future, a time that is not finite or a missing terminator put the
    /// stream into its error state; the list is then as it was. Read cues are attached by `convert`.
    void unpack(PStream& stream) override;
    [[nodiscard]] std::unique_ptr<Streamable> clone(BuilderType type = BuilderType::Copy) const override;
    /// @}

    static const Form kForm;

private:
    std::vector<cue_point> m_cues;
};
