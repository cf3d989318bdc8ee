#include "edit/inspect/seen_report.h"

#include "edit/graph/edit_graph_iterator.h"
#include "platform/media/timecode.h"
#include "platform/services/current_project.h"

#include <cmath>
#include <map>

namespace {

/// True if the event before (or behind) a transition's touches it.
bool touchesNeighbour(const ItorStackEntry& transition, bool before) {
    const ce_handle in = transition.ceh;
    const ce_handle own = before ? in : in.matching_out_ceh();
    const ce_handle other(in.get_its_cel(), own.index() + (before ? -1 : 1));
    return other.valid() != 0 && valEqualsVal(own.get_edit_time(), other.get_edit_time());
}

class Collector {
public:
    Collector(SeenReport& report, const SourceNamer& namer) : m_report(report), m_namer(namer) {}

    /// Adds what a channel shows. `below` is the node that it stands under, or -1.
    void addTrack(const EditPtr& edit, const IdStamp& track, double time, int below) {
        const CelEventPair pair(edit, track, time);
        EditGraphIterator at(pair, time, EditGraphIterator::kBidirectional);
        SeenNode node = begin(below, -1);
        if (at.getStackDepth() == 0) {
            place(node, edit, edit->getIdx(track), time);
            node.kind = pair.valid() ? SeenKind::TooDeep : SeenKind::Black;
            static_cast<void>(add(std::move(node)));
            return;
        }
        addPosition(at, std::move(node));
    }

private:
    [[nodiscard]] SeenNode begin(int parent, int input) const {
        SeenNode node;
        node.parent = parent;
        node.input = input;
        node.depth = parent >= 0 ? m_report.nodes[static_cast<size_t>(parent)].depth + 1 : 0;
        return node;
    }

    /// Its index; -1 where there are too many.
    [[nodiscard]] int add(SeenNode node) {
        if (m_report.nodes.size() >= kMostSeenNodes) {
            m_report.isWhole = false;
            return -1;
        }
        m_report.nodes.push_back(std::move(node));
        return static_cast<int>(m_report.nodes.size()) - 1;
    }

    void place(SeenNode& node, const EditPtr& edit, int chan, double time) {
        node.edit = edit->get_cookie();
        node.time = time;
        auto [known, isNew] = m_places.try_emplace(edit);
        if (isNew) {
            known->second = placesOf(*edit);
        }
        if (chan >= 0 && static_cast<size_t>(chan) < known->second.size()) {
            node.place = known->second[static_cast<size_t>(chan)];
        }
        const Qx::FrameRate rate = edit->getFrameRate();
        node.timecode = Qx::timecodeText(frames(rate, edit->getTimecodeOrigin()) + frames(rate, time), rate,
                                         edit->isDropFrame(Qx::currentProject().dropFrame));
    }

    static int64_t frames(const Qx::FrameRate& rate, double time) {
        return std::isfinite(time) ? rate.toFrames(time) : 0;
    }

    void addPosition(EditGraphIterator& at, SeenNode node) {
        const ItorStackEntry& entry = *at.getEntry();
        const double time = at.applyTimeTransformsStackTo(at.getTime(), false);
        place(node, entry.edit, entry.chanIndex, time);
        node.in = entry.editRange.start();
        node.out = entry.editRange.end();
        if (entry.valid()) {
            addEffect(at, std::move(node));
        } else if (entry.ceh.get_strip_cookie().isBlack()) {
            static_cast<void>(add(std::move(node)));
        } else {
            addMaterial(entry, std::move(node));
        }
    }

    void addMaterial(const ItorStackEntry& entry, SeenNode node) {
        const CelEventPair pair(entry.edit, entry.ceh, entry.chanIndex);
        const double time = entry.ceh.get_strip_time(node.time);
        const EditPtr inner = EditGraphIterator::getGhostEdit(pair);
        node.kind = inner.valid() ? SeenKind::Nested : SeenKind::Source;
        node.source = sourceOf(pair.stripCookie(), *entry.edit);
        node.name = node.source.name;
        node.sourceTime = time;
        const Qx::FrameRate rate = inner.valid() ? inner->getFrameRate() : entry.edit->getFrameRate();
        node.sourceTimecode = Qx::timecodeText(frames(rate, time), rate, node.source.dropFrame);
        const int own = add(std::move(node));
        if (own < 0 || !inner.valid()) {
            return;
        }
        if (isTooDeep(own)) {
            addEnd(own, -1, SeenKind::TooDeep);
            return;
        }
        addTrack(inner, findShownTrack(pair, inner, time), time, own);
    }

