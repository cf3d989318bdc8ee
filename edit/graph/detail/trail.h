#pragma once

#include "edit/graph/edit_graph_iterator.h"

#include <bit>
#include <unordered_map>

namespace EditGraph {

/// Where a walk has been, so that what several ways lead to is entered once and loops end. A place that was reached
/// again with more levels left to go is entered again, at most as often as there are levels.
class Trail {
    struct State {
        int depth;   ///< the least at which it was entered
        bool isOpen; ///< the walk is at it or below it
    };

public:
    /// The walk's stay at a place.
    class Stay {
    public:
        Stay(Trail& trail, const EditGraphIterator& at, int depth) : m_state(trail.enter(at, depth)) {}
        ~Stay() {
            if (m_state != nullptr) {
                m_state->isOpen = false;
            }
        }
        Stay(const Stay&) = delete;
        Stay& operator=(const Stay&) = delete;
        /// False for a place that need not be entered again, and for every place when there were too many.
        explicit operator bool() const { return m_state != nullptr; }

    private:
        State* m_state;
    };

    /// True once, after the walk came to a loop or to too many places.
    [[nodiscard]] bool takeAbort() { return m_abort == Abort::Untold && (m_abort = Abort::Told, true); }

private:
    /// Null where it need not be entered.
    State* enter(const EditGraphIterator& at, int depth) {
        const ItorStackEntry* const entry = at.getEntry();
        if (entry == nullptr) {
            return nullptr;
        }
        const Place place{entry->id(), entry->edit, entry->ceh.get_its_cel(), entry->ceh.index(),
                          std::bit_cast<uint64_t>(at.applyTimeTransformsStackTo(at.getTime(), false))};
        const auto [known, isNew] = m_states.try_emplace(place, State{depth, false});
        State& state = known->second;
        if (state.isOpen || ++m_steps > kMostSteps) {
            m_abort = m_abort == Abort::No ? Abort::Untold : m_abort;
            return nullptr;
        }
        if (!isNew && state.depth <= depth) {
            return nullptr;
        }
        state = {depth, true};
        return &state;
    }

    enum class Abort { No, Untold, Told };

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

    std::unordered_map<Place, State, Hash> m_states;
    size_t m_steps = 0;
    Abort m_abort = Abort::No;
};

} // namespace EditGraph
