#include "platform/effects/effect_graph.h"

#include <set>

namespace Fx {

namespace {

/// The stamps of a graph's nodes, head first, depth first.
std::vector<IdStamp> nodesOf(TagBag& bag, const IdStamp& head) {
    std::vector<IdStamp> nodes;
    std::set<IdStamp> seen;
    Vector<IdStamp> open{head};
    Vector<IdStamp> references;
    while (!open.empty()) {
        const IdStamp id = open.back();
        open.pop_back();
        if (!id.valid() || !seen.insert(id).second || !bag.contains(id)) {
            continue;
        }
        if (const FXGraphNodeBase* const node = Tag<FXGraphNodeBase>(bag, id).get()) {
            nodes.push_back(id);
            references.clear();
            node->listReferences(references);
            open.insert(open.end(), references.rbegin(), references.rend());
        }
    }
    return nodes;
}

Qx::Status notThere(const IdStamp& head) {
    return Qx::Status::failure(Qx::StatusCode::NotFound, "there is no effect node " + head.asString());
}

} // namespace

void listGraph(TagBag& bag, const IdStamp& head, Vector<Tag<FXGraphNodeBase>>& nodes) {
    for (const IdStamp& id : nodesOf(bag, head)) {
        nodes.emplace_back(bag, id);
    }
}

Qx::Status copyGraph(TagBag& from, const IdStamp& head, TagBag& to, const IdStamp& newHead,
                     StampMap& renamed) {
    if (!Tag<FXGraphNodeBase>(from, head).valid()) {
        return notThere(head);
    }
    if (!newHead.valid()) {
        return Qx::Status::failure(Qx::StatusCode::BadArgument, "the copy of an effect needs a stamp");
    }
    StampMap names = renamed;
    for (const IdStamp& id : nodesOf(from, head)) {
        names.erase(id); // a node of an earlier copy is copied again
    }
    names[head] = newHead;
    Qx::Status status = to.copyAndStoreComponents(from, {&head, 1}, names);
    if (status) {
        renamed = std::move(names);
    }
    return status;
}

Qx::Status splitGraph(TagBag& bag, const IdStamp& head, const IdStamp& newHead, double at, double length,
                      StampMap& renamed) {
    if (!(at > 0 && at < length)) {
        return Qx::Status::failure(Qx::StatusCode::BadArgument, "the cut is not inside the effect");
    }
    if (Qx::Status status = copyGraph(bag, head, bag, newHead, renamed); !status) {
        return status;
    }
    keepGraphSpan(bag, newHead, at, length, length);
    keepGraphSpan(bag, head, 0, at, length);
    return {};
}

void keepGraphSpan(TagBag& bag, const IdStamp& head, double from, double to, double length) {
    for (const IdStamp& id : nodesOf(bag, head)) {
        Tag<FXGraphNodeBase>(bag, id)->keepSpan(from, to, length);
    }
}

size_t removeGraph(TagBag& bag, const IdStamp& head, std::span<const IdStamp> kept) {
    std::set<IdStamp> needed;
    for (const IdStamp& id : kept) {
        const std::vector<IdStamp> its = nodesOf(bag, id);
        needed.insert(its.begin(), its.end());
    }
    size_t gone = 0;
    for (const IdStamp& id : nodesOf(bag, head)) {
        gone += needed.contains(id) || !bag.removeObject(id) ? 0 : 1;
    }
    return gone;
}

} // namespace Fx
