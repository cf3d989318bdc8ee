#pragma once

#include "edit/model/ce_handle.h"
#include "edit/model/cel.h"
#include "edit/model/cue_flags_field.h"
#include "edit/model/strp_field.h"
#include "edit/model/tc_field.h"
#include "platform/base/cookie.h"
#include "platform/base/id_stamp.h"
#include "platform/base/vector.h"

#include <cstddef>
#include <memory>

class EventSearch;

/// The flag bits of a cue that have a fixed role. They live in files: do not change them.
namespace CueFlag {
inline constexpr int kAttached = 1; ///< the cue follows the event named by its handle
inline constexpr int kKept = 2;     ///< the cue is kept in the edit file
inline constexpr int kInside = 4;   ///< the edit time lies in the event's span; set for an unattached cue
} // namespace CueFlag

/// A cue's channel number that stands for "any channel".
inline constexpr int kAnyCueChan = 65535;

/// A named marker at an edit time, optionally attached to one event of one channel, so that it moves with the
/// material that it marks.
///
/// A value: copying is deep but for the event, which is a place in a cel that the cue does not own. Whoever
/// destroys a cel first takes the cues off it (`cue_list::dropCel`, `cue_list::rebindCel`); `Edit` does so
/// for its own. Times are seconds and always finite: a setter answers false to a time that is not, and
/// changes nothing. Not thread-safe.
///
/// The *second time* is the end of what the cue marks: a cue of a moment has its edit time there, a cue of a
/// span a later one. It moves with the edit time whatever moves that, so that a span keeps its length. The
/// *code* is a number for the application, 0 at first; the library carries it along.
///
/// How an attached cue finds its event again. Indices shift when a cel changes, stamps do not: the cue
/// remembers the stamps of its event and of the pair's out point, and the strip times that the pair played.
///
///     split, cue in the left piece     aaa^aa        aaa^|bb|aa    the left piece has the stamp: it stays
///     split, cue in the right piece    aaaa^a        aaa|bb|a^a    it attaches to the piece that plays it
///     in point cut off                 aaa^aa        bbba^a        found by the out point's stamp
///     event removed                    aa^aaa        bbbbbb        edit time 0, handle not valid
///
/// A piece is taken for a part of the cue's event when it lies later on the same cel, up to the pair that has
/// the event's out point, plays the same strip within the strip times that the whole played, and plays the
/// cue's strip time. A cue whose moment was trimmed away stays with its event, outside. When other material
/// is laid under its event it keeps its distance from the event's start. Once its event is gone a cue stays
/// at edit time 0 until `convert` finds the event elsewhere.
class QM_API cue_point {
public:
    cue_point() = default;
    /// A cue built from its parts: kept in the file, code `code`, the second time equal to `time`; a `time`
    /// that is not finite gives 0. `cels` are the cels of the edit's channels by channel index, null where a
    /// channel has none. With `attach`, it is attached to the event of `cels[chan]` that plays at `time`, of
    /// any kind, black too; for `kAnyCueChan` to the first of `cels` that plays something other than black.
    /// Where nothing plays it is unattached.
    cue_point(const char* text, double time, int chan, int code, const Vector<cel*>& cels, bool attach);

    [[nodiscard]] const String& text() const { return m_text.get(); }
    void setText(String text) { m_text.set(std::move(text)); }
    [[nodiscard]] double editTime() const { return m_editTime.get(); }
    /// Sets the edit time alone; an attached cue's strip time follows by `update_strip_time`.
    bool setEditTime(double seconds) { return m_editTime.set(seconds); }
    [[nodiscard]] double stripTime() const { return m_stripTime; }
    bool setStripTime(double seconds);
    [[nodiscard]] const cookie& stripCookie() const { return m_stripCookie; }
    void setStripCookie(const cookie& strip) { m_stripCookie = strip; }
    [[nodiscard]] double secondTime() const { return m_secondTime; }
    bool setSecondTime(double seconds);
    [[nodiscard]] int channel() const { return m_channel; }
    void setChannel(int chan) { m_channel = chan; }
    [[nodiscard]] int code() const { return m_code; }
    void setCode(int code) { m_code = code; }
    [[nodiscard]] int flags() const { return static_cast<int>(m_flags.get()); }
    void setFlags(int flags) { m_flags.set(static_cast<uint32_t>(flags)); }
    /// True if the flag word contains every bit of `flags`; always for 0.
    [[nodiscard]] bool hasFlags(int flags) const { return m_flags.has(static_cast<uint32_t>(flags)); }
    [[nodiscard]] bool attached() const { return hasFlags(CueFlag::kAttached); }
    [[nodiscard]] const ce_handle& event() const { return m_event; }
    /// Names the event and remembers its stamps; the flags stay.
    void setEvent(const ce_handle& event);

