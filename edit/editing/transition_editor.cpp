#include "edit/editing/transition_editor.h"

#include "edit/editing/detail/edit_plan.h"
#include "edit/manager/edit_manager.h"
#include "edit/model/transition.h"
#include "platform/media/frame_rate.h"

#include <algorithm>
#include <cmath>
#include <mutex>
#include <optional>

using editing_detail::secondsText;
using EventObjects::Bound;
using Qx::kTimeTolerance;
using Range = cel::Range;

namespace {

/// The span of an item that can be played, by its own clock; nothing where that cannot be told.
std::optional<Range> extentOf(const cookie& strip) {
    if (!strip.isStorable() || edit_manager::theEditManager() == nullptr) {
        return std::nullopt;
    }
    const EditPtr item = edit_manager::openEdit(strip, eOpenExisting);
    const Range extent = item.valid() ? Range(item->getStartTime(), item->getEndTime()) : Range();
    return extent.length() > kTimeTolerance ? std::optional(extent) : std::nullopt;
}

/// Number of the pair that shows a transition at a time; -1 if none does.
int pairAt(Edit& edit, const cel& channel, double at) {
    const ce_handle in = channel.find_ceh(at, CE_IN_POINT);
    const channel_event* const its = channel.getChanEventPtr(in.index());
    const bool plays =
        its != nullptr && in.index() + 1 < channel.numEvents() && its[1].editTime - at > kTimeTolerance;
    return plays && Transitions::isTransition(edit.objectStore(), *its) ? in.index() / 2 : -1;
}

/// One change of a transition: worked out on a copy of the channel, then made.
class Change {
public:
    Change(const EditPtr& edit, const IdStamp& chan, unsigned flags)
        : m_edit(edit), m_chan(chan), m_flags(flags) {}

    TransitionEditor::Result add(double at, const EffectInstance& effect, double length,
                                 TransitionAlign align) {
        return perform([&] { return isFor(effect) && planAdd(at, length, align); }, &effect);
    }
    TransitionEditor::Result set(double at, const EffectInstance* effect, double length,
                                 TransitionAlign align) {
        return perform([&] { return (effect == nullptr || isFor(*effect)) && planSet(at, length, align); },
                       effect);
    }
    TransitionEditor::Result remove(double at) {
        return perform([&] { return planRemove(at); }, nullptr);
    }

private:
    bool refuse(String reason) {
        m_result.reason = std::move(reason);
        return false;
    }
    bool check();
    bool isFor(const EffectInstance& effect);
    bool findTransition(double at);
    bool checkLength(double length);
    bool layAt(double cut, double length, TransitionAlign align);
    bool planAdd(double at, double length, TransitionAlign align);
    bool planSet(double at, double length, TransitionAlign align);
    bool planRemove(double at);
    bool checkHandles();
    template <typename Plan>
    TransitionEditor::Result perform(const Plan& plan, const EffectInstance* effect);
    void make(const EffectInstance* effect);
    [[nodiscard]] double rounded(double time) const {
        return (m_flags & Editor::ExactTimes) != 0 ? time
                                                   : editing_detail::roundTo(m_edit->getFrameRate(), time);
    }
    [[nodiscard]] cel* channel() const { return m_edit->get_edit_cel_p(m_edit->getIdx(m_chan)); }

