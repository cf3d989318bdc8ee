#include "edit/model/event_objects.h"

#include "edit/model/edit.h"
#include "edit/model/transition.h"
#include "platform/effects/effect_graph.h"
#include "platform/effects/orphaned_component_list.h"

#include <algorithm>
#include <set>

using Qx::kTimeTolerance;

namespace {

using EventObjects::Bound;
using EventObjects::Change;
using Range = cel::Range;

/// True for a stamp under which an object of an event may lie.
bool isOfEvent(const IdStamp& id) {
    return id.valid() &&
           (id.getMagicType() == IdStampMagic::EffectNode || id.getMagicType() == IdStampMagic::Material);
}

/// Calls `visit` with the in and the out event of each pair that reaches into a span or touches it.
template <typename Visit>
void forPairs(const cel& content, const Range& span, Visit visit) {
    const int governing = content.find_ceh(span.start(), CE_IN_POINT).index() / 2;
    // Pairs of no length may lie ahead at the same time, and what ends there touches the span.
    int pair = std::max(governing, 0);
    while (pair > 0 && content.getChanEventPtr(2 * pair - 1)->editTime >= span.start() - kTimeTolerance) {
        --pair;
    }
    for (; pair < content.numPairs(); ++pair) {
        const channel_event* const in = content.getChanEventPtr(2 * pair);
        if (in[0].editTime > span.end() + kTimeTolerance) {
            break;
        }
        if (in[1].editTime >= span.start() - kTimeTolerance) {
            visit(in[0], in[1]);
        }
    }
}

bool isSame(const Range& a, const Range& b) {
    return std::abs(a.start() - b.start()) <= kTimeTolerance && std::abs(a.end() - b.end()) <= kTimeTolerance;
}

/// The pieces that a change left of some events, by the stamps of those: where each lay before it.
class Pieces {
public:
    Pieces(const Change& change, std::set<IdStamp> wanted) {
        if (change.splits != nullptr) {
            for (const auto& [old, fresh] : *change.splits) {
                if (wanted.contains(old) && old != fresh) {
                    m_origins[fresh] = old;
                }
            }
        }
        forPairs(change.content, change.span, [&](const channel_event& in, const channel_event& out) {
            const auto split = m_origins.find(in.id);
            if (split == m_origins.end() && !wanted.contains(in.id)) {
                return;
            }
            const Range is(in.editTime, out.editTime);
            m_pieces[split != m_origins.end() ? split->second : in.id].push_back(
                {in.id, change.before ? change.before(is) : is});
        });
    }
    [[nodiscard]] std::span<const Bound> of(const IdStamp& event) const {
        const auto found = m_pieces.find(event);
        return found != m_pieces.end() ? std::span<const Bound>(found->second) : std::span<const Bound>();
    }

private:
    std::map<IdStamp, IdStamp> m_origins;
    std::map<IdStamp, std::vector<Bound>> m_pieces;
};

OrphanedComponentList* orphansOf(Edit& edit, bool make) {
    TagBag& store = edit.objectStore();
    if (!store.contains(OrphanedComponentList::Id)) {
        if (!make) {
            return nullptr;
        }
        store.storeObject(OrphanedComponentList::Id, std::make_unique<OrphanedComponentList>());
    }
    return dynamic_cast<OrphanedComponentList*>(store.openObject(OrphanedComponentList::Id));
}

/// The heads of the graphs that events show, and those of orphans, but for one.
std::vector<IdStamp> headsBut(Edit& edit, const IdStamp& gone) {
    std::vector<IdStamp> heads;
    const TagBag& store = edit.objectStore();
    for (int i = 0; i < edit.getNumChans(); ++i) {
        const cel* const content = edit.get_edit_cel_p(i);
        for (int event = 0; content != nullptr && event < content->numEvents(); event += 2) {
            const IdStamp& id = content->getChanEventPtr(event)->id;
            if (id != gone && isOfEvent(id) && store.contains(id)) {
                heads.push_back(id);
            }
        }
    }
    if (const OrphanedComponentList* const orphans = orphansOf(edit, false)) {
        for (unsigned i = 0; i < orphans->size(); ++i) {
            heads.push_back((*orphans)[i]);
        }
        std::erase(heads, gone);
    }
    return heads;
}

/// Calls `visit` with every effect node of an edit. Nodes are found by their stamps; nothing else is opened.
template <typename Visit>
void forNodes(Edit& edit, Visit visit) {
    TagBag& store = edit.objectStore();
    for (const String& name : store.names()) {
        const IdStamp id{std::string_view(name)};
        if (isOfEvent(id) && id.asString() == name) {
            if (const Tag<FXGraphNodeBase> node(store, id); node.valid()) {
                visit(*node);
            }
        }
    }
}

/// Gives the events that show a channel another stamp, or makes them black for a null one.
void renameAliases(Edit& edit, const StampMap& renamed) {
    for (int i = 0; i < edit.getNumChans(); ++i) {
        cel* const content = edit.get_edit_cel_p(i);
        for (int at = 0; content != nullptr && at + 1 < content->numEvents(); at += 2) {
            const auto found = renamed.find(content->getChanEventPtr(at)->id);
            if (found == renamed.end()) {
                continue;
            }
            channel_event in = content->get_event(at);
            channel_event out = content->get_event(at + 1);
            in.id = found->second.valid() ? found->second : channel_event::newId();
            if (!found->second.valid()) {
                in.strip = out.strip = black_cookie;
            }
            static_cast<void>(content->setEvent(at, in) && content->setEvent(at + 1, out));
        }
    }
}

size_t unwire(FXGraphNodeBase& node, const std::function<bool(const IdStamp&)>& isGone) {
    size_t count = 0;
    for (unsigned i = 0; i < node.getNumTrackInputs(); ++i) {
        const IdStamp track = node.getInputTrackId(i);
        if (track.valid() && track.getMagicType() == IdStampMagic::Channel && track != previousInputId &&
            track != nextInputId && isGone(track) &&
            node.setInputTrackId(i, IdStamp(), node.isInputAutomatic(i))) {
            ++count;
        }
    }
    return count;
}

void orphanAllOf(Edit& edit, const cel& content) {
    std::vector<Bound> bound;
    EventObjects::listBound(content, edit.objectStore(), {content.get_start_time(), content.get_end_time()},
                            bound);
    for (const Bound& event : bound) {
        static_cast<void>(EventObjects::orphan(edit, event));
    }
}

} // namespace

