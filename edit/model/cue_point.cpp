#include "edit/model/cue_point.h"

#include "edit/model/cel.h"
#include "edit/model/detail/event_search.h"

#include <algorithm>
#include <cmath>

namespace {

bool near(double a, double b) {
    return std::abs(a - b) <= Qx::kTimeTolerance;
}

/// What the pair of an event plays.
struct Span {
    double editFrom = 0;
    double editTo = 0;
    double stripFrom = 0; ///< at its start, so above `stripTo` in reverse
    double stripTo = 0;
    cookie strip;

    Span(const cel& content, int inIndex) {
        const channel_event* in = content.getChanEventPtr(inIndex);
        const channel_event* out = content.getChanEventPtr(inIndex + 1);
        if (in != nullptr && out != nullptr) {
            editFrom = in->editTime;
            editTo = out->editTime;
            stripFrom = in->stripTime;
            stripTo = in->stripTime + (editTo - editFrom) * in->velocity;
            strip = in->strip;
        }
    }
    /// The start belongs to what is played, the end does not; of a freeze the one moment does.
    [[nodiscard]] bool plays(double stripTime) const {
        const double way = stripTo >= stripFrom ? 1.0 : -1.0;
        const double gone = (stripTime - stripFrom) * way;
        return gone >= -Qx::kTimeTolerance &&
               (gone < (stripTo - stripFrom) * way - Qx::kTimeTolerance || near(stripTime, stripFrom));
    }
    /// True if all that it plays lies between two strip times, in either order.
    [[nodiscard]] bool within(double a, double b) const {
        return std::min(stripFrom, stripTo) >= std::min(a, b) - Qx::kTimeTolerance &&
               std::max(stripFrom, stripTo) <= std::max(a, b) + Qx::kTimeTolerance;
    }
    [[nodiscard]] bool holds(double editTime) const {
        return Qx::timeIsConsideredToBeInRegion(editTime, {editFrom, editTo});
    }
    [[nodiscard]] double distance(double editTime) const {
        return std::max({editFrom - editTime, editTime - editTo, 0.0});
    }
};

/// The in point of the pair that plays at a time; an invalid handle where none does.
ce_handle playing(const cel* content, double time) {
    if (content == nullptr) {
        return {};
    }
    const ce_handle in = content->find_ceh(time, CE_IN_POINT);
    return in.valid() != 0 && Span(*content, in.index()).holds(time) ? in : ce_handle();
}

} // namespace

cue_point::cue_point(const char* text, double time, int chan, int code, const Vector<cel*>& cels, bool attach)
    : m_channel(chan), m_code(code), m_flags(CueFlag::kKept | CueFlag::kInside) {
    setText(text != nullptr ? text : "");
    setEditTime(time);
    m_secondTime = editTime();
    if (!attach) {
        return;
    }
    if (chan != kAnyCueChan) {
        if (chan >= 0 && chan < std::ssize(cels)) {
            attachTo(playing(cels[static_cast<size_t>(chan)], editTime()));
        }
        return;
    }
    for (const cel* content : cels) {
        const ce_handle event = playing(content, editTime());
        if (event.valid() != 0 && !event.get_strip_cookie().isBlack()) {
            attachTo(event);
            return;
        }
    }
}

bool cue_point::setStripTime(double seconds) {
    if (!std::isfinite(seconds)) {
        return false;
    }
    m_stripTime = seconds;
    return true;
}

bool cue_point::setSecondTime(double seconds) {
    if (!std::isfinite(seconds)) {
        return false;
    }
    m_secondTime = seconds;
    return true;
}

void cue_point::setEvent(const ce_handle& event) {
    m_event = event;
    m_eventId = {};
    m_outId = {};
    m_stripFrom = m_stripTo = 0;
    remember();
}

bool cue_point::attachTo(const ce_handle& event) {
    if (event.valid() == 0) {
        return false;
    }
    setEvent(event);
    m_flags.set(CueFlag::kAttached, true);
    update_strip_time();
    const cel& content = *event.get_its_cel();
    m_flags.set(CueFlag::kInside, Span(content, event.index() & ~1).distance(editTime()) <= 0);
    return true;
}