    EditPtr m_edit;
    IdStamp m_chan;
    unsigned m_flags;
    TransitionEditor::Result m_result;
    std::unique_ptr<cel> m_changed; ///< the channel as it is to be
    Range m_span;                   ///< where it differs
    bool m_removes = false;
};

bool Change::check() {
    constexpr unsigned kKnown = Editor::ExactTimes | Editor::NoBackup | TransitionEditor::WithoutHandles;
    if (!m_edit.valid()) {
        return refuse("there is no edit");
    }
    if ((m_flags & ~kKnown) != 0) {
        return refuse("the operation has flags that do not exist");
    }
    if (m_edit->isBad() || !editing_detail::isWritable(*m_edit)) {
        return refuse("the edit " + m_edit->get_cookie_str() + " cannot be changed");
    }
    const cel* const content = channel();
    if (content == nullptr || !editing_detail::isContinuous(m_edit->getChanTypeAndSubType(m_chan))) {
        return refuse("transitions lie on video and audio channels");
    }
    return content->numEvents() % 2 == 0 || refuse("the channel's last event is incomplete");
}

bool Change::isFor(const EffectInstance& effect) {
    if (!effect.isTransition()) {
        return refuse(effect.getName() + " is no transition");
    }
    const bool isSound = effect.kind()->role == Fx::EffectRole::Sound;
    return isSound == (m_edit->getChanType(m_chan) == AudioChan) ||
           refuse(effect.getName() + (isSound ? " joins sounds, and the channel shows pictures"
                                              : " joins pictures, and the channel is one of sound"));
}

bool Change::findTransition(double at) {
    const int pair = pairAt(*m_edit, *channel(), at);
    if (pair < 0) {
        return refuse("no transition plays at " + secondsText(at) + " s on " +
                      m_edit->getChanDisplayName(m_chan));
    }
    const channel_event* const its = channel()->getChanEventPtr(2 * pair);
    m_result.event = its->id;
    m_result.range = Range(its[0].editTime, its[1].editTime);
    m_span = m_result.range;
    return true;
}

bool Change::checkLength(double length) {
    return (std::isfinite(length) && rounded(length) > kTimeTolerance) ||
           refuse("a transition is at least one frame long");
}

/// Lays the transition over a cut of the copy.
bool Change::layAt(double cut, double length, TransitionAlign align) {
    const double whole = rounded(length);
    const double from = align == TransitionAlign::Start ? cut
                        : align == TransitionAlign::End ? cut - whole
                                                        : rounded(cut - whole / 2);
    m_result.range = Range(from, from + whole);
    m_span.widen(m_result.range);
    return Transitions::lay(*m_changed, cut, from, from + whole, m_result.event) ||
           refuse("a transition from " + secondsText(from) + " s to " + secondsText(from + whole) +
                  " s has no room: it must lie between a clip and the next one, within both, "
                  "and may cover no other transition");
}

bool Change::planAdd(double at, double length, TransitionAlign align) {
    if (!std::isfinite(at) || !checkLength(length)) {
        return refuse(m_result.reason.empty() ? String("the place of a transition must be a time")
                                              : m_result.reason);
    }
    // The nearest end of a pair.
    const Qx::FrameRate rate = m_edit->getFrameRate();
    double within =
        (m_flags & Editor::ExactTimes) != 0 || !rate.valid() ? kTimeTolerance : rate.frameDuration() / 2;
    std::optional<double> cut;
    const cel& content = *channel();
    const int governing = content.find_ceh(at, CE_IN_POINT).index();
    for (int i = std::max(governing - 1, 0); i < std::min(governing + 4, content.numEvents()); ++i) {
        const double far = std::abs(content.getChanEventPtr(i)->editTime - at);
        if (far <= within + kTimeTolerance) {
            within = std::min(within, far);
            cut = content.getChanEventPtr(i)->editTime;
        }
    }
    if (!cut.has_value()) {
        return refuse("no cut is at " + secondsText(at) + " s on " + m_edit->getChanDisplayName(m_chan));
    }
    if (!m_result.event.valid()) {
        m_result.event = IdStamp::fresh(IdStampMagic::EffectNode);
    }
    m_span = Range(*cut, *cut);
    m_changed = content.copy();
    return layAt(*cut, length, align) && checkHandles();
}

bool Change::planSet(double at, double length, TransitionAlign align) {
    if (!findTransition(at) || (length != 0 && !checkLength(length))) {
        return false;
    }
    m_changed = channel()->copy();
    const Range old = m_result.range;
    const double wanted = length == 0 ? old.length() : length;
    if (align == TransitionAlign::Centre && std::abs(wanted - old.length()) <= kTimeTolerance) {
        return true;
    }
    const double middle = std::clamp(rounded((old.start() + old.end()) / 2), old.start(), old.end());
    return (Transitions::resolve(*m_changed, pairAt(*m_edit, *m_changed, at), middle) ||
            refuse("the clips beside the transition cannot be found")) &&
           layAt(middle, wanted, align) && checkHandles();
}

bool Change::planRemove(double at) {
    if (!findTransition(at)) {
        return false;
    }
    m_removes = true;
    m_changed = channel()->copy();
    const Range old = m_result.range;
    const double middle = std::clamp(rounded((old.start() + old.end()) / 2), old.start(), old.end());
    return Transitions::resolve(*m_changed, pairAt(*m_edit, *m_changed, at), middle) ||
           refuse("the transition cannot be taken out");
}

/// The transition never becomes shorter than asked for: what is missing refuses it.
bool Change::checkHandles() {
    const ce_handle in = m_changed->find_ceh(m_result.range.start(), CE_IN_POINT);
    int pair = in.index() / 2;
    while (pair > 0 && m_changed->getChanEventPtr(2 * pair)->id != m_result.event) {
        --pair;
    }
    m_result.handles = Transitions::handlesOf(*m_changed, pair, extentOf);
    m_result.notice.clear();
    String lacks;
    for (const int side : {0, 1}) {
        const char* const clip =
            side == 0 ? "the outgoing clip behind its end" : "the incoming clip before its start";
        if (!m_result.handles.known[side]) {
            m_result.notice += String(m_result.notice.empty() ? "" : "; ") +
                               "it is not known how much material " + clip + " has";
        } else if (m_result.handles.missing[side] > 0) {
            lacks += String(lacks.empty() ? "" : " and ") + secondsText(m_result.handles.missing[side]) +
                     " s of the " + secondsText(m_result.handles.needed[side]) + " s that it needs of " +
                     clip;
        }
    }
    if ((m_flags & TransitionEditor::WithoutHandles) != 0) {
        m_result.notice.clear();
        return true;
    }
    return lacks.empty() ||
           refuse("the transition lacks " + lacks + "; make it shorter, move it or trim the clip");
}

template <typename Plan>
TransitionEditor::Result Change::perform(const Plan& plan, const EffectInstance* effect) {
    TransitionEditor::Result& result = m_result;
    if (!check()) {
        return result;
    }
    const std::lock_guard<criticalSection> hold(m_edit->section());
    // Observers are told of the revision and may change the edit: it is worked out again.
    const auto plans = [&] { return check() && plan(); };
    Qx::Status refusal;
    const auto keepsRevision = [&] {
        const bool kept = (m_flags & Editor::NoBackup) != 0 || editing_detail::makeRevision(m_edit, refusal);
        result.reason = kept ? result.reason : refusal.reason();
        return kept;
    };
    result.done = plans() && keepsRevision() && plans();
    if (result.done) {
        make(effect);
        m_edit->setChangeDescription(
            EditModification(kEffectsChanged).setChan(m_chan).setSpan(m_span.start(), m_span.length()), true);
    }
    return result;
}

void Change::make(const EffectInstance* effect) {
    TagBag& objects = m_edit->objectStore();
    cel& content = *channel();
    std::vector<Bound> bound;
    std::vector<Bound> lost;
    EventObjects::listBound(content, objects, m_span, bound);
    if (!m_removes) {
        // Its own keyframes stay where they are.
        std::erase_if(bound, [&](const Bound& event) { return event.id == m_result.event; });
    }
    if (effect != nullptr) {
        const std::unique_ptr<Streamable> kept = effect->clone(); // `effect` may be the node that goes
        EventObjects::remove(*m_edit, m_result.event);
        objects.storeObject(m_result.event, kept->clone());
    }
    const std::span<const channel_event> events(m_changed->getChanEventPtr(0),
                                                static_cast<size_t>(m_changed->numEvents()));
    static_cast<void>(content.replacePairs(0, content.numPairs(), events));
    EventObjects::follow(objects, bound, {content, m_span}, lost);
    for (const Bound& event : lost) {
        static_cast<void>(EventObjects::orphan(*m_edit, event));
    }
}

} // namespace

