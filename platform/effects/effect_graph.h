#pragma once

#include "platform/base/status.h"
#include "platform/effects/effect_instance.h"

/// What is done to whole graphs: a head and every node that it needs, in one bag.
namespace Fx {

/// Appends the nodes of a graph, its head first and each node once: those that inputs name, and the members of
/// compound effects. Stamps of nodes that are not there are passed over; loops end. Nothing for a head that is
/// not there or is no node.
QM_API void listGraph(TagBag& bag, const IdStamp& head, Vector<Tag<FXGraphNodeBase>>& nodes);

/// Copies a graph to another bag, or within one, so that its head has the stamp `newHead` there and all its
/// other nodes fresh ones. `renamed` may tell what becomes of channels that inputs name, and is told what
/// became of the nodes. An object under `newHead` goes. On a failure nothing was changed.
QM_API Qx::Status copyGraph(TagBag& from, const IdStamp& head, TagBag& to, const IdStamp& newHead,
                            StampMap& renamed);

/// Cuts the graph of an event of `length` seconds in two, `at` seconds after its start: the graph becomes that
/// of the first part, and a copy of it, with `newHead` as the stamp of its head, that of the second. In both
/// every parameter is at every moment what it was. `renamed` is told what the copies are called. On a failure,
/// and for a cut that is not inside the event, nothing was changed.
QM_API Qx::Status splitGraph(TagBag& bag, const IdStamp& head, const IdStamp& newHead, double at,
                             double length, StampMap& renamed);

/// The event becomes the part [from, to) of what it was, in seconds from its start; see
/// `FXGraphNodeBase::keepSpan`. `from` may be below 0 and `to` above `length` for an event that grew.
QM_API void keepGraphSpan(TagBag& bag, const IdStamp& head, double from, double to, double length);

/// Removes the nodes of a graph, but for those that `kept` names and what those need. Returns how many went.
QM_API size_t removeGraph(TagBag& bag, const IdStamp& head, std::span<const IdStamp> kept = {});

} // namespace Fx