void EventObjects::listBound(const cel& content, const TagBag& objects, const cel::Range& span,
                             std::vector<Bound>& bound) {
    if (objects.getNumObjects() == 0) {
        return;
    }
    forPairs(content, span, [&](const channel_event& in, const channel_event& out) {
        if (isOfEvent(in.id) && objects.contains(in.id)) {
            bound.push_back({in.id, {in.editTime, out.editTime}});
        }
    });
}

bool EventObjects::copy(TagBag& from, const IdStamp& event, TagBag& to, const IdStamp& made,
                        const StampMap& channels) {
    if (!isOfEvent(event) || !from.contains(event) || (&from == &to && event == made)) {
        return false;
    }
    StampMap renamed = channels;
    if (Fx::copyGraph(from, event, to, made, renamed)) {
        return true;
    }
    const bool isNode = Tag<FXGraphNodeBase>(from, event).valid();
    return !isNode && static_cast<bool>(to.copyObject(from, event.asString(), made.asString()));
}

void EventObjects::keepPart(TagBag& objects, const IdStamp& event, const cel::Range& whole,
                            const cel::Range& part) {
    if (!isSame(whole, part) && Tag<FXGraphNodeBase>(objects, event).valid()) {
        Fx::keepGraphSpan(objects, event, part.start() - whole.start(), part.end() - whole.start(),
                          whole.length());
    }
}

void EventObjects::follow(TagBag& objects, std::span<const Bound> before, const Change& change,
                          std::vector<Bound>& lost) {
    if (before.empty()) {
        return;
    }
    std::set<IdStamp> wanted;
    for (const Bound& event : before) {
        wanted.insert(event.id);
    }
    const Pieces pieces(change, std::move(wanted));
    for (const Bound& event : before) {
        const std::span<const Bound> its = pieces.of(event.id);
        const Bound* own = nullptr;
        for (const Bound& piece : its) {
            if (piece.id == event.id) {
                own = &piece;
            } else if (copy(objects, event.id, objects, piece.id)) {
                keepPart(objects, piece.id, event.range, piece.range);
            }
        }
        if (own != nullptr) {
            keepPart(objects, event.id, event.range, own->range);
        } else {
            lost.push_back(event);
        }
    }
}

