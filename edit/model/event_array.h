#pragma once

#include "edit/model/channel_event.h"

#include <memory>
#include <span>
#include <vector>

/// The events of one cel: an array in order of time, the in point of pair k at 2k and its out point at 2k + 1
/// (a last in point may lack its out point while a cel is built), and beside it the times of the in points
/// alone, packed, because that is what a search reads: 8 bytes a pair instead of 128.
///
/// A copy shares the memory of the original until one of the two is changed; then that one gets its own. An
/// array may also lie in memory that somebody lends (the image of the file it was read from); it never
/// changes that. Whoever changes a part pays for what is moved, and once for the copy if the array is shared
/// or borrowed.
///
/// The cel keeps the times in order and apart; of the tolerance this knows only to look times up with it and
/// to tell when moved events came too close. References and pointers into it last until the next change.
/// Threads: as a container of the standard library; two arrays that share memory may be used by two threads.
class QM_API EventArray {
public:
    using Events = std::vector<channel_event>;

    EventArray() = default;
    ~EventArray() { release(); }
    EventArray(const EventArray& other) noexcept
        : m_body(other.m_body), m_events(other.m_events), m_starts(other.m_starts), m_size(other.m_size) {
        share();
    }
    EventArray(EventArray&& other) noexcept { swap(other); }
    EventArray& operator=(EventArray other) noexcept {
        swap(other);
        return *this;
    }
    void swap(EventArray& other) noexcept;

    /// \name Reading
    /// @{
    [[nodiscard]] size_t size() const { return m_size; }
    [[nodiscard]] bool empty() const { return m_size == 0; }
    [[nodiscard]] const channel_event* data() const { return m_events; }
    [[nodiscard]] const channel_event& operator[](size_t index) const { return m_events[index]; }
    [[nodiscard]] const channel_event& front() const { return m_events[0]; }
    [[nodiscard]] const channel_event& back() const { return m_events[m_size - 1]; }
    [[nodiscard]] const channel_event* begin() const { return m_events; }
    [[nodiscard]] const channel_event* end() const { return m_events + m_size; }
    /// How many whole pairs start before a time, and how many at it, at most `tolerance` after it, or before.
    [[nodiscard]] size_t numStartingBefore(double time) const {
        return numStarting([time](double start) { return start < time; });
    }
    [[nodiscard]] size_t numStartingUpTo(double time, double tolerance = 0) const {
        const double last = time + tolerance;
        size_t count = numStarting([last](double start) { return start <= last; });
        // The sum is rounded; the difference of two times so close is not.
        while (count > 0 && m_starts[count - 1] - time > tolerance) {
            --count;
        }
        while (count < m_size / 2 && m_starts[count] - time <= tolerance) {
            ++count;
        }
        return count;
    }
    /// How many whole pairs end more than `tolerance` before a time.
    [[nodiscard]] size_t numEndingBefore(double time, double tolerance) const {
        size_t count = numStartingBefore(time - tolerance);
        while (count > 0 && !(time - m_events[2 * count - 1].editTime > tolerance)) {
            --count;
        }
        while (count < m_size / 2 && time - m_events[2 * count + 1].editTime > tolerance) {
            ++count;
        }
        return count;
    }
    /// @}

    /// \name Changing
    /// @{
    /// Room for so many events is made ahead.
    void reserve(size_t events);
    void clear();
    void append(const channel_event& event);
    /// Takes the events of an array over.
    void assign(Events&& events);
    /// Lies from now on in the memory of `events`, which lives as long as `lender` is held and never changes.
    void borrow(std::shared_ptr<const void> lender, std::span<const channel_event> events);
    /// Puts `block` in the place of the events [first, last) and moves the edit times of all that follow by
    /// `shift` seconds: one pass over what follows. All three, and the size of the array, are even. `block`
    /// does not lie in the array. False if rounding brought two events that follow within the tolerance of
    /// one another without being one: the caller is to settle them.
    bool splice(size_t first, size_t last, std::span<const channel_event> block, double shift = 0);
    void setTime(size_t index, double time);
    /// An event for a change of anything but its edit time.
    [[nodiscard]] channel_event& change(size_t index) { return own()[index]; }

    /// The whole array for changes of every kind; the array is as the events are when the rewriting ends.
    class Rewrite {
    public:
        explicit Rewrite(EventArray& array) : m_array(array), m_events(array.own()) {}
        ~Rewrite() { m_array.settle(); }
        Rewrite(const Rewrite&) = delete;
        Rewrite& operator=(const Rewrite&) = delete;
        [[nodiscard]] Events& events() { return m_events; }

    private:
        EventArray& m_array;
        Events& m_events;
    };
    /// @}

private:
    struct Body;

    /// How many whole pairs start where `before` is true, which it is up to some time: a binary search in
    /// which nothing is guessed, as which way it goes is random to the processor.
    template <typename Before>
    [[nodiscard]] size_t numStarting(Before&& before) const {
        const double* first = m_starts;
        size_t left = m_size / 2;
        while (left > 1) {
            const size_t half = left / 2;
            // Both places that may be asked next are on their way while this one is compared.
            __builtin_prefetch(first + half / 2);
            __builtin_prefetch(first + half + half / 2);
            first += half & (size_t{0} - static_cast<size_t>(before(first[half - 1])));
            left -= half;
        }
        return static_cast<size_t>(first - m_starts) + (left == 1 && before(*first) ? 1 : 0);
    }
    void share() const noexcept;
    void release() noexcept;
    void adopt(Body* body) noexcept;
    void refer() noexcept;
    /// The events in memory of this array alone, with room for `more`.
    Events& own(size_t more = 0);
    [[nodiscard]] bool isOwn() const noexcept;
    /// Makes the packed times agree with the events.
    void settle();
    /// The event at a place was put there or moved.
    void noteSteps(size_t index);
    void spliceAnew(size_t first, size_t last, std::span<const channel_event> block, double shift);

    Body* m_body = nullptr;
    const channel_event* m_events = nullptr;
    const double* m_starts = nullptr;
    size_t m_size = 0;
};