    /// Makes the cue follow an event: sets the flags, reads the strip time and cookie at the edit time.
    /// False, changing nothing, for a handle that is not valid.
    bool attachTo(const ce_handle& event);
    /// Makes the cue follow nothing. It stays where it is.
    void detach();

    /// Moves the edit time and the second time by `seconds`. False, changing nothing, when a time would not
    /// be finite any more.
    bool slide(double seconds);
    /// Re-reads the strip time, at the edit time, and the strip cookie from the event. An attached cue
    /// without one goes to edit time 0.
    void update_strip_time();
    /// Moves an attached cue to where its event plays the strip time, that is to strip time - the event's
    /// strip time + the event's edit time, at any velocity, and keeps `CueFlag::kInside` up to date. Answers
    /// whether the cue changed. An attached cue without an event goes to edit time 0.
    bool update_edit_time();
    /// Re-attaches the cue, if it is attached, to the cels of an edit by channel index, as after loading,
    /// when its event is not known, or after cels were replaced: first by the event's stamp; else to the
    /// event that plays the cue's strip time at its edit time, the nearest if several would; else, when the
    /// edit time lay in its event, to what plays there, reading the strip anew. A cue for which there is none
    /// of these becomes unattached and stays at its edit time. A cue of any channel searches all of them, in
    /// order.
    void convert(const Vector<cel*>& cels);
    [[nodiscard]] std::unique_ptr<cue_point> copy() const;

    /// Finds the cue of the source item that this one, attached to material of it, repeats: the cue of the
    /// edit named by the strip cookie with the same text, at this one's strip time (within the tolerance).
    /// Sets the source's cookie and the cue's index there. False, changing neither, for an unattached cue,
    /// where the source does not open, and where it has no such cue.
    bool find_original(cookie& source, int& index) const;
    /// Removes that cue from the source item, which records the change. False if there is none or the source
    /// is read-only.
    bool delete_if_original() const;

    /// The order of the edit times; nothing else counts.
    bool operator<(const cue_point& other) const { return editTime() < other.editTime(); }

    [[nodiscard]] static constexpr uint8_t currentBuildRevision() { return 1; }
    /// The fewest bytes that a packed cue takes, without its own revision byte.
    static constexpr size_t kLeastPackedSize = 43;
    /// Writes the cue; the strip cookie and the event are not packed.
    void pack(PStream& stream) const;
    /// Reads it. On a bad stream the stream is in its error state and the cue is as it was.
    void unpack(PStream& stream, unsigned revision);

private:
    friend class cue_list;

    bool updateEditTime(EventSearch& search);
    void updateStripTime(EventSearch& search);
    bool moveTo(double editTime);
    bool findEvent(EventSearch& search);
    void takeOverStrip();
    void moveToPiece(EventSearch& search);
    void remember();
    void convert(const Vector<cel*>& cels, EventSearch& search);
    bool attachByStamp(const Vector<cel*>& cels, EventSearch& search);
    bool attachByTimes(const Vector<cel*>& cels, EventSearch& search);

    strp_field m_text;
    tc_field m_editTime;
    double m_stripTime = 0;
    cookie m_stripCookie;
    double m_secondTime = 0;
    int m_channel = kAnyCueChan;
    int m_code = 0;
    cue_flags_field m_flags{CueFlag::kInside};
    ce_handle m_event;

    // How the event is found again; not packed.
    IdStamp m_eventId;
    IdStamp m_outId;
    double m_stripFrom = 0;
    double m_stripTo = 0;
};
