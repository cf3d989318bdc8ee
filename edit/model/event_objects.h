#pragma once

#include "edit/model/cel.h"
#include "platform/store/taggable.h"

#include <functional>
#include <span>
#include <vector>

class Edit;
class TagBag;

/// What is bound to events: objects of an edit's store under the stamps of in events, effect graphs mostly.
/// This is the one place that knows what becomes of them when events are copied, cut, trimmed or lost.
///
/// One event, one graph: a copy of an event has a copy of all nodes. Keyframes stand in seconds from the
/// event's start, so an event that is cut or trimmed keeps that part of its graph (`Fx::keepGraphSpan`), and
/// what is seen at a moment stays. An object that is no effect node is copied as it is.
///
/// It knows nothing of undo and announces nothing. One thread at a time, like the edit.
namespace EventObjects {

/// An event to which something is bound, and where it plays.
struct Bound {
    IdStamp id;
    cel::Range range;
};

/// Appends the pairs of a cel that reach into a span, or touch it, and have an object in a store.
QM_API void listBound(const cel& content, const TagBag& objects, const cel::Range& span,
                      std::vector<Bound>& bound);

/// Binds a copy of what `from` has for an event to another stamp in `to`, which may be the same store.
/// Channels that the graph names become what `channels` gives for them. False when nothing is bound to the
/// event or it cannot be copied.
QM_API bool copy(TagBag& from, const IdStamp& event, TagBag& to, const IdStamp& made,
                 const StampMap& channels = {});

/// What is bound to an event becomes that of the part `part` of where it played, `whole`, which may reach
/// beyond it: what is seen at each moment stays.
QM_API void keepPart(TagBag& objects, const IdStamp& event, const cel::Range& whole, const cel::Range& part);

/// A change of one channel, for `follow`.
struct Change {
    /// The channel after it.
    const cel& content;
    /// Where it was changed: what lies outside is as it was, but for having moved.
    cel::Range span;
    /// What was split, as the operations of `cel` tell.
    const cel::Splits* splits = nullptr;
    /// Where a part of the channel lay before, from where it lies; none where nothing moved.
    std::function<cel::Range(const cel::Range&)> before = {};
};

/// Lets what was bound before a change follow it: events that were cut in two both get their part, those that
/// were trimmed or lengthened keep the part that they show. Appends the events that are not there any more to
/// `lost`; what was bound to them stays.
QM_API void follow(TagBag& objects, std::span<const Bound> before, const Change& change,
                   std::vector<Bound>& lost);

/// Binds what `from` has for events that were laid in a channel to what was made of them. `laid` tells where
/// the whole of each would lie in the channel.
QM_API void bindCopies(TagBag& from, std::span<const Bound> laid, TagBag& to, const Change& change,
                       const cel::IdMap& copied, const StampMap& channels);

/// An event is gone. Its graph stays in the store and is noted in the edit's `OrphanedComponentList` with the
/// span where it applied; an object that is no effect node goes. False when nothing was bound to it.
QM_API bool orphan(Edit& edit, const Bound& event);
/// An event is gone whose graph lives on in a copy: the nodes go, but for those that others name.
QM_API void remove(Edit& edit, const IdStamp& event);
/// Brings an orphan back: as an event over the span where it applied, on an effects channel, or as a
/// transition over the one cut within that span on any other. False, with nothing changed, when it is no
/// orphan or its place is not free.
QM_API bool bringBack(Edit& edit, const IdStamp& orphan, const IdStamp& chan);
/// The graphs of all orphans go. Returns how many there were.
QM_API size_t removeOrphans(Edit& edit);

/// Channels get other stamps: inputs that name one of `renamed`, and events that show it, name what it gives.
QM_API void renameChannels(Edit& edit, const StampMap& renamed);
/// A channel goes, or all do for a null stamp: what is bound to its events becomes orphans, inputs that name
/// it are unwired and events that show it become black.
QM_API void dropChannel(Edit& edit, const IdStamp& chan);
/// Unwires the inputs of a graph that name a channel which the edit has not. Returns how many.
QM_API size_t unwireMissing(Edit& edit, const IdStamp& head);

} // namespace EventObjects