void EventObjects::bindCopies(TagBag& from, std::span<const Bound> laid, TagBag& to, const Change& change,
                              const cel::IdMap& copied, const StampMap& channels) {
    std::set<IdStamp> wanted;
    for (const Bound& event : laid) {
        if (const auto made = copied.find(event.id); made != copied.end()) {
            wanted.insert(made->second);
        }
    }
    if (wanted.empty()) {
        return;
    }
    const Pieces pieces(change, std::move(wanted));
    for (const Bound& event : laid) {
        const auto made = copied.find(event.id);
        for (const Bound& piece : made != copied.end() ? pieces.of(made->second) : std::span<const Bound>()) {
            if (copy(from, event.id, to, piece.id, channels)) {
                keepPart(to, piece.id, event.range, piece.range);
            }
        }
    }
}

bool EventObjects::orphan(Edit& edit, const Bound& event) {
    TagBag& store = edit.objectStore();
    if (!store.contains(event.id)) {
        return false;
    }
    const Tag<FXGraphNodeBase> node(store, event.id);
    OrphanedComponentList* const orphans = node.valid() ? orphansOf(edit, true) : nullptr;
    if (orphans != nullptr) {
        orphans->add(node, event.range);
        return true;
    }
    return !node.valid() && store.removeObject(event.id);
}

void EventObjects::remove(Edit& edit, const IdStamp& event) {
    TagBag& store = edit.objectStore();
    if (!Tag<FXGraphNodeBase>(store, event).valid()) {
        store.removeObject(event);
        return;
    }
    Fx::removeGraph(store, event, headsBut(edit, event));
}

bool EventObjects::bringBack(Edit& edit, const IdStamp& orphan, const IdStamp& chan) {
    OrphanedComponentList* const orphans = orphansOf(edit, false);
    const Tag<FXGraphNodeBase> node(edit.objectStore(), orphan);
    cel* const content = edit.get_edit_cel_p(edit.getIdx(chan));
    if (orphans == nullptr || !node.valid() || !orphans->isOrphan(node) || content == nullptr) {
        return false;
    }
    const Range range = orphans->getRangeFor(node);
    if (edit.getChanSubtype(chan) == Edit_Chan_SubType::ALIAS) {
        const int pair = content->find_ceh(range.start(), CE_IN_POINT).valid() != 0
                             ? content->find_ceh(range.start(), CE_IN_POINT).index() / 2 + 1
                             : 0;
        ce_handle made =
            content->insertEventPair(pair, effect_graph_cookie, 0, range.start(), range.length());
        if (made.valid() == 0) {
            return false;
        }
        made.setEffectGraph(orphan);
    } else {
        // The cut within the span: the one joint of two pairs.
        const ce_handle last = content->find_ceh(range.end(), CE_IN_POINT);
        if (last.valid() == 0 ||
            !Transitions::lay(*content, last.get_edit_time(), range.start(), range.end(), orphan)) {
            return false;
        }
    }
    orphans->remove(node);
    static_cast<void>(unwireMissing(edit, orphan));
    return true;
}

size_t EventObjects::removeOrphans(Edit& edit) {
    OrphanedComponentList* const orphans = orphansOf(edit, false);
    size_t count = 0;
    while (orphans != nullptr && orphans->size() > 0) {
        const IdStamp head = (*orphans)[0];
        orphans->remove(Tag<FXGraphNodeBase>(edit.objectStore(), head));
        Fx::removeGraph(edit.objectStore(), head, headsBut(edit, head));
        ++count;
    }
    edit.objectStore().removeObject(OrphanedComponentList::Id);
    return count;
}

void EventObjects::renameChannels(Edit& edit, const StampMap& renamed) {
    forNodes(edit, [&](FXGraphNodeBase& node) { node.renameReferences(renamed); });
    renameAliases(edit, renamed);
}

void EventObjects::dropChannel(Edit& edit, const IdStamp& chan) {
    for (int i = 0; i < edit.getNumChans(); ++i) {
        const cel* const content = edit.get_edit_cel_p(i);
        if (content != nullptr && (!chan.valid() || edit.getId(i) == chan)) {
            orphanAllOf(edit, *content);
        }
    }
    forNodes(edit, [&](FXGraphNodeBase& node) {
        unwire(node, [&](const IdStamp& track) { return !chan.valid() || track == chan; });
    });
    if (chan.valid()) {
        renameAliases(edit, {{chan, IdStamp()}});
    }
}

size_t EventObjects::unwireMissing(Edit& edit, const IdStamp& head) {
    Vector<Tag<FXGraphNodeBase>> nodes;
    Fx::listGraph(edit.objectStore(), head, nodes);
    size_t count = 0;
    for (const Tag<FXGraphNodeBase>& node : nodes) {
        count += unwire(*node, [&](const IdStamp& track) { return !edit.chanValid(track); });
    }
    return count;
}