bool transitionAlignFromText(std::string_view text, TransitionAlign& align) {
    String lower(text);
    std::transform(lower.begin(), lower.end(), lower.begin(),
                   [](char c) { return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c; });
    if (lower == "start") {
        align = TransitionAlign::Start;
    } else if (lower == "centre" || lower == "center") {
        align = TransitionAlign::Centre;
    } else if (lower == "end") {
        align = TransitionAlign::End;
    } else {
        return false;
    }
    return true;
}

TransitionEditor::Result TransitionEditor::add(const EditPtr& edit, const IdStamp& chan, double at,
                                               const EffectInstance& effect, double length,
                                               TransitionAlign align, unsigned flags) {
    return Change(edit, chan, flags).add(at, effect, length, align);
}

TransitionEditor::Result TransitionEditor::set(const EditPtr& edit, const IdStamp& chan, double at,
                                               const EffectInstance* effect, double length,
                                               TransitionAlign align, unsigned flags) {
    return Change(edit, chan, flags).set(at, effect, length, align);
}

TransitionEditor::Result TransitionEditor::remove(const EditPtr& edit, const IdStamp& chan, double at,
                                                  unsigned flags) {
    return Change(edit, chan, flags).remove(at);
}

ce_handle TransitionEditor::find(const EditPtr& edit, const IdStamp& chan, double at) {
    cel* const content = edit.valid() ? edit->get_edit_cel_p(edit->getIdx(chan)) : nullptr;
    const bool fits = content != nullptr && editing_detail::isContinuous(edit->getChanTypeAndSubType(chan));
    const int pair = fits ? pairAt(*edit, *content, at) : -1;
    return pair < 0 ? ce_handle() : ce_handle(content, 2 * pair);
}

Transitions::Handles TransitionEditor::handlesOf(const EditPtr& edit, const IdStamp& chan, double at) {
    const ce_handle in = find(edit, chan, at);
    return in.valid() != 0 ? Transitions::handlesOf(*in.get_its_cel(), in.index() / 2, extentOf)
                           : Transitions::Handles();
}
