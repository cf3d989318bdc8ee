#pragma once

#include "edit/model/event_array.h"

/// Tells whether an array of events has a stamp, without asking them all: a hash table of places in the
/// array. What is appended again and again (`cel::weld`) so costs what is appended and no more.
///
/// It takes 8 to 16 bytes an event from its first use on, and none before. A copy has nothing in it. Not
/// thread-safe.
class StampIndex {
public:
    StampIndex() = default;
    StampIndex(const StampIndex&) noexcept {}
    StampIndex& operator=(const StampIndex&) = delete;
    ~StampIndex() = default;

    /// Brings it up to date with `events`, of which `version` is the number of the last change.
    void follow(const EventArray& events, uint64_t version);
    /// The change with that number did nothing but append.
    void appended(uint64_t version) { m_version = version; }
    /// `events` as at the last `follow`.
    [[nodiscard]] bool contains(const EventArray& events, const IdStamp& id) const;

private:
    /// Where the search for a stamp begins.
    [[nodiscard]] size_t slotOf(const IdStamp& id) const;
    void enter(const EventArray& events, size_t index);

    std::vector<uint32_t>
        m_slots;        ///< 1 + place of an event, 0 for none; a power of two, at most half of them used
    size_t m_count = 0; ///< events entered
    uint64_t m_version = 0;
};