void cue_point::detach() {
    setEvent({});
    m_flags.set(CueFlag::kAttached, false);
    m_flags.set(CueFlag::kInside, true);
}

bool cue_point::slide(double seconds) {
    const double second = m_secondTime + seconds;
    if (!std::isfinite(second) || !m_editTime.set(editTime() + seconds)) {
        return false;
    }
    m_secondTime = second;
    return true;
}

/// Keeps what finds the event again after a change.
void cue_point::remember() {
    const channel_event* event = m_event.get_chan_evnt_ptr();
    if (event == nullptr) {
        return;
    }
    const cel& content = *m_event.get_its_cel();
    const int in = m_event.index() & ~1;
    m_eventId = event->id;
    const channel_event* out = content.getChanEventPtr(in + 1);
    m_outId = out != nullptr ? out->id : IdStamp();
    const Span span(content, in);
    m_stripFrom = span.stripFrom;
    m_stripTo = span.stripTo;
}

/// Brings the handle back to the cue's event after the cel changed. Without one it is left at no event.
bool cue_point::findEvent(EventSearch& search) {
    const cel* content = m_event.get_its_cel();
    if (content == nullptr || m_event.index() < 0) {
        return false;
    }
    if (!m_eventId.valid()) {
        return m_event.valid() != 0;
    }
    int index = search.nearest(*content, m_eventId, m_event.index());
    if (index < 0 && m_outId.valid() && m_event.index() % 2 == 0) {
        const int out = search.nearest(*content, m_outId, m_event.index() + 1);
        if (out > 0) {
            const Span span(*content, out - 1);
            const bool part = span.strip == m_stripCookie && span.within(m_stripFrom, m_stripTo);
            index = part && span.plays(m_stripTime) ? out - 1 : -1;
        }
    }
    m_event.set_index(index);
    return index >= 0;
}

/// When other material was laid under the event: the cue keeps its distance from the event's start.
void cue_point::takeOverStrip() {
    const cookie strip = m_event.get_strip_cookie();
    if (m_event.index() % 2 != 0 || !m_stripCookie.is_valid() || strip == m_stripCookie) {
        return;
    }
    if (setStripTime(m_stripTime - m_stripFrom + m_event.get_strip_time(Qx::kStripTimeAtEvent))) {
        m_stripCookie = strip;
        remember();
    }
}

/// After a split: to the piece that plays the cue's strip time, when the one with the stamp does not any
/// more.
void cue_point::moveToPiece(EventSearch& search) {
    const cel& content = *m_event.get_its_cel();
    const bool played = m_stripTime >= std::min(m_stripFrom, m_stripTo) - Qx::kTimeTolerance &&
                        m_stripTime <= std::max(m_stripFrom, m_stripTo) + Qx::kTimeTolerance;
    const int in = m_event.index();
    const channel_event* const out = content.getChanEventPtr(in + 1);
    // A pair that has its out point still was trimmed at most.
    if (in % 2 != 0 || !played || out == nullptr || out->id == m_outId || !m_outId.valid() ||
        Span(content, in).plays(m_stripTime)) {
        return;
    }
    // Of pieces that follow one another a later moment lies in a later one.
    const double way = m_stripTo >= m_stripFrom ? 1.0 : -1.0;
    const int last = search.nearest(content, m_outId, in + 1) - 1;
    for (int piece = search.firstPiece(content, in, m_stripTime * way); piece <= last; piece += 2) {
        const Span span(content, piece);
        if (span.strip == m_stripCookie && span.plays(m_stripTime) && span.within(m_stripFrom, m_stripTo)) {
            search.notePiece(content, in, m_stripTime * way, piece);
            m_event.set_index(piece);
            return;
        }
    }
}

bool cue_point::moveTo(double time) {
    const double old = editTime();
    const double second = m_secondTime + (time - old);
    if (time == old || !m_editTime.set(time)) {
        return false;
    }
    m_secondTime = std::isfinite(second) ? second : time;
    return true;
}

void cue_point::update_strip_time() {
    EventSearch search;
    updateStripTime(search);
}

