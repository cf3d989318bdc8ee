#include "edit/model/stamp_index.h"

#include <bit>

void StampIndex::follow(const EventArray& events, uint64_t version) {
    if (m_slots.empty() || m_version != version || 2 * events.size() > m_slots.size()) {
        m_slots.assign(std::bit_ceil(2 * events.size() + 16), 0);
        m_count = 0;
        m_version = version;
    }
    for (; m_count < events.size(); ++m_count) {
        enter(events, m_count);
    }
}

bool StampIndex::contains(const EventArray& events, const IdStamp& id) const {
    for (size_t at = slotOf(id); m_slots[at] != 0; at = (at + 1) & (m_slots.size() - 1)) {
        if (events[m_slots[at] - 1].id == id) {
            return true;
        }
    }
    return false;
}

size_t StampIndex::slotOf(const IdStamp& id) const {
    // The upper bits of the product depend on all of the stamp.
    constexpr uint64_t kOdd = 0x9E3779B97F4A7C15u;
    return static_cast<size_t>(std::hash<IdStamp>()(id) * kOdd >> 32) & (m_slots.size() - 1);
}

void StampIndex::enter(const EventArray& events, size_t index) {
    size_t at = slotOf(events[index].id);
    while (m_slots[at] != 0) {
        at = (at + 1) & (m_slots.size() - 1);
    }
    m_slots[at] = static_cast<uint32_t>(index + 1);
}
