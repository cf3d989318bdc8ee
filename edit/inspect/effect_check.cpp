#include "edit/inspect/effect_check.h"

#include "platform/effects/effect_graph.h"
#include "platform/effects/orphaned_component_list.h"

#include <algorithm>
#include <map>
#include <set>

namespace {

using Range = cel::Range;

/// How many steps from channel to channel are followed in search of loops.
constexpr int kMostSteps = 100000;

bool isNodeStamp(const IdStamp& id) {
    return id.getMagicType() == IdStampMagic::EffectNode || id.getMagicType() == IdStampMagic::Material;
}

bool namesChannel(const IdStamp& track) {
    return track.valid() && track.getMagicType() == IdStampMagic::Channel && track != previousInputId &&
           track != nextInputId;
}

class Checker {
public:
    Checker(Edit& edit, const Transitions::MaterialExtent& extentOf, std::vector<String>& faults)
        : m_edit(edit), m_store(edit.objectStore()), m_extentOf(extentOf), m_faults(faults) {}

    void check() {
        for (int i = 0; i < m_edit.getNumChans(); ++i) {
            if (const cel* const content = m_edit.get_edit_cel_p(i)) {
                checkChannel(m_edit.getId(i), *content);
            }
        }
        checkOrphans();
        checkUnreferenced();
        checkChannelLoops();
    }

private:
    /// An effect that shows other channels, and when.
    struct Shows {
        Range range;
        std::vector<IdStamp> channels;
    };

    void fault(const IdStamp& node, const String& what) {
        m_faults.push_back("the effect " + node.asString() + " " + what);
    }
    void checkChannel(const IdStamp& chan, const cel& content);
    void checkTransition(const cel& content, int pair);
    void checkGraph(const IdStamp& head, Shows* shows);
    void checkLoops(const IdStamp& head);
    void checkOrphans();
    void checkUnreferenced();
    void checkChannelLoops();
    bool findsLoop(std::vector<IdStamp>& path, const Range& range, int& steps) const;