void cue_point::updateStripTime(EventSearch& search) {
    if (findEvent(search)) {
        setStripTime(m_event.get_strip_time(editTime()));
        m_stripCookie = m_event.get_strip_cookie();
        remember();
    } else if (attached()) {
        moveTo(0.0);
    }
}

bool cue_point::update_edit_time() {
    EventSearch search;
    return updateEditTime(search);
}

bool cue_point::updateEditTime(EventSearch& search) {
    if (!attached()) {
        m_flags.set(CueFlag::kInside, true);
        return false;
    }
    if (!findEvent(search)) {
        return moveTo(0.0);
    }
    takeOverStrip();
    moveToPiece(search);
    remember();
    const double from = m_event.get_edit_time();
    const bool moved = moveTo(m_stripTime - m_event.get_strip_time(Qx::kStripTimeAtEvent) + from);
    const ce_handle out = m_event.get_next_ceh(CE_OUT_POINT);
    if (out.valid() == 0) {
        return moved;
    }
    const bool inside = editTime() >= from && editTime() <= out.get_edit_time();
    const bool wasInside = hasFlags(CueFlag::kInside);
    m_flags.set(CueFlag::kInside, inside);
    return moved || inside != wasInside;
}

std::unique_ptr<cue_point> cue_point::copy() const {
    return std::make_unique<cue_point>(*this);
}

void cue_point::convert(const Vector<cel*>& cels) {
    EventSearch search;
    convert(cels, search);
}

void cue_point::convert(const Vector<cel*>& cels, EventSearch& search) {
    if (!attached()) {
        return;
    }
    Vector<cel*> searched;
    if (m_channel == kAnyCueChan) {
        searched = cels;
    } else if (m_channel >= 0 && m_channel < std::ssize(cels)) {
        searched.push_back(cels[static_cast<size_t>(m_channel)]);
    }
    if (!attachByStamp(searched, search) && !attachByTimes(searched, search)) {
        const bool reread = hasFlags(CueFlag::kInside);
        for (const cel* content : searched) {
            const ce_handle event = reread ? playing(content, editTime()) : ce_handle();
            if (event.valid() != 0) {
                attachTo(event);
                return;
            }
        }
        detach();
    }
}

bool cue_point::attachByStamp(const Vector<cel*>& cels, EventSearch& search) {
    if (!m_eventId.valid()) {
        return false;
    }
    const int hint = std::max(m_event.index(), 0);
    for (cel* content : cels) {
        const int index = content != nullptr ? search.nearest(*content, m_eventId, hint) : -1;
        if (index >= 0) {
            m_event = ce_handle(content, index);
            return true;
        }
    }
    return false;
}

/// To the event that plays the cue's strip time at its edit time.
bool cue_point::attachByTimes(const Vector<cel*>& cels, EventSearch& search) {
    const double time = editTime();
    const auto fits = [&](const Span& span) {
        return (!m_stripCookie.is_valid() || span.strip == m_stripCookie) &&
               near(m_stripTime - span.stripFrom + span.editFrom, time);
    };
    ce_handle best;
    double bestDistance = 0;
    for (const cel* content : cels) {
        const ce_handle there = playing(content, time);
        if (there.valid() != 0 && (fits(Span(*content, there.index())) ||
                                   near(content->get_strip_time(there, time), m_stripTime))) {
            best = there;
            break;
        }
        const int near =
            content == nullptr ? -1 : search.nearestPair(*content, time, time - m_stripTime, [&](int in) {
                const Span span(*content, in);
                return !span.strip.isBlack() && fits(span);
            });
        if (near >= 0) {
            const double distance = Span(*content, near).distance(time);
            if (best.valid() == 0 || distance < bestDistance) {
                best = ce_handle(content, near);
                bestDistance = distance;
            }
        }
    }
    if (best.valid() == 0) {
        return false;
    }
    const double strip = m_stripTime;
    setEvent(best);
    m_stripTime = strip;
    m_stripCookie = best.get_strip_cookie();
    m_flags.set(CueFlag::kAttached, true);
    return true;
}
