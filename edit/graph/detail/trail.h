#pragma once

#include "edit/graph/edit_graph_iterator.h"
#include "platform/services/log.h"

#include <bit>
#include <unordered_map>

namespace EditGraph {

/// Where a walk has been, so that what several ways lead to is entered once and loops end. A place that was reached
/// again with more levels left to go is entered again, at most as often as there are levels.
class Trail {
public:
    /// False for a place that need not be entered again, and for every place when there were too many.
    bool enter(const EditGraphIterator& at, int depth) {
        const ItorStackEntry* const entry = at.getEntry();
        if (entry == nullptr) {
            return false;
        }
        const Place place{entry->id(), entry->edit, entry->ceh.get_its_cel(), entry->ceh.index(),
                          std::bit_cast<uint64_t>(at.applyTimeTransformsStackTo(at.getTime(), false))};
        const auto [known, isNew] = m_depths.try_emplace(place, depth);
        if (!isNew && known->second <= depth) {
            return false;
        }
        known->second = depth;
        return ++m_steps <= kMostSteps;
    }
    /// Logs that the walk was given up, if it was.
    void tellIfExhausted() const {
        if (m_steps > kMostSteps) {
            herc_printf("EditGraphIterator : more than %zu places, gave up\n", kMostSteps);
        }
    }

private:
    static constexpr size_t kMostSteps = 200'000;

    struct Place {
        IdStamp node;
        const Edit* edit;
        const cel* content;
        int event;
        uint64_t time;
        bool operator==(const Place&) const = default;
    };
    struct Hash {
        size_t operator()(const Place& place) const {
            size_t hash = std::hash<IdStamp>()(place.node);
            for (const uint64_t part :
                 {uint64_t(reinterpret_cast<uintptr_t>(place.content)), uint64_t(place.event), place.time}) {
                hash = (hash ^ part) * size_t{0x9E3779B97F4A7C15u};
                hash ^= hash >> 32;
            }
            return hash;
        }
    };

    std::unordered_map<Place, int, Hash> m_depths;
    size_t m_steps = 0;
};

} // namespace EditGraph
