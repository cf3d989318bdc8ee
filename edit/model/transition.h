#pragma once

#include "edit/model/cel.h"
#include "platform/store/tag_bag.h"

#include <optional>

/// Transitions as they lie in a cel: an event pair between the pairs of the two clips that it joins, touching
/// both, whose strip is `effect_graph_cookie` and whose in event's stamp is that of an effect with two inputs
/// which are not wired.
///
///     AAAA----BBBB    A plays on under it behind its out, B before its in
///
/// At the start or the end of a channel, and beside a gap, the missing side is black.
///
/// What an edit has to say to it (undo, notification, orphans) is for the caller.
namespace Transitions {

/// Tells the span of an item that can be played, by the item's own clock; nothing where that is not known.
using MaterialExtent = std::function<std::optional<cel::Range>(const cookie& strip)>;

/// How much material a transition needs beyond the ends of the two clips that it joins, and what is missing.
/// Index 0 is what goes out, behind its end; 1 what comes in, before its start.
struct Handles {
    double needed[2] = {0, 0};  ///< seconds of edit time
    double missing[2] = {0, 0}; ///< of those, what the material does not have; 0 where that is not known
    bool known[2] = {true, true};
    [[nodiscard]] bool enough() const { return missing[0] <= 0 && missing[1] <= 0; }
};
/// For the transition of pair number `pair`. Black lacks nothing, and neither does a freeze.
[[nodiscard]] QM_API Handles handlesOf(const cel& channel, int pair, const MaterialExtent& extentOf);

/// True if an in event of a channel of pictures or sound shows a transition: its node's inputs are its
/// neighbours on the channel. `objects` is where its node lies; `missingToo` is the answer for an effect whose
/// node is not there.
[[nodiscard]] QM_API bool isTransition(TagBag& objects, const channel_event& in, bool missingToo = true);

/// Lays a transition over [from, to], which holds the cut at `cut` and may begin or end there. The clips that
/// meet in the cut give way to it:
///
///     AAAAAABBBBBB    cut 6, [4, 8)    AAAA----BBBB
///     AAAAAABBBBBB    cut 6, [6, 8)    AAAAAA--BBBB
///     BBBBBB          cut 0, [0, 2)    --BBBB          from black
///
/// `id` becomes the in event's stamp. False, with nothing changed, where no cut is, where a transition lies
/// beside it, and for a span that is no longer than the tolerance, does not hold the cut, or reaches beyond
/// either clip or into a gap. A clip may be left with no length: it then lies wholly under transitions.
[[nodiscard]] QM_API bool lay(cel& channel, double cut, double from, double to, const IdStamp& id);

/// Takes out the transition of pair number `pair`: what is before it is lengthened to `at`, what is behind it
/// begins there. `at` lies within the transition, its ends included. A missing side is filled with black.
///
///     AAAA----BBBB    at 6      AAAAAABBBBBB
///                     at 4      AAAABBBBBBBB
///
/// False, with nothing changed, for a pair that is not there or a time that is not within it.
[[nodiscard]] QM_API bool resolve(cel& channel, int pair, double at);

} // namespace Transitions