    void addEffect(EditGraphIterator& at, SeenNode node) {
        const ItorStackEntry& entry = *at.getEntry();
        const FXGraphNodeBase& base = *entry.get();
        const EffectInstance* const effect = entry.getFXPtr();
        const double since = node.time - entry.eventStart();
        const double length = entry.editRange.length();
        node.name = base.getName();
        node.type = base.tagTypeId();
        node.kind = effect == nullptr        ? SeenKind::Unknown
                    : effect->isTransition() ? SeenKind::Transition
                                             : SeenKind::Effect;
        if (effect != nullptr) {
            node.opacity = effect->getAlphaAt(since);
            node.progress = effect->isTransition() ? effect->getProgressAt(since, length) : 0;
        }
        const int own = add(std::move(node));
        if (own < 0 || effect == nullptr) {
            return;
        }
        for (unsigned i = 0; i < effect->getNumTrackInputs(); ++i) {
            addInput(at, own, i, effect->getInputShareAt(i, since, length));
        }
    }

    void addInput(EditGraphIterator& at, int parent, unsigned input, double share) {
        const EffectInstance& effect = *at.getEntry()->getFXPtr();
        const IdStamp source = effect.getInputTrackId(input);
        const bool isNeighbour = !effect.hasExplicitInputs() &&
                                 (!source.valid() || source == previousInputId || source == nextInputId);
        const bool isBefore = source.valid() ? source == previousInputId : input == 0;
        const auto number = static_cast<int>(input);
        if (isTooDeep(parent)) {
            addEnd(parent, number, SeenKind::TooDeep, share);
        } else if (!source.valid() && !isNeighbour) {
            addEnd(parent, number, SeenKind::Unwired, share);
        } else if ((isNeighbour && !touchesNeighbour(*at.getEntry(), isBefore)) || !at.moveToInput(input)) {
            addEnd(parent, number, SeenKind::Black, share);
        } else {
            SeenNode node = begin(parent, number);
            node.share = share;
            addPosition(at, std::move(node));
            static_cast<void>(at.moveBack());
        }
    }

    void addEnd(int parent, int input, SeenKind kind, double share = 1) {
        SeenNode node = begin(parent, input);
        node.kind = kind;
        node.share = share;
        static_cast<void>(add(std::move(node)));
    }

    [[nodiscard]] bool isTooDeep(int node) const {
        return m_report.nodes[static_cast<size_t>(node)].depth >= kMostSeenLevels || !m_report.isWhole;
    }

    SourceReport sourceOf(const cookie& strip, const Edit& edit) {
        auto [known, isNew] = m_sources.try_emplace(strip);
        if (isNew) {
            known->second.strip = strip;
            known->second.kind = sourceKindOf(strip);
            known->second.dropFrame = edit.isDropFrame(Qx::currentProject().dropFrame);
            if (m_namer && known->second.kind == SourceKind::Shot) {
                m_namer(known->second);
            }
        }
        return known->second;
    }

    SeenReport& m_report;
    const SourceNamer& m_namer;
    std::map<const Edit*, std::vector<String>> m_places;
    std::map<cookie, SourceReport> m_sources;
};

} // namespace

SeenReport seenAt(const EditPtr& edit, double time, const IdStamp& track, const SourceNamer& namer) {
    SeenReport report;
    report.time = time;
    if (!edit.valid()) {
        return report;
    }
    report.item = edit->get_cookie();
    Vector<IdStamp> roots;
    if (track.valid()) {
        roots.push_back(track);
    } else {
        EditPtr its = edit;
        findAllRootNodeChans(its, time, roots);
    }
    Collector collector(report, namer);
    for (const IdStamp& root : roots) {
        collector.addTrack(edit, root, time, -1);
    }
    return report;
}

const char* seenKindText(SeenKind kind) {
    switch (kind) {
    case SeenKind::Source:
        return "source";
    case SeenKind::Nested:
        return "edit";
    case SeenKind::Effect:
        return "effect";
    case SeenKind::Transition:
        return "transition";
    case SeenKind::Unknown:
        return "unknown effect";
    case SeenKind::Black:
        return "black";
    case SeenKind::Unwired:
        return "not wired";
    case SeenKind::TooDeep:
        return "too deep";
    }
    return "black";
}

String seenText(const SeenReport& report) {
    String text;
    for (const SeenNode& node : report.nodes) {
        text += String(2 * size_t{node.depth}, ' ');
        if (node.input >= 0) {
            text += String::format("%.2f  ", node.share);
        }
        if (!node.place.empty()) {
            text += node.place + "  ";
        }
        const bool isItem = node.kind == SeenKind::Source || node.kind == SeenKind::Nested;
        if (isItem) {
            text += (node.name.empty() ? String() : "\"" + node.name + "\"  ") + node.source.strip.asString();
        } else {
            text += node.name.empty() ? String(seenKindText(node.kind)) : node.name;
        }
        if (node.kind == SeenKind::Transition) {
            text += String::format(" %.0f %%", 100 * node.progress);
        } else if (node.opacity < 1) {
            text += String::format(", opacity %.2f", node.opacity);
        }
        text += (node.timecode.empty() ? String() : "  " + node.timecode) +
                (isItem ? "  plays " + node.sourceTimecode : String()) + "\n";
    }
    return report.isWhole ? text : text + "... and more\n";
}