    Edit& m_edit;
    TagBag& m_store;
    const Transitions::MaterialExtent& m_extentOf;
    std::vector<String>& m_faults;
    std::map<IdStamp, IdStamp> m_owners; ///< nodes that were reached, and the head of the graph that did
    std::map<IdStamp, std::vector<Shows>> m_shows;
};

void Checker::checkChannel(const IdStamp& chan, const cel& content) {
    const bool effects = m_edit.getChanSubtype(chan) == Edit_Chan_SubType::ALIAS;
    for (int i = 0; i + 1 < content.numEvents(); i += 2) {
        const channel_event& in = *content.getChanEventPtr(i);
        const Range range(in.editTime, content.getChanEventPtr(i + 1)->editTime);
        Shows shows{range, {}};
        const String where = String::format("the event at %g s on %s ", range.start(),
                                            m_edit.getChanDisplayName(chan).c_str());
        if (in.id.getMagicType() == IdStampMagic::Channel) {
            shows.channels.push_back(in.id);
            if (!m_edit.chanValid(in.id)) {
                m_faults.push_back(where + "shows the channel " + in.id.asString() + ", which is not there");
            }
        } else if (isNodeStamp(in.id) && m_store.contains(in.id)) {
            if (Tag<FXGraphNodeBase>(m_store, in.id).valid()) {
                checkGraph(in.id, &shows);
            }
        } else if (in.strip == effect_graph_cookie) {
            m_faults.push_back(where + "shows the effect " + in.id.asString() + ", which is not there");
        }
        if (!shows.channels.empty()) {
            m_shows[chan].push_back(std::move(shows));
        }
        if (!effects && Transitions::isTransition(m_store, in)) {
            checkTransition(content, i / 2);
        }
    }
}

void Checker::checkTransition(const cel& content, int pair) {
    const channel_event* const its = content.getChanEventPtr(2 * pair);
    const channel_event* const out = content.getChanEventPtr(2 * pair - 2);
    const channel_event* const in = content.getChanEventPtr(2 * pair + 2);
    const bool goesOut = out != nullptr && its[0].editTime - out[1].editTime <= Qx::kTimeTolerance;
    const bool comesIn = in != nullptr && in->editTime - its[1].editTime <= Qx::kTimeTolerance;
    if (!goesOut && !comesIn) {
        fault(its->id, "is a transition that no clip is beside");
    }
    if ((goesOut && out->strip == effect_graph_cookie) || (comesIn && in->strip == effect_graph_cookie)) {
        fault(its->id, "is a transition beside another effect, not a clip");
    }
    if (!m_extentOf) {
        return;
    }
    const Transitions::Handles handles = Transitions::handlesOf(content, pair, m_extentOf);
    for (const int side : {0, 1}) {
        if (handles.missing[side] > 0) {
            fault(its->id, String::format("is a transition that lacks %g s of material of the clip %s it",
                                          handles.missing[side], side == 0 ? "before" : "behind"));
        }
    }
}

void Checker::checkGraph(const IdStamp& head, Shows* shows) {
    if (const auto owner = m_owners.find(head); owner != m_owners.end()) {
        fault(head,
              owner->second == head ? "is that of two events" : "is a node of another event's graph too");
        return;
    }
    Vector<Tag<FXGraphNodeBase>> nodes;
    Fx::listGraph(m_store, head, nodes);
    for (const Tag<FXGraphNodeBase>& node : nodes) {
        const auto [owner, isFirst] = m_owners.emplace(node.id(), head);
        if (!isFirst) {
            fault(head, "shares the node " + node.id().asString() + " with " + owner->second.asString());
        }
        Vector<IdStamp> references;
        node->listReferences(references);
        for (const IdStamp& reference : references) {
            if (namesChannel(reference)) {
                if (!m_edit.chanValid(reference)) {
                    fault(node.id(), "has an input from " + reference.asString() + ", which is no channel");
                } else if (shows != nullptr) {
                    shows->channels.push_back(reference);
                }
            } else if (!Tag<FXGraphNodeBase>(m_store, reference).valid()) {
                fault(node.id(), "names the node " + reference.asString() + ", which is not there");
            }
        }
    }
    checkLoops(head);
}

/// Follows inputs alone: the members of a compound effect name one another by them.
void Checker::checkLoops(const IdStamp& head) {
    enum class State : uint8_t { Open, Done };
    std::map<IdStamp, State> states;
    std::vector<std::pair<IdStamp, unsigned>> path{{head, 0}};
    states[head] = State::Open;
    while (!path.empty()) {
        auto& [id, input] = path.back();
        const Tag<FXGraphNodeBase> node(m_store, id);
        if (!node.valid() || input >= node->getNumTrackInputs()) {
            states[id] = State::Done;
            path.pop_back();
            continue;
        }
        const IdStamp next = node->getInputTrackId(input++);
        if (!next.valid() || !isNodeStamp(next)) {
            continue;
        }
        const auto [state, isNew] = states.emplace(next, State::Open);
        if (isNew) {
            path.emplace_back(next, 0U);
        } else if (state->second == State::Open) {
            fault(head, "has a loop through the node " + next.asString());
            return;
        }
    }
}

void Checker::checkOrphans() {
    const auto* const orphans =
        m_store.contains(OrphanedComponentList::Id)
            ? dynamic_cast<const OrphanedComponentList*>(m_store.openObject(OrphanedComponentList::Id))
            : nullptr;
    for (unsigned i = 0; orphans != nullptr && i < orphans->size(); ++i) {
        const IdStamp id = (*orphans)[i];
        if (m_owners.contains(id)) {
            fault(id, "is listed as an orphan and is that of an event");
        } else if (!Tag<FXGraphNodeBase>(m_store, id).valid()) {
            fault(id, "is listed as an orphan and is not there");
        } else {
            checkGraph(id, nullptr);
        }
    }
}

void Checker::checkUnreferenced() {
    for (const String& name : m_store.names()) {
        const IdStamp id{std::string_view(name)};
        if (id.valid() && isNodeStamp(id) && id.asString() == name && !m_owners.contains(id) &&
            Tag<FXGraphNodeBase>(m_store, id).valid()) {
            fault(id, "is referred to by nothing");
        }
    }
}

/// True when what the last channel of a path shows within a span comes back to a channel of the path.
bool Checker::findsLoop(std::vector<IdStamp>& path, const Range& range, int& steps) const {
    const auto shown = m_shows.find(path.back());
    if (shown == m_shows.end()) {
        return false;
    }
    const std::vector<Shows>& events = shown->second;
    auto event = std::partition_point(events.begin(), events.end(), [&](const Shows& its) {
        return its.range.end() - range.start() <= Qx::kTimeTolerance;
    });
    for (; event != events.end() && range.end() - event->range.start() > Qx::kTimeTolerance; ++event) {
        const Range common(std::max(range.start(), event->range.start()),
                           std::min(range.end(), event->range.end()));
        for (const IdStamp& channel : event->channels) {
            if (--steps < 0) {
                return false;
            }
            if (std::find(path.begin(), path.end(), channel) != path.end()) {
                return true;
            }
            path.push_back(channel);
            const bool found = findsLoop(path, common, steps);
            path.pop_back();
            if (found) {
                return true;
            }
        }
    }
    return false;
}

void Checker::checkChannelLoops() {
    int steps = kMostSteps;
    for (const auto& [chan, events] : m_shows) {
        std::vector<IdStamp> path{chan};
        if (findsLoop(path, {events.front().range.start(), events.back().range.end()}, steps)) {
            m_faults.push_back("what " + m_edit.getChanDisplayName(chan) +
                               " shows comes back to it in a loop");
        }
    }
}

} // namespace

void checkEffects(Edit& edit, const Transitions::MaterialExtent& extentOf, std::vector<String>& faults) {
    Checker(edit, extentOf, faults).check();
}
