#pragma once

#include "edit/model/channel_event.h"
#include "platform/base/num_range.h"
#include "platform/media/gain_curve.h"

class cel;

/// A cursor on one event of one cel: the cel and the event's index. It owns nothing and allocates nothing; it
/// stays usable while the cel lives, and after a change of the cel it names whatever event has that index. A
/// handle one step past either end is not valid. Accessors of an invalid handle answer zero values; setters
/// through it do nothing.
class QM_API ce_handle {
public:
    ce_handle() = default;
    ce_handle(const cel* content, int index) : m_cel(const_cast<cel*>(content)), m_index(index) {}

    [[nodiscard]] cel* get_its_cel() const { return m_cel; }
    void set_its_cel(cel* content) { m_cel = content; }
    [[nodiscard]] int index() const { return m_index; }
    void set_index(int index) { m_index = index; }

    /// Non-zero when the handle names an existing event.
    [[nodiscard]] int valid() const;
    bool operator==(const ce_handle&) const = default;

    [[nodiscard]] bool is_in_point() const;
    [[nodiscard]] bool is_out_point() const;
    [[nodiscard]] ce_info get_ce_info() const;

    /// The other end of the event's pair; for the end itself, a copy of this handle.
    [[nodiscard]] ce_handle matching_in_ceh() const;
    [[nodiscard]] ce_handle matching_out_ceh() const;
    [[nodiscard]] ce_handle get_next_ceh(int kinds) const;
    [[nodiscard]] ce_handle get_prev_ceh(int kinds) const;
    /// Moves to the next event of some kinds (`ce_info` values, or'ed); past the last one, to the cel's event
    /// count.
    void increment(int kinds);
    /// Moves to the event of some kinds before; before the first one, to -1.
    void decrement(int kinds);
    /// `increment(CE_ANY)`; true while the handle is valid.
    bool next();
    ce_handle& operator++();
    ce_handle& operator--();
    [[nodiscard]] ce_handle get_start_ceh() const;
    [[nodiscard]] ce_handle get_end_ceh() const;
    /// `cel::find_ceh` on the handle's cel; false when `found` is not valid.
    bool find_ceh(ce_handle& found, double time, int kinds) const;

    [[nodiscard]] double get_edit_time() const;
    /// See `cel::set_edit_time`.
    bool set_edit_time(double time);
    /// Strip time that the event's pair plays at an edit time; `Qx::kStripTimeAtEvent` asks at the event.
    [[nodiscard]] double get_strip_time(double editTime = Qx::kStripTimeAtEvent) const;
    void set_strip_time(double time);
    [[nodiscard]] cookie get_strip_cookie() const;
    /// This and the setters below change one event of the pair, and ignore a value that no event may hold.
    void set_strip_cookie(const cookie& strip);
    /// Level at an edit time, linear between the pair's ends; `Qx::kStripTimeAtEvent` asks at the event.
    [[nodiscard]] float get_strip_level(double editTime = Qx::kStripTimeAtEvent) const;
    void set_strip_level(float level);
    [[nodiscard]] double get_strip_velocity() const;
    /// Sets the velocity of the pair, at both its ends, and the out point's strip time with it.
    void set_strip_velocity(double velocity);
    [[nodiscard]] int get_dmod_code() const;
    void set_dmod_code(int code);
    /// The event by value (a default one for an invalid handle), and in place (null). The pointer lasts until
    /// the cel's next change.
    [[nodiscard]] channel_event get_channel_event() const;
    [[nodiscard]] const channel_event* get_chan_evnt_ptr() const;
    /// True if `time` lies strictly inside the event's pair, beyond the tolerance from either end.
    [[nodiscard]] bool time_in_range_exclusive(double time) const;
    /// The stamp of the effect graph bound to the event, which is the event's own.
    [[nodiscard]] IdStamp getEffectGraph() const;
    void setEffectGraph(const IdStamp& id);
    [[nodiscard]] uint16_t audioRamp_DurationQFrames() const;
    void set_audioRamp_DurationQFrames(uint16_t quarterFrames);
    [[nodiscard]] Aud::GainCurve::eCurveType audioRamp_CurveType() const;
    void set_audioRamp_CurveType(Aud::GainCurve::eCurveType type);

private:
    [[nodiscard]] const channel_event* event() const;
    [[nodiscard]] channel_event& changing() const;
    template <typename Change>
    void change(Change&& apply);

    cel* m_cel = nullptr;
    int m_index = -1;
};

/// The two handles of one pair.
class QM_API CEHPair {
public:
    CEHPair() = default;
    /// The pair that holds an event.
    explicit CEHPair(const ce_handle& event);
    /// The pair that plays at a time; of a null cel, none.
    CEHPair(const cel& content, double time);
    CEHPair(const cel* content, double time);
    [[nodiscard]] bool valid() const { return m_in.valid() != 0 && m_out.valid() != 0; }
    [[nodiscard]] ce_handle inH() const { return m_in; }
    [[nodiscard]] ce_handle outH() const { return m_out; }
    /// The pair's span of edit time; `Editable::invalidRange()` for an invalid pair.
    [[nodiscard]] NumRange<double, Ordered> editRange() const;

private:
    ce_handle m_in;
    ce_handle m_out;
};
